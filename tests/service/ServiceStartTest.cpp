// Start-up of the service from the configuration file on the drive.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "platform/net/Socket.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

constexpr char kConfigFile[] = "QV-RT\\tarvix\\kelvane\\kelvanert.ini";

// Starts the service itself, after the test has prepared the drive.
class ServiceStartTest : public ServiceFixture {
 protected:
  void SetUp() override {}
  nKV_DLL300::ServiceOptions Options() override {
    nKV_DLL300::ServiceOptions options = ServiceFixture::Options();
    options.portText.reset();  // read the file
    return options;
  }
};

TEST_F(ServiceStartTest, PortThatIsNotANumberLetsTheSystemChoose) {
  drive_.WriteFile(kConfigFile, "PORT=abc\n");
  StartService();
  EXPECT_GT(port(), 0);
  kvhost::HostClient host = ConnectHost();
  EXPECT_TRUE(host.connected());
}

struct ConsoleRow {
  const char* what;
  const char* file;  // written before the start, nullptr: nothing
  const char* contents;
  std::vector<std::string> words;  // each must be in the console; none: the console stays empty
};

TEST_F(ServiceStartTest, SetUpProblemsAreReportedOnTheConsoleInOneLine) {
  const ConsoleRow rows[] = {
      {"missing directory is created silently", nullptr, nullptr, {}},
      {"unusable directory: default port",
       "QV-RT",
       "a file where the directory should be",
       {"kelvane", "13456"}},
      {"first word without =", kConfigFile, "13456 PORT=2000", {"name=port"}},
  };
  for (const ConsoleRow& row : rows) {
    SCOPED_TRACE(row.what);
    if (row.file) drive_.WriteFile(row.file, row.contents);
    testing::internal::CaptureStderr();
    StartService(kSetUpOnly);
    std::string console = testing::internal::GetCapturedStderr();
    const int32_t listening = service().listeningPort();
    StopService();
    for (const std::string& word : row.words)
      EXPECT_NE(console.find(word), std::string::npos) << console;
    // Besides the problem, the one line that names the port the service listens on.
    EXPECT_NE(console.find("listening on port " + std::to_string(listening)), std::string::npos)
        << console;
    EXPECT_EQ(std::count(console.begin(), console.end(), '\n'), row.words.empty() ? 1 : 2)
        << console;
    if (row.file == nullptr) {
      EXPECT_TRUE(std::filesystem::is_directory(drive_.Native("QV-RT\\tarvix\\kelvane")));
    }
    std::filesystem::remove_all(drive_.Native("QV-RT"));
  }
}

// A port another program holds: one line names it and the reason, and the service takes the port
// over once it frees.
TEST_F(ServiceStartTest, PortInUseIsToldOnceAndTakenOverWhenItFrees) {
  platform::net::SocketHandle holder = platform::net::CreateTcpSocket();
  ASSERT_TRUE(platform::net::BindAnyAddress(holder, 0));
  ASSERT_TRUE(platform::net::Listen(holder, 1));
  const int32_t held = platform::net::LocalPort(holder);
  drive_.WriteFile(kConfigFile, "PORT=" + std::to_string(held) + "\n");
  testing::internal::CaptureStderr();
  StartService(kSetUpOnly);
  EXPECT_EQ(service().listeningPort(), -1);
  platform::net::Close(holder);
  EXPECT_TRUE(WaitUntil([&] { return service().listeningPort() == held; }));
  const std::string console = testing::internal::GetCapturedStderr();
  EXPECT_NE(console.find("cannot listen on port " + std::to_string(held) + " (socket error 10048"),
            std::string::npos)
      << console;
  EXPECT_EQ(std::count(console.begin(), console.end(), '\n'), 2) << console;
  kvhost::HostClient host;
  ASSERT_TRUE(host.Connect("127.0.0.1", static_cast<uint16_t>(held))) << host.error();
  auto greeting = host.Receive(kReplyDeadline);
  ASSERT_TRUE(greeting);
  EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
}

}  // namespace
}  // namespace kvtest
