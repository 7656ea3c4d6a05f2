// Type 2 logs of a session written through the real vora.dll: names, echo frames, repeated runs and
// failures (the records of each bus are checked over TCP).
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

// The names are taken as the host gave them (with none the channel is /''/''); echo frames are
// logged only while transmitted frames are wanted; each run replaces the file of the one before.
TEST_F(VoraLogTest, NamesEchoFramesAndRepeatedRuns) {
  const std::vector<uint8_t> batch =
      Batch({{.identifier = 0x100, .payload = Counting(8)},
             {.identifier = 0x7FF, .flags = 0x80, .payload = Counting(8)}});
  for (const auto& [group, channel, logTransmitted] :
       std::vector<std::tuple<std::string, std::string, uint8_t>>{{"", "", 0}, {"a/b", "50%", 1}}) {
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
