// The readers that turn the value text of a property message into a number.
#pragma once

#include <cstdint>
#include <string_view>

namespace nKV_DLL300 {

// Every reader looks only at the bytes of `value` (no terminator needed) and accepts any bytes.
// "Blanks" are the C white-space characters (space, \t, \n, \v, \f, \r).

// Blanks, optional sign, decimal digits up to the first other character; no digits gives 0.
// Values beyond the signed 32-bit range are held at its limits.
int32_t ReadInteger(std::string_view value);

// ReadInteger keeping its low 8 bits (256 gives 0, -1 gives 255).
uint8_t ReadByte(std::string_view value);

// Blanks, optional sign, decimal digits as an unsigned 64-bit number (a minus negates modulo
// 2^64, too large a number gives 2^64-1). Without digits the result is `previous`.
uint64_t ReadUnsigned64(std::string_view value, uint64_t previous);

// Blanks, optional sign, then 0x/0X hexadecimal, a leading 0 octal, otherwise decimal; unsigned
// 32-bit, a minus negates modulo 2^32, too large a number gives 0xFFFFFFFF, no digits gives 0.
uint32_t ReadKey(std::string_view value);

// Every "," taken as ".", then a decimal fraction (double); no number gives 0.0.
double ReadRate(std::string_view value);

}  // namespace nKV_DLL300
