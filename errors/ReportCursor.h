// Adds members to a status's JSON report, in place, growing the buffer when needed.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "errors/Status.h"

namespace qverr {

// Escapes one key or string value: \b \t \n \f \r \" \\, other bytes 0x01-0x1F and 0x7F as
// \u00xx (lower-case hex), bytes 0x80-0xFF and '/' unchanged.
std::string escapeJson(std::string_view raw);

// Positioned at the closing brace of the object being filled; after a failed growth (or a
// report that does not scan) it is dead and every later addition is skipped, while the status
// keeps its code. Belongs to the thread that owns the status; the status must outlive it.
class ReportCursor {
 public:
  // Ensures a buffer (at least 4 bytes) and positions at the end of the root object.
  explicit ReportCursor(Status& owner);

  void openObject(const char* key);                    // inserts "key":{} and moves inside it
  void addString(const char* key, const char* value);  // null texts are written as ""
  void addInteger(const char* key, int32_t value);
  void closeObject();  // back into the enclosing object

  bool isValid() const { return valid; }

 private:
  void addMember(const char* key, const std::string& encodedValue, uint32_t cursorBack);

  Status& owner;
  uint32_t position = 0;  // offset of the current object's closing brace
  bool valid = false;
};

}  // namespace qverr
