// A host monitors the simulated CAN buses over TCP: records, payloads, time stamps, statistics.
#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Status.h"
#include "tarvix/TarvixControl.h"
#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using Payload = std::vector<uint8_t>;

const std::string kCan1 = "SET_PROP_SESSION_PORTNAME=CAN1";
const std::string kCan2 = "SET_PROP_SESSION_PORTNAME=CAN2";
const std::string kNormal = "SET_PROP_SESSION_RUNMODE=NORMAL";
const std::string kBusErrors = "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=1";

constexpr uint32_t kBodyExtended = 0x18FEF100 | kExtendedFlag;
constexpr uint64_t kUnitsPerMs = 10000;  // time stamps count 100 ns units
constexpr uint64_t kUnixEpochIn1601Units = 116444736000000000ull;

uint64_t NowIn1601Units() {
  const auto since1970 = std::chrono::system_clock::now().time_since_epoch();
  return kUnixEpochIn1601Units +
         std::chrono::duration_cast<std::chrono::microseconds>(since1970).count() * 10;
}

// Bus load in 0.01 % units of the default body traffic at 500 kbit/s: the mean of the durations
// with and without worst-case stuff bits of 100 standard 8-byte, 20 standard 3-byte and 10
// extended 8-byte frames per second.
uint32_t BodyBusLoad() {
  auto meanMicroseconds = [](uint32_t bits) {
    const double stuffed = bits + (bits - 12) / 5;
    return (stuffed + bits) / 2 / 500000.0 * 1e6;
  };
  const double busTimePerSecond = 100 * meanMicroseconds(47 + 64) + 20 * meanMicroseconds(47 + 24) +
                                  10 * meanMicroseconds(67 + 64);
  return 10 * static_cast<uint32_t>(busTimePerSecond / 1000.0);
}

using CanSessionTest = BusSessionTest;

// Consecutive frames lie one period apart in bus time, and counts grow at the periods' ratios.
TEST_F(CanSessionTest, CountsAndTimeStampsFollowThePeriods) {
  kvhost::HostClient host = StartedHost({kCan1, "SET_PROP_TX_TIME_DATA=200"});
  auto first = RecordsWhere(host, AllFour);
  ASSERT_TRUE(first.has_value());
  // Wait for enough of the slowest identifier (500 ms) to compare the rates.
  auto later = RecordsWhere(host, [&](const RecordMessage& m) {
    const auto* r = m.find(0x321, kTypeRemote);
    return r != nullptr && r->count >= first->find(0x321, kTypeRemote)->count + 4;
  });
  ASSERT_TRUE(later.has_value());
  auto grown = [&](uint32_t id, int type = kTypeData) {
    return double(later->find(id, type)->count - first->find(id, type)->count);
  };
  const double remote = grown(0x321, kTypeRemote);  // every 500 ms
  EXPECT_NEAR(grown(0x100) / remote, 50.0, 10.0);
  EXPECT_NEAR(grown(0x1A0) / remote, 10.0, 2.5);
  EXPECT_NEAR(grown(kBodyExtended) / remote, 5.0, 1.5);
  // Arbitration may shift one frame of 0x100 (every 10 ms) a little.
  const auto* counter = later->find(0x100);
  EXPECT_NEAR(double(counter->lastTimestamp - counter->previousTimestamp), 10.0 * kUnitsPerMs,
              1.0 * kUnitsPerMs);
  EXPECT_NEAR(double(counter->lastTimestamp), double(NowIn1601Units()), 60e3 * kUnitsPerMs);
}

TEST_F(CanSessionTest, BusErrorFramesAppearOnlyWhenTheHostAsksForThem) {
  kvhost::HostClient quiet = StartedHost({kCan1});
  kvhost::HostClient logging = StartedHost({kCan2, kBusErrors});
  auto withErrors = RecordsWhere(
      logging, [](const RecordMessage& m) { return m.find(0, kTypeBusError) != nullptr; });
  ASSERT_TRUE(withErrors.has_value());
  EXPECT_EQ(withErrors->find(0, kTypeBusError)->payloadLength, 0u);
  // Once the bus has run for two seconds the quiet host has seen more than one error frame go by.
  auto quietLater = RecordsWhere(quiet, [](const RecordMessage& m) {
    const auto* r = m.find(0x321, kTypeRemote);
    return r != nullptr && r->count >= 5;
  });
  ASSERT_TRUE(quietLater.has_value());
  EXPECT_EQ(quietLater->find(0, kTypeBusError), nullptr);
  EXPECT_EQ(quietLater->records.size(), 4u);
}

