// The bus session of a LIN interface.
#pragma once

#include <cstdint>
#include <string>

#include "bus/BusStatistics.h"
#include "bus/CTableSession.h"
#include "bus/LinIdentifierRules.h"

namespace nKV_DLL300 {

class OpenSequence;

// Room for 200 LIN frames of 24 bytes.
inline constexpr uint32_t kLinReadBufferSize = 4800;

// Created by CMD_SESSION_START for a LIN connection and opened with openLinSession; see CBusSystem
// for the threads. One identifier entry per LIN identifier, whatever the type of its frames; the
// statistics count data, bus-error and no-response frames and carry the driver's LIN state word.
// LIN has no bus-load estimate. Every read is followed by a 1 ms pause.
class CLIN : public CTableSession<LinIdentifierRules, LinBusStatistics, kLinReadBufferSize> {
 public:
  explicit CLIN(HostConnection* owner);
  ~CLIN() override;

  // Opens the driver session in one of three modes, chosen from the settings: subordinate
  // (runMode contains "SUBORDINATE": watch the schedule the controller's application runs, no
  // stop or start), database (alias and cluster both set: the database's baud rate is written back
  // to the settings) or built-in (":memory:" at `baudRate`). Then the echo, bus-error,
  // no-response and checksum properties. Returns the status of the last step; the first negative
  // one ends it and is also lastStatus. Service thread, before startPollThread.
  int32_t openLinSession(const std::string& interfaceName, uint64_t baudRate);

  void startPollThread() override;
  // Frame rates and the driver's LIN state word, sent as one 60-byte statistics message.
  void reportBusState(uint64_t elapsedMilliseconds) override;

 protected:
  const char* logHeaderLine() const override;
  // Every LIN frame takes 24 bytes.
  uint32_t batchFrameCount(uint32_t bytes) const override;
  void countFrame(const driver::RawFrameView& frame, bool inWindow) override;

 private:
  // The steps of openLinSession (see OpenSequence for the failure rule).
  void openDatabase(OpenSequence& open, const std::string& interfaceName);
  void openBuiltIn(OpenSequence& open, const std::string& interfaceName, uint64_t baudRate);
  void setReceiveProperties(OpenSequence& open);
};

}  // namespace nKV_DLL300
