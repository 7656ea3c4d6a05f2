// The connection loop over TCP: slots, backlog, hosts that leave, stay silent or never read.
#include <gtest/gtest.h>

#include <vector>

#include "tarvix/TarvixControl.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

constexpr size_t kSlots = 8;
constexpr std::chrono::milliseconds kNoGreetingWindow = 300ms;
constexpr std::chrono::milliseconds kWellWithinThePassWait = 5s;

class ConnectionLoopTest : public ServiceFixture {
 protected:
  void StartWithShortHeartbeat() {
    heartbeatLimitMs_ = kTestHeartbeatLimitMs;
    StartService();
  }
};

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

// Hosts that vanished without closing (asleep, cable pulled) hold every slot while a ninth host
// waits in the backlog and gives up: the watchdog still ends them, and the next host gets in.
TEST_F(ConnectionLoopTest, VanishedHostsInEverySlotAreEndedAndTheNextHostGetsIn) {
  StartWithShortHeartbeat();
  std::vector<kvhost::HostClient> vanished;
  for (size_t i = 0; i < kSlots; ++i) vanished.push_back(ConnectHost());
  kvhost::HostClient gaveUp = ConnectQuietly();
  gaveUp.Close();
  kvhost::HostClient next = ConnectQuietly();
  auto greeting = next.Receive(kConditionDeadline);
  ASSERT_TRUE(greeting) << "the host never got in";
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
  EXPECT_TRUE(WaitUntil([&] { return service().statistics().heartbeatTimeouts.load() >= kSlots; }));
}

TEST_F(ConnectionLoopTest, SilentHostIsEndedWithTheHeartbeatText) {
  StartWithShortHeartbeat();
  const auto connected = std::chrono::steady_clock::now();
  kvhost::HostClient host = ConnectHost();
  auto farewell = host.Receive(kConditionDeadline);
  ASSERT_TRUE(farewell) << "no heartbeat error";
  EXPECT_GE(std::chrono::steady_clock::now() - connected,
            std::chrono::milliseconds(kTestHeartbeatLimitMs));
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

// A hardware table larger than the socket's send buffer: a reply the system can take only in
// part, however the buffers stand.
using HostConnectionPointer = nKV_DLL300::HostConnection*;

class PartlySentReplyTest : public SlowReaderTest {
 protected:
  void SetUp() override {
    std::string devices;
    for (int d = 0; d < kDevices; ++d) {
      std::string interfaces;
      for (int i = 0; i < kInterfacesPerDevice; ++i) {
        const std::string name = "CAN" + std::to_string(d * kInterfacesPerDevice + i + 1);
        interfaces += std::string(i ? "," : "") + R"({"name": ")" + name + R"(", "bus": "b"})";
      }
      devices += std::string(d ? "," : "") + R"({"name": "D)" + std::to_string(d) +
                 R"(", "interfaces": [)" + interfaces + "]}";
    }
    std::string error;
    ASSERT_TRUE(tarvix::LoadConfiguration(
        R"({"buses": [{"name": "b"}], "devices": [)" + devices + "]}", ".", &error))
        << error;
    SlowReaderTest::SetUp();
  }
  void TearDown() override {
    SlowReaderTest::TearDown();
    tarvix::ResetToDefaults();
  }
  static constexpr int kDevices = 64;  // 1024 interfaces: a table of 45 056 bytes
  static constexpr int kInterfacesPerDevice = 16;
};

// The rest of the reply goes out as soon as the host reads again, and before the connection of a
// host that leaves is closed.
TEST_F(PartlySentReplyTest, RestOfAPartlySentMessageFollowsWhenTheHostReadsOrLeaves) {
  for (bool leaves : {false, true}) {
    SCOPED_TRACE(leaves ? "the host leaves" : "the host reads");
    StartService();
    kvhost::HostClient host;
    ASSERT_TRUE(host.ConnectWithReceiveBuffer("127.0.0.1", port(), kSmallBuffer)) << host.error();
    ASSERT_TRUE(WaitUntil([&] { return service().connections[0].published.load() != nullptr; }));
    HostConnectionPointer published = service().connections[0].published.load();
    const nKV_DLL300::HostConnection& connection = *published;
    SendAndWaitDispatched(host, "CMD_GET_HARDWARE_INFO");
    // The message is counted before its reply is sent, and the reply first waits its send wait.
    ASSERT_TRUE(WaitUntil([&] { return connection.hasPendingOutput(); }))
        << "the reply was taken whole";
    // The service frees the connection once the host leaves; this orders the reads before it.
    auto handOver = [&] {
      service().connections[0].published.compare_exchange_strong(published, published);
    };
    handOver();
    if (leaves) host.StopSending();
    // Well within the pass wait of 10 s, every message has arrived whole.
    EXPECT_TRUE(WaitUntil(
        [&] {
          while (host.Receive(kNoGreetingWindow)) {
          }
          const bool sent = leaves ? host.closed() : !connection.hasPendingOutput();
          return sent && host.partialBytes() == 0;
        },
        kWellWithinThePassWait));
    handOver();
  }
}

}  // namespace
}  // namespace kvtest
