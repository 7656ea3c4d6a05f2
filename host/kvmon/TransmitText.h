// The --tx frame text (ID#DATA, as can-utils write frames) and the transmit messages it becomes.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace kvmon {

// One CAN frame for the controller to send, once (an event frame) or every periodMs.
struct TransmitFrame {
  uint32_t identifier = 0;
  bool extended = false;
  bool remote = false;
  uint8_t frameType = 0;  // 0 data, 1 remote, 0x10 CAN FD, 0x18 CAN FD with bit-rate switching
  std::vector<uint8_t> payload;
  uint32_t length = 0;             // payload length on the bus (remote: the requested length)
  std::optional<double> periodMs;  // cyclic when set
  std::string text;                // as the user wrote it
};

// Reads ID#HEXDATA, ID#R[LEN] (remote) or ID##F HEXDATA (CAN FD; flag F bit 0: bit-rate
// switching). An identifier of more than three hex digits is an extended one. Data bytes may be
// separated by dots. nullopt with `error` set when the text is not such a frame or its payload
// would not fit in one message to the controller.
std::optional<TransmitFrame> ParseTransmitFrame(const std::string& text, std::string& error);

// The messages that define `frame` on a running CAN session and start it, in order; the last one
// is CMD_TX_START. Each fits in one 256-byte command.
std::vector<std::string> TransmitMessages(const TransmitFrame& frame);

// The payload list as the controller reads it ("1,2,255"), without the trailing zero bytes the
// controller adds by itself up to the payload length.
std::string PayloadList(const std::vector<uint8_t>& payload);

}  // namespace kvmon
