// A path held in UTF-8, built by joining components with the backslash.
#pragma once

#include <cstdint>
#include <string>

#include "paths/cPathInterface.h"

namespace kxpath {

// Removes trailing whitespace, NUL and backslashes, then leading whitespace (the six ASCII
// whitespace characters; bytes 0x80-0xFF never count).
std::string trimForJoin(const std::string& text);

// Failures are nENSPAN000::cExceptionBase; a failed append leaves the path unchanged.
// A value type owned by its caller; one thread at a time.
class cPath : public cPathInterface {
 public:
  cPath() = default;
  explicit cPath(std::string utf8Text) : text(std::move(utf8Text)) {}

  // Validates the component as UTF-8 (kind 2, line 426 when not), then joins.
  cPath& append(const std::string& utf8Component) override;
  // Converts from the local code page, then appends.
  cPath& appendLocal(const std::string& localComponent) override;
  // Copy with NUL: 0xBFF63259 (line 71) for a null buffer of non-zero size, 0xBFF63258
  // (line 76) when size < length + 1.
  void copyUtf8(char* buffer, uint32_t size) const override;
  std::string getUtf8() const override { return text; }
  void copyLocal(char* buffer, uint32_t size) const override;
  std::string getLocal() const override;

 private:
  std::string text;  // UTF-8
};

}  // namespace kxpath
