#include "PropertyCatalogue.h"

#include <strings.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>

#include "uxsys/PropertyBag.h"

namespace {

constexpr uint32_t kBool = UX_PROPERTY_TYPE_BOOL;
constexpr uint32_t kLong = UX_PROPERTY_TYPE_LONG;
constexpr uint32_t kULong = UX_PROPERTY_TYPE_ULONG;
constexpr uint32_t kText = UX_PROPERTY_TYPE_STRING;
constexpr uint32_t kTime = UX_PROPERTY_TYPE_TIMESTAMP;
constexpr NumberStyle kDec = NumberStyle::kDecimal;
constexpr NumberStyle kHex = NumberStyle::kHexadecimal;

// Rows whose value is a fixed fact the plug-in reports and never reads back carry the name
// "fixed-" and the tag's leading hexadecimal digits: their meaning belongs to the host.
constexpr PropertyDescription kCatalogue[] = {
    // Rows every item reports.
    {0x0101C000, "fixed-0101c", kLong, kDec},
    {0x0101D000, "item-name", kText, kDec},
    {0x0102A000, "numeric-attribute", kLong, kDec},
    {0x0101F000, "host-name", kText, kDec},
    {0x01037000, "fixed-01037", kULong, kHex},
    {0x01038000, "fixed-01038", kBool, kDec},
    {0x01039000, "fixed-01039", kLong, kDec},
    {0x0103A000, "fixed-0103a", kULong, kDec},
    // The chassis item.
    {0x01001000, "fixed-01001", kBool, kDec},
    {0x01024000, "fixed-01024", kLong, kDec},
    {0x01002000, "fixed-01002", kULong, kDec},
    {0x01006000, "description", kText, kDec},
    {0x01005000, "target-id", kULong, kDec},
    {0x0103C000, "target-class", kText, kDec},
    {0x01008000, "fixed-01008", kBool, kDec},
    {0x01004000, "vendor", kText, kDec},
    {0x01003000, "fixed-01003", kULong, kHex},
    {0x01007000, "serial-number", kText, kDec},
    {0x0103D000, "comment", kText, kDec},
    {0x0D11D000, "locale", kText, kDec},
    {0x0D11E000, "supported-locales", kText, kDec},
    {0x0D12B000, "time-zone-offset", kLong, kDec},
    {0x0D120000, "legacy-time-zone", kText, kDec},
    {0x0D14E000, "time-zone", kText, kDec},
    {0x0D129000, "fixed-0d129", kBool, kDec},
    {0x0102F000, "firmware-version", kText, kDec},
    {0x0104C000, "fixed-0104c", kLong, kDec},
    {0x0104A000, "fixed-0104a", kBool, kDec},
    {0x0104B000, "fixed-0104b", kText, kDec},
    {0x01056000, "fixed-01056", kBool, kDec},
    {0x01055000, "fixed-01055", kBool, kDec},
    {0x21004000, "web-service", kBool, kDec},
    {0x0D114000, "dns-name", kText, kDec},
    {0x0D11F000, "current-time", kTime, kDec},
    // The network adapter item.
    {0x0D104000, "mac-address", kText, kDec},
    {0x0D126000, "primary-adapter", kBool, kDec},
    {0x0D105000, "ip-request-mode", kULong, kHex},
    {0x0D106000, "supported-ip-request-modes", kULong, kHex},
    {0x0D107000, "ip-address", kText, kDec},
    {0x0D108000, "fixed-0d108", kULong, kDec},
    {0x0D109000, "subnet-mask", kText, kDec},
    {0x0D10A000, "gateway", kText, kDec},
    {0x0D10B000, "dns-server", kText, kDec},
    {0x0D10F000, "preferred-media-mode", kULong, kHex},
    {0x0D110000, "supported-media-modes", kULong, kHex},
    {0x0D111000, "media-mode", kULong, kHex},
    {0x0D118000, "ethercat-master-id", kULong, kDec},
    {0x0D155000, "ethercat-flag", kBool, kDec},
    // The Ethernet adapter's own rows.
    {0x0D12C000, "fixed-0d12c", kULong, kDec},
    {0x0D102000, "adapter-mode", kULong, kHex},
    {0x0D103000, "supported-adapter-modes", kULong, kHex},
    {0x0D119000, "supported-polling-modes", kULong, kHex},
    {0x0D11A000, "polling-mode", kULong, kHex},
    {0x0D11B000, "polling-interval", kULong, kDec},
};

// A tag number in "0x" hexadecimal or decimal, nothing else.
std::optional<uint32_t> ParseTagNumber(const std::string& word) {
    const bool hex = word.size() > 2 && word[0] == '0' && (word[1] == 'x' || word[1] == 'X');
    const std::string digits = hex ? word.substr(2) : word;
    const auto isDigit = [hex](char c) {
        return hex ? std::isxdigit(static_cast<unsigned char>(c)) != 0 : (c >= '0' && c <= '9');
    };
    if (digits.empty() || digits.size() > 10 ||
        !std::all_of(digits.begin(), digits.end(), isDigit)) {
        return std::nullopt;
    }
    const unsigned long long value = std::strtoull(digits.c_str(), nullptr, hex ? 16 : 10);
    if (value > 0xFFFFFFFFull) {
        return std::nullopt;
    }
    return static_cast<uint32_t>(value);
}

}  // namespace

const PropertyDescription* FindProperty(uint32_t tag) {
    for (const PropertyDescription& description : kCatalogue) {
        if (description.tag == tag) {
            return &description;
        }
    }
    return nullptr;
}

const PropertyDescription* FindPropertyByName(const std::string& name) {
    for (const PropertyDescription& description : kCatalogue) {
        if (strcasecmp(description.name, name.c_str()) == 0) {
            return &description;
        }
    }
    return nullptr;
}

std::optional<uint32_t> TagFromWord(const std::string& word) {
    if (const PropertyDescription* description = FindPropertyByName(word)) {
        return description->tag;
    }
    return ParseTagNumber(word);
}

std::string TagText(uint32_t tag) {
    char text[11];
    std::snprintf(text, sizeof text, "0x%08X", tag);
    return text;
}

std::string TagDisplayName(uint32_t tag) {
    const PropertyDescription* description = FindProperty(tag);
    return description != nullptr ? description->name : TagText(tag);
}
