// vora-dump on files written through vora.dll: the listing, and channels decoded to text log lines.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "logging/BinaryLogFormat.h"
#include "tests/kvlog/ToolRunner.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/vora/VoraDll.h"

namespace {

using namespace nKV_DLL300;
using kvtest::FrameSpec;

class VoraDump : public testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(dll.complete());
    ASSERT_EQ(dll.FileOpenExA(path.c_str(), 2, 2, 4713, &file), 0);
  }

  // A channel as the controller writes it: three properties, one record per frame.
  void AddChannel(const std::string& objectPath, int32_t protocol,
                  const std::vector<FrameSpec>& frames, BinaryRecordLayout layout,
                  bool withProtocol = true) {
    const int32_t channel = dll.OpenChannel(file, objectPath, protocol, withProtocol);
    for (const FrameSpec& f : frames) {
      const auto batch = kvtest::Batch({f});
      uint8_t record[4096];
      const size_t n = CopyBinaryRecord(record, sizeof record, kvtest::FirstView(batch), layout);
      ASSERT_EQ(dll.ObjRawSet(5, static_cast<uint32_t>(n), record, file, channel), 0);
    }
  }

  kvtest::ToolRun Dump(const std::string& arguments) {
    dll.FileBufFlush(3, file);
    dll.FileClose(file);
    return kvtest::RunTool(std::string(VORADUMP_PATH) + " " + arguments + " '" + path + "'",
                           dir.path);
  }

  voratest::VoraDll dll;
  voratest::TempDir dir;
  std::string path = dir / "run.vora";
  int32_t file = -1;
};

const std::vector<FrameSpec> kCanFrames = {
    {.identifier = 0x321, .type = 0x01},
    {.identifier = 0x201, .type = 0x10, .payload = {1, 2, 3, 4, 5, 6, 7, 8, 9}}};
const std::vector<FrameSpec> kLinFrames = {
    {.identifier = 0x13, .type = 0x40, .info = 0x3c, .payload = {0xde, 0xad}}};
const std::vector<FrameSpec> kFlexRayFrames = {
    {.identifier = 40, .type = 0x20, .flags = 0x20, .info = 9, .payload = {7}}};

TEST_F(VoraDump, ListsGroupsChannelsAndTheirProperties) {
  AddChannel("/'Bus'/'CAN1'", 0, kCanFrames, BinaryRecordLayout::kCanVariable);
  AddChannel("/'Bus'/'LIN1'", 2, kLinFrames, BinaryRecordLayout::kFixed24);
  AddChannel("/'it's/x'/''", 1, {}, BinaryRecordLayout::kFlexRayVariable);
  const auto run = Dump("");
  EXPECT_EQ(run.exitCode, 0) << run.err;
  EXPECT_EQ(run.out,
            "group \"Bus\"\n"
            "  channel \"CAN1\": 48 bytes, CAN frames\n"
            "    \"QV_network_frame_byte_order\" = 0\n"
            "    \"QV_network_frame_version\" = 512\n"
            "    \"QV_network_protocol\" = 0\n"
            "  channel \"LIN1\": 24 bytes, LIN frames\n"
            "    \"QV_network_frame_byte_order\" = 0\n"
            "    \"QV_network_frame_version\" = 512\n"
            "    \"QV_network_protocol\" = 2\n"
            "group \"it's/x\"\n"
            "  channel \"\": 0 bytes, FlexRay frames\n"
            "    \"QV_network_frame_byte_order\" = 0\n"
            "    \"QV_network_frame_version\" = 512\n"
            "    \"QV_network_protocol\" = 1\n");
}

// One channel named by group and channel is decoded alone; without names every channel is, each
// under its own banner.
TEST_F(VoraDump, DecodesChannelsToTheTextLogOfTheirBus) {
  AddChannel("/'G'/'CAN1'", 0, kCanFrames, BinaryRecordLayout::kCanVariable);
  AddChannel("/'G'/'FR'", 1, kFlexRayFrames, BinaryRecordLayout::kFlexRayVariable);
  AddChannel("/'G'/'LIN1'", 2, kLinFrames, BinaryRecordLayout::kFixed24);
  const std::string can =
      "Timestamp\tID\tPayload\tPayload Length\tType\tName\n"
      "09:05:03,042\t321\t\t0\tS/R\n"
      "09:05:03,042\t201\t01  02  03  04  05  06  07  08  09  \t9\tFD\n";
  const std::pair<const char*, std::string> cases[] = {
      {"--decode -g G -c CAN1", can},
      {"-d --lin-checksum", "== group \"G\" channel \"CAN1\" ==\n" + can +
                                "== group \"G\" channel \"FR\" ==\n"
                                "Timestamp\tSlot ID\tPayload\tPayload Length\tCycle "
                                "Number\tChannel\tStartup\tSync\tPreamble\n"
                                "09:05:03,042\t28\t07  \t1\t9\tB\t-\t-\t-\n"
                                "== group \"G\" channel \"LIN1\" ==\n"
                                "Timestamp\tID\tPayload\tPayload Length\tChecksum\tType\t\n"
                                "09:05:03,042\t13\tde  ad  00  00  00  00  00  00  \t2\t3c\tS\n"},
  };
  for (const auto& [arguments, expected] : cases) {
    const auto run = Dump(arguments);
    EXPECT_EQ(run.exitCode, 0) << run.err;
    EXPECT_EQ(run.out, expected) << arguments;
  }
}

TEST_F(VoraDump, ChannelsWithoutAKnownBusOrFilesOfOtherKindsFail) {
  AddChannel("/'G'/'C'", 0, kCanFrames, BinaryRecordLayout::kCanVariable, /*withProtocol=*/false);
  const auto run = Dump("-d");
  EXPECT_EQ(run.exitCode, 1);
  EXPECT_NE(run.err.find("no known QV_network_protocol"), std::string::npos) << run.err;

  kvtest::WriteBytes(dir.path / "text.vora", {'h', 'i'});
  const auto other =
      kvtest::RunTool(std::string(VORADUMP_PATH) + " '" + (dir / "text.vora") + "'", dir.path);
  EXPECT_EQ(other.exitCode, 1);
  EXPECT_NE(other.err.find("not a measurement-data (HDF5) file"), std::string::npos) << other.err;
}

// An object whose header cannot be read (here a link to nothing; in a damaged file a damaged
// header) is named, not left out silently.
TEST_F(VoraDump, ObjectThatCannotBeReadIsNamed) {
  AddChannel("/'Bus'/'CAN1'", 0, kCanFrames, BinaryRecordLayout::kCanVariable);
  dll.FileClose(file);
  ASSERT_TRUE(voratest::AddDanglingLink(path, "/Bus/CAN2"));
  const auto run = Dump("");
  EXPECT_EQ(run.exitCode, 1);
  EXPECT_NE(run.err.find(path + ": group \"Bus\" object \"CAN2\": cannot be read"),
            std::string::npos)
      << run.err;
}

}  // namespace
