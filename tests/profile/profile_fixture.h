// Shared fixture of the profile tests: a scratch directory and an empty
// cache for every test.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "profile/profile.h"
#include "runtime/ckerr.h"

class ProfileTest : public ::testing::Test {
 protected:
  void SetUp() override {
    FreeProfile();
    char pattern[] = "/tmp/vlr_profile_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = pattern;
  }
  void TearDown() override {
    FreeProfile();
    set_flg_report(0);
    std::filesystem::remove_all(dir_);
  }

  std::string Path(const char* name) const { return dir_ + "/" + name; }
  // Writes `text` to a file of the scratch directory and returns its path.
  std::string WriteFile(const char* name, const std::string& text) const {
    std::ofstream(Path(name), std::ios::binary) << text;
    return Path(name);
  }
  static std::string ReadFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }
  // The cached value, or "<absent>".
  static std::string Value(const std::string& file, const char* section, const char* key) {
    const char* v = GetSetProfileChar(kProfileGet, section, key, nullptr, file.c_str());
    return v != nullptr ? std::string(v) : std::string("<absent>");
  }
  // Counts the report lines issued while `body` runs.
  template <class F>
  static int ReportsDuring(F body) {
    set_flg_report(1);
    const int before = ckcnt_report();
    body();
    const int count = ckcnt_report() - before;
    set_flg_report(0);
    return count;
  }

  std::string dir_;
};
