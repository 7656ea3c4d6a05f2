// Payload patterns of configured traffic.
#include "tarvix/PayloadPattern.h"

#include <sstream>

namespace tarvix {
namespace {

bool ParseHexByte(std::string_view token, uint8_t& out) {
  if (token.empty() || token.size() > 2) return false;
  unsigned value = 0;
  for (char c : token) {
    value <<= 4;
    if (c >= '0' && c <= '9')
      value |= static_cast<unsigned>(c - '0');
    else if (c >= 'a' && c <= 'f')
      value |= static_cast<unsigned>(c - 'a' + 10);
    else if (c >= 'A' && c <= 'F')
      value |= static_cast<unsigned>(c - 'A' + 10);
    else
      return false;
  }
  out = static_cast<uint8_t>(value);
  return true;
}

}  // namespace

bool PayloadPattern::Parse(std::string_view text, PayloadPattern& out, std::string& error) {
  out.items_.clear();
  std::istringstream in{std::string(text)};
  std::string token;
  while (in >> token) {
    uint8_t value = 0;
    if (token == "ctr") {
      out.items_.push_back({Kind::Counter, 0});
    } else if (token.rfind("ramp:", 0) == 0 &&
               ParseHexByte(std::string_view(token).substr(5), value)) {
      out.items_.push_back({Kind::Ramp, value});
    } else if (ParseHexByte(token, value)) {
      out.items_.push_back({Kind::Literal, value});
    } else {
      error = "bad payload token \"" + token + "\" (expected a hex byte, ctr or ramp:XX)";
      return false;
    }
    if (out.items_.size() > 2048) {
      error = "payload pattern longer than 2048 bytes";
      return false;
    }
  }
  return true;
}

PayloadPattern PayloadPattern::Bytes(std::vector<uint8_t> bytes) {
  PayloadPattern p;
  for (uint8_t b : bytes) p.items_.push_back({Kind::Literal, b});
  return p;
}

PayloadPattern PayloadPattern::CounterThen(std::vector<uint8_t> rest) {
  PayloadPattern p = Bytes(std::move(rest));
  p.items_.insert(p.items_.begin(), Item{Kind::Counter, 0});
  return p;
}

PayloadPattern PayloadPattern::Ramp(uint8_t start) {
  PayloadPattern p;
  p.items_.push_back({Kind::Ramp, start});
  return p;
}

void PayloadPattern::fill(uint8_t* out, uint32_t length, uint8_t counter) const {
  uint32_t i = 0;
  for (const Item& item : items_) {
    if (i >= length) return;
    if (item.kind == Kind::Ramp) {
      for (uint8_t v = item.value; i < length; ++i, ++v) out[i] = v;
      return;
    }
    out[i++] = item.kind == Kind::Counter ? counter : item.value;
  }
  for (; i < length; ++i) out[i] = 0;
}

}  // namespace tarvix
