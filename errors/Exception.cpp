// Status exceptions: copy by moving the report, texts from the held status.
#include "errors/Exception.h"

namespace qverr {

ExceptionBase::ExceptionBase(const ExceptionBase& other) { moveStatus(held, other.held); }

ExceptionBase::~ExceptionBase() = default;

const char* ExceptionBase::reportText() const { return held.reportText(); }

const char* Exception::what() const noexcept { return reportText(); }

}  // namespace qverr
