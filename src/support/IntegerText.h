// Integers to text and back, in bases 2 to 36.
#pragma once

#include <cstdint>
#include <string>

namespace vq {
namespace dsc {

// The digits of `value` in `base` (2 to 36), upper case, most significant first, without leading
// zeros ("0" for zero). Other bases raise vq::dsc::exception::UnableToConvert.
std::wstring IntegerToString(uint32_t value, uint32_t base = 10);

// As above; in base 10 a negative value is "-" followed by its magnitude, in other bases the
// value's 32-bit pattern is written as an unsigned number.
std::wstring IntegerToString(int32_t value, uint32_t base = 10);

// Parses `text` in `base` (2 to 36) into T, one of int8_t, uint8_t, int16_t, uint16_t, int32_t and
// uint32_t. Without `strict`, leading whitespace is skipped and parsing stops at the first
// character that is not a digit of the base; with it, the whole text must be the number. One
// sign may lead; in base 16 a "0x" or "0X" prefix is skipped. A negative number for an unsigned
// target gives its two's complement in the target's width ("-1" gives 255 for a byte). No digit,
// a value outside T's range or, when strict, trailing characters raise
// vq::dsc::exception::UnableToConvert.
template <class T>
T StringToInteger(const std::string& text, uint32_t base = 10, bool strict = false);
template <class T>
T StringToInteger(const std::wstring& text, uint32_t base = 10, bool strict = false);

}  // namespace dsc
}  // namespace vq
