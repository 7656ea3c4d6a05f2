// A receive session (mode 6) on an interface bound to a SocketCAN device: CAN_RAW with CAN FD
// frames and every error frame, kernel time stamps, batched reads, the kernel's drop count; J1939
// sessions also read reassembled messages of a CAN_J1939 socket and claim addresses.
#pragma once

#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <vector>

#include "tarvix/DriverSession.h"
#include "tarvix/socketcan/BusState.h"
#include "tarvix/socketcan/CanSockets.h"
#include "tarvix/socketcan/DevicePort.h"
#include "tarvix/socketcan/J1939Claim.h"

namespace tarvix {

// Thread-safe: mutex_ guards everything below it. A read that waits does so without the lock, on
// its sockets and the wake-up event, so close() (kxClear) ends it at once.
class SocketCanReceiver final : public DriverSession {
 public:
  SocketCanReceiver(SessionSetup setup, std::shared_ptr<DevicePort> port);
  ~SocketCanReceiver() override;

  int32_t setProperty(uint32_t id, uint32_t size, const void* value) override;
  int32_t getProperty(uint32_t id, uint32_t size, void* value) override;
  int32_t start(uint32_t scope) override;
  int32_t stop(uint32_t scope) override;
  int32_t read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) override;
  int32_t write(const void* frames, uint32_t size, double timeoutS) override;
  int32_t wait(uint32_t condition, double timeoutS) override;
  int32_t readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode) override;
  void close() override;

 private:
  // The sockets of a running session. Shared with a read that waits on them, so that a stop or a
  // new device closes them only once that read has let go.
  struct Sockets {
    int index = 0;
    RawCanSocket raw;
    J1939Socket j1939;  // J1939 sessions where the kernel has CAN_J1939 sockets
  };

  int32_t startLocked();
  void stopLocked();
  int openSockets(int index);
  bool ensureOpen(int64_t nowNs);
  void noteLost();
  void noteFound(int index);
  void pushDeviceEvent(uint32_t errorClass);
  void takeAvailable(uint32_t room);
  int takeRaw();
  int takeJ1939();
  void keep(const Reception& r, bool own);
  void keepDriverFrame(DriverFrame frame);
  int32_t deliver(uint8_t* buffer, uint32_t size, uint32_t& bytes);
  std::vector<int> waitFds() const;

  const std::shared_ptr<DevicePort> port_;
  const bool fdFrames_;  // the session understands CAN FD frames
  WakeEvent wake_;
  std::mutex mutex_;
  SessionSettings settings_;
  bool started_ = false;
  bool closed_ = false;
  std::shared_ptr<Sockets> sockets_;
  std::deque<DriverFrame> pending_;  // received, not yet read, in time order
  uint32_t pendingBytes_ = 0;
  uint32_t drops_ = 0;  // the kernel's drop count on the current socket
  bool overflowed_ = false;
  bool lost_ = false;  // the device is down or gone
  int64_t nextProbeNs_ = 0;
  bool configurePending_ = false;  // bit timing to set once the device is there
  BusState state_;
  J1939Claim claim_;
};

}  // namespace tarvix
