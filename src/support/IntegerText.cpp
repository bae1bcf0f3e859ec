#include "support/IntegerText.h"

#include <cctype>
#include <cwctype>
#include <limits>
#include <type_traits>

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace {

const wchar_t kDigits[] = L"0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ";
constexpr uint32_t kMaxBase = 36;

void CheckBase(uint32_t base) {
    if (base < 2 || base > kMaxBase) {
        throw exception::UnableToConvert();
    }
}

bool IsSpace(char c) {
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}
bool IsSpace(wchar_t c) {
    return std::iswspace(static_cast<wint_t>(c)) != 0;
}

// The value of `c` as a digit (0-9, then letters of either case from 10), or kMaxBase when it is
// none.
template <class CharT>
uint32_t DigitValue(CharT c) {
    if (c >= CharT('0') && c <= CharT('9')) {
        return static_cast<uint32_t>(c - CharT('0'));
    }
    if (c >= CharT('a') && c <= CharT('z')) {
        return static_cast<uint32_t>(c - CharT('a')) + 10;
    }
    if (c >= CharT('A') && c <= CharT('Z')) {
        return static_cast<uint32_t>(c - CharT('A')) + 10;
    }
    return kMaxBase;
}

// A parsed number: its magnitude and sign.
struct ParsedNumber {
    uint64_t magnitude;
    bool negative;
};

// Parses sign, prefix and digits; `positiveLimit` and `negativeLimit` bound the magnitude for
// each sign.
template <class CharT>
ParsedNumber ParseNumber(const std::basic_string<CharT>& text, uint32_t base, bool strict,
                         uint64_t positiveLimit, uint64_t negativeLimit) {
    CheckBase(base);
    const CharT* position = text.data();
    const CharT* const end = position + text.size();
    if (!strict) {
        while (position != end && IsSpace(*position)) {
            ++position;
        }
    }
    ParsedNumber number{0, false};
    if (position != end && (*position == CharT('-') || *position == CharT('+'))) {
        number.negative = *position == CharT('-');
        ++position;
    }
    if (base == 16 && end - position > 2 && position[0] == CharT('0') &&
        (position[1] == CharT('x') || position[1] == CharT('X'))) {
        position += 2;
    }
    const uint64_t limit = number.negative ? negativeLimit : positiveLimit;
    const CharT* const firstDigit = position;
    for (; position != end; ++position) {
        const uint32_t digit = DigitValue(*position);
        if (digit >= base) {
            break;
        }
        if (number.magnitude > (limit - digit) / base) {
            throw exception::UnableToConvert();
        }
        number.magnitude = number.magnitude * base + digit;
    }
    if (position == firstDigit || (strict && position != end)) {
        throw exception::UnableToConvert();
    }
    return number;
}

template <class T, class CharT>
T ParseInteger(const std::basic_string<CharT>& text, uint32_t base, bool strict) {
    static_assert(std::is_integral<T>::value && sizeof(T) <= sizeof(uint32_t), "32 bits at most");
    const uint64_t maximum = static_cast<uint64_t>(std::numeric_limits<T>::max());
    const uint64_t negativeLimit = std::is_signed<T>::value ? maximum + 1 : maximum;
    const ParsedNumber number = ParseNumber(text, base, strict, maximum, negativeLimit);
    if (!number.negative) {
        return static_cast<T>(number.magnitude);
    }
    if (std::is_signed<T>::value) {
        return static_cast<T>(-static_cast<int64_t>(number.magnitude));
    }
    return static_cast<T>(0 - number.magnitude);
}

}  // namespace

std::wstring IntegerToString(uint32_t value, uint32_t base) {
    CheckBase(base);
    wchar_t digits[32];
    size_t count = 0;
    do {
        digits[count++] = kDigits[value % base];
        value /= base;
    } while (value != 0);
    std::wstring text;
    text.reserve(count + 1);
    while (count != 0) {
        text += digits[--count];
    }
    return text;
}

std::wstring IntegerToString(int32_t value, uint32_t base) {
    const uint32_t pattern = static_cast<uint32_t>(value);
    if (base != 10 || value >= 0) {
        return IntegerToString(pattern, base);
    }
    return L"-" + IntegerToString(0u - pattern, base);
}

template <class T>
T StringToInteger(const std::string& text, uint32_t base, bool strict) {
    return ParseInteger<T>(text, base, strict);
}

template <class T>
T StringToInteger(const std::wstring& text, uint32_t base, bool strict) {
    return ParseInteger<T>(text, base, strict);
}

#define KEST_STRING_TO_INTEGER(T)                                      \
    template T StringToInteger<T>(const std::string&, uint32_t, bool); \
    template T StringToInteger<T>(const std::wstring&, uint32_t, bool)

KEST_STRING_TO_INTEGER(int8_t);
KEST_STRING_TO_INTEGER(uint8_t);
KEST_STRING_TO_INTEGER(int16_t);
KEST_STRING_TO_INTEGER(uint16_t);
KEST_STRING_TO_INTEGER(int32_t);
KEST_STRING_TO_INTEGER(uint32_t);

#undef KEST_STRING_TO_INTEGER

}  // namespace dsc
}  // namespace vq
