// The code exception's location word, its text, and the translation of foreign exceptions.
#include "errors/cExceptionBase.h"

#include <new>

#include "errors/Exception.h"
#include "errors/RaiseSites.h"
#include "qvapal/TraceOutput.h"

namespace nENSPAN000 {

namespace {

constexpr uint32_t kModuleMask = 0x1F;
constexpr uint32_t kFileMask = 0x3FF;
constexpr uint32_t kKindMask = 0x3;
constexpr uint32_t kLineMask = 0x3FFF;

}  // namespace

uint32_t packLocation(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line) {
  return cExceptionBase::kLocationFilled | (module & kModuleMask) << 26 | (file & kFileMask) << 16 |
         (static_cast<uint32_t>(kind) & kKindMask) << 14 | (line & kLineMask);
}

cExceptionBase::cExceptionBase(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line,
                               int32_t errorCode)
    : code(kind == ErrorKind::UsageError ? 1 : errorCode) {
  fillLocation(kind, module, file, line);
}

cExceptionBase::cExceptionBase(const cExceptionBase& other)
    : std::exception(other), code(other.code), location(other.location) {}

void cExceptionBase::fillLocation(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line) {
  if ((location & kLocationFilled) != 0) return;
  location = packLocation(kind, module, file, line);
}

const char* cExceptionBase::what() const noexcept {
  nQVAPAL000::traceFormat(text, sizeof text, "0x%08X", static_cast<uint32_t>(code));
  return text;
}

void translateException() {
  try {
    throw;
  } catch (const qverr::ExceptionBase& status) {
    throw cExceptionBase(ErrorKind::StatusCode, kPathModule, kPathFile, kLineTranslatedStatus,
                         status.code());
  } catch (const std::bad_alloc&) {
    throw cExceptionBase(ErrorKind::DriverStatus, kPathModule, kPathFile,
                         kLineTranslatedOutOfMemory, kDriverOutOfMemory);
  }
}

}  // namespace nENSPAN000
