// Helpers of the raster tests: a scratch directory and an independent
// encoder of sample values in either byte order.
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace raster_test {

class ScratchDir : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/vlr_raster_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = pattern;
  }
  void TearDown() override { std::filesystem::remove_all(dir_); }
  std::string Path(const std::string& name) const { return dir_ + "/" + name; }

  std::string dir_;
};

inline void WriteFile(const std::string& path, const std::string& bytes) {
  std::ofstream f(path, std::ios::binary);
  f.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

inline std::string ReadFile(const std::string& path) {
  std::ifstream f(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(f), std::istreambuf_iterator<char>());
}

// Component type and count of the cell types 0..7.
inline int ComponentKind(int type) {
  return type / 2;
}  // 0 float, 1 double, 2 int32, 3 int16
inline int ComponentSize(int type) {
  static const int sizes[4] = {4, 8, 4, 2};
  return sizes[ComponentKind(type)];
}
inline int Components(int type) {
  return type % 2 == 0 ? 2 : 1;
}

// One component of type T at p, most significant byte first when `big`.
template <class T>
void Put(double v, bool big, unsigned char* p) {
  const T t = static_cast<T>(v);
  const auto* b = reinterpret_cast<const unsigned char*>(&t);
  for (size_t i = 0; i < sizeof(T); ++i) p[i] = big ? b[sizeof(T) - 1 - i] : b[i];
}
template <class T>
double Get(bool big, const unsigned char* p) {
  T t;
  auto* b = reinterpret_cast<unsigned char*>(&t);
  for (size_t i = 0; i < sizeof(T); ++i) b[i] = big ? p[sizeof(T) - 1 - i] : p[i];
  return static_cast<double>(t);
}

inline void PutComponent(double v, int type, bool big, unsigned char* p) {
  switch (ComponentKind(type)) {
    case 0:
      return Put<float>(v, big, p);
    case 1:
      return Put<double>(v, big, p);
    case 2:
      return Put<int32_t>(v, big, p);
    default:
      return Put<int16_t>(v, big, p);
  }
}

inline double GetComponent(int type, bool big, const unsigned char* p) {
  switch (ComponentKind(type)) {
    case 0:
      return Get<float>(big, p);
    case 1:
      return Get<double>(big, p);
    case 2:
      return Get<int32_t>(big, p);
    default:
      return Get<int16_t>(big, p);
  }
}

}  // namespace raster_test
