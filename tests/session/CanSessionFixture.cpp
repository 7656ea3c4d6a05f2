// Hosts that run CAN sessions over TCP, and the helpers that read what the service sends them.
#include "tests/session/CanSessionFixture.h"

#include "tarvix/TarvixControl.h"

namespace kvtest {

const kvhost::IdentifierRecord* RecordMessage::find(uint32_t identifier, uint8_t type) const {
  for (const kvhost::IdentifierRecord& record : records) {
    if (record.identifier == identifier && record.type == type) return &record;
  }
  return nullptr;
}

void CanSessionTest::SetUp() {
  tarvix::ResetToDefaults();
  ServiceFixture::SetUp();
}

void CanSessionTest::TearDown() {
  ServiceFixture::TearDown();
  tarvix::ResetToDefaults();
}

nKV_DLL300::HostConnection& CanSessionTest::ConnectionAt(size_t slot) {
  nKV_DLL300::ConnectionSlot& entry = service().connections.at(slot);
  EXPECT_TRUE(WaitUntil([&] { return entry.connection != nullptr; }));
  return *entry.connection;
}

void CanSessionTest::UsePort(nKV_DLL300::HostConnection& connection, const std::string& port) {
  connection.settings.portName.set(port);
  connection.settings.interfaceName.set(port + "@qv_corle_tarvix");
  connection.busType.store(driver::BusKind::kCan);
}

std::optional<kvhost::HostMessage> CanSessionTest::ExpectReply(kvhost::HostClient& host,
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

void CanSessionTest::ExpectStartFails(kvhost::HostClient& host, const std::string& text) {
  ExpectReply(host, "CMD_SESSION_START", text, kvhost::kErrorText);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
}

std::optional<RecordMessage> CanSessionTest::RecordsWhere(
    kvhost::HostClient& host, const std::function<bool(const RecordMessage&)>& accept) {
  std::optional<RecordMessage> found;
  NextMessage(host, [&](const kvhost::HostMessage& m) {
    if (m.header.type != kvhost::kCanRecords) return false;
    auto records = kvhost::DecodeCanRecords(m.payload, m.header.idCount);
    EXPECT_TRUE(records.has_value()) << "a record message does not hold its header's count";
    if (!records) return true;
    RecordMessage decoded{m.header, std::move(*records)};
    if (!accept(decoded)) return false;
    found = std::move(decoded);
    return true;
  });
  return found;
}

std::optional<RecordMessage> CanSessionTest::NextRecords(kvhost::HostClient& host) {
  return RecordsWhere(host, [](const RecordMessage&) { return true; });
}

std::optional<kvhost::CanStatisticsView> CanSessionTest::NextStatistics(kvhost::HostClient& host) {
  auto message = NextMessage(
      host, [](const kvhost::HostMessage& m) { return m.header.type == kvhost::kStatistics; });
  if (!message) return std::nullopt;
  auto statistics = kvhost::DecodeCanStatistics(message->payload);
  EXPECT_TRUE(statistics.has_value()) << "statistics of " << message->payload.size() << " bytes";
  return statistics;
}

kvhost::HostClient CanSessionTest::StartedHost(
    size_t slot, const std::string& port,
    const std::function<void(nKV_DLL300::SessionSettings&)>& configure) {
  kvhost::HostClient host = ConnectHost();
  nKV_DLL300::HostConnection& connection = ConnectionAt(slot);
  UsePort(connection, port);
  if (configure) configure(connection.settings);
  ExpectReply(host, "CMD_SESSION_START", "<ACK: CMD_SESSION_START>\n");
  return host;
}

}  // namespace kvtest
