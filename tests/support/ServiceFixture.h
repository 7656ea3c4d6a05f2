// A service in the test process on a temporary drive, and hosts that talk to it over TCP.
#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "host/HostClient.h"
#include "protocol/DriverSystem.h"
#include "service/ServiceContext.h"

namespace kvtest {

using namespace std::chrono_literals;

// Generous deadlines: a slow or loaded machine must not fail a test.
constexpr std::chrono::milliseconds kReplyDeadline = 10s;
constexpr std::chrono::milliseconds kConditionDeadline = 30s;
// The heartbeat time of tests that wait for the watchdog: short, so that they do not wait out the
// controller's 10 s, yet long enough for a test's own steps on a loaded machine.
constexpr uint32_t kTestHeartbeatLimitMs = 3000;

// Waits until `condition` holds or `timeout` passed; returns its last value.
bool WaitUntil(const std::function<bool()>& condition,
               std::chrono::milliseconds timeout = kConditionDeadline);

// A temporary directory that stands for drive C: (KELVANERT_DRIVE_C) for the life of the object.
class TemporaryDrive {
 public:
  TemporaryDrive();
  ~TemporaryDrive();
  const std::filesystem::path& path() const { return path_; }
  // The native path of a runtime path below C:\ given with backslashes ("QV-RT\\tarvix").
  std::filesystem::path Native(const std::string& belowDrive) const;
  // Contents of a file below the drive; nullopt when it cannot be read.
  std::optional<std::string> ReadFile(const std::string& belowDrive) const;
  void WriteFile(const std::string& belowDrive, const std::string& contents) const;

 private:
  std::filesystem::path path_;
};

// Each test gets a drive, a driver and a service started with no delay on a port the system
// chooses. Override Options() to change the start; call StartService() again after changing.
class ServiceFixture : public ::testing::Test {
 protected:
  void SetUp() override;
  void TearDown() override;

  // The options of the service StartService makes; the default: delay 0, port "0", heartbeat
  // time heartbeatLimitMs_.
  virtual nKV_DLL300::ServiceOptions Options();
  // The driver the service uses: the linked driver library.
  virtual nKV_DLL300::DriverSystem& Driver();

  // Starts the service and waits until it listens, or with kSetUpOnly until its set-up ended
  // (the default port may be taken by another program).
  static constexpr bool kSetUpOnly = false;
  void StartService(bool requireListening = true);
  void StopService();
  nKV_DLL300::ServiceContext& service() { return *service_; }
  uint16_t port() const { return port_; }

  // A connected host that has received its greeting (checked).
  kvhost::HostClient ConnectHost();
  // A connected host, nothing received.
  kvhost::HostClient ConnectQuietly();
  // Sends `text` and returns the next message within the reply deadline.
  std::optional<kvhost::HostMessage> Exchange(kvhost::HostClient& host, const std::string& text);
  // Sends `command` and returns the next text reply (type 3 or 5), skipping records and statistics.
  std::optional<kvhost::HostMessage> Command(kvhost::HostClient& host, const std::string& command);
  // The next message for which `accept` holds, within `timeout`; others are skipped.
  std::optional<kvhost::HostMessage> NextMessage(
      kvhost::HostClient& host, const std::function<bool(const kvhost::HostMessage&)>& accept,
      std::chrono::milliseconds timeout = kConditionDeadline);
  // Sends `text` and waits until the service has dispatched it (nothing is read).
  void SendAndWaitDispatched(kvhost::HostClient& host, const std::string& text);

  TemporaryDrive drive_;
  // Set before StartService to end hosts sooner than the controller's 10 s.
  uint32_t heartbeatLimitMs_ = nKV_DLL300::kDefaultHeartbeatLimitMs;

 private:
  std::unique_ptr<nKV_DLL300::ServiceContext> service_;
  uint16_t port_ = 0;
};

}  // namespace kvtest
