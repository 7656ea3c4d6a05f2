// A host monitors the simulated FlexRay bus over TCP: null frames, the key slot, start failures and
// statistics.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <tuple>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "tests/support/BusSessionFixture.h"

namespace kvtest {
namespace {

using Payload = std::vector<uint8_t>;
using Record = kvhost::IdentifierRecord;
using LinFlexRayTest = BusSessionTest;
using FlexRayStatistics = kvhost::FlexRayStatisticsView;

constexpr uint8_t kFlexRayData = 0x20;
constexpr uint8_t kFlexRayNull = 0x21;

const std::string kPort = "SET_PROP_SESSION_PORTNAME=FlexRay1";
const std::vector<std::string> kDatabase = {kPort, "SET_PROP_SESSION_RUNMODE=NORMAL",
                                            "SET_PROP_SESSION_ALIAS=SimDB",
                                            "SET_PROP_SESSION_CLUSTER=FlexRay"};

std::vector<std::string> With(std::vector<std::string> properties, const std::string& more) {
  properties.push_back(more);
  return properties;
}

// Slot 3 carries data in even cycles and null frames in odd ones. Shown, they share its entry: the
// count follows every cycle and the type stays that of the entry's first frame while the cycle
// number follows the last frame.
TEST_F(LinFlexRayTest, NullFramesJoinTheirSlotAndStatisticsOnlyWhenShown) {
  kvhost::HostClient shown = StartedHost(With(kDatabase, "SET_PROP_SESSION_SHOW_NULL_FRAMES=1"));
  kvhost::HostClient hidden =
      StartedHost({"SET_PROP_SESSION_PORTNAME=FlexRay2", "SET_PROP_SESSION_RUNMODE=NORMAL",
                   "SET_PROP_SESSION_ALIAS=SimDB", "SET_PROP_SESSION_CLUSTER=FlexRay"});

  auto mixed = RecordsWhere(shown, [](const RecordMessage& m) {
    const Record* slot3 = m.find(3);
    const Record* slot2 = m.find(2);
    if (slot3 == nullptr || slot2 == nullptr || slot2->count < 20) return false;
    EXPECT_LE(std::abs(int64_t{slot3->count} - int64_t{slot2->count}), 2) << "one frame per cycle";
    const bool lastWasNull = slot3->cycle % 2 == 1;
    return lastWasNull != (slot3->type == kFlexRayNull);
  });
  EXPECT_TRUE(mixed.has_value()) << "slot 3 always showed the type of its last frame";

  auto dataOnly = RecordsWhere(hidden, [](const RecordMessage& m) {
    const Record* slot3 = m.find(3);
    const Record* slot2 = m.find(2);
    return slot3 != nullptr && slot2 != nullptr && slot2->count >= 20;
  });
  ASSERT_TRUE(dataOnly.has_value());
  const Record& slot3 = *dataOnly->find(3);
  EXPECT_EQ(slot3.type, kFlexRayData);
  EXPECT_EQ(slot3.cycle % 2, 0);
  EXPECT_NEAR(2.0 * slot3.count, dataOnly->find(2)->count, 3.0) << "every other cycle";

  // Per 5 ms cycle: slot 1 on A and B, slots 2 and 40, and slot 3 with data in every other cycle
  // and a null frame in the others: 900 data and 100 null frames a second.
  auto statistics = StatisticsWhere<FlexRayStatistics>(
      shown, kvhost::DecodeFlexRayStatistics, [](const FlexRayStatistics& s) {
        return s.dataFramesPerSecond >= 855 && s.dataFramesPerSecond <= 945 &&
               s.nullFramesPerSecond >= 95 && s.nullFramesPerSecond <= 105;
      });
  ASSERT_TRUE(statistics.has_value());
  EXPECT_GE(statistics->dataFrames, statistics->dataFramesPerSecond / 2);
  EXPECT_EQ(statistics->faultCode, 0u);
  EXPECT_EQ(statistics->reserved, 0u);
  EXPECT_EQ(statistics->stateBits0to3, 2u) << "normal active";
  EXPECT_EQ(statistics->stateBits4to7, 0u);
  EXPECT_EQ(statistics->stateBits8to12, 1u) << "one sync slot";
  EXPECT_EQ(statistics->stateBit13 + statistics->stateBit14, 0u);
  EXPECT_GT(statistics->statisticsWords[0], 0u) << "cycles since the start";
  EXPECT_GT(statistics->statisticsWords[1], statistics->statisticsWords[2]) << "data over null";
  EXPECT_LT(statistics->statisticsWords[5], 64u) << "current cycle";
  EXPECT_EQ(statistics->lastStateWord, 3u) << "channels A and B active";
  auto hiddenCounts = StatisticsWhere<FlexRayStatistics>(
      hidden, kvhost::DecodeFlexRayStatistics,
      [](const FlexRayStatistics& s) { return s.dataFrames > 0; });
  ASSERT_TRUE(hiddenCounts.has_value());
  EXPECT_EQ(hiddenCounts->nullFrames, 0u);
}

// The key slot is set, before the start, only when given (the database mode above sets none); 0
// is given too, and the value may be hexadecimal.
TEST_F(LinFlexRayTest, KeySlotIsSetBeforeTheStartOnlyWhenGiven) {
  const std::tuple<std::string, std::string, uint32_t> cases[] = {{"FlexRay1", "0", 0},
                                                                  {"FlexRay2", "0x10", 16}};
  tarvix::StartRecording();
  for (const auto& [port, text, value] : cases) {
    SCOPED_TRACE(port);
    std::vector<std::string> properties = With(kDatabase, "SET_PROP_SESSION_KEY_SLOT=" + text);
    properties[0] = "SET_PROP_SESSION_PORTNAME=" + port;
    kvhost::HostClient host = StartedHost(properties);
    const auto set = SetPropertyCalls(port, driver::kPropKeySlot);
    ASSERT_EQ(set.size(), 1u);
    ASSERT_EQ(set[0].value.size(), sizeof value);
    EXPECT_EQ(ValueOf(set[0]), value);
    const auto calls = CallsOn(port);
    const auto at = [&](const std::string& operation, uint32_t id) {
      return std::find_if(calls.begin(), calls.end(),
                          [&](const tarvix::CallRecord& c) {
                            return c.operation == operation && c.id == id;
                          }) -
             calls.begin();
    };
    EXPECT_LT(at("kxSetProperty", driver::kPropKeySlot), at("kxStart", driver::kScopeNormal));
  }
}

TEST_F(LinFlexRayTest, NormalFlexRayStartWithoutAliasAndClusterIsRefused) {
  tarvix::StartRecording();
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith({kPort, "SET_PROP_SESSION_RUNMODE=NORMAL"}, &reply);
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->header.type, kvhost::kErrorText);
  EXPECT_EQ(reply->text(), "<ERROR: CMD_SESSION_START: no Alias and Cluster defined>\n");
  EXPECT_TRUE(SetPropertyCalls("FlexRay1", driver::kPropEcho).empty()) << "no session is opened";
  // The connection stays open and has no session.
  auto lastError = Command(host, "CMD_SESSION_READ_LAST_ERROR");
  ASSERT_TRUE(lastError.has_value());
  EXPECT_EQ(lastError->text(), "<TCP Error: 0> \n");
}

TEST_F(LinFlexRayTest, FlexRayStartFailsWhenTheBusNeverCommunicates) {
  tarvix::StartRecording();
  tarvix::InjectStatus("kxWait", "FlexRay1", driver::kWaitTimeout, false);
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith(kDatabase, &reply);
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->header.type, kvhost::kErrorText);
  EXPECT_EQ(reply->text(), "<ERROR: " + std::to_string(driver::kWaitTimeout) + ">\n");
  EXPECT_EQ(reply->header.lastStatus, driver::kWaitTimeout);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline)) << "a failed start ends the connection";

  bool waited = false;
  bool cleared = false;
  for (const tarvix::CallRecord& call : CallsOn("FlexRay1")) {
    if (call.operation == "kxWait") {
      waited = true;
      EXPECT_EQ(call.id, driver::kWaitInterfaceCommunicating);
      EXPECT_DOUBLE_EQ(call.timeout, 3.0);
    }
    if (call.operation == "kxSetProperty") {
      EXPECT_FALSE(waited) << "nothing is set after the wait";
    }
    cleared |= call.operation == "kxClear" && call.status == 0;
  }
  EXPECT_TRUE(waited);
  EXPECT_TRUE(cleared) << "the driver session of a failed start is closed";
}

}  // namespace
}  // namespace kvtest
