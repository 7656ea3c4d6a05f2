// Property replies while the connection holds a session: refusals by bus and the header session.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "host/HostClient.h"
#include "hostlink/HostConnection.h"
#include "platform/net/Socket.h"
#include "protocol/Dispatcher.h"
#include "service/Listener.h"
#include "tests/protocol/PropertyReplyCheck.h"
#include "tests/support/FakeSession.h"

namespace kvtest {
namespace {

namespace net = platform::net;
using nKV_DLL300::HostConnection;

constexpr std::chrono::milliseconds kDeadline = std::chrono::seconds(10);
constexpr uint16_t kSessionIdCount = 0x1234;
constexpr int32_t kSessionStatus = -21;
constexpr SessionShown kShown{kSessionIdCount, kSessionStatus};
constexpr SessionShown kHidden{};

// A connection over loopback TCP whose handlers run on the test thread, so the test can give it
// a session directly. The host side reads the replies.
class SessionPropertiesTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_EQ(nKV_DLL300::OpenListener("0", listener_), 0);
    int32_t port = net::LocalPort(listener_);
    ASSERT_GT(port, 0);
    ASSERT_TRUE(host_.Connect("127.0.0.1", static_cast<uint16_t>(port))) << host_.error();
    net::SocketHandle accepted = net::Accept(listener_);
    ASSERT_NE(accepted, net::kInvalidSocket);
    connection_ = std::make_unique<HostConnection>(accepted, nKV_DLL300::ConnectionSetup{});
  }
  void TearDown() override {
    connection_.reset();
    if (listener_ != net::kInvalidSocket) net::Close(listener_);
  }

  void StartSession(driver::BusKind busType) {
    connection_->busType.store(busType);
    auto session = std::make_unique<FakeSession>(connection_.get(), calls_, busType);
    session->idCount.store(kSessionIdCount);
    session->lastStatus.store(kSessionStatus);
    connection_->session = std::move(session);
  }

  // Handles `text` as the dispatcher does and checks the replies it sends, in order.
  void ExpectReplies(const std::string& text, const std::vector<ExpectedReply>& replies,
                     SessionShown shown) {
    nKV_DLL300::HandleMessageText(*connection_, text);
    for (const ExpectedReply& expected : replies) {
      ExpectReply(host_.Receive(kDeadline), expected, sequence_++, shown, text);
    }
  }
  // Proves that nothing was sent since the last checked reply.
  void ExpectNothingMore() {
    ExpectReplies("SET_PROP_FOO=1", {"<ERROR: unknown SETPROP command>\n"}, kHidden);
  }

  net::SocketHandle listener_ = net::kInvalidSocket;
  kvhost::HostClient host_;
  FakeSession::Calls calls_;  // a session that only gives the header its count and status
  std::unique_ptr<HostConnection> connection_;
  uint32_t sequence_ = 0;
};

struct LockedProperty {
  std::string name;
  std::string value;
};

const LockedProperty kLockedProperties[] = {
    {"SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES", "1"},
    {"SET_PROP_SESSION_TERMINATION", "1"},
    {"SET_PROP_SESSION_RUNMODE", "NORMAL"},
    {"SET_PROP_SESSION_LISTEN_ONLY", "1"},
    {"SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES", "1"},
    {"SET_PROP_SESSION_ALIAS", "SimDB"},
    {"SET_PROP_SESSION_CLUSTER", "Body"},
};

// A refused value is still stored for the next session.
TEST_F(SessionPropertiesTest, SessionSettingsAreRefusedNamingTheBusOfTheSession) {
  const std::pair<driver::BusKind, std::string> buses[] = {{driver::BusKind::kCan, "CAN"},
                                                           {driver::BusKind::kLin, "LIN"},
                                                           {driver::BusKind::kFlexRay, "FR"}};
  for (const auto& [busType, word] : buses) {
    StartSession(busType);
    for (const LockedProperty& property : kLockedProperties) {
      ExpectReplies(property.name + "=" + property.value,
                    {"<ERROR: " + property.name + ": " + word + " Session yet created>\n"}, kShown);
    }
  }
  ExpectNothingMore();
  const nKV_DLL300::SessionSettings& stored = connection_->settings;
  EXPECT_EQ(stored.logTransmittedFrames.load(), 1);
  EXPECT_EQ(stored.termination.load(), 1u);
  EXPECT_EQ(stored.runMode.get(), "NORMAL");
  EXPECT_EQ(stored.alias.get(), "SimDB");
  EXPECT_EQ(stored.cluster.get(), "Body");
}

TEST_F(SessionPropertiesTest, RangeErrorComesBeforeTheRefusalAndShowsNoSession) {
  StartSession(driver::BusKind::kLin);
  ExpectReplies("SET_PROP_SESSION_LISTEN_ONLY=7",
                {"<ERROR: SET_PROP_SESSION_LISTEN_ONLY: Value range error>\n"}, kHidden);
  ExpectReplies("SET_PROP_SESSION_RUNMODE=MASTER",
                {"<ERROR: SET_PROP_SESSION_RUNMODE: Value range error>\n"}, kHidden);
  EXPECT_EQ(connection_->settings.listenOnly.load(), 7);
  ExpectNothingMore();
}

