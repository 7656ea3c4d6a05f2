// Runtime paths onto the drive directory: letters, separators, and no way out of the drive.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstdio>
#include <ostream>

#include "platform/Drive.h"
#include "tests/platform/TempDrive.h"

namespace {

struct Mapping {
  const char* runtimePath;
  const char* relative;  // null: refused
};

void PrintTo(const Mapping& m, std::ostream* out) { *out << m.runtimePath; }

class MapRuntimePathTest : public ::testing::TestWithParam<Mapping> {};

TEST_P(MapRuntimePathTest, MapsInsideDriveOrRefuses) {
  TempDrive drive;
  const Mapping& m = GetParam();
  const auto native = platform::MapRuntimePath(m.runtimePath);
  if (m.relative == nullptr) {
    EXPECT_FALSE(native.has_value());
  } else {
    ASSERT_TRUE(native.has_value());
    const std::string expected = drive.root.string() + m.relative;
    EXPECT_EQ(*native, expected);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Paths, MapRuntimePathTest,
    ::testing::Values(Mapping{"C:\\QV-RT\\tarvix\\kelvane", "/QV-RT/tarvix/kelvane"},
                      Mapping{"c:\\temp\\x", "/temp/x"}, Mapping{"C:/QV-RT/a", "/QV-RT/a"},
                      Mapping{"C:\\", ""}, Mapping{"C:", ""}, Mapping{"C:\\QV-RT\\", "/QV-RT"},
                      Mapping{"C:\\a\\\\b", "/a/b"}, Mapping{"relative\\file", "/relative/file"},
                      Mapping{"C:\\a\\..\\b", "/b"}, Mapping{"C:\\a\\.\\b", "/a/b"},
                      Mapping{"C:\\..", nullptr}, Mapping{"C:\\a\\..\\..\\etc\\passwd", nullptr},
                      Mapping{"..\\outside", nullptr}, Mapping{"D:\\QV-RT", nullptr},
                      Mapping{"z:\\", nullptr}));

TEST(MapRuntimePathTest, EmbeddedNulIsRefused) {
  TempDrive drive;
  EXPECT_FALSE(platform::MapRuntimePath(std::string_view("C:\\a\0b", 6)).has_value());
}

TEST(DriveDirectoryTest, DefaultsUnderHome) {
  unsetenv("KELVANERT_DRIVE_C");
  setenv("HOME", "/home/someone", 1);
  EXPECT_EQ(platform::DriveDirectory(), "/home/someone/.kelvanert/drive_c");
}

TEST(OpenFileTest, OpensMappedFileForWritingAndReading) {
  TempDrive drive;
  std::FILE* out = platform::OpenFile("C:\\note.txt", "w");
  ASSERT_NE(out, nullptr);
  std::fputs("hello", out);
  std::fclose(out);
  std::FILE* in = platform::OpenFile("c:\\NOTE.txt\\..\\note.txt", "r");
  ASSERT_NE(in, nullptr);
  char text[8] = {};
  EXPECT_EQ(std::fread(text, 1, 5, in), 5u);
  std::fclose(in);
  EXPECT_STREQ(text, "hello");
}

TEST(OpenFileTest, EscapeIsRefusedLikeMissingFile) {
  TempDrive drive;
  errno = 0;
  EXPECT_EQ(platform::OpenFile("C:\\..\\..\\escape.txt", "w"), nullptr);
  EXPECT_EQ(errno, ENOENT);
}

}  // namespace
