// Type 2 logs of live CAN, LIN and FlexRay sessions, read back with vora-dump's reader.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <string>
#include <tuple>
#include <vector>

#include "logging/BinaryLogFormat.h"
#include "logging/MeasurementLibrary.h"
#include "tests/logging/LogRunFixture.h"
#include "tests/voralog/VoraSupport.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;
namespace fs = std::filesystem;

class VoraOverTcpTest : public LogRunTest {
 protected:
  void SetUp() override {
    LogRunTest::SetUp();
    LocateMeasurementLibrary();
  }
  void TearDown() override {
    LogRunTest::TearDown();
    UnloadMeasurementLibrary();
  }
};

struct BusCase {
  const char* what;
  std::vector<std::string> properties;  // the port and its settings
  uint8_t recordType;
  BinaryRecordLayout layout;
  driver::BusKind bus;
  std::map<uint32_t, uint32_t> recordSizes;  // identifier -> bytes of its record
  int64_t protocol;
  std::vector<uint32_t> rare{};  // identifiers that a short run may miss (bus errors once a second)
};

void PrintTo(const BusCase& c, std::ostream* os) { *os << c.what; }

class VoraBusTest : public VoraOverTcpTest, public ::testing::WithParamInterface<BusCase> {};

// The channel holds exactly the records of the binary log of the bus, under the names and with the
// properties that the host gave (vora-dump and vora.dll's own tests read such files with HDF5).
TEST_P(VoraBusTest, LogHoldsTheBusRecordsUnderTheGivenNames) {
  const BusCase& c = GetParam();
  InstallLibrary(drive_);
  std::vector<std::string> properties = c.properties;
  for (const char* p : {"SET_PROP_LOGFILE_NAME=run", "SET_PROP_LOGFILE_TYPE=2",
                        "SET_PROP_LOGFILE_VORA_GROUP_NAME=Bus",
                        "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=Frames", "SET_PROP_LOGFILE=1"}) {
    properties.push_back(p);
  }
  EXPECT_TRUE(Run(properties, c.recordType).empty());

  const auto channel = OnlyChannel(LogPath("run.vora"));
  ASSERT_TRUE(channel);
  const auto& [info, bytes] = *channel;
  EXPECT_EQ(info.group, "Bus");
  EXPECT_EQ(info.name, "Frames");
  ExpectFrameProperties(info, c.protocol);
  ASSERT_GT(bytes.size(), 0u);
  EXPECT_TRUE(RecordsAreConsistent(bytes.data(), bytes.size(), c.layout, c.bus));

  size_t remaining = 1;
  const std::vector<driver::RawFrameView> frames =
      ReadRecords(bytes.data(), bytes.size(), c.layout, &remaining);
  std::map<uint32_t, int> counted;
  for (const driver::RawFrameView& frame : frames) {
    const auto size = c.recordSizes.find(frame.header.identifier);
    ASSERT_NE(size, c.recordSizes.end()) << std::hex << frame.header.identifier;
    EXPECT_EQ(BinaryRecordSize(c.layout, frame.header), size->second)
        << std::hex << frame.header.identifier;
    ++counted[frame.header.identifier];
  }
  EXPECT_EQ(remaining, 0u);
  for (const auto& [identifier, size] : c.recordSizes) {
    if (std::find(c.rare.begin(), c.rare.end(), identifier) == c.rare.end()) {
      EXPECT_GT(counted[identifier], 0) << std::hex << identifier;
    }
  }
}

constexpr uint32_t kExtended = 0x20000000;

