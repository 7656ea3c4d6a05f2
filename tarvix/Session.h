// A driver session on a simulated bus: a receive stream (mode 6) or an output session (10, 11).
#pragma once

#include <cstdint>
#include <deque>
#include <memory>

#include "tarvix/Bus.h"
#include "tarvix/DriverSession.h"
#include "tarvix/OutputQueue.h"
#include "tarvix/SessionSetup.h"

namespace tarvix {

// Public operations lock the bus's mutex themselves; listening() and offer() are called by the bus
// with its mutex held. The session must be closed (close()) before it is destroyed.
class Session final : public DriverSession {
 public:
  Session(SessionSetup setup, std::shared_ptr<Bus> bus);
  ~Session() override;

  bool isOutput() const { return output_ != nullptr; }

  int32_t setProperty(uint32_t id, uint32_t size, const void* value) override;
  int32_t getProperty(uint32_t id, uint32_t size, void* value) override;
  int32_t start(uint32_t scope) override;
  int32_t stop(uint32_t scope) override;
  int32_t read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) override;
  int32_t write(const void* frames, uint32_t size, double timeoutS) override;
  int32_t wait(uint32_t condition, double timeoutS) override;
  int32_t readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode) override;
  void close() override;

  // Bus side (mutex held).
  bool listening() const { return started_ && !isOutput(); }
  void offer(const SimFrame& frame, const BusConfig& bus);

 private:
  friend class SessionState;
  friend class SessionStateWords;

  bool rateMatches(const BusConfig& bus) const;
  bool understands(const SimFrame& frame, const BusConfig& bus) const;
  void offerCan(SimFrame frame, bool own, const BusConfig& bus);
  void offerLin(SimFrame frame, bool own, const BusConfig& bus);
  void offerFlexRay(SimFrame frame, const BusConfig& bus);
  void push(const SimFrame& frame);
  void pushError(const SimFrame& cause, uint8_t type);
  void startLocked(int64_t nowNs);
  int32_t readLocked(uint8_t* buffer, uint32_t size, uint32_t& bytes);
  bool conditionMet(uint32_t condition, int64_t nowNs) const;
  void updateOutputBlock();
  void claimAddress(int64_t nowNs);

  const std::shared_ptr<Bus> bus_;
  // Everything below is guarded by bus_->mutex().
  SessionSettings settings_;
  bool started_ = false;
  bool closed_ = false;
  int64_t startedAtNs_ = 0;
  std::deque<SimFrame> queue_;
  bool overflowed_ = false;
  std::unique_ptr<OutputQueue> output_;
  // Error and traffic counters for the state words.
  uint32_t receiveErrors_ = 0;
  uint32_t transmitErrors_ = 0;
  uint32_t lastError_ = 0;
  uint32_t lastErrorId_ = 0;
  uint32_t framesSeen_ = 0;
  uint32_t dataFramesSeen_ = 0;
  uint32_t nullFramesSeen_ = 0;
  int64_t lastFrameNs_ = 0;
};

}  // namespace tarvix
