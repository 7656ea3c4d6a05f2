// A host monitors the simulated LIN bus over TCP: no-response frames, checksums and statistics.
#include <gtest/gtest.h>

#include <set>

#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using Payload = std::vector<uint8_t>;
using Record = kvhost::IdentifierRecord;
using LinFlexRayTest = BusSessionTest;
using LinStatistics = kvhost::LinStatisticsView;

constexpr uint8_t kLinData = 0x40;
constexpr uint8_t kLinNoResponse = 0x42;
constexpr uint8_t kLinBusError = 0x41;
constexpr uint8_t kEnhancedChecksumFlag = 0x01;
// Enhanced checksums of the schedule's constant frames: the inverted carry-wrapping sum of the
// protected identifier (0x50, 0xD3) and the data bytes.
constexpr uint32_t kChecksum0x10 = 0x69;
constexpr uint32_t kChecksum0x13 = 0xF0;

const std::string kPort = "SET_PROP_SESSION_PORTNAME=LIN1";
const std::string kNormal = "SET_PROP_SESSION_RUNMODE=NORMAL";

bool Has(const RecordMessage& m, std::initializer_list<uint32_t> identifiers) {
  for (uint32_t identifier : identifiers) {
    if (m.find(identifier) == nullptr) return false;
  }
  return true;
}

TEST_F(LinFlexRayTest, NoResponseFramesChecksumsAndStatisticsAsTheDriverSendsThem) {
  kvhost::HostClient host = StartedHost(
      {kPort, "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1", "SET_PROP_SESSION_LOG_CHECKSUM=1"});
  auto message = RecordsWhere(host, [](const RecordMessage& m) {
    return Has(m, {0x10, 0x11, 0x12, 0x13});
  });
  ASSERT_TRUE(message.has_value());
  ASSERT_EQ(message->records.size(), 4u);
  const Record& silent = *message->find(0x12);
  EXPECT_EQ(silent.type, kLinNoResponse);
  EXPECT_EQ(silent.payloadLength, 0u);
  EXPECT_EQ(message->find(0x10)->checksum, kChecksum0x10);
  EXPECT_EQ(message->find(0x13)->checksum, kChecksum0x13);
  EXPECT_EQ(message->find(0x13)->flag, kEnhancedChecksumFlag);

  // 100 slots per second: 75 answered, 25 without response. A window on a busy machine may be
  // cut short, so a report within a few frames of the schedule is waited for.
  auto statistics =
      StatisticsWhere<LinStatistics>(host, kvhost::DecodeLinStatistics, [](const LinStatistics& s) {
        return s.dataFramesPerSecond >= 70 && s.dataFramesPerSecond <= 80 &&
               s.noResponseFramesPerSecond >= 22 && s.noResponseFramesPerSecond <= 28;
      });
  ASSERT_TRUE(statistics.has_value());
  EXPECT_EQ(statistics->errorFrames, 0u);
  EXPECT_EQ(statistics->errorFramesPerSecond, 0u);
  EXPECT_EQ(statistics->faultCode, 0u);
  EXPECT_EQ(statistics->stateBits0to7 & 1, 1u) << "communicating";
  EXPECT_EQ(statistics->stateBits2to3, 1u) << "active";
  EXPECT_EQ(statistics->stateBit1, 0u);
  EXPECT_EQ(statistics->stateBit31, 0u) << "running";
  EXPECT_EQ(statistics->stateBits4to7, 2u) << "last error: no response";
  EXPECT_EQ(statistics->stateBits8to15, 0x12u) << "identifier of the last error";
  EXPECT_LT(statistics->stateBits24to29, 4u) << "a slot of the four-slot schedule";
  EXPECT_EQ(statistics->stateBits0to7 & 0xF0, statistics->stateBits4to7 << 4);
  EXPECT_GT(statistics->dataFrames, statistics->noResponseFrames);
}

// One identifier that answers in one slot and stays silent in the next: one entry whose count
// covers both and whose type and payload are those of its last frame.
TEST_F(LinFlexRayTest, IdentifierOfBothTypesKeepsOneEntryOfItsLastFrame) {
  std::string error;
  ASSERT_TRUE(tarvix::LoadConfiguration(R"({
    "buses": [{"name": "lin", "protocol": "LIN", "slotMs": 10, "schedule": [
      {"id": "0x20", "length": 2, "payload": "AB CD"}, {"id": "0x20", "response": false}]}],
    "devices": [{"name": "SIM-LIN", "interfaces": [{"name": "LIN1", "bus": "lin", "port": 1}]}]
  })",
                                        ".", &error))
      << error;
  kvhost::HostClient host = StartedHost({kPort, "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1"});

  std::set<uint8_t> typesSeen;
  auto message = RecordsWhere(host, [&](const RecordMessage& m) {
    EXPECT_EQ(m.records.size(), 1u);
    const Record& r = m.records.front();
    if (r.type == kLinData) {
      EXPECT_EQ(r.payload, (Payload{0xAB, 0xCD}));
    }
    if (r.type == kLinNoResponse) {
      EXPECT_EQ(r.payloadLength, 0u);
    }
    typesSeen.insert(r.type);
    return typesSeen.size() == 2;
  });
  EXPECT_TRUE(message.has_value()) << "the entry never showed both types";
  auto statistics = StatisticsWhere<LinStatistics>(
      host, kvhost::DecodeLinStatistics,
      [](const LinStatistics& s) { return s.dataFrames > 0 && s.noResponseFrames > 0; });
  EXPECT_TRUE(statistics.has_value());
}

// ":memory:" runs at the host's baud rate: at the wrong one the interface sees bus-error frames,
// which enter the table and the counters only when the host asked for them.
TEST_F(LinFlexRayTest, BuiltInModeAtTheWrongBaudRateSeesOnlyBusErrors) {
  kvhost::HostClient quiet = StartedHost({kPort, kNormal, "SET_PROP_SESSION_BAUDRATE=9600"});
  kvhost::HostClient errors =
      StartedHost({"SET_PROP_SESSION_PORTNAME=LIN2", kNormal, "SET_PROP_SESSION_BAUDRATE=9600",
                   "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=1"});
  auto message = RecordsWhere(errors, [](const RecordMessage& m) { return !m.records.empty(); });
  ASSERT_TRUE(message.has_value());
  ASSERT_EQ(message->records.size(), 1u);
  EXPECT_EQ(message->records[0].type, kLinBusError);
  auto counted =
      StatisticsWhere<LinStatistics>(errors, kvhost::DecodeLinStatistics,
                                     [](const LinStatistics& s) { return s.errorFrames > 0; });
  ASSERT_TRUE(counted.has_value());
  EXPECT_EQ(counted->dataFrames, 0u);

  // The quiet host gets statistics with nothing counted and never a record message.
  auto first = StatisticsWhere<LinStatistics>(quiet, kvhost::DecodeLinStatistics);
  auto second = NextMessage(quiet, [](const kvhost::HostMessage& m) {
    EXPECT_NE(m.header.type, kvhost::kLinRecords);
    return m.header.type == kvhost::kStatistics;
  });
  ASSERT_TRUE(first.has_value());
  ASSERT_TRUE(second.has_value());
  auto later = kvhost::DecodeLinStatistics(second->payload);
  ASSERT_TRUE(later.has_value());
  EXPECT_EQ(later->errorFrames + later->dataFrames, 0u);
  EXPECT_EQ(later->stateBits4to7, 1u) << "last error: bit rate";
}

}  // namespace
}  // namespace kvtest
