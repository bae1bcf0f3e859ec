// StringToInteger against an independent reference for every target type, base, strictness and
// character width, and IntegerToString parsing back strictly to the same value.
//
// Input: byte 0 selects the base (0-39, so some are invalid); byte 1 the target type (bits 0-2)
// and strictness (bit 3); the rest is the text, one character per byte, parsed as narrow and as
// wide text.
#include <cctype>
#include <cstdint>
#include <cwctype>
#include <limits>
#include <optional>
#include <string>

#include "FuzzCheck.h"
#include "support/Exceptions.h"
#include "support/IntegerText.h"

namespace {

// Magnitudes stop at 2^40, so 64 bits hold every intermediate value on every target.
using Wide = int64_t;

int DigitOf(unsigned char c) {
    return std::isdigit(c) ? c - '0' : std::isalpha(c) ? std::tolower(c) - 'a' + 10 : 99;
}

// Leading blanks are judged per character width: isspace for bytes, iswspace for wide text.
bool IsBlank(unsigned char c, bool wide) {
    return wide ? std::iswspace(c) != 0 : std::isspace(c) != 0;
}

// What StringToInteger<T> promises for `text`: nothing when it must raise.
template <class T>
std::optional<T> Reference(const std::string& text, uint32_t base, bool strict, bool wide) {
    if (base < 2 || base > 36) {
        return std::nullopt;
    }
    size_t i = 0;
    if (!strict) {
        while (i < text.size() && IsBlank(static_cast<unsigned char>(text[i]), wide)) {
            ++i;
        }
    }
    bool negative = false;
    if (i < text.size() && (text[i] == '+' || text[i] == '-')) {
        negative = text[i] == '-';
        ++i;
    }
    if (base == 16 && text.size() - i > 2 && text[i] == '0' && (text[i + 1] | 0x20) == 'x') {
        i += 2;
    }
    const size_t firstDigit = i;
    Wide magnitude = 0;
    for (; i < text.size(); ++i) {
        const int digit = DigitOf(static_cast<unsigned char>(text[i]));
        if (digit >= static_cast<int>(base)) {
            break;
        }
        magnitude = magnitude * base + digit;
        if (magnitude > (Wide(1) << 40)) {
            return std::nullopt;
        }
    }
    if (i == firstDigit || (strict && i != text.size())) {
        return std::nullopt;
    }
    const Wide maximum = std::numeric_limits<T>::max();
    const Wide negativeLimit = std::numeric_limits<T>::is_signed ? maximum + 1 : maximum;
    if (magnitude > (negative ? negativeLimit : maximum)) {
        return std::nullopt;
    }
    if (!negative) {
        return static_cast<T>(magnitude);
    }
    if (std::numeric_limits<T>::is_signed) {
        return static_cast<T>(-magnitude);
    }
    // Two's complement in the target's width.
    return static_cast<T>((Wide(maximum) + 1 - magnitude) & maximum);
}

template <class T, class Text>
std::optional<T> Parse(const Text& text, uint32_t base, bool strict) {
    try {
        return vq::dsc::StringToInteger<T>(text, base, strict);
    } catch (const vq::dsc::exception::UnableToConvert&) {
        return std::nullopt;
    }
}

// Parses `text` as bytes and as wide text, one character per byte.
template <class T>
void Check(const std::string& text, uint32_t base, bool strict) {
    FUZZ_CHECK(Parse<T>(text, base, strict) == Reference<T>(text, base, strict, false));
    std::wstring wideText;
    for (unsigned char c : text) {
        wideText += static_cast<wchar_t>(c);
    }
    FUZZ_CHECK(Parse<T>(wideText, base, strict) == Reference<T>(text, base, strict, true));
}

template <class T>
void CheckWritingBack(T value, uint32_t base) {
    const std::wstring written = vq::dsc::IntegerToString(value, base);
    const bool negativeHex = std::numeric_limits<T>::is_signed && value < 0 && base != 10;
    if (negativeHex) {
        // Other bases write the 32-bit pattern, which parses back as an unsigned number.
        FUZZ_CHECK(Parse<uint32_t>(written, base, true) == static_cast<uint32_t>(value));
    } else {
        FUZZ_CHECK(Parse<T>(written, base, true) == value);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2) {
        return 0;
    }
    const uint32_t base = data[0] % 40;
    const uint8_t type = data[1] & 0x07;
    const bool strict = (data[1] & 0x08) != 0;
    const std::string text(reinterpret_cast<const char*>(data) + 2, size - 2);
    using Checker = void (*)(const std::string&, uint32_t, bool);
    static const Checker kCheckers[] = {Check<int8_t>,   Check<uint8_t>, Check<int16_t>,
                                        Check<uint16_t>, Check<int32_t>, Check<uint32_t>,
                                        Check<uint32_t>, Check<uint32_t>};
    kCheckers[type](text, base, strict);
    if (base >= 2 && base <= 36) {
        if (const std::optional<int32_t> value = Reference<int32_t>(text, base, strict, false)) {
            CheckWritingBack<int32_t>(*value, base);
        }
        if (const std::optional<uint32_t> value = Reference<uint32_t>(text, base, strict, false)) {
            CheckWritingBack<uint32_t>(*value, base);
        }
    }
    return 0;
}
