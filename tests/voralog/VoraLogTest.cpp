// Type 2 logs of a session written through the real vora.dll, read back with the file reader.
#include "logging/VoraLog.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "host/voradump/VoraReader.h"
#include "logging/LogFile.h"
#include "logging/LogFileName.h"
#include "logging/LogWriters.h"
#include "logging/MeasurementLibrary.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/logging/LogSessionHarness.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;
namespace fs = std::filesystem;

constexpr char kDefaultBelowDrive[] = "Program Files\\Quovera\\Shared\\vora\\vora.dll";
constexpr char kHeader[] = "header";
constexpr uint8_t kCanData = 0x00;
constexpr uint8_t kCanFdData = 0x10;
constexpr uint8_t kLinData = 0x40;
constexpr uint8_t kFlexRayData = 0x20;

std::vector<uint8_t> Bytes(size_t count, uint8_t first) {
  std::vector<uint8_t> bytes(count);
  for (size_t i = 0; i < count; ++i) bytes[i] = static_cast<uint8_t>(first + i);
  return bytes;
}

// What a reader finds in one channel of a file.
struct ChannelContents {
  voradump::Channel channel;
  std::vector<uint8_t> bytes;
};

class VoraLogTest : public LogSessionTest {
 protected:
  void SetUp() override {
    LogSessionTest::SetUp();
    LocateMeasurementLibrary();
    settings().logFileType.store(kLogTypeMeasurementData);
  }
  void TearDown() override {
    LogSessionTest::TearDown();
    UnloadMeasurementLibrary();
  }

  void InstallLibrary() {
    const fs::path target = drive_.Native(kDefaultBelowDrive);
    fs::create_directories(target.parent_path());
    fs::copy_file(VORA_DLL_PATH, target, fs::copy_options::overwrite_existing);
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
      case kBusTypeLin: WriteLinLog(log(), batch.data(), bytes, frames); break;
      case kBusTypeFlexRay: WriteFlexRayLog(log(), batch.data(), bytes, frames); break;
      default: WriteCanLog(log(), batch.data(), bytes, frames); break;
    }
  }

  // The only channel of the file `name` in the service directory.
  std::optional<ChannelContents> OnlyChannel(const std::string& name) {
    std::string error;
    std::unique_ptr<voradump::VoraReader> reader =
        voradump::VoraReader::Open((ServiceDirectory() / name).string(), error);
    if (!reader) {
      ADD_FAILURE() << name << ": " << error;
      return std::nullopt;
    }
    const std::vector<voradump::Group> groups = reader->Groups();
    if (groups.size() != 1 || groups[0].channels.size() != 1) {
      ADD_FAILURE() << name << ": not one group with one channel";
      return std::nullopt;
    }
    ChannelContents contents{groups[0].channels[0], {}};
    EXPECT_TRUE(reader->ReadBytes(contents.channel, contents.bytes));
    return contents;
  }
};

struct LayoutCase {
  const char* what;
  uint32_t bus;
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
  InstallLibrary();
  UseBus(c.bus);
  settings().canIoMode.store(c.canIoMode);
  settings().logFileName.Set("layout");
  settings().voraGroupName.Set("Bus");
  settings().voraChannelName.Set("Frames");
  std::vector<uint8_t> batch;
  for (const FrameSpec& f : c.frames) AppendFrame(batch, f, 0xEE);
  RunWith({batch, batch});

  std::vector<uint8_t> expected;
  size_t at = 0;
  for (uint32_t size : c.recordSizes) {
    expected.insert(expected.end(), batch.begin() + at, batch.begin() + at + size);
    at += RawFrameSize(FirstView(std::vector<uint8_t>(batch.begin() + at, batch.end())).header);
  }
  expected.insert(expected.end(), expected.begin(), expected.end());

