// Names of the throw-away databases of the transmit frames.
#pragma once

#include <string>

namespace nKV_DLL300 {

// ":memory<n>", n drawn from a generator seeded with the current time in seconds, 0 to 32767.
//
// Two starts in the same second draw the same n, and the driver hands out one database for a
// name opened twice: a second host transmitting in that second would then re-define the first
// host's frame and inherit the properties it does not set itself (an extended identifier, an FD
// mode). So a number whose database is still open here moves on to the next free number.
// Thread-safe: each service thread of the process uses it.
class TransmitDatabaseName {
 public:
  // Reserves a number (seeded from the clock) and returns it; release gives it back.
  static int acquire();
  // The number drawn from a generator seeded with `seed`.
  static int draw(uint32_t seed);
  static void release(int number);
  static std::string format(int number);
};

}  // namespace nKV_DLL300
