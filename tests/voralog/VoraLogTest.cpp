// Type 2 logs of a session written through the real vora.dll, read back with the file reader.
#include <gtest/gtest.h>

#include <filesystem>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "logging/LogFile.h"
#include "logging/LogFileName.h"
#include "logging/LogWriters.h"
#include "logging/MeasurementLibrary.h"
#include "logging/VoraLog.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/logging/LogSessionHarness.h"
#include "tests/voralog/VoraSupport.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;
namespace fs = std::filesystem;

constexpr char kHeader[] = "header";
constexpr uint8_t kCanData = 0x00;
constexpr uint8_t kCanFdData = 0x10;
constexpr uint8_t kLinData = 0x40;
constexpr uint8_t kFlexRayData = 0x20;

class VoraLogTest : public LogSessionTest {
 protected:
  void SetUp() override {
    LogSessionTest::SetUp();
    LocateMeasurementLibrary();
    InstallLibrary(drive_);
    settings().logFileType.store(kLogTypeMeasurementData);
  }
  void TearDown() override {
    LogSessionTest::TearDown();
    UnloadMeasurementLibrary();
  }

  // One run: open, the batches through the writer of the session's bus, close.
  void RunWith(const std::vector<std::vector<uint8_t>>& batches) {
    OpenLogFile(log(), kHeader);
    for (const std::vector<uint8_t>& batch : batches) Write(batch);
    CloseLogFile(log());
  }
  void Write(const std::vector<uint8_t>& batch) {
    const auto bytes = static_cast<uint32_t>(batch.size());
    const auto frames = static_cast<uint32_t>(batch.size());  // the walk ends the batch first
    switch (session().busType) {
      case driver::BusKind::kLin:
        WriteLinLog(log(), batch.data(), bytes, frames);
        break;
      case driver::BusKind::kFlexRay:
        WriteFlexRayLog(log(), batch.data(), bytes, frames);
        break;
      default:
        WriteCanLog(log(), batch.data(), bytes, frames);
        break;
    }
  }

  std::optional<ChannelContents> Channel(const std::string& name) {
    return OnlyChannel(ServiceDirectory() / name);
  }
};

struct LayoutCase {
  const char* what;
  driver::BusKind bus;
  uint32_t canIoMode;
  std::vector<FrameSpec> frames;
  std::vector<uint32_t> recordSizes;
  int64_t protocol;
};

void PrintTo(const LayoutCase& c, std::ostream* os) { *os << c.what; }

class VoraLayoutTest : public VoraLogTest, public ::testing::WithParamInterface<LayoutCase> {};

