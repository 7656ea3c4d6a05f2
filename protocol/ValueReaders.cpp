// Number parsing over a bounded view: no reader ever looks past the bytes it was given.
#include "protocol/ValueReaders.h"

#include <cstdlib>
#include <string>

namespace nKV_DLL300 {

namespace {

bool IsBlank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }

int DigitValue(char c, int base) {
  int digit = 99;
  if (c >= '0' && c <= '9') digit = c - '0';
  if (c >= 'a' && c <= 'f') digit = c - 'a' + 10;
  if (c >= 'A' && c <= 'F') digit = c - 'A' + 10;
  return digit < base ? digit : -1;
}

// The parts every reader shares: blanks skipped, sign consumed.
struct Cursor {
  std::string_view text;
  size_t at = 0;
  bool negative = false;

  explicit Cursor(std::string_view value) : text(value) {
    while (at < text.size() && IsBlank(text[at])) ++at;
    if (at < text.size() && (text[at] == '+' || text[at] == '-')) negative = text[at++] == '-';
  }
  bool more() const { return at < text.size(); }
  char peek(size_t ahead = 0) const { return at + ahead < text.size() ? text[at + ahead] : '\0'; }
};

// Digits in `base` from the cursor, saturating at `limit`; false when there was no digit.
bool ReadMagnitude(Cursor& cursor, int base, uint64_t limit, uint64_t& magnitude) {
  bool any = false;
  magnitude = 0;
  for (int digit; (digit = DigitValue(cursor.peek(), base)) >= 0 && cursor.more(); ++cursor.at) {
    any = true;
    if (magnitude > (limit - digit) / base) {
      magnitude = limit;
    } else {
      magnitude = magnitude * base + digit;
    }
  }
  return any;
}

}  // namespace

int32_t ReadInteger(std::string_view value) {
  Cursor cursor(value);
  uint64_t magnitude = 0;
  constexpr uint64_t kLimit = uint64_t{1} << 31;  // |INT32_MIN|
  ReadMagnitude(cursor, 10, kLimit, magnitude);
  if (cursor.negative) return static_cast<int32_t>(-static_cast<int64_t>(magnitude));
  return magnitude >= kLimit ? INT32_MAX : static_cast<int32_t>(magnitude);
}

uint8_t ReadByte(std::string_view value) {
  return static_cast<uint8_t>(static_cast<uint32_t>(ReadInteger(value)) & 0xFFu);
}

uint64_t ReadUnsigned64(std::string_view value, uint64_t previous) {
  Cursor cursor(value);
  uint64_t magnitude = 0;
  if (!ReadMagnitude(cursor, 10, UINT64_MAX, magnitude)) return previous;
  return cursor.negative ? uint64_t{0} - magnitude : magnitude;
}

uint32_t ReadKey(std::string_view value) {
  Cursor cursor(value);
  int base = 10;
  if (cursor.peek() == '0') {
    bool hex =
        (cursor.peek(1) == 'x' || cursor.peek(1) == 'X') && DigitValue(cursor.peek(2), 16) >= 0;
    base = hex ? 16 : 8;
    if (hex) cursor.at += 2;
  }
  uint64_t magnitude = 0;
  constexpr uint64_t kLimit = 0xFFFFFFFFull;
  ReadMagnitude(cursor, base, kLimit + 1, magnitude);
  if (magnitude > kLimit) return 0xFFFFFFFFu;
  uint32_t result = static_cast<uint32_t>(magnitude);
  return cursor.negative ? 0u - result : result;
}

double ReadRate(std::string_view value) {
  // A NUL-terminated copy for strtod; a NUL inside the view ends the number as it would in text.
  std::string text(value);
  for (char& c : text) {
    if (c == ',') c = '.';
  }
  return std::strtod(text.c_str(), nullptr);
}

}  // namespace nKV_DLL300
