// Hosts that monitor the simulated LIN and FlexRay buses over TCP, and what they receive.
#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "host/HostClient.h"
#include "host/RecordDecoder.h"
#include "tarvix/TarvixControl.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {

// A decoded identifier-record message of a LIN (type 1) or FlexRay (type 2) session.
struct BusRecords {
  kvhost::MessageHeaderView header;
  std::vector<kvhost::IdentifierRecord> records;

  // The entries of `identifier` (FlexRay: of the slot on any channel), in the order sent.
  std::vector<const kvhost::IdentifierRecord*> all(uint32_t identifier) const;
  const kvhost::IdentifierRecord* find(uint32_t identifier) const;
};

class LinFlexRayTest : public ServiceFixture {
 protected:
  void SetUp() override;
  void TearDown() override;

  // Sends one property message ("NAME=value") and expects its acknowledgement.
  void Set(kvhost::HostClient& host, const std::string& assignment);

  // The next record message of the given type (1 LIN, 2 FlexRay) for which `accept` holds; each
  // message must hold exactly the records its header counts.
  std::optional<BusRecords> RecordsWhere(kvhost::HostClient& host, uint8_t type,
                                         const std::function<bool(const BusRecords&)>& accept);
  // The next statistics message of a LIN or FlexRay session for which `accept` holds.
  std::optional<kvhost::LinStatisticsView> LinStatisticsWhere(
      kvhost::HostClient& host,
      const std::function<bool(const kvhost::LinStatisticsView&)>& accept) {
    return StatisticsWhere(host, kvhost::DecodeLinStatistics, accept);
  }
  std::optional<kvhost::FlexRayStatisticsView> FlexRayStatisticsWhere(
      kvhost::HostClient& host,
      const std::function<bool(const kvhost::FlexRayStatisticsView&)>& accept) {
    return StatisticsWhere(host, kvhost::DecodeFlexRayStatistics, accept);
  }
  template <typename Decode, typename View>
  std::optional<View> StatisticsWhere(kvhost::HostClient& host, Decode decode,
                                      const std::function<bool(const View&)>& accept) {
    std::optional<View> found;
    NextMessage(host, [&](const kvhost::HostMessage& m) {
      if (m.header.type != kvhost::kStatistics) return false;
      found = decode(m.payload);
      EXPECT_TRUE(found.has_value()) << "statistics of " << m.payload.size() << " bytes";
      return !found || accept(*found);
    });
    return found;
  }

  // Connects a host, sends `properties` one by one (each acknowledged) and CMD_SESSION_START;
  // returns the host and the reply to the start.
  kvhost::HostClient HostWith(const std::vector<std::string>& properties,
                              std::optional<kvhost::HostMessage>* startReply = nullptr);
  // As HostWith, checking that the session started.
  kvhost::HostClient StartedHost(const std::vector<std::string>& properties);
};

// The driver calls recorded since StartRecording on `interfaceName` ("LIN1", "FlexRay1").
std::vector<tarvix::CallRecord> CallsOn(const std::string& interfaceName);
// The driver calls of the start from the creation on, in order, without the reads and state reads
// of the poll thread.
std::vector<std::pair<std::string, uint32_t>> StartCalls(const std::string& interfaceName);
// The recorded kxSetProperty calls of property `id` on `interfaceName`.
std::vector<tarvix::CallRecord> SetPropertyCalls(const std::string& interfaceName, uint32_t id);

}  // namespace kvtest
