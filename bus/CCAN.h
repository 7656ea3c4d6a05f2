// The bus session of a CAN, CAN FD or J1939 interface.
#pragma once

#include <cstdint>
#include <string>

#include "bus/BusStatistics.h"
#include "bus/CTableSession.h"
#include "bus/CanFrameTimes.h"
#include "bus/CanIdentifierRules.h"
#include "transmit/CTransmitFrame.h"

namespace nKV_DLL300 {

class OpenSequence;

inline constexpr uint32_t kCanReadBufferSize = 100000;
// The address claim ran out of reads before the driver reported a claimed address.
inline constexpr int32_t kAddressNotClaimed = static_cast<int32_t>(0xBFF6320A);

// Created by CMD_SESSION_START for a CAN connection and opened with openCanSession; see CBusSystem
// for the threads. Besides the identifier records it reports the bus load, estimated from tables
// of frame durations built when each poll loop begins.
class CCAN : public CTableSession<CanIdentifierRules, CanBusStatistics, kCanReadBufferSize> {
 public:
  explicit CCAN(HostConnection* owner);
  ~CCAN() override;

  // Opens and starts the driver session in one of three modes, chosen from the settings:
  // subordinate (runMode contains "SUBORDINATE": watch the interface the controller's application
  // runs), database (alias and cluster both set: the named database decides baud rate and CAN
  // I/O mode, which are written back to the settings) or built-in (a database of the CAN I/O
  // mode at the host's baud rates). Then the echo and bus-error properties, and with J1939 the
  // address claim. Returns the status of the last step; the first failing step ends it and its
  // status is also lastStatus. Service thread, before startPollThread.
  int32_t openCanSession(const std::string& interfaceName, uint64_t baudRate, uint32_t termination);

  // Stops the host's transmission first, whenever the session ends (terminate, heartbeat
  // loss, closed host), then the session itself.
  int32_t stop() override {
    transmit.stopIfActive();
    return CBusSystem::stop();
  }
  void startPollThread() override;
  // Bus load, frame rates and the driver's CAN state word, sent as one statistics message.
  void reportBusState(uint64_t elapsedMilliseconds) override;

  // Status of the address claim (and of the transmit operations that share it). Service thread.
  int32_t addressClaimStatus = 0;
  // The frame the host defines with SET_TX_PROP and sends with CMD_TX_START; its driver status
  // goes to addressClaimStatus. Service thread.
  CTransmitFrame transmit{connection->settings, addressClaimStatus};

 protected:
  const char* logHeaderLine() const override;
  // Builds the frame-time tables for the bus load of this loop.
  void prepareLoop() override;
  uint32_t batchFrameCount(uint32_t bytes) const override;
  void countFrame(const driver::RawFrameView& frame, bool inWindow) override;

 private:
  // The steps of openCanSession (see OpenSequence for the failure rule).
  void openSubordinate(OpenSequence& open, const std::string& interfaceName);
  // Subordinate mode: the bit rate and (FD) data bit rate the interface runs, where the host gave
  // none, into the settings; reads that fail leave them 0.
  void readRunningRates(OpenSequence& open);
  void openDatabase(OpenSequence& open, const std::string& interfaceName);
  void openBuiltIn(OpenSequence& open, const std::string& interfaceName, uint64_t baudRate);
  void setInterfaceProperties(OpenSequence& open, uint32_t termination);
  // The result of the open: its status, or the address claim's.
  int32_t setReceiveProperties(OpenSequence& open);
  // Reads the interface's CAN I/O mode through a temporary subordinate session into the settings.
  void readInterfaceIoMode(const std::string& interfaceName);
  int32_t claimJ1939Address();

  CanFrameTimes frameTimes;   // poll thread; tables and bus time of the current window
  bool classicFrames = true;  // poll thread: every frame of this loop is 24 bytes
};

}  // namespace nKV_DLL300
