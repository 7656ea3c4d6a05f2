// The compact code exception: a 32-bit code, a packed location word and the code as hex text.
#pragma once

#include <cstdint>
#include <exception>

namespace nENSPAN000 {

// What kind of code an exception carries (bits 15-14 of the location word).
enum class ErrorKind : uint32_t {
  DriverStatus = 1,  // a driver-family status code
  UsageError = 2,    // a caller's mistake; the code is always 1
  StatusCode = 3,    // taken over from a qverr::Status
};

// Location word: bit 31 filled, 30-26 module, 25-16 file, 15-14 kind, 13-0 source line.
uint32_t packLocation(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line);

struct ErrorRecord {
  int32_t code;
  uint32_t location;
};

class cExceptionBase : public virtual std::exception {
 public:
  static constexpr uint32_t kLocationFilled = 0x80000000u;

  // A usage error always carries code 1, whatever `code` says.
  cExceptionBase(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line, int32_t code = 1);
  cExceptionBase(const cExceptionBase& other);

  virtual ErrorRecord getRecord() const { return {code, location}; }
  virtual ErrorRecord record() const { return {code, location}; }

  // Fills the location unless it was filled before.
  void fillLocation(ErrorKind kind, uint32_t module, uint32_t file, uint32_t line);
  int32_t errorCode() const { return code; }
  uint32_t locationWord() const { return location; }

  // The code as "0x%08X"; rewrites this object's own text on every call.
  const char* what() const noexcept override;

 private:
  mutable char text[11] = {};  // rewritten by what()
  int32_t code;
  uint32_t location = 0;
};

// Called inside a catch-all handler: rethrows the current exception translated for callers of
// the path library. A qverr::ExceptionBase becomes kind 3 with its status code (line 59),
// std::bad_alloc kind 1 with 0xBFF63010 (line 63), module 22, file 1; anything else passes.
[[noreturn]] void translateException();

}  // namespace nENSPAN000
