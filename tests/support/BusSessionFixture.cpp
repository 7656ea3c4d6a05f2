// Hosts that run bus sessions over TCP, and the helpers that read what the service sends them.
#include "tests/support/BusSessionFixture.h"

#include <algorithm>
#include <cstring>

namespace kvtest {

std::vector<const kvhost::IdentifierRecord*> RecordMessage::all(uint32_t identifier) const {
  std::vector<const kvhost::IdentifierRecord*> found;
  for (const kvhost::IdentifierRecord& record : records) {
    if (record.identifier == identifier) found.push_back(&record);
  }
  return found;
}

const kvhost::IdentifierRecord* RecordMessage::find(uint32_t identifier, int type) const {
  for (const kvhost::IdentifierRecord* record : all(identifier)) {
    if (type == kAnyType || record->type == type) return record;
  }
  return nullptr;
}

void BusSessionTest::SetUp() {
  tarvix::ResetToDefaults();
  ServiceFixture::SetUp();
}

void BusSessionTest::TearDown() {
  ServiceFixture::TearDown();
  tarvix::ResetToDefaults();
}

std::optional<kvhost::HostMessage> BusSessionTest::ExpectReply(kvhost::HostClient& host,
                                                               const std::string& command,
                                                               const std::string& text,
                                                               uint8_t type) {
  auto reply = Command(host, command);
  EXPECT_TRUE(reply.has_value()) << "no reply to " << command;
  if (reply) {
    EXPECT_EQ(reply->text(), text) << command;
    EXPECT_EQ(reply->header.type, type) << command;
  }
  return reply;
}

kvhost::HostClient BusSessionTest::HostWith(const std::vector<std::string>& properties,
                                            std::optional<kvhost::HostMessage>* startReply) {
  kvhost::HostClient host = ConnectHost();
  for (const std::string& property : properties) {
    auto reply = Command(host, property);
    EXPECT_TRUE(reply && reply->text().starts_with("<ACK: "))
        << property << " answered " << (reply ? reply->text() : "nothing");
  }
  auto reply = Command(host, "CMD_SESSION_START");
  EXPECT_TRUE(reply.has_value()) << "no reply to CMD_SESSION_START";
  if (startReply != nullptr) *startReply = std::move(reply);
  return host;
}

kvhost::HostClient BusSessionTest::StartedHost(const std::vector<std::string>& properties) {
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith(properties, &reply);
  EXPECT_TRUE(reply && reply->text() == "<ACK: CMD_SESSION_START>\n");
  return host;
}

void BusSessionTest::ExpectStartFails(const std::vector<std::string>& properties,
                                      const std::string& text) {
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith(properties, &reply);
  ASSERT_TRUE(reply.has_value());
  EXPECT_EQ(reply->text(), text);
  EXPECT_EQ(reply->header.type, kvhost::kErrorText);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline)) << "a failed start ends the connection";
}

std::optional<RecordMessage> BusSessionTest::RecordsWhere(
    kvhost::HostClient& host, const std::function<bool(const RecordMessage&)>& accept) {
  std::optional<RecordMessage> found;
  NextMessage(host, [&](const kvhost::HostMessage& m) {
    const uint8_t type = m.header.type;
    if (type != kvhost::kCanRecords && type != kvhost::kLinRecords &&
        type != kvhost::kFlexRayRecords) {
      return false;
    }
    auto records =
        type == kvhost::kCanRecords   ? kvhost::DecodeCanRecords(m.payload, m.header.idCount)
        : type == kvhost::kLinRecords ? kvhost::DecodeLinRecords(m.payload, m.header.idCount)
                                      : kvhost::DecodeFlexRayRecords(m.payload, m.header.idCount);
    EXPECT_TRUE(records.has_value()) << "a record message does not hold its header's count";
    if (!records) return true;
    RecordMessage decoded{m.header, std::move(*records)};
    if (!accept(decoded)) return false;
    found = std::move(decoded);
    return true;
  });
  return found;
}

std::optional<RecordMessage> BusSessionTest::NextRecords(kvhost::HostClient& host) {
  return RecordsWhere(host, [](const RecordMessage&) { return true; });
}

std::vector<tarvix::CallRecord> CallsOn(const std::string& interfaceName) {
  std::vector<tarvix::CallRecord> calls;
  for (tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.interfaceName == interfaceName) calls.push_back(std::move(call));
  }
  return calls;
}

std::vector<tarvix::CallRecord> SetPropertyCalls(const std::string& interfaceName, uint32_t id) {
  std::vector<tarvix::CallRecord> calls;
  for (tarvix::CallRecord& call : CallsOn(interfaceName)) {
    if (call.operation == "kxSetProperty" && call.id == id) calls.push_back(std::move(call));
  }
  return calls;
}

uint64_t ValueOf(const tarvix::CallRecord& call) {
  uint64_t value = 0;
  std::memcpy(&value, call.value.data(), std::min(call.value.size(), sizeof value));
  return value;
}

bool ClearedOn(const std::string& interfaceName) {
  const auto calls = CallsOn(interfaceName);
  return std::any_of(calls.begin(), calls.end(), [](const tarvix::CallRecord& call) {
    return call.operation == "kxClear" && call.status == 0;
  });
}

}  // namespace kvtest
