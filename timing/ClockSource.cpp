// Clock state: picoseconds per tick computed once from the counter's frequency.
#include "timing/ClockSource.h"

#include <atomic>

#include "platform/Clock.h"

namespace {

constexpr uint64_t kPicosecondsPerSecond = 1000000000000ULL;

class PlatformCounter final : public iClockSource {
 public:
  uint64_t readCounter() override {
    return static_cast<uint64_t>(platform::ReadPerformanceCounter());
  }
  uint64_t counterFrequency() override {
    return static_cast<uint64_t>(platform::PerformanceCounterFrequency());
  }
};

PlatformCounter platformCounter;
std::atomic<iClockSource*> installedSource{&platformCounter};

// Written only by the idempotent initialisation: two racing first readers store the same value.
std::atomic<bool> clockInitialised{false};
std::atomic<uint64_t> picosecondsPerTick{0};

void InitialiseClock(iClockSource& source) {
  uint64_t frequency = source.counterFrequency();
  if (frequency == 0) frequency = 1;  // a broken source must not divide by zero
  picosecondsPerTick.store(kPicosecondsPerSecond / frequency, std::memory_order_relaxed);
  clockInitialised.store(true, std::memory_order_release);
}

}  // namespace

void InstallClockSource(iClockSource* source) {
  installedSource.store(source != nullptr ? source : &platformCounter);
  clockInitialised.store(false);
}

uint64_t ReadClockPicoseconds() {
  iClockSource& source = *installedSource.load();
  if (!clockInitialised.load(std::memory_order_acquire)) InitialiseClock(source);
  const uint64_t ticks = source.readCounter();
  if (!clockInitialised.load(std::memory_order_acquire)) InitialiseClock(source);
  return ticks * picosecondsPerTick.load(std::memory_order_relaxed);
}