  const std::optional<ChannelContents> contents = OnlyChannel("layout.vora");
  ASSERT_TRUE(contents);
  EXPECT_EQ(contents->channel.group, "Bus");
  EXPECT_EQ(contents->channel.name, "Frames");
  EXPECT_EQ(contents->bytes, expected);
  EXPECT_EQ(contents->channel.IntegerProperty(kVoraPropertyByteOrder), 0);
  EXPECT_EQ(contents->channel.IntegerProperty(kVoraPropertyVersion), 512);
  EXPECT_EQ(contents->channel.IntegerProperty(kVoraPropertyProtocol), c.protocol);
  EXPECT_TRUE(SentMessages().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Buses, VoraLayoutTest,
    ::testing::Values(
        LayoutCase{"ClassicCan", kBusTypeCan, 0,
                   {{.identifier = 0x100, .type = kCanData, .payload = Bytes(8, 1)},
                    {.identifier = 0x1A0, .type = kCanData, .payload = Bytes(3, 0xAA)},
                    {.identifier = 0x321, .type = 0x01}},
                   {24, 24, 24}, 0},
        LayoutCase{"CanFd", kBusTypeCan, 1,
                   {{.identifier = 0x200, .type = kCanFdData, .payload = Bytes(64, 0)},
                    {.identifier = 0x201, .type = kCanFdData, .payload = Bytes(12, 0xA0)},
                    {.identifier = 0x080, .type = kCanData, .payload = Bytes(8, 0)}},
                   {80, 32, 24}, 0},
        LayoutCase{"Lin", kBusTypeLin, 0,
                   {{.identifier = 0x11, .type = kLinData, .payload = Bytes(8, 0)},
                    {.identifier = 0x10, .type = kLinData, .payload = {0x12, 0x34}},
                    {.identifier = 0x12, .type = 0x42}},
                   {24, 24, 24}, 2},
        LayoutCase{"FlexRay", kBusTypeFlexRay, 0,
                   {{.identifier = 40, .type = kFlexRayData, .flags = 0x20, .payload = Bytes(32, 0)},
                    {.identifier = 1, .type = kFlexRayData, .flags = 0x13, .payload = Bytes(16, 0)},
                    {.identifier = 3, .type = 0x21, .payload = Bytes(8, 0)}},
                   {48, 32, 24}, 1}),
    [](const ::testing::TestParamInfo<LayoutCase>& info) { return std::string(info.param.what); });

TEST_F(VoraLogTest, EchoFramesAreLoggedOnlyWhenTransmittedFramesAreWanted) {
  InstallLibrary();
  const std::vector<uint8_t> batch =
      Batch({{.identifier = 0x100, .payload = Bytes(8, 0)}, {.identifier = 0x7FF, .flags = 0x80, .payload = Bytes(8, 0)}});
  for (uint8_t logTransmitted : {0, 1}) {
    settings().logTransmittedFrames.store(logTransmitted);
    RunWith({batch});
    const std::optional<ChannelContents> contents = OnlyChannel(".vora");
    ASSERT_TRUE(contents);
    EXPECT_EQ(contents->bytes.size(), logTransmitted ? 48u : 24u);
  }
}

// The names are taken as the host gave them; with none the channel is /''/''.
TEST_F(VoraLogTest, GroupAndChannelNamesReachTheFileUnchanged) {
  InstallLibrary();
  for (const auto& [group, channel] : std::vector<std::pair<std::string, std::string>>{
           {"", ""}, {"Body bus", "CAN1 @ 500k"}, {"a/b", "50%"}, {"it's", ".hidden"}}) {
    settings().voraGroupName.Set(group);
    settings().voraChannelName.Set(channel);
    RunWith({Batch({{.identifier = 0x100, .payload = Bytes(8, 0)}})});
    const std::optional<ChannelContents> contents = OnlyChannel(".vora");
    ASSERT_TRUE(contents);
    EXPECT_EQ(contents->channel.group, group);
    EXPECT_EQ(contents->channel.name, channel);
    EXPECT_EQ(contents->bytes.size(), 24u);
  }
  EXPECT_EQ(VoraChannelPath("", ""), "/''/''");
}

// A file the library cannot create (its directory is a file) is silent: the run logs nothing.
TEST_F(VoraLogTest, FileTheLibraryCannotOpenIsSilentAndSkipsTheRun) {
  InstallLibrary();
  settings().logFileName.Set("blocked");
  fs::create_directories(ServiceDirectory() / "blocked.vora");
  RunWith({Batch({{.identifier = 0x100}})});
  EXPECT_TRUE(SentMessages().empty());
  EXPECT_EQ(log().voraFile, -1);
  EXPECT_TRUE(fs::is_directory(ServiceDirectory() / "blocked.vora"));
}

// The naming failure reports -20; the library is then asked for the empty path, which it refuses.
TEST_F(VoraLogTest, ServiceDirectoryThatCannotBeMadeReportsOnlyTheNamingFailure) {
  InstallLibrary();
  drive_.WriteFile("QV-RT\\tarvix", "not a directory");
  RunWith({Batch({{.identifier = 0x100}})});
  EXPECT_EQ(SentErrorTexts(), std::vector<std::string>{LogErrorText(kLogOpenFailed)});
}

TEST_F(VoraLogTest, SecondRunWithTheSameNameReplacesTheFile) {
  InstallLibrary();
  settings().logFileName.Set("again");
  RunWith({Batch({{.identifier = 0x100}, {.identifier = 0x101}, {.identifier = 0x102}})});
  settings().voraChannelName.Set("second");
  RunWith({Batch({{.identifier = 0x200}})});
  const std::optional<ChannelContents> contents = OnlyChannel("again.vora");
  ASSERT_TRUE(contents);
  EXPECT_EQ(contents->channel.name, "second");
  EXPECT_EQ(contents->bytes.size(), 24u);
}

// Calls into a library that went away fail as the library's own failures do: once per batch, and
// the close gives the handle up.
TEST_F(VoraLogTest, LibraryUnloadedDuringTheRunReportsEachBatchAndTheClose) {
  InstallLibrary();
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
