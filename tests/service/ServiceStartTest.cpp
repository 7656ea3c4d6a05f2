// Start-up of the service from the configuration file on the drive.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

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
    StopService();
    for (const std::string& word : row.words)
      EXPECT_NE(console.find(word), std::string::npos) << console;
    EXPECT_EQ(std::count(console.begin(), console.end(), '\n'), row.words.empty() ? 0 : 1)
        << console;
    if (row.file == nullptr) {
      EXPECT_TRUE(std::filesystem::is_directory(drive_.Native("QV-RT\\tarvix\\kelvane")));
    }
    std::filesystem::remove_all(drive_.Native("QV-RT"));
  }
}

}  // namespace
}  // namespace kvtest