INSTANTIATE_TEST_SUITE_P(
    DefaultHardware, VoraBusTest,
    ::testing::Values(
        BusCase{"ClassicCan",
                {"SET_PROP_SESSION_PORTNAME=CAN1"},
                kvhost::kCanRecords,
                BinaryRecordLayout::kFixed24,
                driver::BusKind::kCan,
                {{0x100, 24}, {0x1A0, 24}, {0x321, 24}, {kExtended | 0x18FEF100, 24}, {0, 24}},
                0,
                {0}},
        BusCase{"CanFd",
                {"SET_PROP_SESSION_PORTNAME=CAN5"},
                kvhost::kCanRecords,
                BinaryRecordLayout::kCanVariable,
                driver::BusKind::kCan,
                {{0x200, 80}, {0x201, 32}, {kExtended | 0x1ABCDE00, 32}, {0x080, 24}},
                0},
        BusCase{"Lin",
                {"SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_BAUDRATE=19200",
                 "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1"},
                kvhost::kLinRecords,
                BinaryRecordLayout::kFixed24,
                driver::BusKind::kLin,
                {{0x10, 24}, {0x11, 24}, {0x12, 24}, {0x13, 24}},
                2},
        BusCase{"FlexRay",
                {"SET_PROP_SESSION_PORTNAME=FlexRay1"},
                kvhost::kFlexRayRecords,
                BinaryRecordLayout::kFlexRayVariable,
                driver::BusKind::kFlexRay,
                {{1, 32}, {2, 32}, {3, 24}, {40, 48}},
                1}),
    [](const ::testing::TestParamInfo<BusCase>& info) { return std::string(info.param.what); });

TEST_F(VoraOverTcpTest, MissingLibraryIsReportedOnceAndLoadedByALaterSessionOnceInstalled) {
  const std::vector<std::string> properties = {"SET_PROP_SESSION_PORTNAME=CAN1",
                                               "SET_PROP_LOGFILE_NAME=late",
                                               "SET_PROP_LOGFILE_TYPE=2", "SET_PROP_LOGFILE=1"};
  EXPECT_EQ(Run(properties, kvhost::kCanRecords),
            std::vector<std::string>{"<ERROR:LOG FILE: -24> \n"});
  EXPECT_FALSE(fs::exists(LogPath("late.vora")));
  InstallLibrary(drive_);
  EXPECT_TRUE(Run(properties, kvhost::kCanRecords).empty());
  const auto channel = OnlyChannel(LogPath("late.vora"));
  ASSERT_TRUE(channel);
  EXPECT_GT(channel->bytes.size(), 0u);
  EXPECT_EQ(channel->bytes.size() % 24, 0u);
}

// Two sessions load the library together and write their own files at the same time.
TEST_F(VoraOverTcpTest, TwoSessionsLogAtOnceEachToItsOwnFile) {
  InstallLibrary(drive_);
  std::vector<std::string> errors;
  kvhost::HostClient can = Configured(
      {"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=can", "SET_PROP_LOGFILE_TYPE=2",
       "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=CAN1", "SET_PROP_LOGFILE=1"},
      errors);
  kvhost::HostClient lin =
      Configured({"SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_BAUDRATE=19200",
                  "SET_PROP_LOGFILE_NAME=lin", "SET_PROP_LOGFILE_TYPE=2",
                  "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=LIN1", "SET_PROP_LOGFILE=1"},
                 errors);
  WaitForRecords(can, kvhost::kCanRecords, errors);
  WaitForRecords(lin, kvhost::kLinRecords, errors);
  Terminate(can);
  Terminate(lin);
  EXPECT_TRUE(errors.empty());
  for (const auto& [file, name, protocol, bus] :
       {std::tuple{"can.vora", "CAN1", 0, driver::BusKind::kCan},
        std::tuple{"lin.vora", "LIN1", 2, driver::BusKind::kLin}}) {
    const auto channel = OnlyChannel(LogPath(file));
    ASSERT_TRUE(channel) << file;
    EXPECT_EQ(channel->channel.name, name);
    EXPECT_EQ(channel->channel.IntegerProperty("QV_network_protocol"), protocol);
    EXPECT_GT(channel->bytes.size(), 0u);
    EXPECT_TRUE(RecordsAreConsistent(channel->bytes.data(), channel->bytes.size(),
                                     BinaryRecordLayout::kFixed24, bus))
        << file;
  }
}

}  // namespace
}  // namespace kvtest