TEST_F(SessionPropertiesTest, SessionOfNoKnownBusGetsNoReplyButTheValueIsStored) {
  StartSession(driver::BusKind::kNone);
  nKV_DLL300::HandleMessageText(*connection_, "SET_PROP_SESSION_CLUSTER=Body");
  ExpectNothingMore();
  EXPECT_EQ(connection_->settings.cluster.get(), "Body");
}

// Replies marked "with session" carry the session's count and status in bytes 12 to 19; all
// others carry zeros although the connection has a session.
TEST_F(SessionPropertiesTest, HeaderShowsTheSessionOnlyInRepliesThatCarryIt) {
  const std::string range = ": Value range error>\n";
  const std::pair<std::string, std::vector<ExpectedReply>> shown[] = {
      {"SET_PROP_SESSION_KEY_SLOT=3", {"<ACK: SET_PROP_SESSION_KEY_SLOT 3> \n"}},
      {"SET_PROP_SESSION_CANFD_BAUDRATE=2", {"<ACK: SET_PROP_SESSION_CANFD_BAUDRATE 2> \n"}},
      {"SET_PROP_SESSION_ISOFD_MODE=1", {"<ACK: SET_PROP_SESSION_ISOFD_MODE  1> \n"}},
      {"SET_PROP_SESSION_NODE_ADDRESS=5", {"<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n"}},
      {"SET_PROP_SESSION_NODE_NAME=9", {"<ACK: SET_PROP_SESSION_NODE_NAME 9> \n"}},
      {"SET_PROP_SESSION_TRANSCEIVER_TYPE=9",
       {"<ERROR: SET_PROP_SESSION_TRANSCEIVER_TYPE" + range}},
      {"SET_PROP_SESSION_SHOW_NULL_FRAMES=1", {"<ACK: SET_PROP_SESSION_SHOW_NULL_FRAMES 1> \n"}},
      {"SET_PROP_SESSION_NO_RESPONSE_FRAMES=3",
       {"<ERROR: SET_PROP_SESSION_NO_RESPONSE_FRAMES" + range}},
      {"SET_PROP_SESSION_LOG_CHECKSUM=0", {"<ACK: SET_PROP_SESSION_LOG_CHECKSUM 0> \n"}},
      {"SET_PROP_SESSION_CAN_IOMODE=3",
       {"<ERROR: SET_PROP_SESSION_CAN_IOMODE" + range, "<ACK: SET_PROP_SESSION_IOMODE 0> \n"}},
      {"SET_PROP_SESSION_APPLICATION_PROTOCOL=1",
       {"<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL 1> \n"}},
  };
  const std::pair<std::string, ExpectedReply> hidden[] = {
      {"SET_PROP_SESSION_BAUDRATE=500000", "<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n"},
      {"SET_PROP_TX_TIME_DATA=100", "<ACK: SETPROP_TXTIMECAN 100> \n"},
      {"SET_PROP_DATA_LOG_IDS_MAX=10", "<ACK: SET_PROP_MEM_SIZE_ID 10> \n"},
      {"SET_PROP_LOGFILE=3", "<ERROR: SET_PROP_LOGFILE" + range},
      {"SET_PROP_LOGFILE_TYPE=1", "<ACK: SET_PROP_LOGFILE_TYPE 1> \n"},
      {"SET_PROP_TX_TIME_STATISTIC=2000", "<ACK: SET_PROP_TX_TIME_STATISTIC 2000> \n"},
      {"SET_PROP_LOGFILE_VORA_GROUP_NAME=G", "<ACK: SET_PROP_LOGFILE_VORA_GROUP_NAME G>"},
      {"SET_PROP_SESSION_PORTNAME=CAN2", "<ACK: SET_PROP_SESSION_PORTNAME CAN2>"},
  };
  StartSession(driver::BusKind::kCan);
  for (const auto& [text, replies] : shown) ExpectReplies(text, replies, kShown);
  for (const auto& [text, reply] : hidden) ExpectReplies(text, {reply}, kHidden);
  ExpectNothingMore();
}

TEST_F(SessionPropertiesTest, LogFileNameIsRefusedOnlyWhileASessionLogs) {
  ExpectReplies("SET_PROP_LOGFILE=1", {"<ACK: SET_PROP_LOGFILE 1> \n"}, kHidden);
  ExpectReplies("SET_PROP_LOGFILE_NAME=first", {"<ACK: SET_PROP_LOGFILE_NAME first> \n"}, kHidden);
  StartSession(driver::BusKind::kCan);
  ExpectReplies("SET_PROP_LOGFILE_NAME=second",
                {"<ERROR: SET_PROP_LOGFILE_NAME, logging is active>\n"}, kHidden);
  ExpectReplies("SET_PROP_LOGFILE_NAME=", {"<ERROR: SET_PROP_LOGFILE_NAME, logging is active>\n"},
                kHidden);
  EXPECT_EQ(connection_->settings.logFileName.get(), "first");
  ExpectReplies("SET_PROP_LOGFILE=0", {"<ACK: SET_PROP_LOGFILE 0> \n"}, kHidden);
  ExpectReplies("SET_PROP_LOGFILE_NAME=second", {"<ACK: SET_PROP_LOGFILE_NAME second> \n"},
                kHidden);
  ExpectNothingMore();
}

}  // namespace
}  // namespace kvtest
