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

// Stores value v as one component of `type` at p, most significant byte
// first when `big`.
inline void PutComponent(double v, int type, bool big, unsigned char* p) {
  unsigned char tmp[8];
  const int n = ComponentSize(type);
  switch (ComponentKind(type)) {
    case 0: {
      const float f = static_cast<float>(v);
      std::memcpy(tmp, &f, 4);
      break;
    }
    case 1:
      std::memcpy(tmp, &v, 8);
      break;
    case 2: {
      const int32_t i = static_cast<int32_t>(v);
      std::memcpy(tmp, &i, 4);
      break;
    }
    default: {
      const int16_t s = static_cast<int16_t>(v);
      std::memcpy(tmp, &s, 2);
      break;
    }
  }
  for (int i = 0; i < n; ++i) p[i] = big ? tmp[n - 1 - i] : tmp[i];
}

inline double GetComponent(int type, bool big, const unsigned char* p) {
  unsigned char tmp[8];
  const int n = ComponentSize(type);
  for (int i = 0; i < n; ++i) tmp[i] = big ? p[n - 1 - i] : p[i];
  switch (ComponentKind(type)) {
    case 0: {
      float f;
      std::memcpy(&f, tmp, 4);
      return f;
    }
    case 1: {
      double d;
      std::memcpy(&d, tmp, 8);
      return d;
    }
    case 2: {
      int32_t i;
      std::memcpy(&i, tmp, 4);
      return i;
    }
    default: {
      int16_t s;
      std::memcpy(&s, tmp, 2);
      return s;
    }
  }
}

}  // namespace raster_test
