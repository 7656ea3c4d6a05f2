// UTF-8 well-formedness and the UTF-8 / UTF-16 transcoding of the path library.
#pragma once

#include <string>
#include <string_view>

namespace kxpath {

// Lead byte gives the length (1-4), continuation bytes are 10xxxxxx, the text does not end
// inside a sequence, values are at most 0x10FFFF, not surrogates, and in their shortest form.
bool isValidUtf8(std::string_view text);

// Decodes well-formed UTF-8 (check with isValidUtf8 first) into UTF-16, with surrogate pairs
// for values above 0xFFFF.
std::u16string utf8ToUtf16(std::string_view text);

// Encodes UTF-16 as UTF-8; a surrogate pair becomes one four-byte sequence, an unpaired
// surrogate is encoded as its own three-byte value.
std::string utf16ToUtf8(std::u16string_view text);

}  // namespace kxpath
