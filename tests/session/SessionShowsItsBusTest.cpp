// A session shows its bus: for each bus and way of opening it, a host sees every identifier of the
// simulated traffic once, sorted, with its type and payload, and the driver got the database and
// rates of the mode.
#include <gtest/gtest.h>

#include <algorithm>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using Payload = std::vector<uint8_t>;
using Record = kvhost::IdentifierRecord;

Payload Ramp(uint8_t first, size_t length) {
  Payload bytes(length);
  for (size_t i = 0; i < length; ++i) bytes[i] = static_cast<uint8_t>(first + i);
  return bytes;
}

struct Entry {
  uint32_t identifier;
  uint8_t type;
  int length = -1;  // -1: not compared (a counter in the first byte, or payload compared)
  Payload payload = {};
};

struct BusCase {
  const char* name;
  std::vector<std::string> properties;
  std::string interfaceName;
  std::string database;                              // the database the session was opened on
  std::vector<std::pair<uint32_t, uint64_t>> rates;  // rate properties set, with their values
  std::vector<Entry> sorted;                         // every entry, in the order sent
  uint32_t counter;                                  // the identifier whose bytes 1 to 7 are 1 to 7
  std::function<void(const RecordMessage&)> more = {};
};
void PrintTo(const BusCase& c, std::ostream* os) { *os << c.name; }

const std::string kNormal = "SET_PROP_SESSION_RUNMODE=NORMAL";
const std::vector<Entry> kLinSchedule = {
    {0x10, 0x40, -1, {0x12, 0x34}}, {0x11, 0x40, 8}, {0x13, 0x40, -1, {0xDE, 0xAD, 0xBE, 0xEF}}};

const std::vector<Entry> kFlexRaySlots = {{1, 0x20, -1, Ramp(0x10, 16)},
                                          {1, 0x20, -1, Ramp(0x10, 16)},
                                          {2, 0x20, 16},
                                          {3, 0x20, -1, Ramp(0x30, 8)},
                                          {40, 0x20, -1, Ramp(0x40, 32)}};

// Without asking, the info byte holds no checksum; the flag shows the enhanced checksum.
void LinFlags(const RecordMessage& m) {
  for (const Record& r : m.records) {
    EXPECT_EQ(r.flag, 0x01) << r.identifier;
    EXPECT_EQ(r.checksum, 0u) << r.identifier;
  }
}

void FlexRaySlots(const RecordMessage& m) {
  const auto slot1 = m.all(1);
  EXPECT_NE(slot1[0]->channel, slot1[1]->channel);
  for (const Record* r : slot1) {
    EXPECT_EQ(r->startup, 1);
    EXPECT_EQ(r->sync, 1);
    EXPECT_EQ(r->preamble, 0);
  }
  const Record& slot2 = *m.find(2);
  EXPECT_EQ(slot2.channel, 0);
  EXPECT_EQ(slot2.startup + slot2.sync, 0);
  EXPECT_EQ(Payload(slot2.payload.begin() + 1, slot2.payload.end()), Payload(15, 0));
  EXPECT_EQ(m.find(40)->channel, 1);
  EXPECT_EQ(m.find(3)->cycle % 2, 0) << "without null frames slot 3 shows its data cycles only";
  for (const Record& r : m.records) {
    EXPECT_LT(r.cycle, 64);
    EXPECT_GE(r.lastTimestamp, r.previousTimestamp);
  }
}

