#include "config/IniValues.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <limits>

#include "config/IniNames.h"
#include "config/IniText.h"

namespace kest::ini {
namespace {

constexpr uint64_t kMaxMagnitude = UINT32_MAX;

// Splits " [+|-]digits " into sign and magnitude; false for anything else or a magnitude beyond
// 32 bits.
bool ParseMagnitude(std::string_view text, bool* negative, uint64_t* magnitude) {
    text = TrimIniSpace(text);
    *negative = false;
    if (!text.empty() && (text[0] == '+' || text[0] == '-')) {
        *negative = text[0] == '-';
        text.remove_prefix(1);
    }
    if (text.empty()) {
        return false;
    }
    uint64_t value = 0;
    for (char c : text) {
        if (c < '0' || c > '9') {
            return false;
        }
        value = value * 10 + static_cast<uint64_t>(c - '0');
        if (value > kMaxMagnitude) {
            return false;
        }
    }
    *magnitude = value;
    return true;
}

int HexDigitValue(char c, int otherwise) {
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    if (c >= 'a' && c <= 'f') {
        return c - 'a' + 10;
    }
    if (c >= 'A' && c <= 'F') {
        return c - 'A' + 10;
    }
    return otherwise;
}

}  // namespace

int ParseUInt32(std::string_view text, uint32_t* value) {
    if (TrimIniSpace(text).empty()) {
        return kIniNotFound;
    }
    bool negative = false;
    uint64_t magnitude = 0;
    if (!ParseMagnitude(text, &negative, &magnitude) || negative) {
        return kIniNotUInt32;
    }
    *value = static_cast<uint32_t>(magnitude);
    return kIniFound;
}

int ParseInt32(std::string_view text, int32_t* value) {
    if (TrimIniSpace(text).empty()) {
        return kIniNotFound;
    }
    bool negative = false;
    uint64_t magnitude = 0;
    uint64_t limit = static_cast<uint64_t>(std::numeric_limits<int32_t>::max());
    if (!ParseMagnitude(text, &negative, &magnitude) || magnitude > limit + (negative ? 1 : 0)) {
        return kIniNotInt32;
    }
    int64_t signedValue = static_cast<int64_t>(magnitude);
    *value = static_cast<int32_t>(negative ? -signedValue : signedValue);
    return kIniFound;
}

int ParseBoolean(std::string_view text, bool* value) {
    if (TrimIniSpace(text).empty()) {
        return kIniNotFound;
    }
    NameRules caseless;
    if (caseless(text, "True")) {
        *value = true;
    } else if (caseless(text, "False")) {
        *value = false;
    } else {
        return kIniNotBoolean;
    }
    return kIniFound;
}

int ParseDouble(const std::string& text, double* value) {
    if (TrimIniSpace(text).empty()) {
        return kIniNotFound;
    }
    NameRules caseless;
    if (caseless(text, "Inf") || caseless(text, "+Inf")) {
        *value = std::numeric_limits<double>::infinity();
        return kIniFound;
    }
    if (caseless(text, "-Inf")) {
        *value = -std::numeric_limits<double>::infinity();
        return kIniFound;
    }
    char* end = nullptr;
    errno = 0;
    double parsed = std::strtod(text.c_str(), &end);
    if (errno != 0 || end != text.c_str() + text.size()) {
        return kIniNotDouble;
    }
    *value = parsed;
    return kIniFound;
}

void DecodeEscapes(std::string_view text, std::string& out) {
    out.clear();
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\') {
            out += text[i];
            continue;
        }
        if (++i == text.size()) {
            break;
        }
        switch (text[i]) {
            case 'n':
                out += '\n';
                break;
            case 't':
                out += '\t';
                break;
            case 'x': {
                // A missing or non-hexadecimal digit counts as 15 in the first place and 255 in
                // the second; the sum is cut to eight bits.
                int high = i + 1 < text.size() ? HexDigitValue(text[i + 1], 15) : 15;
                int low = i + 2 < text.size() ? HexDigitValue(text[i + 2], 255) : 255;
                out += static_cast<char>((high * 16 + low) & 0xFF);
                i = std::min(i + 2, text.size() - 1);
                break;
            }
            default:
                out += text[i];
                break;
        }
    }
}

std::string EncodeEscapes(std::string_view text) {
    std::string encoded;
    encoded.reserve(text.size());
    for (char c : text) {
        unsigned char byte = static_cast<unsigned char>(c);
        if (c == '\\' || c == '"') {
            encoded += '\\';
            encoded += c;
        } else if (c == '\t') {
            encoded += "\\t";
        } else if (c == '\n') {
            encoded += "\\n";
        } else if (byte < 0x20 || byte == 0x7F) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\x%02x", byte);
            encoded += escape;
        } else {
            encoded += c;
        }
    }
    return encoded;
}

}  // namespace kest::ini
