// Database names for the transmit frames: one clock-seeded number, unique among open databases.
#include "transmit/TransmitDatabaseName.h"

#include <bitset>
#include <cstdint>
#include <cstdio>
#include <ctime>
#include <mutex>

namespace nKV_DLL300 {

namespace {

constexpr int kNumberRange = 32768;  // the generator's numbers are 0 to 32767

struct NumbersInUse {
  std::mutex mutex;
  std::bitset<kNumberRange> used;  // guarded by mutex
};

NumbersInUse& InUse() {
  static NumbersInUse numbers;
  return numbers;
}

}  // namespace

int TransmitDatabaseName::draw(uint32_t seed) {
  // The classic linear congruential generator; its first number after seeding.
  const uint32_t state = seed * 214013u + 2531011u;
  return static_cast<int>((state >> 16) & 0x7FFFu);
}

int TransmitDatabaseName::acquire() {
  const int drawn = draw(static_cast<uint32_t>(std::time(nullptr)));
  NumbersInUse& numbers = InUse();
  std::lock_guard lock(numbers.mutex);
  for (int step = 0; step < kNumberRange; ++step) {
    const int number = (drawn + step) % kNumberRange;
    if (!numbers.used.test(number)) {
      numbers.used.set(number);
      return number;
    }
  }
  return drawn;  // unreachable: at most a few hosts per service transmit at once
}

void TransmitDatabaseName::release(int number) {
  if (number < 0 || number >= kNumberRange) return;
  NumbersInUse& numbers = InUse();
  std::lock_guard lock(numbers.mutex);
  numbers.used.reset(number);
}

std::string TransmitDatabaseName::format(int number) {
  char name[128];
  std::snprintf(name, sizeof name, ":memory%d", number);
  return name;
}

}  // namespace nKV_DLL300
