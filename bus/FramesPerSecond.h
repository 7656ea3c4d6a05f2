// Turning a window's frame count into frames per second.
#pragma once

#include <algorithm>
#include <cstdint>

namespace nKV_DLL300 {

// (count x 1000 + 500) / elapsedMs, rounded to the nearest frame per second. Computed in 64 bits so
// that long windows with many frames do not wrap, and with at least 1 ms so that a zero elapsed
// time (a period of 2^32 ms) cannot divide by zero.
inline uint32_t FramesPerSecond(uint32_t count, uint64_t elapsedMs) {
  const uint64_t perSecond = (uint64_t{count} * 1000 + 500) / std::max<uint64_t>(elapsedMs, 1);
  return static_cast<uint32_t>(std::min<uint64_t>(perSecond, UINT32_MAX));
}

}  // namespace nKV_DLL300
