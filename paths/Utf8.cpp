// Byte-level UTF-8 rules and the transcoding to and from UTF-16.
#include "paths/Utf8.h"

#include <cstdint>

namespace kxpath {

namespace {

constexpr uint32_t kMaxCodePoint = 0x10FFFF;

int sequenceLength(uint8_t lead) {
  if (lead < 0x80) return 1;
  if ((lead & 0xE0) == 0xC0) return 2;
  if ((lead & 0xF0) == 0xE0) return 3;
  if ((lead & 0xF8) == 0xF0) return 4;
  return 0;
}

uint32_t leadBits(uint8_t lead, int length) {
  static constexpr uint8_t kMasks[5] = {0, 0x7F, 0x1F, 0x0F, 0x07};
  return lead & kMasks[length];
}

uint32_t shortestLimit(int length) {
  static constexpr uint32_t kLimits[5] = {0, 0, 0x80, 0x800, 0x10000};
  return kLimits[length];
}

// Decodes one sequence at `pos`; returns its length, or 0 when it is not well-formed.
int decodeOne(std::string_view text, size_t pos, uint32_t& value) {
  const auto lead = static_cast<uint8_t>(text[pos]);
  const int length = sequenceLength(lead);
  if (length == 0 || pos + length > text.size()) return 0;
  value = leadBits(lead, length);
  for (int i = 1; i < length; ++i) {
    const auto next = static_cast<uint8_t>(text[pos + i]);
    if ((next & 0xC0) != 0x80) return 0;
    value = (value << 6) | (next & 0x3F);
  }
  if (value > kMaxCodePoint || (value >= 0xD800 && value <= 0xDFFF)) return 0;
  if (value < shortestLimit(length)) return 0;
  return length;
}

void appendUtf8(std::string& out, uint32_t value) {
  if (value < 0x80) {
    out += static_cast<char>(value);
  } else if (value < 0x800) {
    out += static_cast<char>(0xC0 | (value >> 6));
    out += static_cast<char>(0x80 | (value & 0x3F));
  } else if (value < 0x10000) {
    out += static_cast<char>(0xE0 | (value >> 12));
    out += static_cast<char>(0x80 | ((value >> 6) & 0x3F));
    out += static_cast<char>(0x80 | (value & 0x3F));
  } else {
    out += static_cast<char>(0xF0 | (value >> 18));
    out += static_cast<char>(0x80 | ((value >> 12) & 0x3F));
    out += static_cast<char>(0x80 | ((value >> 6) & 0x3F));
    out += static_cast<char>(0x80 | (value & 0x3F));
  }
}

}  // namespace

bool isValidUtf8(std::string_view text) {
  for (size_t pos = 0; pos < text.size();) {
    uint32_t value = 0;
    const int length = decodeOne(text, pos, value);
    if (length == 0) return false;
    pos += length;
  }
  return true;
}

std::u16string utf8ToUtf16(std::string_view text) {
  std::u16string out;
  out.reserve(text.size());
  for (size_t pos = 0; pos < text.size();) {
    uint32_t value = 0;
    const int length = decodeOne(text, pos, value);
    if (length == 0) break;  // callers validate first
    pos += length;
    if (value < 0x10000) {
      out += static_cast<char16_t>(value);
    } else {
      value -= 0x10000;
      out += static_cast<char16_t>(0xD800 + (value >> 10));
      out += static_cast<char16_t>(0xDC00 + (value & 0x3FF));
    }
  }
  return out;
}

std::string utf16ToUtf8(std::u16string_view text) {
  std::string out;
  out.reserve(text.size() * 3);
  for (size_t i = 0; i < text.size(); ++i) {
    uint32_t value = text[i];
    const bool high = value >= 0xD800 && value <= 0xDBFF;
    if (high && i + 1 < text.size() && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF) {
      value = 0x10000 + ((value - 0xD800) << 10) + (text[i + 1] - 0xDC00);
      ++i;
    }
    appendUtf8(out, value);
  }
  return out;
}

}  // namespace kxpath
