// Conversions between the controller's local code page (Windows-1252) and UTF-8.
#pragma once

#include <cstdint>
#include <string>

namespace kxpath {

// Both return 0 on success, -52027 when the text cannot be converted (an invalid byte of the
// code page, or ill-formed UTF-8), -52000 when a buffer cannot be allocated. A null or empty
// text succeeds and leaves `out` empty; 7-bit text is copied unchanged. Characters the code
// page lacks become '?' without an error.
int32_t mbsToUtf8(const char* text, std::string& out);
int32_t utf8ToMbs(const char* text, std::string& out);

// Throws the conversion failure as a qverr::Exception with the error set directly on its
// status (file "qvsstutf8/mbsToUtf8", constant "err", `line` 77 or 99).
[[noreturn]] void throwConversionError(int32_t code, int32_t line);

}  // namespace kxpath
