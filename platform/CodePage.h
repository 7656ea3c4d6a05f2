// The controller's active code page, Windows-1252, to and from UTF-16.
#pragma once

#include <string>
#include <string_view>

namespace platform {

// Every byte becomes one UTF-16 unit. With strictInvalid (the "invalid characters are an error"
// conversion) the unassigned bytes 0x81 0x8D 0x8F 0x90 0x9D fail the whole conversion (false,
// out cleared); otherwise they pass through as the control characters of the same value.
bool CodePageToUtf16(std::string_view bytes, std::u16string& out, bool strictInvalid = true);

// Each UTF-16 unit becomes one byte; characters the code page lacks, and unpaired surrogates,
// become the default character '?' (no best-fit replacement). A surrogate pair is one
// character and gives one '?'.
void Utf16ToCodePage(std::u16string_view text, std::string& out);

}  // namespace platform
