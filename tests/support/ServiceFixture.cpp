// The in-process service fixture shared by every over-TCP test.
#include "tests/support/ServiceFixture.h"

#include <cstdlib>
#include <fstream>
#include <random>
#include <sstream>
#include <thread>

namespace kvtest {

namespace fs = std::filesystem;

bool WaitUntil(const std::function<bool()>& condition, std::chrono::milliseconds timeout) {
  auto deadline = std::chrono::steady_clock::now() + timeout;
  while (!condition()) {
    if (std::chrono::steady_clock::now() >= deadline) return condition();
    std::this_thread::sleep_for(2ms);  // polling interval of the condition, not a wait for it
  }
  return true;
}

TemporaryDrive::TemporaryDrive() {
  std::random_device random;
  for (;;) {
    path_ = fs::temp_directory_path() / ("kelvanert-drive-" + std::to_string(random()));
    if (fs::create_directory(path_)) break;
  }
  setenv("KELVANERT_DRIVE_C", path_.c_str(), 1);
}

TemporaryDrive::~TemporaryDrive() {
  std::error_code ignored;
  fs::remove_all(path_, ignored);
}

fs::path TemporaryDrive::Native(const std::string& belowDrive) const {
  std::string relative = belowDrive;
  for (char& c : relative) {
    if (c == '\\') c = '/';
  }
  return path_ / relative;
}

std::optional<std::string> TemporaryDrive::ReadFile(const std::string& belowDrive) const {
  std::ifstream file(Native(belowDrive), std::ios::binary);
  if (!file) return std::nullopt;
  std::ostringstream contents;
  contents << file.rdbuf();
  return contents.str();
}

void TemporaryDrive::WriteFile(const std::string& belowDrive, const std::string& contents) const {
  fs::path native = Native(belowDrive);
  fs::create_directories(native.parent_path());
  std::ofstream(native, std::ios::binary) << contents;
}

void ServiceFixture::SetUp() { StartService(); }

void ServiceFixture::TearDown() { StopService(); }

nKV_DLL300::ServiceOptions ServiceFixture::Options() {
  nKV_DLL300::ServiceOptions options;
  options.startDelayMs = 0;
  options.portText = "0";
  options.heartbeatLimitMs = heartbeatLimitMs_;
  return options;
}

nKV_DLL300::DriverSystem& ServiceFixture::Driver() { return nKV_DLL300::TarvixDriverSystem(); }

void ServiceFixture::StartService(bool requireListening) {
  StopService();
  nKV_DLL300::ServiceOptions options = Options();
  if (options.driver == nullptr) options.driver = &Driver();
  service_ = std::make_unique<nKV_DLL300::ServiceContext>(options);
  if (!requireListening) {
    ASSERT_TRUE(WaitUntil([&] { return service_->isSetUp(); })) << "the service did not set up";
    return;
  }
  ASSERT_TRUE(WaitUntil([&] { return service_->listeningPort() >= 0; }))
      << "the service did not start listening";
  port_ = static_cast<uint16_t>(service_->listeningPort());
}

void ServiceFixture::StopService() {
  if (service_) service_->shutdown();
  service_.reset();
}

kvhost::HostClient ServiceFixture::ConnectQuietly() {
  kvhost::HostClient host;
  EXPECT_TRUE(host.Connect("127.0.0.1", port_)) << host.error();
  return host;
}

kvhost::HostClient ServiceFixture::ConnectHost() {
  kvhost::HostClient host = ConnectQuietly();
  auto greeting = host.Receive(kReplyDeadline);
  EXPECT_TRUE(greeting.has_value()) << "no greeting";
  if (greeting) {
    EXPECT_EQ(greeting->text(), "<Connected to Kelvane>\n");
  }
  return host;
}

std::optional<kvhost::HostMessage> ServiceFixture::Exchange(kvhost::HostClient& host,
                                                            const std::string& text) {
  EXPECT_TRUE(host.Send(text)) << host.error();
  return host.Receive(kReplyDeadline);
}

void ServiceFixture::SendAndWaitDispatched(kvhost::HostClient& host, const std::string& text) {
  uint32_t before = service_->statistics().messagesReceived.load();
  ASSERT_TRUE(host.Send(text)) << host.error();
  ASSERT_TRUE(WaitUntil([&] { return service_->statistics().messagesReceived.load() > before; }))
      << "the service did not take the message " << text;
}

std::optional<kvhost::HostMessage> ServiceFixture::NextMessage(
    kvhost::HostClient& host, const std::function<bool(const kvhost::HostMessage&)>& accept,
    std::chrono::milliseconds timeout) {
  const auto deadline = std::chrono::steady_clock::now() + timeout;
  for (;;) {
    const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
        deadline - std::chrono::steady_clock::now());
    if (left.count() <= 0) return std::nullopt;
    std::optional<kvhost::HostMessage> message = host.Receive(left);
    if (!message) return std::nullopt;
    if (accept(*message)) return message;
  }
}

std::optional<kvhost::HostMessage> ServiceFixture::Command(kvhost::HostClient& host,
                                                           const std::string& command) {
  EXPECT_TRUE(host.Send(command)) << host.error();
  return NextMessage(
      host,
      [](const kvhost::HostMessage& m) {
        return m.header.type == kvhost::kText || m.header.type == kvhost::kErrorText;
      },
      kReplyDeadline);
}

}  // namespace kvtest
