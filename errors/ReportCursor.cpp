// Member insertion: escaping, comma placement and cursor movement over the report text.
#include "errors/ReportCursor.h"

#include <cstdio>
#include <cstring>
#include <optional>

#include "errors/JsonScanner.h"

namespace qverr {

namespace {

constexpr uint32_t kMinimumCursorBuffer = 4;

bool isBlank(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

const char* shortEscape(unsigned char byte) {
  switch (byte) {
    case 0x08:
      return "\\b";
    case 0x09:
      return "\\t";
    case 0x0A:
      return "\\n";
    case 0x0C:
      return "\\f";
    case 0x0D:
      return "\\r";
    case '"':
      return "\\\"";
    case '\\':
      return "\\\\";
    default:
      return nullptr;
  }
}

std::string quoted(const char* text) { return '"' + escapeJson(text != nullptr ? text : "") + '"'; }

}  // namespace

std::string escapeJson(std::string_view raw) {
  std::string out;
  out.reserve(raw.size());
  for (char c : raw) {
    const auto byte = static_cast<unsigned char>(c);
    if (const char* escape = shortEscape(byte)) {
      out += escape;
    } else if ((byte >= 0x01 && byte <= 0x1F) || byte == 0x7F) {
      char unicode[8];
      std::snprintf(unicode, sizeof unicode, "\\u%04x", byte);
      out += unicode;
    } else {
      out += c;
    }
  }
  return out;
}

ReportCursor::ReportCursor(Status& status) : owner(status) {
  if (owner.capacity < kMinimumCursorBuffer &&
      (!owner.reallocate(owner, kMinimumCursorBuffer) || owner.report == nullptr)) {
    return;
  }
  const std::optional<size_t> end = findRootObjectEnd(owner.report);
  if (!end) return;
  position = static_cast<uint32_t>(*end);
  valid = true;
}

void ReportCursor::addMember(const char* key, const std::string& encodedValue,
                             uint32_t cursorBack) {
  if (!valid) return;
  uint32_t before = position;
  while (before > 0 && isBlank(owner.report[before - 1])) --before;
  const bool empty = before > 0 && owner.report[before - 1] == '{';
  const std::string member = (empty ? "" : ",") + quoted(key) + ':' + encodedValue;
  if (!insertIntoReport(owner, position, member.data(), static_cast<uint32_t>(member.size()))) {
    valid = false;
    return;
  }
  position += static_cast<uint32_t>(member.size()) - cursorBack;
}

void ReportCursor::openObject(const char* key) { addMember(key, "{}", 1); }

void ReportCursor::addString(const char* key, const char* value) {
  addMember(key, quoted(value), 0);
}

void ReportCursor::addInteger(const char* key, int32_t value) {
  addMember(key, std::to_string(value), 0);
}

void ReportCursor::closeObject() {
  if (valid) ++position;
}

}  // namespace qverr
