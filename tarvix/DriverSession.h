// A driver session as the C interface sees it: on a simulated bus (Session) or on a SocketCAN
// device (socketcan/SocketCanReceiver, socketcan/SocketCanSender).
#pragma once

#include <cstdint>
#include <utility>

#include "tarvix/SessionSetup.h"

namespace tarvix {

// The registry hands out shared references; every operation may be called from any thread, and
// different sessions are used concurrently. Statuses are the driver's (driver/Status.h).
class DriverSession {
 public:
  explicit DriverSession(SessionSetup setup) : setup_(std::move(setup)) {}
  virtual ~DriverSession() = default;
  DriverSession(const DriverSession&) = delete;
  DriverSession& operator=(const DriverSession&) = delete;

  const SessionSetup& setup() const { return setup_; }

  virtual int32_t setProperty(uint32_t id, uint32_t size, const void* value) = 0;
  virtual int32_t getProperty(uint32_t id, uint32_t size, void* value) = 0;
  virtual int32_t start(uint32_t scope) = 0;
  virtual int32_t stop(uint32_t scope) = 0;
  virtual int32_t read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) = 0;
  virtual int32_t write(const void* frames, uint32_t size, double timeoutS) = 0;
  virtual int32_t wait(uint32_t condition, double timeoutS) = 0;
  virtual int32_t readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode) = 0;
  // Ends the session (kxClear, new hardware): a call waiting inside it returns promptly, and the
  // session takes no more frames. The object lives on while a caller still holds it.
  virtual void close() = 0;

 protected:
  const SessionSetup setup_;
};

}  // namespace tarvix