TEST_F(CanSessionTest, StatisticsShowFrameRatesAndTheBusLoadOfTheDefaultTraffic) {
  // A subordinate session learns the bit rate its frame durations take from the interface.
  kvhost::HostClient host = StartedHost({kCan1, kBusErrors});
  ASSERT_TRUE(NextStatistics(host).has_value());  // the first period began with the session
  auto statistics = NextStatistics(host);
  ASSERT_TRUE(statistics.has_value());
  EXPECT_NEAR(statistics->standardFramesPerSecond, 120.0, 12.0);
  EXPECT_NEAR(statistics->extendedFramesPerSecond, 10.0, 2.0);
  EXPECT_NEAR(statistics->remoteFramesPerSecond, 2.0, 1.0);
  EXPECT_NEAR(statistics->errorFramesPerSecond, 1.0, 1.0);
  EXPECT_NEAR(statistics->busLoad, BodyBusLoad(), 30.0);
  EXPECT_GE(statistics->peakBusLoad, statistics->busLoad);
  EXPECT_GT(statistics->standardFrames, statistics->standardFramesPerSecond);
  EXPECT_EQ(statistics->faultCode, 0u);
}

// The database's rates replace the host's: read back as a host reads them, and an FD cluster's
// data rate gives its bus load. A bit rate without digits keeps the stored one.
TEST_F(CanSessionTest, DatabaseModeTakesTheRatesFromTheDatabase) {
  const struct {
    std::string port;
    std::string cluster;
    std::string rateReply;
  } cases[] = {
      {"CAN1", "Body", "<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n"},
      {"CAN5", "FD", "<ACK: SET_PROP_SESSION_CANFD_BAUDRATE 2000000> \n"},
      {"LIN1", "LIN", "<ACK: SET_PROP_SESSION_BAUDRATE 19200> \n"},
      {"FlexRay1", "FlexRay", "<ACK: SET_PROP_SESSION_BAUDRATE 10000000> \n"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.port);
    kvhost::HostClient host =
        StartedHost({"SET_PROP_SESSION_PORTNAME=" + c.port, kNormal, "SET_PROP_SESSION_ALIAS=SimDB",
                     "SET_PROP_SESSION_CLUSTER=" + c.cluster, "SET_PROP_SESSION_BAUDRATE=9600"});
    const std::string query = c.rateReply.substr(6, c.rateReply.find(' ', 6) - 6) + "=?";
    ExpectReply(host, query, c.rateReply);
    if (c.port.starts_with("CAN")) {
      ASSERT_TRUE(NextStatistics(host).has_value());  // the first period began with the session
      auto statistics = NextStatistics(host);
      ASSERT_TRUE(statistics.has_value());
      EXPECT_GT(statistics->busLoad, 0u);
    }
    ExpectReply(host, "CMD_SESSION_TERMINATE", "<ACK: CMD_SESSION_TERMINATE>\n");
  }
}

// A refused I/O mode is acknowledged with the one kept.
TEST_F(CanSessionTest, RefusedIoModeKeepsTheSessionsOwn) {
  kvhost::HostClient host =
      StartedHost({kCan1, kNormal, "SET_PROP_SESSION_ALIAS=SimDB", "SET_PROP_SESSION_CLUSTER=Body",
                   "SET_PROP_SESSION_CAN_IOMODE=1"});
  ExpectReply(host, "SET_PROP_SESSION_CAN_IOMODE=9",
              "<ERROR: SET_PROP_SESSION_CAN_IOMODE: Value range error>\n", kvhost::kErrorText);
  auto kept = NextMessage(
      host, [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kText; });
  EXPECT_TRUE(kept && kept->text() == "<ACK: SET_PROP_SESSION_IOMODE 0> \n");
  EXPECT_TRUE(RecordsWhere(host, AllFour));
}

