#include "ValueText.h"

#include <strings.h>

#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>

#include "hostkit/HostText.h"
#include "hostkit/TimestampText.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

std::string UnsignedText(uint32_t value, NumberStyle style) {
    char text[16];
    std::snprintf(text, sizeof text, style == NumberStyle::kHexadecimal ? "0x%02X" : "%u", value);
    return text;
}

std::string DoubleText(double value) {
    char text[32];
    std::snprintf(text, sizeof text, "%.17g", value);
    return text;
}

std::optional<bool> ParseBool(const std::string& text) {
    for (const char* word : {"true", "yes", "on", "1"}) {
        if (strcasecmp(text.c_str(), word) == 0) {
            return true;
        }
    }
    for (const char* word : {"false", "no", "off", "0"}) {
        if (strcasecmp(text.c_str(), word) == 0) {
            return false;
        }
    }
    return std::nullopt;
}

// An integer in decimal (with an optional sign) or in hexadecimal with "0x", within [low, high].
std::optional<long long> ParseInteger(const std::string& text, long long low, long long high) {
    if (text.empty() || std::isspace(static_cast<unsigned char>(text[0]))) {
        return std::nullopt;
    }
    const bool negative = text[0] == '-';
    const size_t signLength = (text[0] == '-' || text[0] == '+') ? 1 : 0;
    const std::string magnitude = text.substr(signLength);
    const bool hex =
        magnitude.size() > 2 && magnitude[0] == '0' && (magnitude[1] == 'x' || magnitude[1] == 'X');
    const std::string digits = hex ? magnitude.substr(2) : magnitude;
    if (digits.empty()) {
        return std::nullopt;
    }
    for (const char c : digits) {
        const bool digit =
            hex ? std::isxdigit(static_cast<unsigned char>(c)) != 0 : (c >= '0' && c <= '9');
        if (!digit) {
            return std::nullopt;
        }
    }
    errno = 0;
    const unsigned long long value = std::strtoull(digits.c_str(), nullptr, hex ? 16 : 10);
    if (errno != 0 || value > 0xFFFFFFFFull) {
        return std::nullopt;
    }
    const long long signedValue =
        negative ? -static_cast<long long>(value) : static_cast<long long>(value);
    if (signedValue < low || signedValue > high) {
        return std::nullopt;
    }
    return signedValue;
}

std::optional<double> ParseDouble(const std::string& text) {
    if (text.empty() || std::isspace(static_cast<unsigned char>(text[0]))) {
        return std::nullopt;
    }
    errno = 0;
    char* end = nullptr;
    const double value = std::strtod(text.c_str(), &end);
    if (errno != 0 || *end != '\0' || !std::isfinite(value)) {
        return std::nullopt;
    }
    return value;
}

// A GUID in registry form, with or without braces.
std::optional<GUID> ParseGuid(const std::string& text) {
    std::string inner = text;
    if (inner.size() == 38 && inner.front() == '{' && inner.back() == '}') {
        inner = inner.substr(1, 36);
    }
    if (inner.size() != 36) {
        return std::nullopt;
    }
    uint8_t bytes[16];
    size_t byte = 0;
    for (size_t i = 0; i < inner.size();) {
        if (i == 8 || i == 13 || i == 18 || i == 23) {
            if (inner[i] != '-') {
                return std::nullopt;
            }
            ++i;
            continue;
        }
        if (!std::isxdigit(static_cast<unsigned char>(inner[i])) ||
            !std::isxdigit(static_cast<unsigned char>(inner[i + 1]))) {
            return std::nullopt;
        }
        bytes[byte++] = static_cast<uint8_t>(std::strtoul(inner.substr(i, 2).c_str(), nullptr, 16));
        i += 2;
    }
    GUID guid{};
    guid.Data1 = (uint32_t{bytes[0]} << 24) | (uint32_t{bytes[1]} << 16) |
                 (uint32_t{bytes[2]} << 8) | bytes[3];
    guid.Data2 = static_cast<uint16_t>((bytes[4] << 8) | bytes[5]);
    guid.Data3 = static_cast<uint16_t>((bytes[6] << 8) | bytes[7]);
    for (size_t i = 0; i < 8; ++i) {
        guid.Data4[i] = bytes[8 + i];
    }
    return guid;
}

std::string TimestampForPeople(const uxSysAttrTimestampUTC& time) {
    if (IsNoTime(time)) {
        return "(no time)";
    }
    const std::string text = TimestampToIso8601(time);
    return text.empty() ? "(not representable)" : text;
}

}  // namespace

std::string TypeCodeName(uint32_t type) {
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL:
            return "boolean";
        case UX_PROPERTY_TYPE_LONG:
            return "signed";
        case UX_PROPERTY_TYPE_ULONG:
            return "unsigned";
        case UX_PROPERTY_TYPE_DOUBLE:
            return "double";
        case UX_PROPERTY_TYPE_GUID:
            return "guid";
        case UX_PROPERTY_TYPE_STRING:
            return "text";
        case UX_PROPERTY_TYPE_TIMESTAMP:
            return "timestamp";
        default:
            return "type " + std::to_string(type);
    }
}

