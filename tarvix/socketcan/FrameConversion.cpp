// Conversions between SocketCAN frames and the driver's frames.
#include "tarvix/socketcan/FrameConversion.h"

#include <linux/can.h>

#include <algorithm>
#include <cstring>

#include "driver/FrameTypes.h"
#include "driver/RawFrame.h"

namespace tarvix {
namespace {

constexpr uint64_t kUnixEpochAsFileTime = 116444736000000000ULL;
constexpr int64_t kHardwareAgreementNs = 1'000'000'000;
constexpr uint32_t kErrorFrameBytes = 8;
constexpr uint32_t kPduFormatBoundary = 240;  // PDU1 (addressed) below, PDU2 (broadcast) above

uint8_t DataType(const WireFrame& f) {
  if (!f.fd) return driver::kFrameCanData;
  return (f.fdFlags & CANFD_BRS) ? driver::kFrameCanFdBrsData : driver::kFrameCanFdData;
}

uint32_t DriverIdentifier(uint32_t canId) {
  if (canId & CAN_EFF_FLAG) return (canId & CAN_EFF_MASK) | driver::kExtendedIdFlag;
  return canId & CAN_SFF_MASK;
}

}  // namespace

uint32_t DriverFrame::rawSize() const {
  return driver::kRawFrameHeaderSize + driver::RawPayloadArea(length);
}

uint32_t DriverFrame::encode(uint8_t* out) const {
  driver::RawFrameHeader h{timestamp,
                           identifier,
                           type,
                           flags,
                           static_cast<uint8_t>(length >> 8 & 0x7),
                           static_cast<uint8_t>(length & 0xFF)};
  if (type != driver::kFrameJ1939) h.info = 0;
  std::memcpy(out, &h, sizeof h);
  const uint32_t size = rawSize();
  std::memcpy(out + sizeof h, payload(), length);
  std::memset(out + sizeof h + length, 0, size - sizeof h - length);
  return size;
}

uint64_t DriverTimestamp(int64_t unixNs) {
  return kUnixEpochAsFileTime + static_cast<uint64_t>(std::max<int64_t>(0, unixNs) / 100);
}

int64_t ReceptionTimeNs(const Reception& r) {
  if (r.hardwareNs != 0 &&
      (r.softwareNs == 0 || (r.hardwareNs > r.softwareNs - kHardwareAgreementNs &&
                             r.hardwareNs < r.softwareNs + kHardwareAgreementNs))) {
    return r.hardwareNs;
  }
  return r.softwareNs;
}

DriverFrame ToDriverFrame(const WireFrame& f, uint64_t timestamp) {
  DriverFrame d;
  d.timestamp = timestamp;
  if (f.canId & CAN_ERR_FLAG) {
    d.identifier = f.canId & CAN_ERR_MASK;
    d.type = driver::kFrameCanBusError;
    d.length = kErrorFrameBytes;
    std::copy_n(f.data.begin(), kErrorFrameBytes, d.data.begin());
    return d;
  }
  d.identifier = DriverIdentifier(f.canId);
  d.length = std::min<uint8_t>(f.length, f.fd ? CANFD_MAX_DLEN : CAN_MAX_DLEN);
  if (f.canId & CAN_RTR_FLAG) {
    d.type = driver::kFrameCanRemote;
    return d;
  }
  d.type = DataType(f);
  std::copy_n(f.data.begin(), d.length, d.data.begin());
  return d;
}

WireFrame ToWireFrame(const SimFrame& f) {
  WireFrame w;
  const bool extended = (f.identifier & driver::kExtendedIdFlag) != 0;
  w.canId = extended ? (f.identifier & CAN_EFF_MASK) | CAN_EFF_FLAG : f.identifier & CAN_SFF_MASK;
  w.fd = f.type == driver::kFrameCanFdData || f.type == driver::kFrameCanFdBrsData;
  w.fdFlags = f.type == driver::kFrameCanFdBrsData ? CANFD_BRS : 0;
  w.length = std::min<uint8_t>(f.length, w.fd ? CANFD_MAX_DLEN : CAN_MAX_DLEN);
  if (f.type == driver::kFrameCanRemote) {
    w.canId |= CAN_RTR_FLAG;
    return w;
  }
  std::copy_n(f.payload.begin(), w.length, w.data.begin());
  return w;
}

bool SameFrame(const WireFrame& a, const WireFrame& b) {
  if (a.canId != b.canId || a.length != b.length || a.fd != b.fd) return false;
  if (a.fd && (a.fdFlags & CANFD_BRS) != (b.fdFlags & CANFD_BRS)) return false;
  if (a.canId & CAN_RTR_FLAG) return true;
  return std::equal(a.data.begin(), a.data.begin() + a.length, b.data.begin());
}

uint32_t J1939Identifier(const J1939Message& m) {
  uint32_t pgn = m.pgn & 0x3FFFF;
  if (((pgn >> 8) & 0xFF) < kPduFormatBoundary) pgn = (pgn & 0x3FF00) | m.destination;
  return (static_cast<uint32_t>(m.priority & 7) << 26) | (pgn << 8) | m.source;
}

}  // namespace tarvix
