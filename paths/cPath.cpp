// Joining, validation, conversions and bounded copies of a path value.
#include "paths/cPath.h"

#include <cstring>

#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"
#include "paths/LocalText.h"
#include "paths/Utf8.h"

namespace kxpath {

namespace {

using nENSPAN000::cExceptionBase;
using nENSPAN000::ErrorKind;

bool isAsciiSpace(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

bool isTrailingTrim(char c) { return isAsciiSpace(c) || c == '\0' || c == '\\'; }

cExceptionBase pathError(ErrorKind kind, uint32_t line, int32_t code = 1) {
  return cExceptionBase(kind, nENSPAN000::kPathModule, nENSPAN000::kPathFile, line, code);
}

void copyBounded(const std::string& text, char* buffer, uint32_t size) {
  if (size != 0 && buffer == nullptr) {
    throw pathError(ErrorKind::DriverStatus, nENSPAN000::kLineCopyBufferMissing,
                    nENSPAN000::kDriverBufferMissing);
  }
  if (text.size() + 1 > size) {
    throw pathError(ErrorKind::DriverStatus, nENSPAN000::kLineCopyBufferTooSmall,
                    nENSPAN000::kDriverBufferTooSmall);
  }
  std::memcpy(buffer, text.c_str(), text.size() + 1);
}

}  // namespace

std::string trimForJoin(const std::string& text) {
  size_t end = text.size();
  while (end > 0 && isTrailingTrim(text[end - 1])) --end;
  size_t begin = 0;
  while (begin < end && isAsciiSpace(text[begin])) ++begin;
  return text.substr(begin, end - begin);
}

cPath& cPath::append(const std::string& utf8Component) {
  try {
    if (!isValidUtf8(utf8Component)) {
      throw pathError(ErrorKind::UsageError, nENSPAN000::kLineInvalidUtf8);
    }
    const std::string current = trimForJoin(text);
    const std::string component = trimForJoin(utf8Component);
    text = current.empty() ? component : current + "\\" + component;
  } catch (...) {
    nENSPAN000::translateException();
  }
  return *this;
}

cPath& cPath::appendLocal(const std::string& localComponent) {
  try {
    std::string utf8;
    const int32_t code = mbsToUtf8(localComponent.c_str(), utf8);
    if (code < 0) throwConversionError(code, qverr::kLineToUtf8);
    append(utf8);
  } catch (...) {
    nENSPAN000::translateException();
  }
  return *this;
}

void cPath::copyUtf8(char* buffer, uint32_t size) const { copyBounded(getUtf8(), buffer, size); }

void cPath::copyLocal(char* buffer, uint32_t size) const { copyBounded(getLocal(), buffer, size); }

std::string cPath::getLocal() const {
  try {
    std::string local;
    const int32_t code = utf8ToMbs(text.c_str(), local);
    if (code < 0) throwConversionError(code, qverr::kLineFromUtf8);
    return local;
  } catch (...) {
    nENSPAN000::translateException();
  }
}

}  // namespace kxpath
