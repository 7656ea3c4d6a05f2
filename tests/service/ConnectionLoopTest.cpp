// The connection loop over TCP: slots, backlog, hosts that leave, stay silent or never read.
#include <gtest/gtest.h>

#include <vector>

#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

constexpr size_t kSlots = 8;
constexpr std::chrono::milliseconds kNoGreetingWindow = 300ms;
constexpr std::chrono::milliseconds kHeartbeatDeadline = 40s;

class ConnectionLoopTest : public ServiceFixture {};

TEST_F(ConnectionLoopTest, NinthHostWaitsInBacklogUntilSlotFrees) {
  std::vector<kvhost::HostClient> hosts;
  for (size_t i = 0; i < kSlots; ++i) hosts.push_back(ConnectHost());
  kvhost::HostClient ninth = ConnectQuietly();
  EXPECT_FALSE(ninth.Receive(kNoGreetingWindow)) << "a ninth host was greeted";
  EXPECT_EQ(service().statistics().connectionsAccepted.load(), kSlots);

  hosts[3].Close();
  auto greeting = ninth.Receive(kReplyDeadline);
  ASSERT_TRUE(greeting);
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
  EXPECT_EQ(greeting->header.sequence, 0u);
  EXPECT_EQ(service().statistics().connectionsOpen.load(), kSlots);
}

TEST_F(ConnectionLoopTest, HostThatClosesItsSocketIsRemoved) {
  kvhost::HostClient leaving = ConnectHost();
  kvhost::HostClient staying = ConnectHost();
  leaving.Close();
  EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsEnded.load() == 1; }));
  EXPECT_EQ(service().statistics().connectionsOpen.load(), 1u);
  auto reply = Exchange(staying, "CMD_PROBE");
  ASSERT_TRUE(reply);
  EXPECT_EQ(reply->header.sequence, 1u);
}

TEST_F(ConnectionLoopTest, SilentHostIsEndedWithTheHeartbeatText) {
  kvhost::HostClient host = ConnectHost();
  auto farewell = host.Receive(kHeartbeatDeadline);
  ASSERT_TRUE(farewell) << "no heartbeat error";
  EXPECT_EQ(farewell->header.type, 5);
  EXPECT_EQ(farewell->header.sequence, 1u);
  EXPECT_EQ(farewell->text(), "<ERROR: Heartbeat message missing| TCP Client disconnect> \n");
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline));
  EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsOpen.load() == 0; }));
  EXPECT_EQ(service().statistics().heartbeatTimeouts.load(), 1u);
}

// A host that never reads: once its buffers are full the service's sends fail after their wait,
// but the host's commands are still taken, and every message that did go out is whole.
class SlowReaderTest : public ServiceFixture {
 protected:
  nKV_DLL300::ServiceOptions Options() override {
    nKV_DLL300::ServiceOptions options = ServiceFixture::Options();
    options.socketSendBufferBytes = kSmallBuffer;
    return options;
  }
  static constexpr int32_t kSmallBuffer = 4096;
  static constexpr int kMaxRequests = 5000;
};

TEST_F(SlowReaderTest, HostThatNeverReadsStaysConnectedAndIsStillServed) {
  kvhost::HostClient host;
  ASSERT_TRUE(host.ConnectWithReceiveBuffer("127.0.0.1", port(), kSmallBuffer)) << host.error();
  const auto& statistics = service().statistics();
  for (int i = 0; i < kMaxRequests && statistics.failedSends.load() == 0; ++i) {
    SendAndWaitDispatched(host, "CMD_GET_HARDWARE_INFO");
  }
  ASSERT_GT(statistics.failedSends.load(), 0u) << "the buffers never filled";
  SendAndWaitDispatched(host, "CMD_HEARTBEAT");
  EXPECT_EQ(statistics.connectionsOpen.load(), 1u);

  // Now read everything; a marker's reply ends what was queued before it.
  std::vector<kvhost::HostMessage> messages;
  bool markerSeen = false;
  for (int attempt = 0; attempt < 5 && !markerSeen; ++attempt) {
    ASSERT_TRUE(host.Send("CMD_MARK"));
    while (auto message = host.Receive(kReplyDeadline)) {
      messages.push_back(*message);
      if (message->header.type == 5) {
        markerSeen = true;
        break;
      }
    }
  }
  ASSERT_TRUE(markerSeen);
  bool gap = false;
  for (size_t i = 0; i < messages.size(); ++i) {
    const kvhost::HostMessage& message = messages[i];
    if (i > 0) {
      EXPECT_GT(message.header.sequence, messages[i - 1].header.sequence);
      gap = gap || message.header.sequence != messages[i - 1].header.sequence + 1;
    }
    if (message.header.type == 7) {
      EXPECT_EQ(message.payload.size(), 440u);
    } else if (message.header.type == 3) {
      EXPECT_EQ(message.text(), "<Connected to Kelvane>\n");
    } else {
      EXPECT_EQ(message.text(), "<ERROR: unknown command>\n");
    }
  }
  EXPECT_TRUE(gap) << "no message was dropped";
  EXPECT_EQ(statistics.connectionsOpen.load(), 1u);
}

}  // namespace
}  // namespace kvtest