// A second node that wants the claimed address on the same bus fails its start.
TEST_F(CanSessionTest, J1939SessionClaimsItsAddressAndSeesExtendedFramesAsJ1939) {
  const std::vector<std::string> j1939 = {"SET_PROP_SESSION_APPLICATION_PROTOCOL=1",
                                          "SET_PROP_SESSION_NODE_ADDRESS=128"};
  tarvix::StartRecording();
  kvhost::HostClient host = StartedHost({kCan1, j1939[0], j1939[1]});
  auto message = RecordsWhere(host, [](const RecordMessage& m) {
    return m.find(kBodyExtended, 0xC0) != nullptr && m.find(0x100) != nullptr;
  });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->find(kBodyExtended, 0xC0)->payloadLength, 8u);
  const auto address = SetPropertyCalls("CAN1", driver::kPropJ1939NodeAddress);
  ASSERT_EQ(address.size(), 1u);
  EXPECT_EQ(address[0].value, (Payload{0x80, 0, 0, 0}));
  ExpectReply(host, "CMD_SESSION_READ_LAST_ERROR", "<CAN Error: 0>  <TCP Error: 0> \n");

  ExpectStartFails({kCan2, j1939[0], j1939[1]}, "<ERROR: -1074384374>\n");  // not claimed
  // A cluster without J1939 refuses the node name: the start reports the driver's status.
  ExpectStartFails({kCan2, kNormal, "SET_PROP_SESSION_ALIAS=SimDB", "SET_PROP_SESSION_CLUSTER=Body",
                    j1939[0], j1939[1]},
                   "<ERROR: -1074384848>\n");  // 0xBFF63030, unknown property
}

TEST_F(CanSessionTest, WrongBaudRateSeesOnlyBusErrorFrames) {
  kvhost::HostClient host =
      StartedHost({kCan1, kNormal, "SET_PROP_SESSION_BAUDRATE=250000", kBusErrors});
  auto message = RecordsWhere(host, [](const RecordMessage& m) {
    const auto* r = m.find(0, kTypeBusError);
    return r != nullptr && r->count > 20;
  });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->records.size(), 1u);
}

TEST_F(CanSessionTest, FullTableListsNoMoreIdentifiersButItsStatisticsCountTheWholeBus) {
  // The body bus has 4 identifiers; the bit rate gives the bus load.
  kvhost::HostClient full =
      StartedHost({kCan1, "SET_PROP_DATA_LOG_IDS_MAX=2", "SET_PROP_SESSION_BAUDRATE=500000"});
  kvhost::HostClient roomy =
      StartedHost({kCan2, "SET_PROP_DATA_LOG_IDS_MAX=1000", "SET_PROP_SESSION_BAUDRATE=500000"});
  auto message = RecordsWhere(
      full, [](const RecordMessage& m) { return !m.records.empty() && m.records[0].count > 50; });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->records.size(), 2u);
  EXPECT_EQ(message->header.idCount, 2u);

  // A full window of each: whichever two identifiers were left out, the rates are the bus's.
  ASSERT_TRUE(NextStatistics(full).has_value());
  ASSERT_TRUE(NextStatistics(roomy).has_value());
  auto a = NextStatistics(full);
  auto b = NextStatistics(roomy);
  ASSERT_TRUE(a.has_value() && b.has_value());
  EXPECT_NEAR(a->standardFramesPerSecond, b->standardFramesPerSecond, 12.0);
  EXPECT_NEAR(a->extendedFramesPerSecond, b->extendedFramesPerSecond, 2.0);
  EXPECT_NEAR(a->remoteFramesPerSecond, b->remoteFramesPerSecond, 1.0);
  EXPECT_NEAR(a->busLoad, b->busLoad, 30.0);
}

}  // namespace
}  // namespace kvtest
