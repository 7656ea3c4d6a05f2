// The status-and-report exception family: a thrown status with its JSON report.
#pragma once

#include <cstdint>
#include <exception>

#include "errors/Status.h"

namespace qverr {

// Holds one Status. Copying moves the report into the copy (the source keeps its code but no
// report), which is how a status travels through a throw without duplicating its buffer.
class ExceptionBase {
 public:
  ExceptionBase() = default;
  ExceptionBase(const ExceptionBase& other);
  ExceptionBase& operator=(const ExceptionBase&) = delete;
  virtual ~ExceptionBase();                // the Status releases the report through its policy
  virtual const char* reportText() const;  // the report, or "" when there is none

  int32_t code() const { return held.code; }
  Status& status() const { return held; }

 private:
  mutable Status held;  // mutable: a copy takes the report over from its source
};

class Exception : public virtual ExceptionBase, public virtual std::exception {
 public:
  Exception() = default;
  Exception(const Exception& other) : ExceptionBase(other), std::exception(other) {}
  const char* what() const noexcept override;  // the report text, or ""
};

}  // namespace qverr
