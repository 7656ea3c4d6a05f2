// What a host sees over TCP: the greeting, headers, unknown names, silent drops, hardware table.
#include <gtest/gtest.h>

#include "host/HostMessage.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

using kvhost::HostMessage;

class HostProtocolTest : public ServiceFixture {};

TEST_F(HostProtocolTest, GreetingIsTextWithSequenceZeroAndTheDriverVersionBytes) {
  kvhost::HostClient host = ConnectQuietly();
  auto greeting = host.Receive(kReplyDeadline);
  ASSERT_TRUE(greeting);
  const std::vector<uint8_t> expected = {0, 0, 0, 0, 3, 0, 0, 0,    23, 0, 0,    0,    0,    0,
                                         0, 0, 0, 0, 0, 0, 0, 0x0F, 0,  0, 0x15, 0x05, 0x00, 0x03};
  EXPECT_EQ(greeting->headerBytes, expected);
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
}

// Each reply is an error text whose sequence number is one above the last message's.
TEST_F(HostProtocolTest, UnknownNamesAreAnsweredWithTheirErrorTexts) {
  const std::string command = "<ERROR: unknown command>\n";
  const std::string property = "<ERROR: unknown SETPROP command>\n";
  const std::pair<std::string, std::string> rows[] = {
      {"CMD_NOPE", command},
      {"UNKNOWN", command},
      {"CMD_HEARTBEAT\n", command},
      {"cmd_heartbeat", command},
      {"CMD_HEARTBEATCMD_HEARTBEAT", command},
      {"SET_PROP_FOO=1", property},
      {"SET_PROPX=1", property},
      {"SET_PROP_SESSION_BAUDRATE\n=1", property},
      {"SET_PROP_UNKNOWN=" + std::string(239, 'x'), property},  // 256 bytes: one message
  };
  kvhost::HostClient host = ConnectHost();
  uint32_t sequence = 1;
  for (const auto& [message, text] : rows) {
    auto reply = Exchange(host, message);
    ASSERT_TRUE(reply) << message;
    EXPECT_EQ(reply->header.type, 5) << message;
    EXPECT_EQ(reply->header.sequence, sequence++) << message;
    EXPECT_EQ(reply->text(), text) << message;
    EXPECT_EQ(reply->header.payloadLength, text.size()) << message;
  }
}

TEST_F(HostProtocolTest, SilentMessagesGetNoReplyAndLeaveTheConnectionUsable) {
  const std::string silent[] = {
      "CMD_HEARTBEAT",
      std::string("CMD_HEARTBEAT\0garbage", 21),  // text after a NUL is ignored
      "SET_PROP_SESSION_BAUDRATE 500000",         // no "=": dropped
      "SET_TX_PROP_IDENTIFIER=5",                 // no CAN session: dropped
      "SET_TX_PROP_FOO=1",                        // likewise, even with an unknown name
  };
  kvhost::HostClient host = ConnectHost();
  uint32_t sequence = 1;
  for (const std::string& message : silent) {
    SendAndWaitDispatched(host, message);
    // The next reply is the one to a probe, so nothing was sent for the silent message.
    auto reply = Exchange(host, "CMD_PROBE");
    ASSERT_TRUE(reply) << message;
    EXPECT_EQ(reply->header.sequence, sequence++) << message;
    EXPECT_EQ(reply->text(), "<ERROR: unknown command>\n") << message;
  }
}

TEST_F(HostProtocolTest, HardwareInfoSendsTheTenRecordsOfTheController) {
  kvhost::HostClient host = ConnectHost();
  auto reply = Exchange(host, "CMD_GET_HARDWARE_INFO");
  ASSERT_TRUE(reply);
  EXPECT_EQ(reply->header.type, 7);
  EXPECT_EQ(reply->header.payloadLength, 440u);
  EXPECT_EQ(reply->header.sequence, 1u);
  const std::vector<uint8_t> versionBytes(reply->headerBytes.begin() + 24,
                                          reply->headerBytes.end());
  EXPECT_EQ(versionBytes, (std::vector<uint8_t>{0x15, 0x05, 0x00, 0x03}));
  auto table = kvhost::DecodeHardwareTable(reply->payload);
  ASSERT_TRUE(table);
  struct Expected {
    const char* name;
    uint32_t port, protocol, canProperty;
  };
  const Expected expected[] = {
      {"CAN1", 1, 0, 0},     {"CAN2", 2, 0, 0},     {"CAN3", 3, 0, 1}, {"CAN4", 4, 0, 1},
      {"CAN5", 5, 0, 1},     {"CAN6", 6, 0, 1},     {"LIN1", 1, 2, 0}, {"LIN2", 2, 2, 0},
      {"FlexRay1", 1, 1, 0}, {"FlexRay2", 2, 1, 0},
  };
  ASSERT_EQ(table->size(), std::size(expected));
  for (size_t i = 0; i < table->size(); ++i) {
    const kvhost::HardwareEntry& entry = (*table)[i];
    EXPECT_EQ(entry.name, expected[i].name);
    EXPECT_EQ(entry.port, expected[i].port) << entry.name;
    EXPECT_EQ(entry.protocol, expected[i].protocol) << entry.name;
    EXPECT_EQ(entry.canProperty, expected[i].canProperty) << entry.name;
    for (size_t b = 28; b < 44; ++b) EXPECT_EQ(entry.raw[b], 0) << entry.name << " byte " << b;
  }
}

}  // namespace
}  // namespace kvtest
