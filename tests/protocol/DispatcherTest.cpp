// The dispatcher on a connection over a local socket pair: which messages reach a handler, what
// the replies' headers carry, and the fuzz corpus as a regression run.
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "host/HostMessage.h"
#include "hostlink/HostConnection.h"
#include "protocol/Dispatcher.h"
#include "tests/support/FakeSession.h"

namespace nKV_DLL300 {
namespace {

constexpr uint16_t kSessionIdCount = 0x0102;
constexpr int32_t kSessionStatus = -20;

class DispatcherTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, pair_), 0);
    connection_ = std::make_unique<HostConnection>(pair_[0], ConnectionSetup{});
  }
  void TearDown() override {
    connection_.reset();  // closes pair_[0]
    close(pair_[1]);
  }

  void GiveSession(driver::BusKind kind) {
    connection_->session = std::make_unique<kvtest::FakeSession>(connection_.get(), calls_, kind);
    connection_->session->idCount.store(kSessionIdCount);
    connection_->session->lastStatus.store(kSessionStatus);
    connection_->busType.store(kind);
  }
  void GiveCanSession() { GiveSession(driver::BusKind::kCan); }

  // Sends `text` as the host and dispatches it; returns what the service answered (may be empty).
  std::vector<uint8_t> Dispatch(const std::string& text) {
    EXPECT_EQ(send(pair_[1], text.data(), text.size(), 0), static_cast<ssize_t>(text.size()));
    DispatchOutcome outcome = DispatchMessage(*connection_);
    EXPECT_EQ(outcome.receiveResult, 0);
    std::vector<uint8_t> reply(4096);
    ssize_t received = recv(pair_[1], reply.data(), reply.size(), MSG_DONTWAIT);
    reply.resize(received > 0 ? static_cast<size_t>(received) : 0);
    return reply;
  }

  int pair_[2] = {-1, -1};
  std::unique_ptr<HostConnection> connection_;
  kvtest::FakeSession::Calls calls_;
};

std::string TextOf(const std::vector<uint8_t>& reply) {
  return reply.size() < 28 ? "" : std::string(reply.begin() + 28, reply.end());
}

TEST_F(DispatcherTest, TransmitPropertiesReachTheTableOnlyWithACanSession) {
  EXPECT_TRUE(Dispatch("SET_TX_PROP_FOO=1").empty());
  GiveCanSession();
  EXPECT_EQ(TextOf(Dispatch("SET_TX_PROP_FOO=1")), "<ERROR: unknown SETPROP command>\n");
  // A port name of another bus set while the CAN session runs does not change the session's kind.
  connection_->busType.store(driver::BusKind::kLin);
  EXPECT_EQ(TextOf(Dispatch("SET_TX_PROP_FOO=1")), "<ERROR: unknown SETPROP command>\n");
  GiveSession(driver::BusKind::kLin);
  EXPECT_TRUE(Dispatch("SET_TX_PROP_FOO=1").empty());
}

TEST_F(DispatcherTest, UnknownCommandCarriesTheSessionUnknownPropertyDoesNot) {
  GiveCanSession();
  auto command = kvhost::DecodeHeader(Dispatch("CMD_NOPE").data(), 28);
  auto reply = Dispatch("SET_PROP_NOPE=1");
  auto property = kvhost::DecodeHeader(reply.data(), reply.size());
  ASSERT_TRUE(command && property);
  EXPECT_EQ(command->idCount, kSessionIdCount);
  EXPECT_EQ(command->lastStatus, kSessionStatus);
  EXPECT_EQ(property->idCount, 0u);
  EXPECT_EQ(property->lastStatus, 0);
}

TEST_F(DispatcherTest, ReceiveFailureIsReportedWithoutHandling) {
  close(pair_[1]);
  pair_[1] = socket(AF_UNIX, SOCK_STREAM, 0);  // keep TearDown's close harmless
  DispatchOutcome outcome = DispatchMessage(*connection_);
  EXPECT_EQ(outcome.receiveResult, -7);
}

TEST_F(DispatcherTest, FuzzCorpusRunsCleanThroughTheDispatcher) {
  GiveCanSession();
  size_t inputs = 0;
  for (const auto& entry : std::filesystem::directory_iterator(KV_FUZZ_CORPUS_DIR)) {
    std::ifstream file(entry.path(), std::ios::binary);
    std::stringstream contents;
    contents << file.rdbuf();
    std::string input = contents.str().substr(0, 256);
    if (input.empty()) continue;
    (void)Dispatch(input);
    ++inputs;
  }
  EXPECT_GT(inputs, 0u);
}

}  // namespace
}  // namespace nKV_DLL300
