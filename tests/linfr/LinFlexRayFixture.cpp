// Hosts that monitor LIN and FlexRay sessions over TCP, and the helpers that read what they
// receive.
#include "tests/linfr/LinFlexRayFixture.h"

namespace kvtest {

std::vector<const kvhost::IdentifierRecord*> BusRecords::all(uint32_t identifier) const {
  std::vector<const kvhost::IdentifierRecord*> found;
  for (const kvhost::IdentifierRecord& record : records) {
    if (record.identifier == identifier) found.push_back(&record);
  }
  return found;
}

const kvhost::IdentifierRecord* BusRecords::find(uint32_t identifier) const {
  const auto found = all(identifier);
  return found.empty() ? nullptr : found.front();
}

void LinFlexRayTest::SetUp() {
  tarvix::ResetToDefaults();
  ServiceFixture::SetUp();
}

void LinFlexRayTest::TearDown() {
  ServiceFixture::TearDown();
  tarvix::ResetToDefaults();
}

void LinFlexRayTest::Set(kvhost::HostClient& host, const std::string& assignment) {
  auto reply = Command(host, assignment);
  ASSERT_TRUE(reply.has_value()) << "no reply to " << assignment;
  EXPECT_EQ(reply->text().rfind("<ACK: ", 0), 0u) << assignment << " answered " << reply->text();
}

std::optional<BusRecords> LinFlexRayTest::RecordsWhere(
    kvhost::HostClient& host, uint8_t type, const std::function<bool(const BusRecords&)>& accept) {
  std::optional<BusRecords> found;
  NextMessage(host, [&](const kvhost::HostMessage& m) {
    if (m.header.type != type) return false;
    auto records = type == kvhost::kLinRecords
                       ? kvhost::DecodeLinRecords(m.payload, m.header.idCount)
                       : kvhost::DecodeFlexRayRecords(m.payload, m.header.idCount);
    EXPECT_TRUE(records.has_value()) << "a record message does not hold its header's count";
    if (!records) return true;
    BusRecords decoded{m.header, std::move(*records)};
    if (!accept(decoded)) return false;
    found = std::move(decoded);
    return true;
  });
  return found;
}

kvhost::HostClient LinFlexRayTest::HostWith(const std::vector<std::string>& properties,
                                            std::optional<kvhost::HostMessage>* startReply) {
  kvhost::HostClient host = ConnectHost();
  for (const std::string& property : properties) Set(host, property);
  auto reply = Command(host, "CMD_SESSION_START");
  EXPECT_TRUE(reply.has_value()) << "no reply to CMD_SESSION_START";
  if (startReply != nullptr) *startReply = std::move(reply);
  return host;
}

kvhost::HostClient LinFlexRayTest::StartedHost(const std::vector<std::string>& properties) {
  std::optional<kvhost::HostMessage> reply;
  kvhost::HostClient host = HostWith(properties, &reply);
  if (reply) {
    EXPECT_EQ(reply->text(), "<ACK: CMD_SESSION_START>\n");
  }
  return host;
}

std::vector<tarvix::CallRecord> CallsOn(const std::string& interfaceName) {
  std::vector<tarvix::CallRecord> calls;
  for (tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.interfaceName == interfaceName) calls.push_back(std::move(call));
  }
  return calls;
}

std::vector<std::pair<std::string, uint32_t>> StartCalls(const std::string& interfaceName) {
  std::vector<std::pair<std::string, uint32_t>> calls;
  for (const tarvix::CallRecord& call : CallsOn(interfaceName)) {
    // The hardware table read at accept comes before the start.
    if (calls.empty() && call.operation != "kxCreateSession") continue;
    if (call.operation == "kxReadFrame" || call.operation == "kxReadState") continue;
    if (call.operation == "kxClear") break;
    calls.emplace_back(call.operation, call.id);
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

}  // namespace kvtest
