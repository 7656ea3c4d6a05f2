// Over-TCP CAN sessions against the simulated driver: hosts, their settings, and what they receive.
#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "bus/CBusSystem.h"
#include "host/HostClient.h"
#include "host/RecordDecoder.h"
#include "service/ServiceContext.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {

// Frame types and identifiers of the default body bus.
constexpr uint8_t kTypeData = 0x00;
constexpr uint8_t kTypeRemote = 0x01;
constexpr uint8_t kTypeBusError = 0x02;
constexpr uint32_t kExtendedFlag = 0x20000000;

// A decoded identifier-record message.
struct RecordMessage {
  kvhost::MessageHeaderView header;
  std::vector<kvhost::IdentifierRecord> records;

  const kvhost::IdentifierRecord* find(uint32_t identifier, uint8_t type = kTypeData) const;
};

// A record message that holds all four identifiers of the default body bus.
inline bool AllFour(const RecordMessage& m) { return m.records.size() == 4; }

class CanSessionTest : public ServiceFixture {
 protected:
  void SetUp() override;
  void TearDown() override;

  // The connection of the host in `slot` (hosts take slots in the order they connect).
  nKV_DLL300::HostConnection& ConnectionAt(size_t slot);
  // What SET_PROP_SESSION_PORTNAME stores for a CAN port: port name, interface name, bus type.
  void UsePort(nKV_DLL300::HostConnection& connection, const std::string& port);

  // Sends `command` and checks that its text reply is `text` of `type`; returns the reply.
  std::optional<kvhost::HostMessage> ExpectReply(kvhost::HostClient& host,
                                                 const std::string& command,
                                                 const std::string& text,
                                                 uint8_t type = kvhost::kText);
  // Sends CMD_SESSION_START, expects the error `text` and the end of the connection.
  void ExpectStartFails(kvhost::HostClient& host, const std::string& text);
  // The next CAN record message (decoded and checked against its header's count).
  std::optional<RecordMessage> NextRecords(kvhost::HostClient& host);
  // The next record message for which `accept` holds.
  std::optional<RecordMessage> RecordsWhere(
      kvhost::HostClient& host, const std::function<bool(const RecordMessage&)>& accept);
  // The next CAN statistics message.
  std::optional<kvhost::CanStatisticsView> NextStatistics(kvhost::HostClient& host);

  // Connects a host, gives it a CAN port and starts a session; checks the acknowledgement.
  kvhost::HostClient StartedHost(
      size_t slot, const std::string& port,
      const std::function<void(nKV_DLL300::SessionSettings&)>& configure = {});
};

}  // namespace kvtest
