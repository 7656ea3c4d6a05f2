// Status codes by precedence, the report buffer policy and moving reports between statuses.
#include "errors/Status.h"

#include <cstring>
#include <exception>
#include <new>

#include "errors/Exception.h"
#include "errors/ReportCursor.h"

namespace qverr {

namespace {

constexpr uint32_t kMinimumBuffer = 512;
constexpr uint32_t kLargestRequest = 0x7FFFFFFF;
constexpr uint64_t kLargestDoubling = 0x7FFFFFFD;

uint32_t roundedSize(uint32_t request) {
  if (request <= kMinimumBuffer) return kMinimumBuffer;
  uint32_t size = kMinimumBuffer;
  while (size < request) size <<= 1;
  return size;
}

// Writes text, zero fill and the sentinel into a buffer that is large enough.
void fillBuffer(char* buffer, uint32_t capacity, const char* text, size_t length) {
  std::memcpy(buffer, text, length);
  std::memset(buffer + length, 0, capacity - length);
  buffer[capacity - 1] = kReportSentinel;
}

void freeReport(Status& status) {
  if (status.report != nullptr || status.capacity != 0) status.reallocate(status, 0);
}

bool growOnce(Status& status) {
  const uint64_t doubled = 2ULL * status.capacity;
  if (doubled < 4 || doubled - 4 > kLargestDoubling) return false;
  const uint32_t before = status.capacity;
  return status.reallocate(status, static_cast<uint32_t>(doubled - 2)) && status.capacity > before;
}

}  // namespace

bool defaultReallocate(Status& status, uint32_t newCapacity) {
  if (newCapacity == 0) {
    delete[] status.report;
    status.report = nullptr;
    status.capacity = 0;
    return true;
  }
  if (newCapacity <= status.capacity) return true;
  if (newCapacity > kLargestRequest) return false;
  const uint32_t size = roundedSize(newCapacity);
  char* buffer = new (std::nothrow) char[size];
  if (buffer == nullptr) return false;
  const char* old = status.report != nullptr ? status.report : kEmptyReport;
  fillBuffer(buffer, size, old, std::strlen(old));
  delete[] status.report;
  status.report = buffer;
  status.capacity = size;
  return true;
}

Status::~Status() { freeReport(*this); }

uint32_t Status::freeRoom() const {
  if (report == nullptr || capacity < 2) return 0;
  return capacity - 2 - static_cast<uint32_t>(std::strlen(report));
}

bool setCode(Status& status, int32_t newCode) {
  const bool taken = status.code == 0 ? newCode != 0 : (status.code > 0 && newCode < 0);
  if (!taken) return false;
  status.code = newCode;
  if (status.report != nullptr) setReportText(status, nullptr);
  return true;
}

bool setError(Status& status, int32_t code, const SourceLocation& location) {
  if (!setCode(status, code)) return false;
  setReportText(status, nullptr);
  ReportCursor cursor(status);
  cursor.addString("error_constant", location.errorConstant);
  cursor.addString("file", location.file);
  cursor.addInteger("line", location.line);
  if (location.component != nullptr) cursor.addString("component", location.component);
  return true;
}

char* setReportText(Status& status, const char* text) {
  if (text == nullptr) text = kEmptyReport;
  const size_t length = std::strlen(text);
  if (length + 2 > kLargestRequest) return nullptr;
  const auto needed = static_cast<uint32_t>(length + 2);
  if (status.capacity < needed &&
      (!status.reallocate(status, needed) || status.capacity < needed)) {
    return nullptr;
  }
  std::memmove(status.report, text, length);
  std::memset(status.report + length, 0, status.capacity - length);
  status.report[status.capacity - 1] = kReportSentinel;
  return length == 0 ? status.report : status.report + length - 1;
}

bool moveStatus(Status& destination, Status& source) {
  if (!setCode(destination, source.code)) return false;
  if (destination.reallocate != source.reallocate) {
    if (source.report != nullptr) setReportText(destination, source.report);
    return true;
  }
  freeReport(destination);
  destination.report = source.report;
  destination.capacity = source.capacity;
  source.report = nullptr;
  source.capacity = 0;
  return true;
}

bool copyStatus(Status& destination, const Status& source) {
  if (!setCode(destination, source.code)) return false;
  if (source.report != nullptr) setReportText(destination, source.report);
  return true;
}

void checkStatus(Status& status) {
  if (status.code >= 0 || std::uncaught_exceptions() > 0) return;
  Exception exception;
  moveStatus(exception.status(), status);
  throw exception;  // the thrown copy takes the report over by another move
}

bool insertIntoReport(Status& status, uint32_t offset, const char* bytes, uint32_t length) {
  if (status.report == nullptr) return false;
  while (length > status.freeRoom()) {
    if (!growOnce(status)) return false;
  }
  const size_t textLength = std::strlen(status.report);
  if (offset > textLength) return false;
  char* at = status.report + offset;
  std::memmove(at + length, at, textLength - offset);
  std::memcpy(at, bytes, length);
  return true;
}

}  // namespace qverr
