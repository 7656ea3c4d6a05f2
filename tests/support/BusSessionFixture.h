// One fixture for hosts that run CAN, LIN and FlexRay sessions over TCP against the simulated
// driver: every setting goes through the host protocol, as a host program would send it.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

#include "host/HostClient.h"
#include "host/RecordDecoder.h"
#include "tarvix/TarvixControl.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {

// CAN record types and the extended-identifier flag of the records.
constexpr uint8_t kTypeData = 0x00;
constexpr uint8_t kTypeRemote = 0x01;
constexpr uint8_t kTypeBusError = 0x02;
constexpr uint32_t kExtendedFlag = 0x20000000;
constexpr int kAnyType = -1;

// A decoded identifier-record message of any bus (its header's type tells which).
struct RecordMessage {
  kvhost::MessageHeaderView header;
  std::vector<kvhost::IdentifierRecord> records;

  // The entries of `identifier` (FlexRay: of the slot on any channel), in the order sent.
  std::vector<const kvhost::IdentifierRecord*> all(uint32_t identifier) const;
  const kvhost::IdentifierRecord* find(uint32_t identifier, int type = kAnyType) const;
};

// A record message that holds all four identifiers of the default body bus.
inline bool AllFour(const RecordMessage& m) { return m.records.size() == 4; }

class BusSessionTest : public ServiceFixture {
 protected:
  void SetUp() override;
  void TearDown() override;

  // Sends `command` and checks that its text reply is `text` of `type`; returns the reply.
  std::optional<kvhost::HostMessage> ExpectReply(kvhost::HostClient& host,
                                                 const std::string& command,
                                                 const std::string& text,
                                                 uint8_t type = kvhost::kText);
  // Connects a host, sends `properties` one by one (each acknowledged) and CMD_SESSION_START;
  // returns the host and the reply to the start.
  kvhost::HostClient HostWith(const std::vector<std::string>& properties,
                              std::optional<kvhost::HostMessage>* startReply = nullptr);
  // As HostWith, checking that the session started.
  kvhost::HostClient StartedHost(const std::vector<std::string>& properties);
  // As HostWith, expecting the start to fail with `text` and the connection to end.
  void ExpectStartFails(const std::vector<std::string>& properties, const std::string& text);

  // The next record message (of any bus) for which `accept` holds; each message must hold
  // exactly the records its header counts.
  std::optional<RecordMessage> RecordsWhere(
      kvhost::HostClient& host, const std::function<bool(const RecordMessage&)>& accept);
  std::optional<RecordMessage> NextRecords(kvhost::HostClient& host);
  // The next statistics message, decoded by `decode`, for which `accept` holds.
  template <typename View>
  std::optional<View> StatisticsWhere(
      kvhost::HostClient& host, std::optional<View> (*decode)(const std::vector<uint8_t>&),
      const std::type_identity_t<std::function<bool(const View&)>>& accept = {}) {
    std::optional<View> found;
    NextMessage(host, [&](const kvhost::HostMessage& m) {
      if (m.header.type != kvhost::kStatistics) return false;
      found = decode(m.payload);
      EXPECT_TRUE(found.has_value()) << "statistics of " << m.payload.size() << " bytes";
      return !found || !accept || accept(*found);
    });
    return found;
  }
  std::optional<kvhost::CanStatisticsView> NextStatistics(kvhost::HostClient& host) {
    return StatisticsWhere(host, kvhost::DecodeCanStatistics);
  }
};

// The driver calls recorded since StartRecording on `interfaceName` ("CAN1", "FlexRay1").
std::vector<tarvix::CallRecord> CallsOn(const std::string& interfaceName);
// The recorded kxSetProperty calls of property `id` on `interfaceName`.
std::vector<tarvix::CallRecord> SetPropertyCalls(const std::string& interfaceName, uint32_t id);
// The value of a recorded call read as a little-endian integer.
uint64_t ValueOf(const tarvix::CallRecord& call);
// Whether a driver session on `interfaceName` was cleared successfully since StartRecording.
bool ClearedOn(const std::string& interfaceName);

}  // namespace kvtest
