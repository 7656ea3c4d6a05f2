// The Linux calls of the SocketCAN backend: CAN_RAW, CAN_BCM and CAN_J1939 sockets, device
// look-ups by name, and a wake-up event that waiting readers poll with their sockets. Only this
// unit and LinkQuery talk to the kernel; the sessions above them hold no Linux types.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "tarvix/socketcan/WireFrame.h"

namespace tarvix {

// An owned file descriptor (-1: none). Closed when destroyed or reset.
class FileHandle {
 public:
  FileHandle() = default;
  explicit FileHandle(int fd) : fd_(fd) {}
  ~FileHandle();
  FileHandle(FileHandle&& other) noexcept : fd_(other.fd_) { other.fd_ = -1; }
  FileHandle& operator=(FileHandle&& other) noexcept;
  FileHandle(const FileHandle&) = delete;
  FileHandle& operator=(const FileHandle&) = delete;

  int get() const { return fd_; }
  bool valid() const { return fd_ >= 0; }
  void reset(int fd = -1);

 private:
  int fd_ = -1;
};

// A device as the kernel's interface table shows it.
struct DeviceLookup {
  int index = 0;
  bool up = false;       // administratively up
  bool running = false;  // up with its carrier on
  int mtu = 0;           // 16 classic CAN, 72 CAN FD
};

// Looks a network device up by name; false when there is none.
bool LookUpDevice(const std::string& name, DeviceLookup& out);

struct RawSocketOptions {
  bool fdFrames = false;      // receive and send CAN FD frames
  bool errorFrames = false;   // receive every class of error frame
  bool receiveOwn = false;    // receive the frames this socket sends (marked `confirm`)
  bool standardOnly = false;  // receive standard identifiers only (besides error frames)
  // Receive only frames whose kernel identifier matches one of these (identifier, mask) pairs;
  // empty: every frame.
  std::vector<std::pair<uint32_t, uint32_t>> filters;
  int receiveBufferBytes = 0;  // 0: the system's default
};

// A CAN_RAW socket bound to one device. Receives in batches with kernel time stamps and the
// kernel's count of dropped frames. One thread at a time.
class RawCanSocket {
 public:
  RawCanSocket();
  ~RawCanSocket();
  RawCanSocket(RawCanSocket&&) noexcept;
  RawCanSocket& operator=(RawCanSocket&&) noexcept;

  // Opens the socket on device `index`: 0, or the errno of the step that failed.
  int open(int index, const RawSocketOptions& options);
  bool isOpen() const { return handle_.valid(); }
  int fd() const { return handle_.get(); }
  // Takes up to `max` received frames without waiting: their count (0: none there), or -errno
  // (ENETDOWN: the device went down; ENODEV: it went away and the socket is unbound).
  int receive(Reception* out, int max);
  // Sends one frame without waiting: 0, or errno (ENOBUFS: the device's queue is full).
  int send(const WireFrame& frame);

 private:
  struct Batch;
  FileHandle handle_;
  std::unique_ptr<Batch> batch_;
};

// A CAN_BCM socket on one device whose kernel timer repeats a frame.
class BcmSocket {
 public:
  int open(int index);
  bool isOpen() const { return handle_.valid(); }
  // Sends `frame` every `periodNs`. `restart` sets the period and starts the timer afresh (else
  // the running timer keeps its rhythm and only the data changes); `now` also sends it at once.
  int repeat(const WireFrame& frame, int64_t periodNs, bool restart, bool now);
  // Ends the repetition of `frame`'s identifier.
  int stop(const WireFrame& frame);
  // Closing the socket ends every repetition at once.
  void close() { handle_.reset(); }

 private:
  FileHandle handle_;
};

// A CAN_J1939 socket on one device.
class J1939Socket {
 public:
  // Receives every message on the bus (promiscuous), multi-packet transfers reassembled.
  int openMonitor(int index, int receiveBufferBytes);
  // A node with `name` at `address`: sends its address claim, receives the claims of others and
  // transfers addressed to it.
  int openNode(int index, uint64_t name, uint8_t address);
  bool isOpen() const { return handle_.valid(); }
  int fd() const { return handle_.get(); }
  // Takes one message without waiting: 1, 0 when none is there, or -errno. Payloads beyond
  // `maxBytes` are cut there.
  int receive(J1939Message& out, uint32_t maxBytes);
  // Broadcasts the address claim of the bound node: 0 or errno.
  int sendAddressClaim(uint64_t name);

 private:
  FileHandle handle_;
};

// True when this machine's kernel makes CAN_J1939 sockets.
bool J1939Available();

// A wake-up for readers that wait in WaitReadable: signal() makes its fd readable until clear().
class WakeEvent {
 public:
  WakeEvent();
  int fd() const { return handle_.get(); }
  void signal();
  void clear();

 private:
  FileHandle handle_;
};

// Waits until one of `fds` (-1 entries are skipped) is readable or `timeoutNs` passed.
void WaitReadable(const std::vector<int>& fds, int64_t timeoutNs);

// Sleeps the calling thread (waits for room in a device queue).
void PauseNs(int64_t ns);

}  // namespace tarvix
