// Durations of CAN frames by payload length, and the bus time they add up to in a window.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

// What the frame-time tables are built from, read from the session settings when a poll loop
// begins.
struct CanFrameTimeSettings {
  uint32_t canIoMode = 0;            // 0 classic, 1 FD, 2 FD with bit-rate switching
  uint32_t applicationProtocol = 0;  // 1: J1939
  uint64_t baudRate = 0;             // arbitration bit rate, bit/s
  uint64_t canFdBaudRate = 0;        // data bit rate of FD with bit-rate switching, bit/s
};

// Two tables of frame durations in microseconds, rows 0 (standard) and 1 (extended identifiers),
// 16 payload-length indices; frameTimeMax counts worst-case stuff bits, frameTimeMin none. The bus
// time sums both over the data frames of the current window. Poll thread only.
class CanFrameTimes {
 public:
  static constexpr uint32_t kIndices = 16;
  static constexpr uint32_t kNoIndex = kIndices;

  // Index of a payload length: 0-8 are their own, 12 16 20 24 32 48 64 are 9-15; kNoIndex
  // otherwise.
  static uint32_t indexOf(uint32_t payloadLength);

  // Classic CAN without J1939 fills indices 0-8; FD modes fill all 16. Everything else (J1939 on a
  // classic interface, unknown modes) and a bit rate of 0, whose durations would be infinite,
  // build no table: those frames then add nothing to the bus time.
  void buildFrameTimeTables(const CanFrameTimeSettings& settings);

  // Adds the frame's durations to the bus time when its length has a filled index.
  void addFrame(bool extended, uint32_t payloadLength);

  // Bus load in 0.01 % units over elapsedMs: 10 x trunc(mean bus time / elapsed), at most 10000.
  uint32_t busLoad(uint64_t elapsedMs) const;

  void clearBusTime() { busTimeMax_ = busTimeMin_ = 0.0; }

  bool hasFrameTime(uint32_t index) const { return index < filled_; }
  double frameTimeMax(uint32_t row, uint32_t index) const { return frameTimeMax_[row][index]; }
  double frameTimeMin(uint32_t row, uint32_t index) const { return frameTimeMin_[row][index]; }
  double busTimeMax() const { return busTimeMax_; }
  double busTimeMin() const { return busTimeMin_; }

 private:
  void buildClassic(uint64_t baudRate);
  void buildFd(uint64_t baudRate, uint64_t dataRate);

  double frameTimeMax_[2][kIndices] = {};
  double frameTimeMin_[2][kIndices] = {};
  uint32_t filled_ = 0;  // indices 0 to filled_ - 1 hold durations
  double busTimeMax_ = 0.0;
  double busTimeMin_ = 0.0;
};

}  // namespace nKV_DLL300
