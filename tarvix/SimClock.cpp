// Virtual time of the simulated hardware.
#include "tarvix/SimClock.h"

#include <chrono>
#include <cmath>
#include <cstdint>
#include <thread>

namespace tarvix {
namespace {

// 100 ns units between 1601-01-01 and 1970-01-01.
constexpr uint64_t kUnixEpochAsFileTime = 116444736000000000ULL;

struct Epoch {
  int64_t monotonicNs;
  uint64_t fileTime;
};

const Epoch& TheEpoch() {
  static const Epoch epoch = [] {
    const auto wall = std::chrono::system_clock::now().time_since_epoch();
    const int64_t wallNs = std::chrono::duration_cast<std::chrono::nanoseconds>(wall).count();
    return Epoch{NowNs(), kUnixEpochAsFileTime + static_cast<uint64_t>(wallNs / 100)};
  }();
  return epoch;
}

}  // namespace

int64_t NowNs() {
  return std::chrono::duration_cast<std::chrono::nanoseconds>(
             std::chrono::steady_clock::now().time_since_epoch())
      .count();
}

uint64_t TimestampAt(int64_t monotonicNs) {
  const Epoch& e = TheEpoch();
  const int64_t delta = monotonicNs - e.monotonicNs;
  // Floor division keeps stamps monotonic across the epoch for moments before it.
  const int64_t units = delta >= 0 ? delta / 100 : -((-delta + 99) / 100);
  return e.fileTime + static_cast<uint64_t>(units);
}

void UnixTimeOf(uint64_t timestamp, uint64_t& seconds, uint32_t& microseconds) {
  const uint64_t units = timestamp > kUnixEpochAsFileTime ? timestamp - kUnixEpochAsFileTime : 0;
  seconds = units / 10000000ULL;
  microseconds = static_cast<uint32_t>((units % 10000000ULL) / 10ULL);
}

int64_t DeadlineOf(double timeoutS, int64_t nowNs) {
  if (timeoutS < 0 || !std::isfinite(timeoutS) || timeoutS > 1e6) return INT64_MAX;
  return nowNs + static_cast<int64_t>(timeoutS * 1e9);
}

void SleepNs(int64_t ns) {
  if (ns > 0) std::this_thread::sleep_for(std::chrono::nanoseconds(ns));
}

}  // namespace tarvix