const BusCase kCases[] = {
    {"CanBody",
     {"SET_PROP_SESSION_PORTNAME=CAN1"},
     "CAN1",
     driver::kDatabaseSubordinate,
     {},
     {{0x100, kTypeData, 8},
      {0x1A0, kTypeData, -1, {0xAA, 0xBB, 0xCC}},
      {0x321, kTypeRemote, 0},
      {0x18FEF100 | kExtendedFlag, kTypeData, -1, {0, 0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77}}},
     0x100},
    {"CanFdWithDataRate",
     {"SET_PROP_SESSION_PORTNAME=CAN5", kNormal, "SET_PROP_SESSION_CAN_IOMODE=2",
      "SET_PROP_SESSION_BAUDRATE=500000", "SET_PROP_SESSION_CANFD_BAUDRATE=2000000"},
     "CAN5",
     driver::kDatabaseCanFdBrs,
     {{driver::kPropBaudRate, 500000}, {driver::kPropCanFdBaudRate, 2000000}},
     {{0x080, kTypeData, 8},
      {0x200, 0x18, -1, Ramp(0, 64)},
      {0x201, 0x10, 12},
      {0x1ABCDE00 | kExtendedFlag, 0x18, 16}},
     0},
    {"LinSubordinate",
     {"SET_PROP_SESSION_PORTNAME=LIN1"},
     "LIN1",
     driver::kDatabaseSubordinate,
     {},
     kLinSchedule,
     0x11,
     LinFlags},
    {"LinBuiltIn",
     {"SET_PROP_SESSION_PORTNAME=LIN1", kNormal, "SET_PROP_SESSION_BAUDRATE=19200"},
     "LIN1",
     driver::kDatabaseMemory,
     {{driver::kPropBaudRate, 19200}},
     kLinSchedule,
     0x11,
     LinFlags},
    {"LinDatabase",
     {"SET_PROP_SESSION_PORTNAME=LIN1", kNormal, "SET_PROP_SESSION_ALIAS=SimDB",
      "SET_PROP_SESSION_CLUSTER=LIN"},
     "LIN1",
     "SimDB",
     {},
     kLinSchedule,
     0x11,
     LinFlags},
    {"FlexRaySubordinate",
     {"SET_PROP_SESSION_PORTNAME=FlexRay1"},
     "FlexRay1",
     driver::kDatabaseSubordinate,
     {},
     kFlexRaySlots,
     0,
     FlexRaySlots},
    {"FlexRayDatabase",
     {"SET_PROP_SESSION_PORTNAME=FlexRay1", kNormal, "SET_PROP_SESSION_ALIAS=SimDB",
      "SET_PROP_SESSION_CLUSTER=FlexRay"},
     "FlexRay1",
     "SimDB",
     {},
     kFlexRaySlots,
     0,
     FlexRaySlots},
};

class SessionShowsItsBusTest : public BusSessionTest,
                               public ::testing::WithParamInterface<BusCase> {};

TEST_P(SessionShowsItsBusTest, EveryIdentifierOnceSortedWithTypeAndPayload) {
  const BusCase& c = GetParam();
  tarvix::StartRecording();
  kvhost::HostClient host = StartedHost(c.properties);
  auto message = RecordsWhere(host, [&](const RecordMessage& m) {
    return m.records.size() == c.sorted.size() &&
           std::all_of(c.sorted.begin(), c.sorted.end(),
                       [&](const Entry& e) { return m.find(e.identifier, e.type) != nullptr; });
  });
  ASSERT_TRUE(message.has_value());
  EXPECT_EQ(message->header.idCount, c.sorted.size());
  for (size_t i = 0; i < c.sorted.size(); ++i) {
    const Entry& e = c.sorted[i];
    const Record& r = message->records[i];
    SCOPED_TRACE(e.identifier);
    EXPECT_EQ(r.identifier, e.identifier);
    EXPECT_EQ(r.type, e.type);
    EXPECT_EQ(r.echo, 0);
    EXPECT_GE(r.count, 1u);
    if (e.length >= 0) {
      EXPECT_EQ(r.payloadLength, uint32_t(e.length));
    }
    if (!e.payload.empty()) {
      EXPECT_EQ(r.payload, e.payload);
    }
  }
  if (const Record* counter = c.counter ? message->find(c.counter) : nullptr) {
    ASSERT_EQ(counter->payload.size(), 8u);
    EXPECT_EQ(Payload(counter->payload.begin() + 1, counter->payload.end()), Ramp(1, 7));
  }
  if (c.more) c.more(*message);

  const auto calls = CallsOn(c.interfaceName);
  const auto created = std::find_if(calls.begin(), calls.end(), [](const auto& call) {
    return call.operation == "kxCreateSession";
  });
  ASSERT_NE(created, calls.end());
  EXPECT_EQ(created->texts.at(0), c.database);
  std::vector<std::pair<uint32_t, uint64_t>> rates;
  for (const tarvix::CallRecord& call : calls) {
    if (call.operation == "kxSetProperty" &&
        (call.id == driver::kPropBaudRate || call.id == driver::kPropCanFdBaudRate)) {
      rates.emplace_back(call.id, ValueOf(call));
    }
  }
  EXPECT_EQ(rates, c.rates);
}

INSTANTIATE_TEST_SUITE_P(Buses, SessionShowsItsBusTest, ::testing::ValuesIn(kCases),
                         [](const auto& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace kvtest
