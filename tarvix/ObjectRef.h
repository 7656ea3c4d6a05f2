// Driver references: the kind of object in the top byte, a serial number below it.
#pragma once

#include <cstdint>

namespace tarvix {

inline constexpr uint32_t kRefSystem = 1;
inline constexpr uint32_t kRefDevice = 2;
inline constexpr uint32_t kRefInterface = 3;
inline constexpr uint32_t kRefSession = 4;
inline constexpr uint32_t kRefDatabase = 5;
inline constexpr uint32_t kRefCluster = 6;
inline constexpr uint32_t kRefFrame = 7;

inline constexpr uint32_t kRefSerialMask = 0x00FFFFFF;

constexpr uint32_t MakeRef(uint32_t kind, uint32_t serial) {
  return (kind << 24) | (serial & kRefSerialMask);
}
constexpr uint32_t RefKind(uint32_t ref) { return ref >> 24; }

}  // namespace tarvix
