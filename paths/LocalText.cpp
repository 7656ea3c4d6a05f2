// Local code page <-> UTF-8 through UTF-16, as the controller's system conversions do it.
#include "paths/LocalText.h"

#include <cstring>
#include <new>
#include <string_view>

#include "errors/Exception.h"
#include "errors/RaiseSites.h"
#include "paths/Utf8.h"
#include "platform/CodePage.h"

namespace kxpath {

namespace {

bool isSevenBit(std::string_view text) {
  for (char c : text) {
    if (static_cast<unsigned char>(c) >= 0x80) return false;
  }
  return true;
}

int32_t convertToUtf8(std::string_view text, std::string& out) {
  std::u16string wide;
  if (!platform::CodePageToUtf16(text, wide, true) || wide.empty()) return qverr::kConversionFailed;
  out = utf16ToUtf8(wide);
  return 0;
}

int32_t convertFromUtf8(std::string_view text, std::string& out) {
  if (!isValidUtf8(text)) return qverr::kConversionFailed;
  const std::u16string wide = utf8ToUtf16(text);
  std::string local;
  platform::Utf16ToCodePage(wide, local);
  if (local.empty()) return qverr::kConversionFailed;
  out = std::move(local);
  return 0;
}

template <typename Conversion>
int32_t convert(const char* text, std::string& out, Conversion conversion) {
  if (text == nullptr || *text == '\0') {
    out.clear();
    return 0;
  }
  try {
    const std::string_view view(text);
    if (isSevenBit(view)) {
      out.assign(view);
      return 0;
    }
    return conversion(view, out);
  } catch (const std::bad_alloc&) {
    return qvapalerr_memoryFull;
  }
}

}  // namespace

int32_t mbsToUtf8(const char* text, std::string& out) { return convert(text, out, convertToUtf8); }

int32_t utf8ToMbs(const char* text, std::string& out) {
  return convert(text, out, convertFromUtf8);
}

void throwConversionError(int32_t code, int32_t line) {
  qverr::Exception exception;
  qverr::setError(
      exception.status(), code,
      {qverr::kConversionFile, line, qverr::kComponentName, qverr::kConversionConstant});
  throw exception;
}

}  // namespace kxpath
