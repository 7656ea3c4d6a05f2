// What the sessions of one interface bound to a SocketCAN device share: the device's name, the
// frames the driver sends through it (so receive sessions can tell the interface's own frames in
// the traffic), the J1939 addresses its sessions hold, and listen-only.
#pragma once

#include <atomic>
#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "tarvix/SessionSetup.h"
#include "tarvix/socketcan/CanSockets.h"
#include "tarvix/socketcan/WireFrame.h"

namespace tarvix {

// Thread-safe. Sessions call it holding their own lock; the port never calls back into a session
// while it holds its own, so the lock order is always session, then port.
class DevicePort {
 public:
  explicit DevicePort(std::string device) : device_(std::move(device)) {}

  const std::string& device() const { return device_; }
  // 1 when the device carries CAN FD frames now (its MTU), else 0.
  uint32_t canFd() const;
  // The bus settings of the device as it runs: bit rates from its bit timing (0 where it has
  // none, as a virtual device), CAN I/O mode 2 with CAN FD frames, else 0.
  ClusterSettings runningSettings(bool j1939) const;

  // Output sessions register the socket they write with (own frames come back confirmed on it)
  // and a call that restarts their repetition on a device that came back under a new index.
  void addOutput(const void* owner, std::shared_ptr<RawCanSocket> socket,
                 std::function<void()> restart);
  void removeOutput(const void* owner);
  // The frame an output session's kernel timer repeats (none: nullopt).
  void setRepeated(const void* owner, std::optional<WireFrame> frame);
  // Frames of this output the device has confirmed as sent since it registered.
  uint64_t confirmed(const void* owner);

  // Marks the frames of a received batch (at most 64) that the driver sent through this
  // interface: bit i of the result stands for batch[i].
  uint64_t ownFrames(const Reception* batch, int count);
  // True when a J1939 message is one of this interface's own address claims.
  bool isOwnClaim(uint32_t pgn, uint8_t source, const uint8_t* data, size_t size);

  // J1939: reserves `address` for `owner`; false when another session of this interface holds it.
  bool reserve(const void* owner, uint8_t address, uint64_t name);
  void release(const void* owner);

  // A running receive session in listen-only mode keeps the interface from sending.
  void setListenOnly(const void* owner, bool on);
  bool listenOnly();

  // A receive session found the device again under a new index: output sessions restart.
  void deviceReturned();

 private:
  struct Output {
    std::shared_ptr<RawCanSocket> socket;
    std::function<void()> restart;
    uint64_t confirmed = 0;
    std::optional<WireFrame> repeated;
  };
  struct Sent {
    int64_t timeNs;
    WireFrame frame;
  };
  struct Claim {
    uint8_t address;
    uint64_t name;
  };
  void drainLocked();
  bool isOwnLocked(const Reception& r);

  const std::string device_;
  std::mutex mutex_;
  std::map<const void*, Output> outputs_;   // guarded by mutex_
  std::deque<Sent> sent_;                   // guarded by mutex_: recent confirmed frames
  std::map<const void*, Claim> claims_;     // guarded by mutex_
  std::map<const void*, bool> listenOnly_;  // guarded by mutex_
  std::atomic<bool> anyOwn_{false};         // outputs or claims exist
};

}  // namespace tarvix
