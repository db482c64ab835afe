#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>

#include "runtime/file_handle.h"

namespace {

std::string Contents(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// Buffered writes reach the file when the handle closes, whichever way it
// closes; a close that loses them says so.
TEST(FileHandle, ClosingFlushesAndReportsLostWrites) {
  const std::string path = testing::TempDir() + "file_handle_out";
  {
    FileHandle f(path.c_str(), "wb");
    ASSERT_TRUE(f.valid());
    std::fputs("by destructor", f.get());
  }
  EXPECT_EQ(Contents(path), "by destructor");

  FileHandle f(path.c_str(), "wb");
  std::fputs("by close", f.get());
  FileHandle moved(std::move(f));
  EXPECT_FALSE(f.valid());
  EXPECT_TRUE(f.close());  // nothing open: nothing lost
  EXPECT_TRUE(moved.close());
  EXPECT_FALSE(moved.valid());
  EXPECT_EQ(Contents(path), "by close");

  // A full device takes the bytes into the buffer and fails at the flush.
  FileHandle full("/dev/full", "wb");
  if (full.valid()) {
    std::fputs("lost", full.get());
    EXPECT_FALSE(full.close());
  }
  std::remove(path.c_str());
}

TEST(FileHandle, MissingFileAndMoveAssignment) {
  FileHandle missing((testing::TempDir() + "file_handle_absent/x").c_str(), "rb");
  EXPECT_FALSE(missing.valid());
  EXPECT_FALSE(FileHandle(nullptr, "rb").valid());

  // Assigning over an open handle closes its file first.
  const std::string a = testing::TempDir() + "file_handle_a";
  const std::string b = testing::TempDir() + "file_handle_b";
  FileHandle h(a.c_str(), "wb");
  std::fputs("first", h.get());
  h = FileHandle(b.c_str(), "wb");
  EXPECT_EQ(Contents(a), "first");
  std::fputs("second", h.get());
  h.reset();
  EXPECT_EQ(Contents(b), "second");
  std::remove(a.c_str());
  std::remove(b.c_str());
}

}  // namespace
