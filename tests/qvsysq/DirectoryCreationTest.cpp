// Directory chains on a temporary drive: created, present, blocked by a file, without parents.
#include <gtest/gtest.h>

#include <string>

#include "errors/Exception.h"
#include "platform/FileSystem.h"
#include "qvapal/ErrorCodes.h"
#include "qvsysq/DirectoryCreation.h"
#include "qvsysq/cSysqWrapper.h"
#include "tests/platform/TempDrive.h"

namespace {

constexpr const char* kServiceDir = "C:\\QV-RT\\tarvix\\kelvane";

std::string escaped(const std::string& text) {
  std::string out;
  for (char c : text) {
    if (c == '\\' || c == '"') out += '\\';
    out += c;
  }
  return out;
}

qverr::Exception failureOf(const char* path) {
  try {
    qvsysq::createDirectories(path, nullptr);
  } catch (const qverr::Exception& e) {
    return e;
  }
  ADD_FAILURE() << "no exception for " << path;
  return {};
}

TEST(CreateDirectoriesTest, CreatesMissingParentsThenFindsTheDirectoryExisting) {
  TempDrive drive;
  bool existed = true;
  kxpath::cSysqWrapper().createDirectories(kServiceDir, &existed);
  EXPECT_FALSE(existed);
  EXPECT_TRUE(drive.isDirectory("QV-RT/tarvix/kelvane"));
  qvsysq::createDirectories(kServiceDir, &existed);
  EXPECT_TRUE(existed);
}

TEST(CreateDirectoriesTest, FileInTheWayReportsCollisionWithPath) {
  TempDrive drive;
  drive.writeFile("QV-RT/tarvix");
  const qverr::Exception e = failureOf(kServiceDir);
  EXPECT_EQ(e.code(), qvapalerr_objectNameCollision);
  const std::string expected =
      R"({"error_constant":"qvapalerr_objectNameCollision","file":"qvsysq\\stdpath_util","line":124,)"
      R"("component":"kelvanert","internal_error":{"api":"errno","code":17,"string":")" +
      escaped(platform::ErrorText(17)) +
      R"("},"qvsysq_debug":{"desc":"path exist but not a dir","path":"C:\\QV-RT\\tarvix"}})";
  EXPECT_EQ(std::string(e.what()), expected);
  EXPECT_FALSE(drive.isDirectory("QV-RT/tarvix/kelvane"));
}

TEST(CreateDirectoriesTest, PathWithoutBackslashAndMissingParentReportsParentNotFound) {
  TempDrive drive;
  const qverr::Exception e = failureOf("nowhere/child");
  EXPECT_EQ(e.code(), qvapalerr_resourceNotFound);
  EXPECT_NE(std::string(e.what()).find(R"("line":132)"), std::string::npos);
  EXPECT_NE(std::string(e.what()).find(R"("qvsysq_debug":{"desc":"parent not found"})"),
            std::string::npos);
}

TEST(CreateDirectoriesTest, FileAtTheLeafOtherDriveAndEscapeAreRefused) {
  const std::pair<const char*, int32_t> rows[] = {
      {kServiceDir, qvapalerr_objectNameCollision},  // a file where the leaf should be
      {"D:\\data", qvapalerr_resourceNotFound},
      {"C:\\..\\..\\kv-outside", qvapalerr_resourceNotFound}};
  for (const auto& [path, code] : rows) {
    TempDrive drive;
    drive.writeFile("QV-RT/tarvix/kelvane");
    EXPECT_EQ(failureOf(path).code(), code) << path;
    EXPECT_FALSE(std::filesystem::exists(drive.root.parent_path() / "kv-outside"));
  }
}

TEST(MakeOneDirectoryTest, StatusInErrorDoesNothing) {
  TempDrive drive;
  qverr::Status status;
  qverr::setCode(status, -1);
  bool existed = true;
  qvsysq::makeOneDirectory("C:\\QV-RT", status, &existed);
  EXPECT_TRUE(existed);
  EXPECT_FALSE(drive.isDirectory("QV-RT"));
}

TEST(MakeOneDirectoryTest, OtherErrnoReportsMkdirFailed) {
  TempDrive drive;
  qverr::Status status;
  const std::string tooLong = "C:\\" + std::string(300, 'n');  // ENAMETOOLONG
  qvsysq::makeOneDirectory(tooLong.c_str(), status, nullptr);
  EXPECT_EQ(status.code, qvapalerr_osFault);
  EXPECT_NE(std::string(status.report).find(R"("line":139)"), std::string::npos);
  EXPECT_NE(std::string(status.report).find(R"("desc":"mkdir failed")"), std::string::npos);
}

}  // namespace
