// The outcome of a support-layer operation: a code by precedence and a JSON report in a buffer.
#pragma once

#include <cstdint>

#include "errors/SourceLocation.h"

namespace qverr {

struct Status;

// Buffer policy: newCapacity 0 frees the buffer; otherwise makes the buffer at least that large,
// keeping its text. Returns false (buffer unchanged) when it cannot.
using Reallocate = bool (*)(Status& status, uint32_t newCapacity);

// Report buffer layout (capacity bytes): the JSON text, its NUL, zero bytes, and at index
// capacity - 1 the sentinel 'J'. Free room = the bytes between the NUL and the sentinel.
inline constexpr char kReportSentinel = 'J';
inline constexpr const char* kEmptyReport = "{}";

// The default policy: at least 512 bytes, then powers of two; requests of 2^31 or more fail.
bool defaultReallocate(Status& status, uint32_t newCapacity);

// One per operation, used by one thread. Releases its buffer when destroyed; throwing on an
// error is the explicit end-of-scope checkStatus.
struct Status {
  int32_t code = 0;  // 0 success, < 0 error, > 0 warning
  uint32_t capacity = 0;
  Reallocate reallocate = defaultReallocate;
  char* report = nullptr;  // owned; null when there is no report

  Status() = default;
  explicit Status(Reallocate policy) : reallocate(policy) {}
  ~Status();
  Status(const Status&) = delete;
  Status& operator=(const Status&) = delete;

  uint32_t freeRoom() const;
  const char* reportText() const { return report != nullptr ? report : ""; }
};

// Precedence: 0 takes any non-zero code, a warning takes an error, an error keeps.
// A taken code resets an existing report to "{}".
bool setCode(Status& status, int32_t newCode);

// setCode, and when taken a fresh report with "error_constant", "file", "line" and "component"
// (the last only when the location names one).
bool setError(Status& status, int32_t code, const SourceLocation& location);

// Replaces the report text (null means "{}"), growing the buffer as needed. Returns the
// position of the text's last character, or null when the buffer cannot hold it.
char* setReportText(Status& status, const char* text);

// Takes the source's code by precedence; when taken the report moves over (same policy) or is
// copied (different policies). The source keeps its code.
bool moveStatus(Status& destination, Status& source);
// Takes the code by precedence; when taken and the source has a report, copies its text.
bool copyStatus(Status& destination, const Status& source);

// End-of-scope check: an error is moved into a thrown qverr::Exception, unless an exception is
// already propagating.
void checkStatus(Status& status);

// Inserts `bytes` at `offset` of the report text, growing the buffer (2 x capacity - 2 at each
// step) while they do not fit the free room. False when growth fails; the text is unchanged.
bool insertIntoReport(Status& status, uint32_t offset, const char* bytes, uint32_t length);

}  // namespace qverr
