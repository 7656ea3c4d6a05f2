// Conversions between SocketCAN frames and the driver's frames: identifiers and flags, bus-error
// frames, time stamps, J1939 identifiers. Pure functions.
#pragma once

#include <cstdint>

#include "tarvix/SimFrame.h"
#include "tarvix/socketcan/WireFrame.h"

namespace tarvix {

// 100 ns units since 1601-01-01 UTC of a time in ns since 1970-01-01 UTC.
uint64_t DriverTimestamp(int64_t unixNs);

// The moment a frame was received: the device's time stamp when it has one that lies within a
// second of the kernel's, otherwise the kernel's. Device clocks that run apart from the system's
// would reorder frames, so their stamps are used only while they agree.
int64_t ReceptionTimeNs(const Reception& r);

// A received frame in the driver's terms: data (classic, FD with or without bit-rate switching),
// remote, or bus-error frame (type 0x02; identifier: the kernel's error class bits; 8 bytes of
// error detail). Extended identifiers carry bit 29.
DriverFrame ToDriverFrame(const WireFrame& frame, uint64_t timestamp);

// The frame an output session writes, as the kernel sends it. Data and remote frames only.
WireFrame ToWireFrame(const SimFrame& frame);

// True when `a` and `b` are the same frame on the bus (identifier, flags, length, payload).
bool SameFrame(const WireFrame& a, const WireFrame& b);

// The 29-bit identifier of a J1939 message (without bit 29).
uint32_t J1939Identifier(const J1939Message& m);

}  // namespace tarvix
