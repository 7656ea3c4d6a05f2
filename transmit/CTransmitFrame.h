// The one frame a host defines on its CAN session, and the output session that sends it.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "hostlink/SessionSettings.h"

namespace nKV_DLL300 {

// Owned by the CAN session (CCAN). The SET_TX_PROP handlers fill the fields, CMD_TX_START builds
// a throw-away database in the driver's memory (one cluster "Cluster", one frame "TxFrame") with
// an output session on the port, and writes the frame once; any repetition on the bus is the
// driver's, from the frame's timing type and cyclic rate. CMD_TX_STOP, and the end of the CAN
// session, release the output session and the database.
//
// Threads: everything here runs on the service thread (property handlers, commands, the session's
// stop); the poll thread never touches it, so nothing is locked. The settings are read live.
//
// Failures are never reported to the host: the status of the last driver call goes to the CAN
// session's status word (`status`), and a frame is written only while that word is 0.
class CTransmitFrame {
 public:
  // `settings` and `status` belong to the owning session's connection and session; both outlive
  // this object.
  CTransmitFrame(const SessionSettings& settings, int32_t& status);
  // A transmission still active is stopped: no output session outlives its CAN session.
  ~CTransmitFrame();
  CTransmitFrame(const CTransmitFrame&) = delete;
  CTransmitFrame& operator=(const CTransmitFrame&) = delete;

  // SET_TX_PROP_PAYLOAD: the payload from a list of decimal numbers ("1,2,255"), each taken
  // modulo 256 without checking its characters. A cyclic frame (timing type 0) being sent is
  // written again at once with the new payload.
  void SetTxPayload(std::string_view text);
  // CMD_TX_START: releases a transmission still active, builds the database and output session
  // and writes the frame. A timing-type-1 frame returns once the driver reports it sent, or
  // after 2 s.
  void StartTransmit();
  // Writes the frame once to the output session, unless an earlier step failed.
  void SendTxFrame();
  // CMD_TX_STOP and the end of the session: ends the cyclic repetition, clears the output
  // session, closes the database, empties the payload. The other fields stay for the next start.
  void StopTransmit();
  // StopTransmit when a transmission is active.
  void stopIfActive() {
    if (txActive) StopTransmit();
  }
  // Builds the in-memory database and the output session; the first failing call's status stays
  // in the status word (0 when every step succeeded). Called by StartTransmit only.
  void CreateTransmitSession();

  // The frame fields. Unset fields start at 0.
  uint32_t txPayloadLength = 0;  // bytes to send: its low byte, at most 64
  uint32_t txIdentifier = 0;
  uint8_t txExtendedId = 0;  // non-zero: txIdentifier is an extended identifier
  std::vector<uint8_t> txPayload;
  uint32_t txTimingType = 1;  // 0 cyclic data, 1 event data (the driver's frame timing types)
  double txCyclicRate = 0.0;  // seconds between repetitions
  uint8_t txFrameType = 0;    // 1 remote; 0x08, 0x10, 0x18 choose the frame's CAN I/O mode
  bool txActive = false;      // started and not stopped

  // Driver references; 0 while none is held.
  uint32_t txSession = 0;
  uint32_t txDatabase = 0;
  uint32_t txCluster = 0;
  uint32_t txFrameObject = 0;

 private:
  // Each returns the driver status it also leaves in the status word.
  int32_t setClusterProperties();
  int32_t setFrameProperties();
  int32_t setOutputSessionProperties();
  // The frame's CAN I/O mode property, when the frame type asks for one.
  int32_t setFrameIoMode();
  // Stops and clears the output session and closes the database (the close's status goes to the
  // status word); the frame fields and payload stay.
  void releaseOutput();

  const SessionSettings& settings_;
  int32_t& status_;
  int txDatabaseNumber_ = -1;  // the number in the database's name while one is open
};

}  // namespace nKV_DLL300
