// The heartbeat rule and sends on a connection without a socket, without any network.
#include <gtest/gtest.h>

#include "hostlink/HostLink.h"
#include "hostlink/SendReply.h"
#include "tests/support/FakeSession.h"

namespace nKV_DLL300 {
namespace {

constexpr uint64_t kElevenSecondsPs = 11'000'000'000'000ull;

TEST(HostLinkTest, LapsedHeartbeatStopsTheSessionBeforeClosing) {
  ServiceStatistics statistics;
  HostConnection connection(platform::net::kInvalidSocket, ConnectionSetup{{}, {}, &statistics});
  kvtest::FakeSession::Calls calls;
  connection.session = std::make_unique<kvtest::FakeSession>(&connection, calls);
  connection.heartbeatWatch.accumulatedPs = kElevenSecondsPs;

  EXPECT_EQ(CheckHeartbeat(connection), kHeartbeatTimeout);
  EXPECT_EQ(calls.stops, 1);
  EXPECT_TRUE(calls.destroyed);
  EXPECT_EQ(connection.session, nullptr);
  EXPECT_TRUE(connection.closeRequested.load());
  EXPECT_FALSE(connection.heartbeatWatch.isRunning);
  EXPECT_EQ(connection.heartbeatWatch.ElapsedMilliseconds(), 0u);
  EXPECT_EQ(statistics.heartbeatTimeouts.load(), 1u);
}

TEST(HostLinkTest, RecentHeartbeatLeavesTheConnectionAlone) {
  HostConnection connection(platform::net::kInvalidSocket, ConnectionSetup{});
  connection.heartbeatWatch.accumulatedPs = kElevenSecondsPs;
  RestartHeartbeat(connection);
  EXPECT_EQ(CheckHeartbeat(connection), 0);
  EXPECT_FALSE(connection.closeRequested.load());
  EXPECT_TRUE(connection.heartbeatWatch.isRunning);
}

TEST(HostLinkTest, SendWithoutSocketFailsAndStillCountsTheMessage) {
  ServiceStatistics statistics;
  HostConnection connection(platform::net::kInvalidSocket, ConnectionSetup{{}, {}, &statistics});
  SendText(connection, "<ACK: x>\n", nullptr, 3);
  EXPECT_EQ(connection.lastTcpError.load(), kSendFailed);
  EXPECT_EQ(statistics.failedSends.load(), 1u);
}

TEST(HostLinkTest, NewConnectionStartsFromTheDefaults) {
  ConnectionSetup setup;
  setup.hardwareTable.resize(3);
  for (uint32_t i = 0; i < kDriverVersionCount; ++i) setup.driverVersion[i] = i + 1;
  HostConnection connection(platform::net::kInvalidSocket, std::move(setup));
  EXPECT_EQ(connection.hardwareCount, 3);
  EXPECT_EQ(connection.driverVersion[4], 5u);
  EXPECT_EQ(connection.busType.load(), driver::BusKind::kNone);
  EXPECT_EQ(connection.settings.txTimeData.load(), 1000u);
  EXPECT_EQ(connection.settings.keySlot.load(), 0xFFFFFFFFu);
  EXPECT_EQ(connection.settings.runMode.get(), "SUBORDINATE");
  EXPECT_EQ(connection.commandTable.find("CMD_HEARTBEAT"), 6);
  EXPECT_EQ(connection.propertyTable.find("SET_PROP_SESSION_NODE_NAME"), 35);
  EXPECT_EQ(connection.propertyTable.find("SET_PROP_SESSION_NODE_NAMEX"), 0);
  EXPECT_TRUE(connection.heartbeatWatch.isRunning);
}

}  // namespace
}  // namespace nKV_DLL300
