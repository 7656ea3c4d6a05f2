// Support inside the user-mode kernel for the SocketCAN tests and benchmark: the controller
// process bound to vcan0 (CAN7, CAN FD) and vcan1 (CAN8, classic), hosts that talk to it, and the
// can-utils programs they compare against.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "host/HostClient.h"
#include "host/RecordDecoder.h"

namespace kvtest {

using namespace std::chrono_literals;

// Generous: the user-mode kernel shares a loaded machine.
constexpr std::chrono::milliseconds kDeadline = 30s;

// Waits until `condition` holds or `timeout` passed; returns its last value.
bool WaitFor(const std::function<bool()>& condition, std::chrono::milliseconds timeout = kDeadline);

// Runs `command` with /bin/sh; its exit status.
int Shell(const std::string& command);

// The controller process with TARVIX_SOCKETCAN=vcan0,vcan1,slcan0 (CAN7, CAN8, CAN9) on a drive
// in /tmp. slcan0 exists only while a test makes it.
class UmlController {
 public:
  // Starts it and waits until it listens; false (with `error`) when it does not.
  bool Start(std::string& error);
  // Ends it with SIGTERM.
  void Stop();
  pid_t pid() const { return pid_; }
  static uint16_t Port();
  // Native path of a file in the service directory.
  static std::string ServiceFile(const std::string& name);

 private:
  pid_t pid_ = -1;
};

// One host connection. Records and statistics are collected while replies are awaited; every
// exchange also sends the heartbeat now and then, so long tests keep the connection. The
// controller reads each TCP segment as one command, so the heartbeat never goes out while a reply
// is awaited, and a command waits a pause after it.
class Host {
 public:
  Host();
  // Sends `text` and returns the next text reply (types 3 and 5).
  std::string Command(const std::string& text);
  // Sends each property and the start; "" when every reply is an acknowledgement, else the
  // message and its reply.
  std::string Start(const std::vector<std::string>& properties);
  // Receives until `condition` holds on what was collected, or `timeout` passed.
  bool WaitFor(const std::function<bool()>& condition,
               std::chrono::milliseconds timeout = kDeadline);
  // Ends the connection without a word (a host that vanishes).
  void Vanish() { client_.Close(); }

  // Identifier records by identifier, the latest of each.
  std::map<uint32_t, kvhost::IdentifierRecord> records;
  std::optional<kvhost::CanStatisticsView> statistics;
  int32_t lastStatus = 0;  // of the latest message

 private:
  std::optional<kvhost::HostMessage> receive(std::chrono::milliseconds timeout);
  void take(const kvhost::HostMessage& message);
  void heartbeatIfDue();

  kvhost::HostClient client_;
  bool greeted_ = false;
  bool replyAwaited_ = false;
  std::chrono::steady_clock::time_point heartbeatDue_;
  std::chrono::steady_clock::time_point heartbeatSent_;
};

// A program in the background (candump), ended with SIGINT by Stop() or the destructor.
class Background {
 public:
  explicit Background(const std::string& command);
  ~Background();
  void Stop();
  // Waits for the program to end by itself; false after `timeout`.
  bool Ended(std::chrono::milliseconds timeout);
  pid_t pid() const { return pid_; }
  // CPU seconds (user and system) of the program once it has ended.
  double cpuSeconds() const { return cpuSeconds_; }
  // Its exit status once it has ended (-1 when it was killed).
  int exitStatus() const { return exitStatus_; }

 private:
  pid_t pid_ = -1;
  double cpuSeconds_ = 0;
  int exitStatus_ = -1;
};

// CPU seconds (user and system) a running process has used so far, all its threads.
double CpuSeconds(pid_t pid);

// candump -L of `device` (with candump's filters after it: ",123:7FF"; empty: every frame) into
// `path`, line by line; the constructor returns once candump takes frames (it has seen a marker
// frame 0x7FF).
class Capture {
 public:
  Capture(const std::string& device, const std::string& filters, const std::string& path);
  // Ends candump; its lines.
  std::string Stop();

 private:
  std::string path_;
  Background candump_;
};

// One frame of a candump -l line, as the tests compare frames.
struct LoggedFrame {
  std::string time;   // "SECONDS.MICROS"
  std::string frame;  // ID#DATA with the CAN FD flags reduced to bit-rate switching
  uint32_t id = 0;    // with bit 29 for extended identifiers
};

// The frames of a candump -l text (lines that are no frames are skipped).
std::vector<LoggedFrame> ReadCandumpText(const std::string& text);
std::string ReadFile(const std::string& path);

}  // namespace kvtest
