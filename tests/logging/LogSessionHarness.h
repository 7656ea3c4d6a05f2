// Test harness: a host connection on a real socket, a bus session that owns a SessionLog, and the
// service directory of a temporary drive.
#pragma once

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "bus/CBusSystem.h"
#include "host/HostClient.h"
#include "hostlink/HostConnection.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "logging/SessionLog.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {

// A session with nothing to poll: the log operations are called by the test as a poll loop would.
class LoggingSession : public nKV_DLL300::CBusSystem {
 public:
  LoggingSession(nKV_DLL300::HostConnection* connection, driver::BusKind bus)
      : CBusSystem(connection, bus) {}
  void startPollThread() override {}
  int32_t pollLoop() override { return 0; }
  void reportBusState(uint64_t) override {}

  nKV_DLL300::SessionLog& log() { return sessionLog; }
};

inline constexpr char kServiceDirectoryBelowDrive[] = "QV-RT\\tarvix\\kelvane";
inline constexpr char kMark[] = "<MARK>";

// A host (client end) and the service's HostConnection (server end) of one TCP connection.
class LogSessionTest : public ::testing::Test {
 protected:
  void SetUp() override {
    const int listener = ::socket(AF_INET, SOCK_STREAM, 0);
    ASSERT_GE(listener, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    ASSERT_EQ(::bind(listener, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    ASSERT_EQ(::listen(listener, 1), 0);
    ASSERT_EQ(::getsockname(listener, reinterpret_cast<sockaddr*>(&address), &length), 0);
    ASSERT_TRUE(host_.Connect("127.0.0.1", ntohs(address.sin_port))) << host_.error();
    const int accepted = ::accept(listener, nullptr, nullptr);
    ::close(listener);
    ASSERT_GE(accepted, 0);
    connection_ =
        std::make_unique<nKV_DLL300::HostConnection>(accepted, nKV_DLL300::ConnectionSetup{});
    UseBus(driver::BusKind::kCan);
  }

  void TearDown() override {
    session_.reset();
    connection_.reset();
  }

  // A new session of `bus`; the connection's busType follows it.
  void UseBus(driver::BusKind bus) {
    session_.reset();
    connection_->busType.store(bus);
    session_ = std::make_unique<LoggingSession>(connection_.get(), bus);
  }

  nKV_DLL300::SessionSettings& settings() { return connection_->settings; }
  nKV_DLL300::SessionLog& log() { return session_->log(); }
  LoggingSession& session() { return *session_; }

  // Every message sent since the last call: a marker is sent and messages are read up to it.
  std::vector<kvhost::HostMessage> SentMessages() {
    nKV_DLL300::SendText(*connection_, kMark, nullptr, nKV_DLL300::kMessageText);
    std::vector<kvhost::HostMessage> messages;
    for (;;) {
      std::optional<kvhost::HostMessage> message = host_.Receive(kReplyDeadline);
      if (!message) {
        ADD_FAILURE() << "the marker did not arrive";
        return messages;
      }
      if (message->text() == kMark) return messages;
      messages.push_back(*message);
    }
  }

  // The texts of SentMessages, each checked to be an error text carrying the session's status.
  std::vector<std::string> SentErrorTexts() {
    std::vector<std::string> texts;
    for (const kvhost::HostMessage& m : SentMessages()) {
      EXPECT_EQ(m.header.type, kvhost::kErrorText);
      texts.push_back(m.text());
    }
    return texts;
  }

  std::filesystem::path ServiceDirectory() const {
    return drive_.Native(kServiceDirectoryBelowDrive);
  }
  std::optional<std::string> ReadLog(const std::string& fileName) const {
    return drive_.ReadFile(std::string(kServiceDirectoryBelowDrive) + "\\" + fileName);
  }

  TemporaryDrive drive_;
  kvhost::HostClient host_;
  std::unique_ptr<nKV_DLL300::HostConnection> connection_;
  std::unique_ptr<LoggingSession> session_;
};

inline std::string LogErrorText(int32_t code) {
  return "<ERROR:LOG FILE: " + std::to_string(code) + "> \n";
}

}  // namespace kvtest
