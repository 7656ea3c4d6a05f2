// A host monitors the simulated CAN buses over TCP: records, payloads, time stamps, statistics.
#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Status.h"
#include "tarvix/TarvixControl.h"
#include "tests/session/CanSessionFixture.h"

namespace kvtest {
namespace {

using nKV_DLL300::SessionSettings;
using Payload = std::vector<uint8_t>;

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

TEST_F(CanSessionTest, BodyBusShowsItsIdentifiersSortedWithPayloadsAndTimeStamps) {
  kvhost::HostClient host = StartedHost(0, "CAN1");
  auto message = RecordsWhere(host, AllFour);
  ASSERT_TRUE(message.has_value());

  const std::vector<uint32_t> sorted = {0x100, 0x1A0, 0x321, kBodyExtended};
  for (size_t i = 0; i < sorted.size(); ++i) EXPECT_EQ(message->records[i].identifier, sorted[i]);
  EXPECT_EQ(message->header.idCount, 4u);

  const auto* counter = message->find(0x100);
  ASSERT_NE(counter, nullptr);
  ASSERT_EQ(counter->payload.size(), 8u);
  EXPECT_EQ(Payload(counter->payload.begin() + 1, counter->payload.end()),
            (Payload{1, 2, 3, 4, 5, 6, 7}));
  const auto* short3 = message->find(0x1A0);
  ASSERT_NE(short3, nullptr);
  EXPECT_EQ(short3->payload, (Payload{0xAA, 0xBB, 0xCC}));
  const auto* remote = message->find(0x321, kTypeRemote);
  ASSERT_NE(remote, nullptr);
  EXPECT_EQ(remote->payloadLength, 0u);
  const auto* extended = message->find(kBodyExtended);
  ASSERT_NE(extended, nullptr);
  EXPECT_EQ(extended->payload, (Payload{0x00, 0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77}));

  // Consecutive frames of 0x100 lie one 10 ms period apart (arbitration may shift one a little).
  auto laterMessage = RecordsWhere(host, [](const RecordMessage& m) {
    const auto* r = m.find(0x1A0);
    return r != nullptr && r->count > 1;
  });
  ASSERT_TRUE(laterMessage.has_value());
  const auto* later = laterMessage->find(0x100);
  ASSERT_NE(later, nullptr);
  EXPECT_NEAR(double(later->lastTimestamp - later->previousTimestamp), 10.0 * kUnitsPerMs,
              1.0 * kUnitsPerMs);
  EXPECT_NEAR(double(later->lastTimestamp), double(NowIn1601Units()), 60e3 * kUnitsPerMs);
  EXPECT_EQ(later->echo, 0);
}

TEST_F(CanSessionTest, CountsGrowAtTheirPeriods) {
  kvhost::HostClient host = StartedHost(0, "CAN1", [](SessionSettings& s) { s.txTimeData = 200; });
  auto first = RecordsWhere(host, AllFour);
  ASSERT_TRUE(first.has_value());
  // Wait for enough of the slowest identifier (500 ms) to compare the rates.
  auto later = RecordsWhere(host, [&](const RecordMessage& m) {
    const auto* r = m.find(0x321, kTypeRemote);
    return r != nullptr && r->count >= first->find(0x321, kTypeRemote)->count + 4;
  });
  ASSERT_TRUE(later.has_value());
  auto grown = [&](uint32_t id, uint8_t type = kTypeData) {
    return double(later->find(id, type)->count - first->find(id, type)->count);
  };
  const double remote = grown(0x321, kTypeRemote);  // every 500 ms
  EXPECT_NEAR(grown(0x100) / remote, 50.0, 10.0);
  EXPECT_NEAR(grown(0x1A0) / remote, 10.0, 2.5);
  EXPECT_NEAR(grown(kBodyExtended) / remote, 5.0, 1.5);
}

TEST_F(CanSessionTest, BusErrorFramesAppearOnlyWhenTheHostAsksForThem) {
  kvhost::HostClient quiet = StartedHost(0, "CAN1");
  kvhost::HostClient logging =
      StartedHost(1, "CAN2", [](SessionSettings& s) { s.logBusErrorFrames = 1; });
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
  kvhost::HostClient host =
      StartedHost(0, "CAN1", [](SessionSettings& s) { s.logBusErrorFrames = 1; });
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

TEST_F(CanSessionTest, FdSessionOnCan5SeesFdFramesAtTheDataRate) {
  tarvix::StartRecording();
  kvhost::HostClient host = StartedHost(0, "CAN5", [](SessionSettings& s) {
    s.runMode.set("NORMAL");
    s.canIoMode = 2;
    s.baudRate = 500000;
    s.canFdBaudRate = 2000000;
  });
  auto message = RecordsWhere(host, AllFour);
  ASSERT_TRUE(message.has_value());
  const auto* brs = message->find(0x200, 0x18);
  ASSERT_NE(brs, nullptr);
  Payload ramp(64);
  for (uint8_t i = 0; i < 64; ++i) ramp[i] = i;
  EXPECT_EQ(brs->payload, ramp);
  const auto* plain = message->find(0x201, 0x10);
  ASSERT_NE(plain, nullptr);
  EXPECT_EQ(plain->payloadLength, 12u);
  const auto* extended = message->find(0x1ABCDE00 | kExtendedFlag, 0x18);
  ASSERT_NE(extended, nullptr);
  EXPECT_EQ(extended->payloadLength, 16u);
  EXPECT_NE(message->find(0x080), nullptr);

  bool dataRateSet = false;
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation == "kxCreateSession" && call.status == 0 && call.interfaceName == "CAN5") {
      EXPECT_EQ(call.texts.at(0), ":can_fd_brs:");
    }
    if (call.operation == "kxSetProperty" && call.id == driver::kPropCanFdBaudRate) {
      uint64_t rate = 0;
      std::memcpy(&rate, call.value.data(), sizeof rate);
      dataRateSet = rate == 2000000;
    }
  }
  EXPECT_TRUE(dataRateSet);
  auto statistics = NextStatistics(host);
  ASSERT_TRUE(statistics.has_value());
  EXPECT_GT(statistics->busLoad, 0u);
}

TEST_F(CanSessionTest, DatabaseModeTakesBaudRateAndIoModeFromTheDatabase) {
  kvhost::HostClient host = StartedHost(0, "CAN1", [](SessionSettings& s) {
    s.runMode.set("NORMAL");
    s.alias.set("SimDB");
    s.cluster.set("Body");
    s.baudRate = 125000;
    s.canIoMode = 1;
  });
  // Read back as a host reads them, not from the service's slots: a bit rate without digits keeps
  // the stored one, and a refused I/O mode is acknowledged with the one kept.
  ExpectReply(host, "SET_PROP_SESSION_BAUDRATE=?", "<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n");
  ExpectReply(host, "SET_PROP_SESSION_CAN_IOMODE=9",
              "<ERROR: SET_PROP_SESSION_CAN_IOMODE: Value range error>\n", kvhost::kErrorText);
  auto kept = NextMessage(
      host, [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kText; });
  EXPECT_TRUE(kept && kept->text() == "<ACK: SET_PROP_SESSION_IOMODE 0> \n");
  EXPECT_TRUE(RecordsWhere(host, AllFour));
}

// The data bit rate comes from the database too, so an FD cluster's bus load is known.
TEST_F(CanSessionTest, DatabaseModeOnAnFdClusterShowsTheBusLoad) {
  kvhost::HostClient host = StartedHost(0, "CAN5", [](SessionSettings& s) {
    s.runMode.set("NORMAL");
    s.alias.set("SimDB");
    s.cluster.set("FD");
  });
  EXPECT_EQ(ConnectionAt(0).settings.canFdBaudRate.load(), 2000000u);
  ASSERT_TRUE(NextStatistics(host).has_value());  // the first period began with the session
  auto statistics = NextStatistics(host);
  ASSERT_TRUE(statistics.has_value());
  EXPECT_GT(statistics->busLoad, 0u);
}

// A second node that wants the claimed address on the same bus fails its start.
TEST_F(CanSessionTest, J1939SessionClaimsItsAddressAndSeesExtendedFramesAsJ1939) {
  tarvix::StartRecording();
  auto j1939 = [](SessionSettings& s) {
    s.applicationProtocol = 1;
    s.nodeAddress = 0x80;
  };
  kvhost::HostClient host = StartedHost(0, "CAN1", j1939);
  EXPECT_EQ(ConnectionAt(0).session->lastStatus.load(), 0);
  auto message = RecordsWhere(host, [](const RecordMessage& m) {
    return m.find(kBodyExtended, 0xC0) != nullptr && m.find(0x100) != nullptr;
  });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->find(kBodyExtended, 0xC0)->payloadLength, 8u);
  bool addressSet = false;
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation == "kxSetProperty" && call.id == driver::kPropJ1939NodeAddress) {
      addressSet = call.value == Payload{0x80, 0, 0, 0};
    }
  }
  EXPECT_TRUE(addressSet);

  kvhost::HostClient second = ConnectHost();
  UsePort(ConnectionAt(1), "CAN2");
  j1939(ConnectionAt(1).settings);
  ExpectStartFails(second, "<ERROR: -1074384374>\n");  // 0xBFF6320A, not claimed
}

