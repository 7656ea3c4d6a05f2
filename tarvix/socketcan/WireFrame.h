// Frames as SocketCAN carries them, and frames as the driver hands them out.
#pragma once

#include <array>
#include <cstdint>
#include <vector>

namespace tarvix {

// A CAN frame of a CAN_RAW socket (struct can_frame / canfd_frame without the kernel's types).
struct WireFrame {
  uint32_t canId = 0;   // identifier with the kernel's flag bits (extended, remote, error)
  uint8_t length = 0;   // payload bytes (remote frames: the requested length)
  uint8_t fdFlags = 0;  // CAN FD flags (bit-rate switch, error state indicator)
  bool fd = false;      // a CAN FD frame
  std::array<uint8_t, 64> data{};
};

// A frame as a socket received it, with what the kernel told about it.
struct Reception {
  WireFrame frame;
  int64_t softwareNs = 0;  // kernel receive time stamp, ns since 1970 UTC; 0: none
  int64_t hardwareNs = 0;  // the device's time stamp where it gives one; 0: none
  bool local = false;      // sent from this machine (by any local socket)
  bool confirm = false;    // sent by the receiving socket itself
  bool hasDrops = false;   // `drops` holds the socket's count of frames the kernel dropped
  uint32_t drops = 0;
};

// A J1939 message of a CAN_J1939 socket: a single frame or a reassembled multi-packet transfer.
struct J1939Message {
  uint32_t pgn = 0;
  uint8_t source = 0;
  uint8_t destination = 0xFF;
  uint8_t priority = 6;
  int64_t softwareNs = 0;
  std::vector<uint8_t> data;
};

// A frame in the driver's raw layout before encoding: 16-byte header, payload padded to a
// multiple of 8 (at least 8). J1939 messages may carry up to 2047 bytes.
struct DriverFrame {
  uint64_t timestamp = 0;  // 100 ns units since 1601-01-01 UTC
  uint32_t identifier = 0;
  uint8_t type = 0;
  uint8_t flags = 0;
  uint16_t length = 0;
  std::array<uint8_t, 64> data{};
  std::vector<uint8_t> longData;  // J1939 payloads above 64 bytes (then `data` is unused)

  const uint8_t* payload() const { return longData.empty() ? data.data() : longData.data(); }
  uint32_t rawSize() const;
  // Writes the frame at `out` (rawSize() bytes of room); returns the bytes written.
  uint32_t encode(uint8_t* out) const;
};

}  // namespace tarvix
