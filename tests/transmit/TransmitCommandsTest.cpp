// Transmit messages by session kind: acknowledged on CAN, acknowledged and nothing else on LIN and
// FlexRay, dropped unanswered without a CAN session.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tarvix/TarvixControl.h"
#include "tests/session/CanSessionFixture.h"

namespace kvtest {
namespace {

const std::vector<std::string> kTxProperties = {
    "SET_TX_PROP_PAYLOAD_LENGTH=8", "SET_TX_PROP_EXTENDED_ID=1", "SET_TX_PROP_FRAME_TYPE=0",
    "SET_TX_PROP_TIMING_TYPE=1",    "SET_TX_PROP_CYCLIC_RATE=0,5", "SET_TX_PROP_PAYLOAD=1,2",
    "SET_TX_PROP_IDENTIFIER=16"};

// True when the driver was asked to build or use a transmit database or output session.
bool AnyTransmitCall() {
  for (const tarvix::CallRecord& call : tarvix::RecordedCalls()) {
    if (call.operation.starts_with("kxdb") || call.operation == "kxWriteFrame") return true;
  }
  return false;
}

class TransmitCommandsTest : public CanSessionTest {
 protected:
  // Connects a host and names its port over TCP (bus kind from the name); checks the reply.
  kvhost::HostClient HostOnPort(const std::string& port) {
    kvhost::HostClient host = ConnectHost();
    auto reply = Command(host, "SET_PROP_SESSION_PORTNAME=" + port);
    EXPECT_TRUE(reply.has_value());
    if (reply) {
      EXPECT_EQ(reply->text(), "<ACK: SET_PROP_SESSION_PORTNAME " + port + ">");
    }
    return host;
  }

  void ExpectText(kvhost::HostClient& host, const std::string& command, const std::string& text) {
    auto reply = Command(host, command);
    ASSERT_TRUE(reply.has_value()) << command;
    EXPECT_EQ(reply->text(), text);
  }

  // Sends every transmit property; none may be answered, so the next text is the error query's.
  void ExpectTxPropertiesDropped(kvhost::HostClient& host, const std::string& lastErrorPrefix) {
    for (const std::string& message : kTxProperties) SendAndWaitDispatched(host, message);
    auto reply = Command(host, "CMD_SESSION_READ_LAST_ERROR");
    ASSERT_TRUE(reply.has_value());
    EXPECT_TRUE(reply->text().starts_with(lastErrorPrefix)) << reply->text();
  }
};

TEST_F(TransmitCommandsTest, EveryTransmitPropertyIsAcknowledgedOnACanSession) {
  kvhost::HostClient host = StartedHost(0, "CAN3");
  for (const std::string& message : kTxProperties) {
    auto reply = Command(host, message);
    ASSERT_TRUE(reply.has_value()) << message;
    EXPECT_EQ(reply->header.type, kvhost::kText);
    EXPECT_EQ(reply->text(), "<ACK: " + message.substr(0, message.find('=')) + ">\n");
  }
}

TEST_F(TransmitCommandsTest, TransmitPropertiesWithoutACanSessionAreDropped) {
  kvhost::HostClient host = HostOnPort("CAN3");  // a CAN port, but no session yet
  ExpectTxPropertiesDropped(host, "<TCP Error: ");
}

TEST_F(TransmitCommandsTest, LinAndFlexRaySessionsOnlyAcknowledgeTransmitCommands) {
  struct Case {
    const char* port;
    std::vector<std::string> settings;
    const char* lastErrorPrefix;
  };
  const std::vector<Case> cases = {
      {"LIN1", {"SET_PROP_SESSION_BAUDRATE=19200"}, "<LIN Error: "},
      {"FlexRay1", {}, "<FlexRay Error: "},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.port);
    tarvix::ResetToDefaults();
    StartService();
    kvhost::HostClient host = HostOnPort(c.port);
    for (const std::string& setting : c.settings) ASSERT_TRUE(Command(host, setting).has_value());
    ExpectText(host, "CMD_SESSION_START", "<ACK: CMD_SESSION_START>\n");

    tarvix::StartRecording();
    ExpectText(host, "CMD_TX_START", "<ACK: CMD_TX_START>\n");
    ExpectText(host, "CMD_TX_STOP", "<ACK: CMD_TX_STOP>\n");
    ExpectTxPropertiesDropped(host, c.lastErrorPrefix);
    tarvix::StopRecording();
    EXPECT_FALSE(AnyTransmitCall());
  }
}

}  // namespace
}  // namespace kvtest
