// Windows-1252: 0x80-0x9F through a table, every other byte is its own Unicode value.
#include "platform/CodePage.h"

#include <cstdint>

namespace platform {

namespace {

constexpr char16_t kUnassigned = 0;
constexpr char kDefaultCharacter = '?';

// Unicode values of the bytes 0x80 to 0x9F; kUnassigned marks the five bytes without one.
constexpr char16_t kHighControls[32] = {
    0x20AC,      kUnassigned, 0x201A, 0x0192, 0x201E, 0x2026,      0x2020, 0x2021,
    0x02C6,      0x2030,      0x0160, 0x2039, 0x0152, kUnassigned, 0x017D, kUnassigned,
    kUnassigned, 0x2018,      0x2019, 0x201C, 0x201D, 0x2022,      0x2013, 0x2014,
    0x02DC,      0x2122,      0x0161, 0x203A, 0x0153, kUnassigned, 0x017E, 0x0178};

bool IsHighSurrogate(char16_t unit) { return unit >= 0xD800 && unit <= 0xDBFF; }
bool IsLowSurrogate(char16_t unit) { return unit >= 0xDC00 && unit <= 0xDFFF; }

char EncodeUnit(char16_t unit) {
  if (unit < 0x80 || (unit >= 0xA0 && unit <= 0xFF)) return static_cast<char>(unit);
  // The five unassigned bytes decode (leniently) to the controls of their value; keep them so.
  if (unit <= 0x9F && kHighControls[unit - 0x80] == kUnassigned) return static_cast<char>(unit);
  for (int index = 0; index < 32; ++index) {
    if (kHighControls[index] == unit && unit != kUnassigned) return static_cast<char>(0x80 + index);
  }
  return kDefaultCharacter;
}

}  // namespace

bool CodePageToUtf16(std::string_view bytes, std::u16string& out, bool strictInvalid) {
  out.clear();
  out.reserve(bytes.size());
  for (char raw : bytes) {
    const auto byte = static_cast<uint8_t>(raw);
    if (byte < 0x80 || byte >= 0xA0) {
      out.push_back(static_cast<char16_t>(byte));
      continue;
    }
    const char16_t mapped = kHighControls[byte - 0x80];
    if (mapped == kUnassigned && strictInvalid) {
      out.clear();
      return false;
    }
    out.push_back(mapped == kUnassigned ? static_cast<char16_t>(byte) : mapped);
  }
  return true;
}

void Utf16ToCodePage(std::u16string_view text, std::string& out) {
  out.clear();
  out.reserve(text.size());
  for (size_t index = 0; index < text.size(); ++index) {
    const char16_t unit = text[index];
    if (IsHighSurrogate(unit) && index + 1 < text.size() && IsLowSurrogate(text[index + 1])) {
      ++index;  // a character above 0xFFFF: never in this code page
      out.push_back(kDefaultCharacter);
      continue;
    }
    out.push_back(EncodeUnit(unit));
  }
}

}  // namespace platform