// Each record is the frame's first bytes in the read buffer: 24 for LIN and classic CAN, the
// rounded payload for CAN FD and FlexRay.
TEST_P(VoraLayoutTest, ChannelHoldsTheBinaryLogRecordsAndTheThreeProperties) {
  const LayoutCase& c = GetParam();
  UseBus(c.bus);
  settings().canIoMode.store(c.canIoMode);
  settings().logFileName.set("layout");
  settings().voraGroupName.set("Bus");
  settings().voraChannelName.set("Frames");
  std::vector<uint8_t> batch;
  for (const FrameSpec& f : c.frames) AppendFrame(batch, f, 0xEE);
  RunWith({batch, batch});

  std::vector<uint8_t> expected;
  size_t at = 0;
  for (uint32_t size : c.recordSizes) {
    expected.insert(expected.end(), batch.begin() + at, batch.begin() + at + size);
    at += driver::RawFrameSize(
        FirstView(std::vector<uint8_t>(batch.begin() + at, batch.end())).header);
  }
  expected.insert(expected.end(), expected.begin(), expected.end());

  const std::optional<ChannelContents> contents = Channel("layout.vora");
  ASSERT_TRUE(contents);
  EXPECT_EQ(contents->channel.group, "Bus");
  EXPECT_EQ(contents->channel.name, "Frames");
  EXPECT_EQ(contents->bytes, expected);
  ExpectFrameProperties(contents->channel, c.protocol);
  EXPECT_TRUE(SentMessages().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Buses, VoraLayoutTest,
    ::testing::Values(
        LayoutCase{"ClassicCan",
                   driver::BusKind::kCan,
                   0,
                   {{.identifier = 0x100, .type = kCanData, .payload = Counting(8, 1)},
                    {.identifier = 0x1A0, .type = kCanData, .payload = Counting(3, 0xAA)},
                    {.identifier = 0x321, .type = 0x01}},
                   {24, 24, 24},
                   0},
        LayoutCase{"CanFd",
                   driver::BusKind::kCan,
                   1,
                   {{.identifier = 0x200, .type = kCanFdData, .payload = Counting(64)},
                    {.identifier = 0x201, .type = kCanFdData, .payload = Counting(12, 0xA0)},
                    {.identifier = 0x080, .type = kCanData, .payload = Counting(8)}},
                   {80, 32, 24},
                   0},
        LayoutCase{"Lin",
                   driver::BusKind::kLin,
                   0,
                   {{.identifier = 0x11, .type = kLinData, .payload = Counting(8)},
                    {.identifier = 0x10, .type = kLinData, .payload = {0x12, 0x34}},
                    {.identifier = 0x12, .type = 0x42}},
                   {24, 24, 24},
                   2},
        LayoutCase{
            "FlexRay",
            driver::BusKind::kFlexRay,
            0,
            {{.identifier = 40, .type = kFlexRayData, .flags = 0x20, .payload = Counting(32)},
             {.identifier = 1, .type = kFlexRayData, .flags = 0x13, .payload = Counting(16)},
             {.identifier = 3, .type = 0x21, .payload = Counting(8)}},
            {48, 32, 24},
            1}),
    [](const ::testing::TestParamInfo<LayoutCase>& info) { return std::string(info.param.what); });

// The names are taken as the host gave them (with none the channel is /''/''); echo frames are
// logged only while transmitted frames are wanted; each run replaces the file of the one before.
TEST_F(VoraLogTest, NamesEchoFramesAndRepeatedRuns) {
  const std::vector<uint8_t> batch =
      Batch({{.identifier = 0x100, .payload = Counting(8)},
             {.identifier = 0x7FF, .flags = 0x80, .payload = Counting(8)}});
  for (const auto& [group, channel, logTransmitted] :
       std::vector<std::tuple<std::string, std::string, uint8_t>>{{"", "", 0},
                                                                  {"Body bus", "CAN1 @ 500k", 1},
                                                                  {"a/b", "50%", 0},
                                                                  {"it's", ".hidden", 1}}) {
    settings().voraGroupName.set(group);
    settings().voraChannelName.set(channel);
    settings().logTransmittedFrames.store(logTransmitted);
    RunWith({batch});
    const std::optional<ChannelContents> contents = Channel(".vora");
    ASSERT_TRUE(contents);
    EXPECT_EQ(contents->channel.group, group);
    EXPECT_EQ(contents->channel.name, channel);
    EXPECT_EQ(contents->bytes.size(), logTransmitted ? 48u : 24u) << group;
  }
  EXPECT_EQ(VoraChannelPath("", ""), "/''/''");
}

// A file the library cannot create (its directory is a file) is silent: the run logs nothing.
TEST_F(VoraLogTest, FileTheLibraryCannotOpenIsSilentAndSkipsTheRun) {
  settings().logFileName.set("blocked");
  fs::create_directories(ServiceDirectory() / "blocked.vora");
  RunWith({Batch({{.identifier = 0x100}})});
  EXPECT_TRUE(SentMessages().empty());
  EXPECT_EQ(log().voraFile, -1);
  EXPECT_TRUE(fs::is_directory(ServiceDirectory() / "blocked.vora"));
}

// The naming failure reports -20; the library is then asked for the empty path, which it refuses.
TEST_F(VoraLogTest, ServiceDirectoryThatCannotBeMadeReportsOnlyTheNamingFailure) {
  drive_.WriteFile("QV-RT\\tarvix", "not a directory");
  RunWith({Batch({{.identifier = 0x100}})});
  EXPECT_EQ(SentErrorTexts(), std::vector<std::string>{LogErrorText(kLogOpenFailed)});
}

// Calls into a library that went away fail as the library's own failures do: once per batch, and
// the close gives the handle up.
TEST_F(VoraLogTest, LibraryUnloadedDuringTheRunReportsEachBatchAndTheClose) {
  OpenLogFile(log(), kHeader);
  ASSERT_NE(log().voraFile, -1);
  UnloadMeasurementLibrary();
  const std::vector<uint8_t> batch = Batch({{.identifier = 0x100}, {.identifier = 0x101}});
  Write(batch);
  Write(batch);
  CloseLogFile(log());
  EXPECT_EQ(SentErrorTexts(), std::vector<std::string>(3, LogErrorText(kLogLibraryFailed)));
  EXPECT_EQ(log().voraFile, -1);
  CloseLogFile(log());
  EXPECT_TRUE(SentMessages().empty());
}

}  // namespace
}  // namespace kvtest
