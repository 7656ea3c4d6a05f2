// mkdir and attributes on runtime paths with the original errno numbers.
#include <gtest/gtest.h>

#include "platform/FileSystem.h"
#include "tests/platform/TempDrive.h"

namespace {

constexpr int kExists = 17;
constexpr int kNoEntry = 2;

TEST(MakeDirectoryTest, CreatesThenReportsExistingWithSeventeen) {
  TempDrive drive;
  EXPECT_EQ(platform::MakeDirectory("C:\\QV-RT"), 0);
  EXPECT_TRUE(drive.isDirectory("QV-RT"));
  EXPECT_EQ(platform::MakeDirectory("C:\\QV-RT"), kExists);
}

// A missing parent, a file as parent and a path out of the drive all give ENOENT.
TEST(MakeDirectoryTest, PathsWithoutAParentDirectoryGiveTwo) {
  for (const char* path : {"C:\\missing\\child", "C:\\file\\sub", "C:\\..\\kv-escaped"}) {
    TempDrive drive;
    drive.writeFile("file");
    EXPECT_EQ(platform::MakeDirectory(path), kNoEntry) << path;
    EXPECT_FALSE(std::filesystem::exists(drive.root.parent_path() / "kv-escaped"));
  }
}

TEST(MakeDirectoryTest, MissingDriveDirectoryIsCreatedOnDemand) {
  TempDrive drive;
  const std::filesystem::path nested = drive.root / "deeper" / "drive_c";
  setenv("KELVANERT_DRIVE_C", nested.c_str(), 1);
  EXPECT_EQ(platform::MakeDirectory("C:\\QV-RT"), 0);
  EXPECT_TRUE(std::filesystem::is_directory(nested / "QV-RT"));
}

TEST(GetFileAttributesTest, TellsDirectoryFileAndMissing) {
  TempDrive drive;
  drive.writeFile("dir/file.txt");
  EXPECT_EQ(platform::GetFileAttributes("C:\\dir"), platform::kFileAttributeDirectory);
  EXPECT_EQ(platform::GetFileAttributes("C:\\dir\\file.txt"), platform::kFileAttributeNormal);
  EXPECT_EQ(platform::GetFileAttributes("C:\\nothing"), platform::kInvalidFileAttributes);
  EXPECT_EQ(platform::GetFileAttributes("D:\\dir"), platform::kInvalidFileAttributes);
}

}  // namespace
