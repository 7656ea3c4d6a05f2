// A payload pattern of configured traffic: fixed bytes, a rolling counter byte, a rising ramp.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tarvix {

// Text form: blank-separated tokens, one per byte from byte 0:
//   "AA"        a hexadecimal byte
//   "ctr"       the frame counter: rises by one with every frame of this traffic entry, wraps at
//   256 "ramp:XX"   this and every following byte count up from XX (wrapping), to the end of the
//   payload
// Bytes beyond the pattern are 0. Example: "ctr 01 02 03", "ramp:A0".
class PayloadPattern {
 public:
  // Parses `text`; on failure returns false and describes the bad token in `error`.
  static bool Parse(std::string_view text, PayloadPattern& out, std::string& error);

  static PayloadPattern Bytes(std::vector<uint8_t> bytes);
  static PayloadPattern CounterThen(std::vector<uint8_t> rest);
  static PayloadPattern Ramp(uint8_t start);

  // Fills `length` bytes of `out` for the frame with this counter value.
  void fill(uint8_t* out, uint32_t length, uint8_t counter) const;

 private:
  enum class Kind : uint8_t { Literal, Counter, Ramp };
  struct Item {
    Kind kind;
    uint8_t value;
  };
  std::vector<Item> items_;
};

}  // namespace tarvix
