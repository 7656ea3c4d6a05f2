// A driver session on one interface: a receive stream (mode 6) or an output session (10, 11).
#pragma once

#include <cstdint>
#include <deque>
#include <memory>

#include "tarvix/Bus.h"
#include "tarvix/OutputQueue.h"
#include "tarvix/SessionSetup.h"

namespace tarvix {

// The settings a session's properties hold (see SessionProperties.cpp for ids and rules).
struct SessionSettings {
  uint64_t baudRate = 0;
  uint64_t dataBaudRate = 0;
  uint32_t termination = 0;
  uint32_t transceiver = 0;
  uint32_t isoFdMode = 0;
  bool listenOnly = false;
  bool echo = false;
  uint8_t busErrorFrames = 0;      // byte 0 of 0x02100015: bus-error frames in the stream
  uint8_t busErrorListenOnly = 0;  // byte 1 of 0x02100015: kept, reported back
  bool linNoResponse = false;
  bool linChecksum = false;
  uint32_t flexRayTermination = 0;
  bool nullFrames = false;
  uint32_t keySlot = 0;
  uint64_t nodeName = 0;
  uint32_t nodeAddress = 0xFE;
};

// Public operations lock the bus's mutex themselves; listening() and offer() are called by the bus
// with its mutex held. The session must be closed (close()) before it is destroyed.
class Session {
 public:
  Session(SessionSetup setup, std::shared_ptr<Bus> bus);
  ~Session();
  Session(const Session&) = delete;
  Session& operator=(const Session&) = delete;

  const SessionSetup& setup() const { return setup_; }
  bool isOutput() const { return output_ != nullptr; }

  int32_t setProperty(uint32_t id, uint32_t size, const void* value);
  int32_t getProperty(uint32_t id, uint32_t size, void* value);
  int32_t start(uint32_t scope);
  int32_t stop(uint32_t scope);
  int32_t read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead);
  int32_t write(const void* frames, uint32_t size, double timeoutS);
  int32_t wait(uint32_t condition, double timeoutS);
  int32_t readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode);
  void close();

  // Bus side (mutex held).
  bool listening() const { return started_ && !isOutput(); }
  void offer(const SimFrame& frame, const BusConfig& bus);

 private:
  friend class SessionProperties;
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
  int32_t parseRecords(const uint8_t* data, uint32_t size,
                       std::vector<std::pair<SimFrame, const FrameDefinition*>>& out) const;
  bool conditionMet(uint32_t condition, int64_t nowNs) const;
  void updateOutputBlock();

  const SessionSetup setup_;
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
