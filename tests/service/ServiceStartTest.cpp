// Start-up of the service from the configuration file on the drive.
#include <gtest/gtest.h>

#include <algorithm>

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

TEST_F(ServiceStartTest, MissingServiceDirectoryIsCreatedSilently) {
  testing::internal::CaptureStderr();
  StartService(kSetUpOnly);
  std::string console = testing::internal::GetCapturedStderr();
  EXPECT_TRUE(std::filesystem::is_directory(drive_.Native("QV-RT\\tarvix\\kelvane")));
  EXPECT_EQ(console, "");
}

TEST_F(ServiceStartTest, UnusableServiceDirectoryFallsBackToTheDefaultPortWithOneLine) {
  drive_.WriteFile("QV-RT", "a file where the directory should be");
  testing::internal::CaptureStderr();
  StartService(kSetUpOnly);
  std::string console = testing::internal::GetCapturedStderr();
  EXPECT_NE(console.find("kelvane"), std::string::npos) << console;
  EXPECT_NE(console.find("13456"), std::string::npos) << console;
  EXPECT_EQ(std::count(console.begin(), console.end(), '\n'), 1) << console;
}

TEST_F(ServiceStartTest, FirstWordWithoutEqualsIsReportedOnTheConsole) {
  drive_.WriteFile(kConfigFile, "13456 PORT=2000");
  testing::internal::CaptureStderr();
  StartService(kSetUpOnly);
  std::string console = testing::internal::GetCapturedStderr();
  EXPECT_NE(console.find("name=port"), std::string::npos) << console;
  EXPECT_EQ(std::count(console.begin(), console.end(), '\n'), 1) << console;
}

}  // namespace
}  // namespace kvtest