// A cluster without J1939 refuses the node name: the start reports the driver's status.
TEST_F(CanSessionTest, RefusedJ1939NodeNameIsReportedWithTheDriversStatus) {
  kvhost::HostClient host = ConnectHost();
  UsePort(ConnectionAt(0), "CAN1");
  SessionSettings& s = ConnectionAt(0).settings;
  s.runMode.set("NORMAL");
  s.alias.set("SimDB");
  s.cluster.set("Body");
  s.applicationProtocol = 1;
  s.nodeAddress = 0x80;
  ExpectStartFails(host, "<ERROR: -1074384848>\n");  // 0xBFF63030, unknown property
}

TEST_F(CanSessionTest, WrongBaudRateSeesOnlyBusErrorFrames) {
  kvhost::HostClient host = StartedHost(0, "CAN1", [](SessionSettings& s) {
    s.runMode.set("NORMAL");
    s.baudRate = 250000;
    s.logBusErrorFrames = 1;
  });
  auto message = RecordsWhere(host, [](const RecordMessage& m) {
    const auto* r = m.find(0, kTypeBusError);
    return r != nullptr && r->count > 20;
  });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->records.size(), 1u);
}

TEST_F(CanSessionTest, FullTableListsNoMoreIdentifiersButItsStatisticsCountTheWholeBus) {
  auto tableOf = [](uint32_t capacity) {
    return [capacity](SessionSettings& s) {
      s.dataLogIdsMax = capacity;
      s.baudRate = 500000;  // for the bus load
    };
  };
  kvhost::HostClient full = StartedHost(0, "CAN1", tableOf(2));  // the body bus has 4 identifiers
  kvhost::HostClient roomy = StartedHost(1, "CAN2", tableOf(1000));
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
