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
  const std::vector<uint8_t> expected = {0,  0, 0, 0, 3, 0, 0, 0, 23, 0,  0, 0, 0, 0,
                                         0,  0, 0, 0, 0, 0, 0, 0x0F, 0, 0, 0x15, 0x05, 0x00, 0x03};
  EXPECT_EQ(greeting->headerBytes, expected);
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
}

TEST_F(HostProtocolTest, SequenceNumbersRiseByOnePerMessage) {
  kvhost::HostClient host = ConnectHost();
  for (uint32_t expected = 1; expected <= 5; ++expected) {
    auto reply = Exchange(host, "CMD_NOPE");
    ASSERT_TRUE(reply);
    EXPECT_EQ(reply->header.sequence, expected);
  }
}

struct ReplyRow {
  const char* message;
  uint8_t type;
  const char* text;
};

TEST_F(HostProtocolTest, UnknownNamesAreAnsweredWithTheirErrorTexts) {
  const ReplyRow rows[] = {
      {"CMD_NOPE", 5, "<ERROR: unknown command>\n"},
      {"UNKNOWN", 5, "<ERROR: unknown command>\n"},
      {"CMD_HEARTBEAT\n", 5, "<ERROR: unknown command>\n"},
      {"cmd_heartbeat", 5, "<ERROR: unknown command>\n"},
      {"CMD_HEARTBEATCMD_HEARTBEAT", 5, "<ERROR: unknown command>\n"},
      {"SET_PROP_FOO=1", 5, "<ERROR: unknown SETPROP command>\n"},
      {"SET_PROPX=1", 5, "<ERROR: unknown SETPROP command>\n"},
      {"SET_PROP_SESSION_BAUDRATE\n=1", 5, "<ERROR: unknown SETPROP command>\n"},
  };
  kvhost::HostClient host = ConnectHost();
  for (const ReplyRow& row : rows) {
    auto reply = Exchange(host, row.message);
    ASSERT_TRUE(reply) << row.message;
    EXPECT_EQ(reply->header.type, row.type) << row.message;
    EXPECT_EQ(reply->text(), row.text) << row.message;
    EXPECT_EQ(reply->header.payloadLength, std::string(row.text).size()) << row.message;
  }
}

TEST_F(HostProtocolTest, SilentMessagesGetNoReplyAndLeaveTheConnectionUsable) {
  const char* silent[] = {
      "CMD_HEARTBEAT",
      "SET_PROP_SESSION_BAUDRATE 500000",   // no "=": dropped
      "SET_TX_PROP_IDENTIFIER=5",           // no CAN session: dropped
      "SET_TX_PROP_FOO=1",                  // likewise, even with an unknown name
  };
  kvhost::HostClient host = ConnectHost();
  uint32_t sequence = 1;
  for (const char* message : silent) {
    SendAndWaitDispatched(host, message);
    // The next reply is the one to a probe, so nothing was sent for the silent message.
    auto reply = Exchange(host, "CMD_PROBE");
    ASSERT_TRUE(reply) << message;
    EXPECT_EQ(reply->header.sequence, sequence++) << message;
    EXPECT_EQ(reply->text(), "<ERROR: unknown command>\n") << message;
  }
}

TEST_F(HostProtocolTest, TextAfterANulIsIgnored) {
  kvhost::HostClient host = ConnectHost();
  SendAndWaitDispatched(host, std::string("CMD_HEARTBEAT\0garbage", 21));
  auto reply = Exchange(host, "CMD_PROBE");
  ASSERT_TRUE(reply);
  EXPECT_EQ(reply->header.sequence, 1u);
}

TEST_F(HostProtocolTest, LongMessageIsReadAsOneMessageOf256Bytes) {
  kvhost::HostClient host = ConnectHost();
  auto reply = Exchange(host, "SET_PROP_UNKNOWN=" + std::string(239, 'x'));  // 256 bytes
  ASSERT_TRUE(reply);
  EXPECT_EQ(reply->text(), "<ERROR: unknown SETPROP command>\n");
}

TEST_F(HostProtocolTest, HardwareInfoSendsTheTenRecordsOfTheController) {
  kvhost::HostClient host = ConnectHost();
  auto reply = Exchange(host, "CMD_GET_HARDWARE_INFO");
  ASSERT_TRUE(reply);
  EXPECT_EQ(reply->header.type, 7);
  EXPECT_EQ(reply->header.payloadLength, 440u);
  EXPECT_EQ(reply->header.sequence, 1u);
  const std::vector<uint8_t> versionBytes(reply->headerBytes.begin() + 24, reply->headerBytes.end());
  EXPECT_EQ(versionBytes, (std::vector<uint8_t>{0x15, 0x05, 0x00, 0x03}));
  auto table = kvhost::DecodeHardwareTable(reply->payload);
  ASSERT_TRUE(table);
  struct Expected {
    const char* name;
    uint32_t port, protocol, canProperty;
  };
  const Expected expected[] = {
      {"CAN1", 1, 0, 0}, {"CAN2", 2, 0, 0}, {"CAN3", 3, 0, 1},     {"CAN4", 4, 0, 1},
      {"CAN5", 5, 0, 1}, {"CAN6", 6, 0, 1}, {"LIN1", 1, 2, 0},     {"LIN2", 2, 2, 0},
      {"FlexRay1", 1, 1, 0},                {"FlexRay2", 2, 1, 0},
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
