// vora.dll loaded by name as the runtime loads it: files written through its entry points are read
// back with the HDF5 C API (h5dump reads the logs of live sessions over TCP).
#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "tests/vora/VoraDll.h"

namespace {

using voratest::ReadBytes;
using voratest::TempDir;
using voratest::VoraDll;

constexpr int32_t kReplaceMode = 2, kReadWrite = 2, kRevision = 4713, kInt32 = 3, kBytes = 5,
                  kFlushAll = 3;
constexpr uint32_t kLinRecord = 24;

// A record whose bytes say which writer and which frame it is (replacing runs, names, files of
// several sessions at once and the drive directory are tested through the runtime's logs).
std::array<uint8_t, kLinRecord> Record(uint32_t writer, uint32_t index) {
  std::array<uint8_t, kLinRecord> r{};
  for (uint32_t i = 0; i < kLinRecord; ++i)
    r[i] = static_cast<uint8_t>(writer * 31 + index * 7 + i);
  return r;
}

class VoraLibrary : public testing::Test {
 protected:
  void SetUp() override { ASSERT_TRUE(dll.complete()) << dlerror(); }

  // The runtime's open sequence: open, channel, the three channel properties.
  void OpenChannel(const std::string& path, const char* objectPath, int32_t protocol) {
    ASSERT_EQ(dll.SetOS(0), 0);
    ASSERT_EQ(dll.FileOpenExA(path.c_str(), kReplaceMode, kReadWrite, kRevision, &file), 0);
    channel = dll.OpenChannel(file, objectPath, protocol);
  }
  void Write(const std::array<uint8_t, kLinRecord>& r) {
    ASSERT_EQ(dll.ObjRawSet(kBytes, kLinRecord, r.data(), file, channel), 0);
  }
  void FlushAndClose() {
    EXPECT_EQ(dll.FileBufFlush(kFlushAll, file), 0);
    EXPECT_EQ(dll.FileClose(file), 0);
  }

  VoraDll dll;
  TempDir dir;
  int32_t file = -1;
  int32_t channel = -1;
};

TEST_F(VoraLibrary, ChannelHoldsEveryRecord) {
  const std::string path = dir / "run.vora";
  OpenChannel(path, "/'Bus'/'LIN1'", 2);
  std::vector<uint8_t> expected;
  for (uint32_t i = 0; i < 5000; ++i) {  // more than the library buffers at once
    const auto r = Record(0, i);
    Write(r);
    expected.insert(expected.end(), r.begin(), r.end());
  }
  FlushAndClose();

  EXPECT_EQ(ReadBytes(path, "/Bus/LIN1"), expected);
}

TEST_F(VoraLibrary, OpenExistingAppendsToTheChannelAndSameObjectKeepsItsHandle) {
  const std::string path = dir / "run.vora";
  OpenChannel(path, "/'G'/'C'", 1);
  const auto first = Record(2, 0), second = Record(2, 1);
  Write(first);
  int32_t again = -1;
  ASSERT_EQ(dll.ObjCreateA("/'G'/'C'", file, &again), 0);
  EXPECT_EQ(again, channel);
  FlushAndClose();

  ASSERT_EQ(dll.FileOpenExA(path.c_str(), 0, kReadWrite, kRevision, &file), 0);
  ASSERT_EQ(dll.ObjCreateA("/'G'/'C'", file, &channel), 0);
  Write(second);
  FlushAndClose();

  std::vector<uint8_t> expected(first.begin(), first.end());
  expected.insert(expected.end(), second.begin(), second.end());
  EXPECT_EQ(ReadBytes(path, "/G/C"), expected);
}

TEST_F(VoraLibrary, RefusedOpensLeaveTheFileHandleUnset) {
  setenv("KELVANERT_DRIVE_C", dir.path.c_str(), 1);
  const std::string path = dir / "x.vora";
  const std::string missingDirectory = dir / "missing/x.vora";
  const struct {
    const char* path;
    int32_t mode, access, revision, expected;
  } cases[] = {
      {path.c_str(), 2, 2, 4712, kVorErrRevision},
      {"", 2, 2, 4713, kVorErrFile},
      {missingDirectory.c_str(), 2, 2, 4713, kVorErrFile},
      {"D:\\x.vora", 2, 2, 4713, kVorErrFile},
      {"C:\\..\\x.vora", 2, 2, 4713, kVorErrFile},
      {path.c_str(), 7, 2, 4713, kVorErrArgument},
      {path.c_str(), 2, 1, 4713, kVorErrArgument},
      {path.c_str(), 0, 2, 4713, kVorErrFile},  // open existing: there is none
  };
  for (const auto& c : cases) {
    int32_t handle = -1;
    EXPECT_EQ(dll.FileOpenExA(c.path, c.mode, c.access, c.revision, &handle), c.expected) << c.path;
    EXPECT_EQ(handle, -1) << c.path;
  }
  EXPECT_EQ(dll.FileOpenExA(nullptr, 2, 2, 4713, &file), kVorErrArgument);
  EXPECT_FALSE(std::filesystem::exists(dir.path.parent_path() / "x.vora"));
}

TEST_F(VoraLibrary, CallsWithBadHandlesTypesOrPathsChangeNothing) {
  const std::string path = dir / "run.vora";
  OpenChannel(path, "/'G'/'C'", 0);
  int32_t group = -1, object = -1;
  ASSERT_EQ(dll.ObjCreateA("/'G'", file, &group), 0);
  const auto r = Record(3, 0);
  const int32_t value = 5;
  EXPECT_EQ(dll.ObjCreateA("G/C", file, &object), kVorErrPath);
  EXPECT_EQ(object, -1);
  EXPECT_EQ(dll.ObjCreateA("/'G'/'D'", file + 1000, &object), kVorErrHandle);
  EXPECT_EQ(dll.ObjRawSet(kInt32, kLinRecord, r.data(), file, channel), kVorErrDataType);
  EXPECT_EQ(dll.ObjRawSet(kBytes, kLinRecord, r.data(), file, group), kVorErrHandle);
  EXPECT_EQ(dll.ObjRawSet(kBytes, kLinRecord, r.data(), file, 77), kVorErrHandle);
  EXPECT_EQ(dll.ObjRawSet(kBytes, kLinRecord, nullptr, file, channel), kVorErrArgument);
  EXPECT_EQ(dll.PropSetA("p", 9, &value, file, channel), kVorErrDataType);
  EXPECT_EQ(dll.PropSetA(nullptr, kInt32, &value, file, channel), kVorErrArgument);
  EXPECT_EQ(dll.FileBufFlush(0, file), kVorErrArgument);
  FlushAndClose();
  EXPECT_EQ(dll.ObjRawSet(kBytes, kLinRecord, r.data(), file, channel), kVorErrHandle);
  EXPECT_EQ(dll.FileClose(file), kVorErrHandle);
  EXPECT_EQ(ReadBytes(path, "/G/C"), std::vector<uint8_t>{});
}

TEST_F(VoraLibrary, UnloadingWithAFileOpenWritesAndClosesIt) {
  const std::string path = dir / "run.vora";
  OpenChannel(path, "/'G'/'C'", 0);
  const auto r = Record(4, 4);
  Write(r);
  dll.Unload();
  EXPECT_EQ(ReadBytes(path, "/G/C"), std::vector<uint8_t>(r.begin(), r.end()));
}

}  // namespace
