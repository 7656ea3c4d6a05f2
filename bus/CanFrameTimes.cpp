// Durations of CAN frames by payload length, and the bus time they add up to in a window.
#include "bus/CanFrameTimes.h"

namespace nKV_DLL300 {

namespace {

constexpr uint32_t kFdLengths[CanFrameTimes::kIndices] = {0, 1,  2,  3,  4,  5,  6,  7,
                                                          8, 12, 16, 20, 24, 32, 48, 64};
constexpr uint32_t kClassicIndices = 9;
constexpr uint32_t kBusLoadFull = 10000;

// Microseconds that `bits` bits take at `rate` bit/s.
double At(uint32_t bits, uint64_t rate) {
  return static_cast<double>(bits) / static_cast<double>(rate) * 1e6;
}

}  // namespace

uint32_t CanFrameTimes::indexOf(uint32_t payloadLength) {
  if (payloadLength <= 8) return payloadLength;
  for (uint32_t i = kClassicIndices; i < kIndices; ++i) {
    if (kFdLengths[i] == payloadLength) return i;
  }
  return kNoIndex;
}

void CanFrameTimes::buildFrameTimeTables(const CanFrameTimeSettings& settings) {
  filled_ = 0;
  if (settings.canIoMode == 0 && settings.applicationProtocol == 0) {
    if (settings.baudRate != 0) buildClassic(settings.baudRate);
  } else if (settings.canIoMode == 1 || settings.canIoMode == 2) {
    const uint64_t dataRate = settings.canIoMode == 1 ? settings.baudRate : settings.canFdBaudRate;
    if (settings.baudRate != 0 && dataRate != 0) buildFd(settings.baudRate, dataRate);
  }
}

void CanFrameTimes::buildClassic(uint64_t baudRate) {
  for (uint32_t row = 0; row < 2; ++row) {
    for (uint32_t n = 0; n < kClassicIndices; ++n) {
      const uint32_t bits = (row == 0 ? 47 : 67) + 8 * n;
      frameTimeMax_[row][n] = At(bits + (bits - 12) / 5, baudRate);
      frameTimeMin_[row][n] = At(bits, baudRate);
    }
  }
  filled_ = kClassicIndices;
}

void CanFrameTimes::buildFd(uint64_t baudRate, uint64_t dataRate) {
  for (uint32_t row = 0; row < 2; ++row) {
    const uint32_t a = row == 0 ? 22 : 41;
    for (uint32_t i = 0; i < kIndices; ++i) {
      const uint32_t length = kFdLengths[i];
      const uint32_t d = 8 * length;
      const uint32_t t = length > 16 ? 29 : 24;
      frameTimeMax_[row][i] = At(a + a / 5 + 12, baudRate) + At(d + d / 5 + t, dataRate);
      frameTimeMin_[row][i] = At(a + 12, baudRate) + At(d + t, dataRate);
    }
  }
  filled_ = kIndices;
}

void CanFrameTimes::addFrame(bool extended, uint32_t payloadLength) {
  const uint32_t index = indexOf(payloadLength);
  if (!hasFrameTime(index)) return;
  const uint32_t row = extended ? 1 : 0;
  busTimeMax_ += frameTimeMax_[row][index];
  busTimeMin_ += frameTimeMin_[row][index];
}

uint32_t CanFrameTimes::busLoad(uint64_t elapsedMs) const {
  const double busTime = (busTimeMin_ + busTimeMax_) * 0.5;
  if (busTime <= 0.0) return 0;
  if (elapsedMs == 0) return kBusLoadFull;
  const double perMille = busTime / static_cast<double>(elapsedMs);
  // Compared before the conversion so that no value outside 32 bits is ever converted.
  if (!(perMille < kBusLoadFull / 10 + 1)) return kBusLoadFull;
  const uint32_t load = 10 * static_cast<uint32_t>(perMille);
  return load > kBusLoadFull ? kBusLoadFull : load;
}

}  // namespace nKV_DLL300
