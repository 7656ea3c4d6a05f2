// Helpers of the driver stand-in's tests: sessions, reading decoded frames until a condition holds.
#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"

namespace tarvix::test {

// Generous: machine speed must never decide a test.
inline constexpr auto kDeadline = std::chrono::seconds(20);

struct Frame {
  uint64_t timestamp = 0;
  uint32_t identifier = 0;
  uint8_t type = 0;
  uint8_t flags = 0;
  uint8_t info = 0;
  uint32_t length = 0;
  std::vector<uint8_t> payload;
};

// Splits a read batch into frames (16-byte header, payload padded to a multiple of 8, at least 8).
inline std::vector<Frame> Decode(const uint8_t* data, uint32_t size) {
  std::vector<Frame> frames;
  uint32_t offset = 0;
  while (offset + 16 <= size) {
    Frame f;
    std::memcpy(&f.timestamp, data + offset, 8);
    std::memcpy(&f.identifier, data + offset + 8, 4);
    f.type = data[offset + 12];
    f.flags = data[offset + 13];
    f.info = data[offset + 14];
    f.length = data[offset + 15] + (f.type == 0xC0 ? 256u * (f.info & 7u) : 0u);
    const uint32_t area = f.length == 0 ? 8 : (f.length + 7) & ~7u;
    f.payload.assign(data + offset + 16, data + offset + 16 + f.length);
    offset += 16 + area;
    frames.push_back(std::move(f));
  }
  EXPECT_EQ(offset, size) << "a batch holds whole frames only";
  return frames;
}

// Reads with time-out 0 until `done(frames so far)` holds or the deadline passes.
inline std::vector<Frame> ReadUntil(kxRef session,
                                    const std::function<bool(const std::vector<Frame>&)>& done) {
  std::vector<Frame> all;
  std::vector<uint8_t> buffer(100000);
  const auto deadline = std::chrono::steady_clock::now() + kDeadline;
  while (!done(all) && std::chrono::steady_clock::now() < deadline) {
    uint32_t bytes = 0;
    const kxStatus st =
        kxReadFrame(session, buffer.data(), static_cast<uint32_t>(buffer.size()), 0.0, &bytes);
    EXPECT_TRUE(st == 0 || st == driver::kReadTimeout || st == driver::kWarnReceiveQueueOverflow)
        << std::hex << st;
    const auto batch = Decode(buffer.data(), bytes);
    all.insert(all.end(), batch.begin(), batch.end());
    if (bytes == 0) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return all;
}

inline size_t CountId(const std::vector<Frame>& frames, uint32_t id, uint8_t type) {
  size_t n = 0;
  for (const Frame& f : frames) n += f.identifier == id && f.type == type;
  return n;
}

inline constexpr uint8_t kErrorsOn[2] = {1, 0};

inline void Load(const std::string& json, const std::string& dir = ".") {
  std::string error;
  ASSERT_TRUE(LoadConfiguration(json, dir, &error)) << error;
}

// The first device a freshly opened system object lists; 0 when there is no hardware.
inline uint32_t FirstDevice() {
  kxRef system = 0;
  uint32_t devices[64] = {};
  EXPECT_EQ(kxSystemOpen(&system), 0);
  EXPECT_EQ(kxGetProperty(system, driver::kPropSystemDevices, sizeof devices, devices), 0);
  EXPECT_EQ(kxSystemClose(system), 0);
  return devices[0];
}

// A 4-byte property of a freshly opened system object.
inline uint32_t SystemValue(uint32_t id) {
  kxRef system = 0;
  uint32_t value = 0xFFFFFFFF;
  EXPECT_EQ(kxSystemOpen(&system), 0);
  EXPECT_EQ(kxGetProperty(system, id, 4, &value), 0) << std::hex << id;
  EXPECT_EQ(kxSystemClose(system), 0);
  return value;
}

inline kxRef Open(const char* database, const char* interfaceName, const char* cluster = "") {
  kxRef ref = 0;
  EXPECT_EQ(kxCreateSession(database, cluster, "", interfaceName, driver::kModeReceiveStream, &ref),
            0)
      << database << " on " << interfaceName;
  return ref;
}

template <typename T>
kxStatus Set(kxRef ref, uint32_t id, T value) {
  return kxSetProperty(ref, id, sizeof value, &value);
}

// Every test starts from the default hardware with nothing recorded or injected.
class TarvixTest : public ::testing::Test {
 protected:
  void SetUp() override { ResetToDefaults(); }
  void TearDown() override { ResetToDefaults(); }
};

}  // namespace tarvix::test
