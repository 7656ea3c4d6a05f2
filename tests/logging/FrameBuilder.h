// Test helper: builds read batches of frames in the driver's layout.
#pragma once

#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <vector>

#include "driver/RawFrame.h"

namespace kvtest {

// 2024-05-17 09:05:03.042 UTC in 100 ns units since 1601.
inline constexpr uint64_t kAt090503042 = 133'604'103'030'420'000ull;

struct FrameSpec {
  uint64_t timestamp = kAt090503042;
  uint32_t identifier = 0;
  uint8_t type = 0;
  uint8_t flags = 0;
  uint8_t info = 0;
  std::vector<uint8_t> payload{};
  int lengthByte = -1;  // the length byte to store; -1: the payload size (low 8 bits)
};

// Appends one frame with its payload padded to the driver's payload area (pad bytes `pad`).
inline void AppendFrame(std::vector<uint8_t>& batch, const FrameSpec& f, uint8_t pad = 0) {
  driver::RawFrameHeader h{
      f.timestamp, f.identifier,
      f.type,      f.flags,
      f.info,      static_cast<uint8_t>(f.lengthByte >= 0 ? f.lengthByte : f.payload.size())};
  const uint32_t area = driver::RawPayloadArea(driver::RawPayloadLength(h));
  const size_t at = batch.size();
  batch.resize(at + driver::kRawFrameHeaderSize + area, pad);
  std::memcpy(batch.data() + at, &h, sizeof h);
  if (!f.payload.empty()) {
    std::memcpy(batch.data() + at + driver::kRawFrameHeaderSize, f.payload.data(),
                std::min<size_t>(f.payload.size(), area));
  }
}

// `count` bytes counting up from `first`.
inline std::vector<uint8_t> Counting(size_t count, uint8_t first = 0) {
  std::vector<uint8_t> bytes(count);
  for (size_t i = 0; i < count; ++i) bytes[i] = static_cast<uint8_t>(first + i);
  return bytes;
}

inline std::vector<uint8_t> Batch(std::initializer_list<FrameSpec> frames) {
  std::vector<uint8_t> batch;
  for (const FrameSpec& f : frames) AppendFrame(batch, f);
  return batch;
}

// The view of the first frame of a one-frame batch.
inline driver::RawFrameView FirstView(const std::vector<uint8_t>& batch) {
  driver::RawFrameWalker walker(batch.data(), static_cast<uint32_t>(batch.size()));
  driver::RawFrameView view{};
  walker.next(view);
  return view;
}

}  // namespace kvtest