std::string ValueForPeople(const PropertyValue& value, NumberStyle style) {
    switch (TypeCodeOf(value)) {
        case UX_PROPERTY_TYPE_BOOL:
            return std::get<bool>(value) ? "true" : "false";
        case UX_PROPERTY_TYPE_LONG:
            return std::to_string(std::get<int32_t>(value));
        case UX_PROPERTY_TYPE_ULONG:
            return UnsignedText(std::get<uint32_t>(value), style);
        case UX_PROPERTY_TYPE_DOUBLE:
            return DoubleText(std::get<double>(value));
        case UX_PROPERTY_TYPE_GUID:
            return GuidText(std::get<GUID>(value));
        case UX_PROPERTY_TYPE_STRING: {
            const std::wstring& text = std::get<std::wstring>(value);
            return Utf8FromWide(text.data(), text.size());
        }
        default:
            return TimestampForPeople(std::get<uxSysAttrTimestampUTC>(value));
    }
}

Json ValueAsJson(const PropertyValue& value) {
    switch (TypeCodeOf(value)) {
        case UX_PROPERTY_TYPE_BOOL:
            return std::get<bool>(value);
        case UX_PROPERTY_TYPE_LONG:
            return std::get<int32_t>(value);
        case UX_PROPERTY_TYPE_ULONG:
            return std::get<uint32_t>(value);
        case UX_PROPERTY_TYPE_DOUBLE:
            return std::get<double>(value);
        case UX_PROPERTY_TYPE_TIMESTAMP: {
            const uxSysAttrTimestampUTC& time = std::get<uxSysAttrTimestampUTC>(value);
            const std::string text = IsNoTime(time) ? std::string() : TimestampToIso8601(time);
            return text.empty() ? Json(nullptr) : Json(text);
        }
        default:
            return ValueForPeople(value, NumberStyle::kDecimal);
    }
}

bool SameValue(const PropertyValue& a, const PropertyValue& b) {
    return a.index() == b.index() && ValueAsJson(a) == ValueAsJson(b);
}

std::optional<PropertyValue> ParseValue(const std::string& text, uint32_t type) {
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL:
            if (const std::optional<bool> value = ParseBool(text)) {
                return PropertyValue(std::in_place_type<bool>, *value);
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_LONG:
            if (const std::optional<long long> value = ParseInteger(text, INT32_MIN, INT32_MAX)) {
                return PropertyValue(std::in_place_type<int32_t>, static_cast<int32_t>(*value));
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_ULONG:
            if (const std::optional<long long> value = ParseInteger(text, 0, UINT32_MAX)) {
                return PropertyValue(std::in_place_type<uint32_t>, static_cast<uint32_t>(*value));
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_DOUBLE:
            if (const std::optional<double> value = ParseDouble(text)) {
                return PropertyValue(std::in_place_type<double>, *value);
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_GUID:
            if (const std::optional<GUID> value = ParseGuid(text)) {
                return PropertyValue(std::in_place_type<GUID>, *value);
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_STRING:
            if (std::optional<std::wstring> value = WideFromUtf8(text)) {
                return PropertyValue(std::in_place_type<std::wstring>, std::move(*value));
            }
            return std::nullopt;
        case UX_PROPERTY_TYPE_TIMESTAMP: {
            const std::optional<uxSysAttrTimestampUTC> value =
                text == "now" ? CurrentTimestamp() : TimestampFromIso8601(text);
            if (value) {
                return PropertyValue(std::in_place_type<uxSysAttrTimestampUTC>, *value);
            }
            return std::nullopt;
        }
        default:
            return std::nullopt;
    }
}

std::string AcceptedForm(uint32_t type) {
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL:
            return "true or false (also yes/no, on/off, 1/0)";
        case UX_PROPERTY_TYPE_LONG:
            return "a whole number from -2147483648 to 2147483647";
        case UX_PROPERTY_TYPE_ULONG:
            return "a whole number from 0 to 4294967295, decimal or 0x-hexadecimal";
        case UX_PROPERTY_TYPE_DOUBLE:
            return "a finite number";
        case UX_PROPERTY_TYPE_GUID:
            return "a GUID such as 01234567-89ab-cdef-0123-456789abcdef";
        case UX_PROPERTY_TYPE_STRING:
            return "UTF-8 text without zero characters";
        case UX_PROPERTY_TYPE_TIMESTAMP:
            return "an ISO 8601 UTC time such as 2024-05-01T12:00:00Z, or now";
        default:
            return "a value of a known type";
    }
}

}  // namespace kest::cfg
