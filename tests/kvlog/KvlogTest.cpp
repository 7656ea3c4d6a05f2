// kvlog end to end: crafted binary logs converted to text logs and to candump logs that python-can
// reads back frame for frame.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "logging/BinaryLogFormat.h"
#include "tests/kvlog/ToolRunner.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/vora/VoraDll.h"

namespace {

using namespace nKV_DLL300;
using kvtest::FrameSpec;
using kvtest::RunTool;

constexpr uint64_t kT0 = kvtest::kAt090503042;
constexpr uint64_t kStep = 1'234;  // 123.4 us

// A binary log as the controller writes it: the file header, then one record per frame.
std::vector<uint8_t> BinaryLog(const std::vector<FrameSpec>& frames, BinaryRecordLayout layout) {
  std::vector<uint8_t> log(kBinaryLogFileHeaderBytes.begin(), kBinaryLogFileHeaderBytes.end());
  for (const FrameSpec& f : frames) {
    const auto batch = kvtest::Batch({f});
    uint8_t record[4096];
    const size_t n = CopyBinaryRecord(record, sizeof record, kvtest::FirstView(batch), layout);
    log.insert(log.end(), record, record + n);
  }
  return log;
}

std::vector<uint8_t> Bytes(size_t n, uint8_t first) {
  std::vector<uint8_t> bytes(n);
  for (size_t i = 0; i < n; ++i) bytes[i] = static_cast<uint8_t>(first + i);
  return bytes;
}

// Every kind of CAN frame a FD or J1939 session logs.
std::vector<FrameSpec> MixedCanFrames() {
  return {
      {.timestamp = kT0, .identifier = 0x123, .payload = {0x11, 0x22, 0x33, 0x44}},
      {.timestamp = kT0 + 1 * kStep, .identifier = 0x38FEF100, .payload = Bytes(8, 0)},
      {.timestamp = kT0 + 2 * kStep, .identifier = 0x321, .type = 0x01},
      {.timestamp = kT0 + 3 * kStep, .identifier = 0x322, .type = 0x01, .lengthByte = 3},
      {.timestamp = kT0 + 4 * kStep, .identifier = 0x201, .type = 0x10, .payload = Bytes(12, 0xa0)},
      {.timestamp = kT0 + 5 * kStep,
       .identifier = 0x3ABCDE00,
       .type = 0x18,
       .payload = Bytes(64, 0)},
      {.timestamp = kT0 + 6 * kStep, .identifier = 0, .type = 0x02},
      {.timestamp = kT0 + 7 * kStep, .identifier = 0x100, .flags = 0x80, .payload = {0x7f}},
      {.timestamp = kT0 + 8 * kStep,
       .identifier = 0x38FECA00,
       .type = 0xC0,
       .payload = Bytes(8, 1)},
      {.timestamp = kT0 + 9 * kStep,
       .identifier = 0x38FECA00,
       .type = 0xC0,
       .payload = Bytes(20, 1)},
  };
}

std::string CountingHex(int n) {
  std::string hex;
  for (int i = 0; i < n; ++i) hex += {"0123456789abcdef"[i >> 4], "0123456789abcdef"[i & 15]};
  return hex;
}

class Kvlog : public testing::Test {
 protected:
  kvtest::ToolRun Kvlog_(const std::string& arguments) {
    return RunTool(std::string(KVLOG_PATH) + " " + arguments, dir.path);
  }
  std::string Write(const std::string& name, const std::vector<uint8_t>& bytes) {
    kvtest::WriteBytes(dir.path / name, bytes);
    return "'" + (dir / name) + "'";
  }
  voratest::TempDir dir;
};

TEST_F(Kvlog, CandumpLogReadByPythonCanGivesTheSameFrames) {
  if (!std::filesystem::exists(PYTHON3_PATH)) GTEST_SKIP() << "python3 is not installed";
  const std::string log =
      Write("run.zfl", BinaryLog(MixedCanFrames(), BinaryRecordLayout::kCanVariable));
  const auto converted = Kvlog_("--bus can --candump -o '" + (dir / "run.log") + "' " + log);
  ASSERT_EQ(converted.exitCode, 0) << converted.err;
  EXPECT_NE(converted.err.find("1 frames have no candump form"), std::string::npos)
      << converted.err;

  // python-can reports error frames with its default extended flag and remote frames without data.
  const auto read = RunTool(
      std::string(PYTHON3_PATH) + " " + READ_CANDUMP_PY + " '" + (dir / "run.log") + "'", dir.path);
  ASSERT_EQ(read.exitCode, 0) << read.err;
  EXPECT_EQ(
      read.out,
      "1715936703.042000 123 ext=0 rtr=0 fd=0 brs=0 err=0 dlc=4 rx=1 11223344\n"
      "1715936703.042123 18FEF100 ext=1 rtr=0 fd=0 brs=0 err=0 dlc=8 rx=1 0001020304050607\n"
      "1715936703.042246 321 ext=0 rtr=1 fd=0 brs=0 err=0 dlc=0 rx=1 \n"
      "1715936703.042370 322 ext=0 rtr=1 fd=0 brs=0 err=0 dlc=3 rx=1 \n"
      "1715936703.042493 201 ext=0 rtr=0 fd=1 brs=0 err=0 dlc=12 rx=1 a0a1a2a3a4a5a6a7a8a9aaab\n"
      "1715936703.042617 1ABCDE00 ext=1 rtr=0 fd=1 brs=1 err=0 dlc=64 rx=1 " +
          CountingHex(64) +
          "\n"
          "1715936703.042740 0 ext=1 rtr=0 fd=0 brs=0 err=1 dlc=0 rx=1 \n"
          "1715936703.042863 100 ext=0 rtr=0 fd=0 brs=0 err=0 dlc=1 rx=0 7f\n"
          "1715936703.042987 18FECA00 ext=1 rtr=0 fd=0 brs=0 err=0 dlc=8 rx=1 0102030405060708\n");
}

TEST_F(Kvlog, BinaryLogsBecomeTheTextLogOfTheirBus) {
  const struct {
    const char* arguments;
    std::vector<FrameSpec> frames;
    BinaryRecordLayout layout;
    const char* expected;
  } cases[] = {
      {"--bus can",
       {{.identifier = 0x321, .type = 0x01},
        {.identifier = 0x201, .type = 0x10, .payload = Bytes(12, 0)}},
       BinaryRecordLayout::kCanVariable,
       "Timestamp\tID\tPayload\tPayload Length\tType\tName\n"
       "09:05:03,042\t321\t\t0\tS/R\n"
       "09:05:03,042\t201\t00  01  02  03  04  05  06  07  08  09  0a  0b  \t12\tFD\n"},
      {"--bus lin --lin-checksum",
       {{.identifier = 0x12, .type = 0x42, .info = 0x5a},
        {.identifier = 0x10, .type = 0x40, .payload = {0x12, 0x34}}},
       BinaryRecordLayout::kFixed24,
       "Timestamp\tID\tPayload\tPayload Length\tChecksum\tType\t\n"
       "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\t5a\tNR\n"
       "09:05:03,042\t10\t12  34  00  00  00  00  00  00  \t2\t00\tS\n"},
      {"--bus flexray",
       {{.identifier = 5, .type = 0x20, .flags = 0x12, .info = 3, .payload = {0x0a, 0x0b}},
        {.identifier = 3, .type = 0x21, .flags = 0x10, .info = 1}},
       BinaryRecordLayout::kFlexRayVariable,
       "Timestamp\tSlot ID\tPayload\tPayload Length\tCycle "
       "Number\tChannel\tStartup\tSync\tPreamble\n"
       "09:05:03,042\t5\t0a  0b  \t2\t3\tA\t-\tX\t-\n"
       "09:05:03,042\t3\t\t0\t1\tA\t-\t-\t-\n"},
  };
  for (const auto& c : cases) {
    const std::string log = Write("run.zfl", BinaryLog(c.frames, c.layout));
    const auto run = Kvlog_(std::string(c.arguments) + " " + log);
    EXPECT_EQ(run.exitCode, 0) << c.arguments << run.err;
    EXPECT_EQ(run.out, c.expected) << c.arguments;
  }
}

// A copy taken while the controller wrote the log ends anywhere in a record; a classic CAN log with
// an empty remote frame must still be read in its fixed layout.
TEST_F(Kvlog, CutLastRecordIsReportedAndTheWholeOnesConverted) {
  const std::vector<FrameSpec> can = {{.identifier = 0x321, .type = 0x01},
                                      {.identifier = 0x1A0, .payload = {0xaa, 0xbb, 0xcc}},
                                      {.identifier = 0x100, .payload = Bytes(8, 1)}};
  const struct {
    const char* arguments;
    std::vector<FrameSpec> frames;
    size_t cut;
    const char* expected;
    const char* skipped;
  } cases[] = {
      {"--bus lin",
       {{.type = 0x40, .payload = {1}}, {.type = 0x40, .payload = {2}}},
       10,
       "Timestamp\tID\tPayload\tPayload Length\tType\t\n"
       "09:05:03,042\t0\t01  00  00  00  00  00  00  00  \t1\tS\n",
       "14 bytes after the last whole frame record skipped"},
      {"--bus can --candump", can, 5,
       "(1715936703.042000) can0 321#R\n(1715936703.042000) can0 1A0#AABBCC\n", "19 bytes after"},
      {"--bus can --candump", can, 20,
       "(1715936703.042000) can0 321#R\n"
       "(1715936703.042000) can0 1A0#AABBCC\n",
       "4 bytes after"},
  };
  for (const auto& c : cases) {
    auto bytes = BinaryLog(c.frames, BinaryRecordLayout::kFixed24);
    bytes.resize(bytes.size() - c.cut);
    const auto run = Kvlog_(std::string(c.arguments) + " " + Write("cut.zfl", bytes));
    EXPECT_EQ(run.exitCode, 0) << c.arguments << c.cut;
    EXPECT_EQ(run.out, c.expected) << c.arguments << c.cut;
    EXPECT_NE(run.err.find(c.skipped), std::string::npos) << run.err;
  }
}

TEST_F(Kvlog, BadInputsAreRefusedWithAReason) {
  const std::string log =
      Write("run.zfl", BinaryLog({{.type = 0x40}}, BinaryRecordLayout::kFixed24));
  const std::string notALog = Write("notes.zfl", {'h', 'e', 'l', 'l', 'o', '\n'});
  const struct {
    std::string arguments;
    int exitCode;
    const char* error;
  } cases[] = {
      {log, 2, "give --bus"},
      {"--bus lin " + notALog, 1, "not a binary log"},
      {"--bus can " + Write("empty.zfl", {}), 1, "not a binary log"},
      {"--bus lin --candump " + log, 1, "CAN frames only"},
      {"--bus can " + log, 1,
       "not CAN records: record 1 (byte 12 of the file) has frame type "
       "0x40; they read as LIN records (--bus lin)"},
      {"--bus ethernet " + log, 2, "--bus: 'ethernet' is not can, lin or flexray"},
      {"--bus can --interface 'can 0' " + log, 2, "--interface needs"},
      {"--bus can '" + (dir / "missing.zfl") + "'", 1, "cannot read"},
      {"--bus can '" + dir.path.string() + "'", 1, "is a directory"},
      {"--bus can " + log + " " + log, 2, "one log file at a time"},
  };
  for (const auto& c : cases) {
    const auto run = Kvlog_(c.arguments);
    EXPECT_EQ(run.exitCode, c.exitCode) << c.arguments;
    EXPECT_NE(run.err.find(c.error), std::string::npos) << c.arguments << ": " << run.err;
  }
}

TEST_F(Kvlog, HelpShowsExamplesFirst) {
  const auto run = Kvlog_("--help");
  EXPECT_EQ(run.exitCode, 0);
  EXPECT_EQ(run.out.find("Usage: kvlog"), 0u);
  EXPECT_LT(run.out.find("Examples:"), run.out.find("Options:"));
}

// CAN channels become candump lines and other buses are left out. A channel whose stated size is
// far beyond the file (as one changed byte makes it) is named, nothing is allocated for it, and the
// other channels are still converted.
TEST(KvlogMeasurementFile, CanChannelsAreConvertedAndADamagedOneIsNamed) {
  voratest::VoraDll dll;
  ASSERT_TRUE(dll.complete());
  voratest::TempDir dir;
  const std::string path = dir / "run.vora";
  int32_t file = -1;
  ASSERT_EQ(dll.FileOpenExA(path.c_str(), 2, 2, 4713, &file), 0);
  const int32_t can = dll.OpenChannel(file, "/'Bus'/'CAN1'", 0),
                lin = dll.OpenChannel(file, "/'Bus'/'LIN1'", 2);
  dll.OpenChannel(file, "/'Bus'/'CAN2'", 0);
  const auto batch = kvtest::Batch({{.identifier = 0x1A0, .payload = {0xaa, 0xbb, 0xcc}}});
  uint8_t record[24];
  ASSERT_EQ(CopyBinaryRecord(record, sizeof record, kvtest::FirstView(batch),
                             BinaryRecordLayout::kFixed24),
            24u);
  dll.ObjRawSet(5, 24, record, file, can);
  dll.ObjRawSet(5, 24, record, file, lin);
  dll.FileClose(file);
  dll.Unload();
  constexpr hsize_t kClaimed = hsize_t{1} << 40;
  ASSERT_TRUE(voratest::SetExtent(path, "/Bus/CAN2", kClaimed));

  const struct {
    const char* format;
    const char* out;
    bool whole;  // the output is exactly `out`
  } cases[] = {{"--candump -i vcan1", "(1715936703.042000) vcan1 1A0#AABBCC\n", true},
               {"--format text", "\t1a0\taa  bb  cc  \t3\tS\n", false}};
  for (const auto& c : cases) {
    const auto run =
        RunTool(std::string(KVLOG_PATH) + " " + c.format + " '" + path + "'", dir.path);
    EXPECT_EQ(run.exitCode, 1) << c.format;
    EXPECT_TRUE(c.whole ? run.out == c.out : run.out.find(c.out) != std::string::npos)
        << c.format << ": " << run.out;
    EXPECT_NE(run.err.find(path + ": group \"Bus\" channel \"CAN2\": its size of " +
                           std::to_string(kClaimed) + " bytes is more than the file"),
              std::string::npos)
        << c.format << ": " << run.err;
  }
}

}  // namespace
