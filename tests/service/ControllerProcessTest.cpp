// The real controller program: it loads the module, serves a host after its start delay, and
// unloads the module in order on SIGTERM.
#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include "host/HostClient.h"
#include "host/HostMessage.h"
#include "tests/support/ServiceFixture.h"

extern char** environ;

namespace kvtest {
namespace {

constexpr std::chrono::milliseconds kStartDeadline = 60s;  // the module waits 10 s first

bool ExitedWith(pid_t child, int expectedStatus, std::chrono::milliseconds timeout) {
  int status = 0;
  bool ended = WaitUntil([&] { return waitpid(child, &status, WNOHANG) == child; }, timeout);
  return ended && WIFEXITED(status) && WEXITSTATUS(status) == expectedStatus;
}

TEST(ControllerProcessTest, ControllerServesAHostAndStopsInOrderOnSigterm) {
  TemporaryDrive drive;
  uint16_t port = kvhost::FreeLoopbackPort();
  drive.WriteFile("QV-RT\\tarvix\\kelvane\\kelvanert.ini", "PORT=" + std::to_string(port) + "\n");

  pid_t child = 0;
  char program[] = KV_CONTROLLER_PATH;
  char* arguments[] = {program, nullptr};
  ASSERT_EQ(posix_spawn(&child, program, nullptr, nullptr, arguments, environ), 0);

  kvhost::HostClient host;
  EXPECT_TRUE(WaitUntil([&] { return host.Connect("127.0.0.1", port); }, kStartDeadline));
  auto greeting = host.Receive(kReplyDeadline);
  ASSERT_TRUE(greeting);
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
  ASSERT_TRUE(host.Send("CMD_GET_HARDWARE_INFO"));
  auto table = host.Receive(kReplyDeadline);
  ASSERT_TRUE(table);
  EXPECT_EQ(table->header.type, 7);
  EXPECT_EQ(table->payload.size(), 440u);
  EXPECT_EQ(std::vector<uint8_t>(table->headerBytes.begin() + 24, table->headerBytes.end()),
            (std::vector<uint8_t>{0x15, 0x05, 0x00, 0x03}));

  kill(child, SIGTERM);
  EXPECT_TRUE(host.WaitForClose(kReplyDeadline)) << "the connection outlived the module";
  EXPECT_TRUE(ExitedWith(child, 0, kConditionDeadline));
}

}  // namespace
}  // namespace kvtest
