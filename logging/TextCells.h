// Allocation-free appenders for the cells of the text logs (hex bytes, numbers, time of day).
#pragma once

#include <array>
#include <cstdint>
#include <cstring>

namespace nKV_DLL300::textcells {

// "%02x  " for every byte value, four characters each, built at compile time.
struct HexByteTable {
  std::array<char, 256 * 4> text{};
  constexpr HexByteTable() {
    constexpr char kDigits[] = "0123456789abcdef";
    for (int v = 0; v < 256; ++v) {
      text[v * 4 + 0] = kDigits[v >> 4];
      text[v * 4 + 1] = kDigits[v & 15];
      text[v * 4 + 2] = ' ';
      text[v * 4 + 3] = ' ';
    }
  }
};
inline constexpr HexByteTable kHexBytes{};

// Appends "%02x  " for each of `count` bytes.
inline char* AppendPayloadGroups(char* p, const uint8_t* bytes, uint32_t count) {
  for (uint32_t i = 0; i < count; ++i, p += 4) std::memcpy(p, &kHexBytes.text[bytes[i] * 4u], 4);
  return p;
}

// Appends "%x": lower-case hexadecimal without leading zeros.
inline char* AppendHex(char* p, uint32_t value) {
  constexpr char kDigits[] = "0123456789abcdef";
  int digits = 1;
  while (digits < 8 && (value >> (4 * digits)) != 0) ++digits;
  for (int i = digits - 1; i >= 0; --i) *p++ = kDigits[(value >> (4 * i)) & 15];
  return p;
}

// Appends "%02x".
inline char* AppendHex2(char* p, uint8_t value) {
  std::memcpy(p, &kHexBytes.text[value * 4u], 2);
  return p + 2;
}

// Appends "%d" for a non-negative value.
inline char* AppendDecimal(char* p, uint32_t value) {
  char digits[10];
  int n = 0;
  do {
    digits[n++] = static_cast<char>('0' + value % 10);
    value /= 10;
  } while (value != 0);
  while (n > 0) *p++ = digits[--n];
  return p;
}

// Appends "%02d" for 0 to 99 and "%03d" for 0 to 999.
inline char* AppendTwoDigits(char* p, uint32_t value) {
  p[0] = static_cast<char>('0' + value / 10);
  p[1] = static_cast<char>('0' + value % 10);
  return p + 2;
}
inline char* AppendThreeDigits(char* p, uint32_t value) {
  p[0] = static_cast<char>('0' + value / 100);
  return AppendTwoDigits(p + 1, value % 100);
}

inline char* AppendText(char* p, const char* text, size_t length) {
  std::memcpy(p, text, length);
  return p + length;
}

}  // namespace nKV_DLL300::textcells
