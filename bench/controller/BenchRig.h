// The rig of the controller benchmark: a hardware description with saturated and silent buses, the
// controller process on a drive of its own, hosts with a session and a text log each, and the
// comparison of each log with what its bus carried.
#pragma once

#include <sys/types.h>

#include <atomic>
#include <cstdint>
#include <string>
#include <thread>
#include <vector>

#include "host/HostClient.h"

namespace kvbench {

// What the hardware description holds. Saturated classic CAN buses "sat0".."sat5" (1 Mbit/s,
// 2000 identifiers with 0-8 bytes back to back) on CAN1..CAN6; "satfd" (500 kbit/s,
// data 2 Mbit/s, 64-byte frames back to back) on CAN7; "fr" (10 Mbit/s, every one of the 100
// static slots of a 5 ms cycle, 32 bytes) on FlexRay1; a silent bus "quiet" on CAN8..CAN15.
// The CAN buses with traffic write capture files.
struct Hardware {
  int saturatedCan = 0;  // 0-6
  bool canFd = false;
  bool flexRay = false;
  int quietSessions = 0;  // 0-8
};

inline constexpr int kFlexRaySlots = 100;

std::string HardwareJson(const Hardware& hardware);
// The replay file the saturated classic CAN buses play, into `directory` (the description's).
void WriteReplay(const std::string& directory);

// A directory under /tmp holding the drive, the hardware description and the capture files;
// removed with everything in it by the destructor (kept when KV_BENCH_KEEP is set).
class Workspace {
 public:
  Workspace();
  ~Workspace();
  const std::string& path() const { return path_; }
  std::string serviceFile(const std::string& name) const;

 private:
  std::string path_;
};

// The controller process on the workspace's drive and the given hardware, on a port of its own.
class Controller {
 public:
  // Starts it and waits (up to a minute: it listens 10 s after its start) until it listens.
  Controller(const Workspace& workspace, const Hardware& hardware);
  ~Controller();
  bool listening() const { return listening_; }
  uint16_t port() const { return port_; }
  pid_t pid() const { return pid_; }
  // CPU seconds (user and system, all threads) used so far.
  double cpuSeconds() const;
  // Resident memory in KiB.
  uint64_t residentKiB() const;

 private:
  pid_t pid_ = -1;
  uint16_t port_ = 0;
  bool listening_ = false;
};

// One host with one session. A thread of its own takes every message (and sends the heartbeat)
// from the start to terminate().
class Host {
 public:
  Host(uint16_t port, std::string interfaceName, std::string logName);
  ~Host();
  // Connects, sets the properties and starts the session; "" or what went wrong.
  std::string start();
  // Ends the receiving thread and the session (its log file is complete afterwards).
  void terminate();

  const std::string& logName() const { return logName_; }
  // Messages whose header carried the receive-queue overflow warning.
  uint64_t overflowWarnings() const { return overflows_.load(); }
  uint64_t messages() const { return messages_.load(); }
  // Longest gap between two statistics messages, ms (0 before the second).
  uint64_t longestStatisticsGapMs() const { return longestGapMs_.load(); }

 private:
  void receiveLoop();

  uint16_t port_;
  std::string interfaceName_;
  std::string logName_;
  kvhost::HostClient client_;
  std::thread receiver_;
  std::atomic<bool> running_{false};
  std::atomic<uint64_t> overflows_{0};
  std::atomic<uint64_t> messages_{0};
  std::atomic<uint64_t> longestGapMs_{0};
};

// Frame lines of a text log (its header line not counted).
uint64_t CountLogFrames(const std::string& path);

// Frames the bus carried between the log's first and last frame that the log lacks. A CAN log is
// compared with its bus's capture file frame by frame (identifier, payload and millisecond);
// `unmatched` counts log frames that the capture does not hold at all (should be 0).
uint64_t LostCanFrames(const std::string& logPath, const std::string& capturePath,
                       uint64_t& unmatched);
// A FlexRay log is compared with the slot sequence: every cycle carries every static slot.
uint64_t LostFlexRayFrames(const std::string& logPath);

}  // namespace kvbench
