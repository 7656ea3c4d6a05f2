// Parsing of object paths and the reversible encoding of names into HDF5 link names.
#include "vora/VoraNames.h"

namespace vora {
namespace {

constexpr std::string_view kOpen = "/'";
constexpr std::string_view kSeparator = "'/'";

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return -1;
}

}  // namespace

bool ParseObjectPath(std::string_view text, ObjectPath& out) {
  if (text == "/") {
    out = ObjectPath{};
    return true;
  }
  if (text.size() < kOpen.size() + 1 || !text.starts_with(kOpen) || !text.ends_with('\''))
    return false;
  const std::string_view inner = text.substr(kOpen.size(), text.size() - kOpen.size() - 1);
  const size_t separator = inner.find(kSeparator);
  out = ObjectPath{};
  if (separator == std::string_view::npos) {
    out.kind = ObjectPath::Kind::kGroup;
    out.group = inner;
    return true;
  }
  out.kind = ObjectPath::Kind::kChannel;
  out.group = inner.substr(0, separator);
  out.channel = inner.substr(separator + kSeparator.size());
  return true;
}

std::string EncodeStoredName(std::string_view name) {
  if (name.empty()) return "%";
  std::string stored;
  stored.reserve(name.size() + 8);
  for (size_t i = 0; i < name.size(); ++i) {
    const char c = name[i];
    if (c == '/') {
      stored += "%2F";
    } else if (c == '%') {
      stored += "%25";
    } else if (c == '.' && i == 0) {
      stored += "%2E";
    } else {
      stored += c;
    }
  }
  return stored;
}

std::string DecodeStoredName(std::string_view stored) {
  if (stored == "%") return {};
  std::string name;
  name.reserve(stored.size());
  for (size_t i = 0; i < stored.size(); ++i) {
    if (stored[i] == '%' && i + 2 < stored.size() && HexValue(stored[i + 1]) >= 0 &&
        HexValue(stored[i + 2]) >= 0) {
      name += static_cast<char>(HexValue(stored[i + 1]) * 16 + HexValue(stored[i + 2]));
      i += 2;
    } else {
      name += stored[i];  // not an escape this encoding writes: kept as it stands
    }
  }
  return name;
}

}  // namespace vora
