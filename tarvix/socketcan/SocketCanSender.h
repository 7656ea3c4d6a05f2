// An output session (modes 10 and 11) on an interface bound to a SocketCAN device. Queued frames
// (mode 10) and single frames go out with a plain write on a CAN_RAW socket that reads its own
// frames back, so the session knows when the device has sent them; a cyclic frame (mode 11,
// timing types 0, 2, 4 with a cyclic rate) is repeated by the kernel's broadcast manager, which
// stops it the moment the session stops or ends, or the process does.
#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>

#include "tarvix/DriverSession.h"
#include "tarvix/FrameRecords.h"
#include "tarvix/socketcan/CanSockets.h"
#include "tarvix/socketcan/DevicePort.h"

namespace tarvix {

// Thread-safe: mutex_ guards everything below it. Owned by a shared_ptr (MakeSocketCanSession):
// the port restarts it through a weak reference.
class SocketCanSender final : public DriverSession,
                              public std::enable_shared_from_this<SocketCanSender> {
 public:
  SocketCanSender(SessionSetup setup, std::shared_ptr<DevicePort> port);
  ~SocketCanSender() override;

  int32_t setProperty(uint32_t id, uint32_t size, const void* value) override;
  int32_t getProperty(uint32_t id, uint32_t size, void* value) override;
  int32_t start(uint32_t scope) override;
  int32_t stop(uint32_t scope) override;
  int32_t read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) override;
  int32_t write(const void* frames, uint32_t size, double timeoutS) override;
  int32_t wait(uint32_t condition, double timeoutS) override;
  int32_t readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode) override;
  void close() override;

  // The device came back under a new index: the repeated frame goes out again there.
  void restart();

 private:
  using Lock = std::unique_lock<std::mutex>;

  bool ensureSocket();
  // Both hold `lock` on mutex_; a full device queue is waited out without it.
  int32_t sendOnce(Lock& lock, const WireFrame& frame, int64_t deadlineNs);
  int32_t sendLatest(Lock& lock, const FrameRecord& record, int64_t deadlineNs);
  void endRepetition();

  const std::shared_ptr<DevicePort> port_;
  std::mutex mutex_;
  SessionSettings settings_;
  bool started_ = false;
  bool closed_ = false;
  int index_ = 0;                         // device index of the sockets
  std::shared_ptr<RawCanSocket> socket_;  // shared with the port, which reads it back
  BcmSocket bcm_;
  std::optional<WireFrame> repeated_;  // the frame the kernel repeats
  int64_t periodNs_ = 0;
  uint64_t written_ = 0;         // frames handed to the device by plain writes
  bool lostSinceWrite_ = false;  // a frame of the last write found no device
};

// A session on a bound interface: a receiver for mode 6, a sender for modes 10 and 11.
std::shared_ptr<DriverSession> MakeSocketCanSession(SessionSetup setup,
                                                    std::shared_ptr<DevicePort> port);

}  // namespace tarvix
