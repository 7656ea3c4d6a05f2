// The bus session of a FlexRay interface.
#pragma once

#include <cstdint>
#include <string>

#include "bus/BusStatistics.h"
#include "bus/CTableSession.h"
#include "bus/FlexRayIdentifierRules.h"

namespace nKV_DLL300 {

class OpenSequence;

inline constexpr uint32_t kFlexRayReadBufferSize = 100000;
// The start waits this long for the interface to communicate.
inline constexpr double kFlexRayCommunicatingWaitSeconds = 3.0;
// keySlot's default: no key slot is set.
inline constexpr uint32_t kNoKeySlot = 0xFFFFFFFF;

// Created by CMD_SESSION_START for a FlexRay connection and opened with openFlexRaySession; see
// CBusSystem for the threads. One identifier entry per slot and channel, keeping the type of its
// first frame; the statistics count data and null frames and carry three driver state values.
class CFlexRay
    : public CTableSession<FlexRayIdentifierRules, FlexRayBusStatistics, kFlexRayReadBufferSize> {
 public:
  explicit CFlexRay(HostConnection* owner);
  ~CFlexRay() override;

  // Opens the driver session: as a subordinate when runMode contains "SUBORDINATE" (it joins the
  // cluster the controller's application runs and only sets the echo property), otherwise on the
  // database named by alias and cluster, whose baud rate is written back to the settings; that
  // session is configured (termination, null frames, the key slot when one is set), started, and
  // must be communicating within three seconds. Returns the status of the last step; the first
  // negative one ends it and is also lastStatus. Service thread, before startPollThread.
  int32_t openFlexRaySession(const std::string& interfaceName, uint32_t termination);

  void startPollThread() override;
  // Frame rates and three driver state values, sent as one 72-byte statistics message.
  void reportBusState(uint64_t elapsedMilliseconds) override;

 protected:
  const char* logHeaderLine() const override;
  // Frames are of variable length: the batch is walked.
  uint32_t batchFrameCount(uint32_t bytes) const override;
  void countFrame(const driver::RawFrameView& frame, bool inWindow) override;

 private:
  // The database branch of openFlexRaySession (see OpenSequence for the failure rule).
  void openDatabase(OpenSequence& open, const std::string& interfaceName, uint32_t termination);
  // The three state reads, in order, until one fails (its status goes to lastStatus).
  void readStates();
};

}  // namespace nKV_DLL300
