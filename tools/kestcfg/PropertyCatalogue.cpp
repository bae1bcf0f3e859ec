#include "PropertyCatalogue.h"

#include <strings.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstdlib>

#include "kest/ChassisTags.h"
#include "uxsys/PropertyBag.h"

namespace kest::cfg {

namespace {

constexpr uint32_t kBool = UX_PROPERTY_TYPE_BOOL;
constexpr uint32_t kLong = UX_PROPERTY_TYPE_LONG;
constexpr uint32_t kULong = UX_PROPERTY_TYPE_ULONG;
constexpr uint32_t kText = UX_PROPERTY_TYPE_STRING;
constexpr uint32_t kTime = UX_PROPERTY_TYPE_TIMESTAMP;
constexpr NumberStyle kDec = NumberStyle::kDecimal;
constexpr NumberStyle kHex = NumberStyle::kHexadecimal;

// Rows whose value is a fixed fact the plug-in reports and never reads back carry the name
// "fixed-" and the tag's leading hexadecimal digits: their meaning belongs to the host. The
// values of mode properties are listed by their names (ModeNames), not here.
constexpr PropertyDescription kCatalogue[] = {
    // Rows every item reports.
    {kest::tag::kItemFixedLong, "fixed-0101c", kLong, kDec, ItemKind::kAny, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kItemName, "item-name", kText, kDec, ItemKind::kAny, Change::kNo, "",
     "the item's name"},
    {kest::tag::kNumericAttribute, "numeric-attribute", kLong, kDec, ItemKind::kAny, Change::kNo,
     "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kHostName, "host-name", kText, kDec, ItemKind::kAny, Change::kAfterRestart,
     "1 to 63 letters, digits and hyphens, starting and ending with a letter or digit, not only "
     "digits",
     "the controller's host name (the chassis item); the item name (adapters)"},
    {kest::tag::kItemFixedULong, "fixed-01037", kULong, kHex, ItemKind::kAny, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kItemFixedBool, "fixed-01038", kBool, kDec, ItemKind::kAny, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kItemFixedLong2, "fixed-01039", kLong, kDec, ItemKind::kAny, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kItemFixedULong2, "fixed-0103a", kULong, kDec, ItemKind::kAny, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    // The chassis item.
    {kest::tag::kChassisFixedBool1, "fixed-01001", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kChassisFixedLong1, "fixed-01024", kLong, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kChassisFixedULong1, "fixed-01002", kULong, kDec, ItemKind::kChassis, Change::kNo,
     "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kDeviceDescription, "description", kText, kDec, ItemKind::kChassis, Change::kNo, "",
     "the device description"},
    {kest::tag::kTargetId, "target-id", kULong, kDec, ItemKind::kChassis, Change::kNo, "",
     "the target identifier"},
    {kest::tag::kTargetClass, "target-class", kText, kDec, ItemKind::kChassis, Change::kNo, "",
     "the target class"},
    {kest::tag::kChassisFixedBool2, "fixed-01008", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kVendorName, "vendor", kText, kDec, ItemKind::kChassis, Change::kNo, "",
     "the vendor's name"},
    {kest::tag::kChassisFixedULong2, "fixed-01003", kULong, kHex, ItemKind::kChassis, Change::kNo,
     "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kSerialNumber, "serial-number", kText, kDec, ItemKind::kChassis, Change::kNo, "",
     "the serial number, eight hexadecimal digits"},
    {kest::tag::kComment, "comment", kText, kDec, ItemKind::kChassis, Change::kYes,
     "text of up to 64 bytes (UTF-8)", "a comment for the people who look after the controller"},
    {kest::tag::kLocaleCode, "locale", kText, kDec, ItemKind::kChassis, Change::kAfterRestart,
     "one of supported-locales", "the language code of the controller's user interface"},
    {kest::tag::kSupportedLocaleCodes, "supported-locales", kText, kDec, ItemKind::kChassis,
     Change::kNo, "", "the language codes the controller supports"},
    {kest::tag::kTimeZoneOffset, "time-zone-offset", kLong, kDec, ItemKind::kChassis, Change::kNo,
     "", "the time zone's offset from UTC as the controller reports it"},
    {kest::tag::kLegacyTimeZone, "legacy-time-zone", kText, kDec, ItemKind::kChassis, Change::kYes,
     "a POSIX time-zone text of the time-zone table, such as CET-1CEST",
     "the time zone in POSIX notation"},
    {kest::tag::kOlsonTimeZone, "time-zone", kText, kDec, ItemKind::kChassis, Change::kYes,
     "a time-zone name such as Europe/Berlin", "the time zone by name"},
    {kest::tag::kChassisFixedBool3, "fixed-0d129", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kFirmwareVersion, "firmware-version", kText, kDec, ItemKind::kChassis, Change::kNo,
     "", "the installed firmware's version"},
    {kest::tag::kChassisFixedLong2, "fixed-0104c", kLong, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kChassisFixedBool4, "fixed-0104a", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kConfigurationFilePattern, "fixed-0104b", kText, kDec, ItemKind::kChassis,
     Change::kNo, "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kChassisFixedBool5, "fixed-01056", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kChassisFixedBool6, "fixed-01055", kBool, kDec, ItemKind::kChassis, Change::kNo, "",
     "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kWebServiceEnabled, "web-service", kBool, kDec, ItemKind::kChassis,
     Change::kAfterRestart, "true or false", "whether the controller's web service runs"},
    {kest::tag::kDnsName, "dns-name", kText, kDec, ItemKind::kChassis, Change::kNo, "",
     "the fully qualified DNS name (refresh reads it)"},
    {kest::tag::kCurrentTime, "current-time", kTime, kDec, ItemKind::kChassis, Change::kYes,
     "an ISO 8601 UTC time from 1970 on, or now",
     "the controller's clock (refresh reads it; never exported)"},
    // The network adapter item.
    {kest::tag::kMacAddress, "mac-address", kText, kDec, ItemKind::kAdapter, Change::kNo, "",
     "the adapter's MAC address"},
    {kest::tag::kPrimaryAdapter, "primary-adapter", kBool, kDec, ItemKind::kAdapter, Change::kYes,
     "true makes this adapter the primary one", "whether this is the primary adapter"},
    {kest::tag::kRequestMode, "ip-request-mode", kULong, kHex, ItemKind::kAdapter, Change::kYes, "",
     "how the adapter gets its address"},
    {kest::tag::kSupportedRequestModes, "supported-ip-request-modes", kULong, kHex,
     ItemKind::kAdapter, Change::kNo, "", "the address request modes the adapter supports"},
    {kest::tag::kIPAddress, "ip-address", kText, kDec, ItemKind::kAdapter, Change::kYes,
     "a dotted IPv4 address (static request mode)", "the adapter's IPv4 address"},
    {kest::tag::kAddressFixedULong, "fixed-0d108", kULong, kDec, ItemKind::kAdapter, Change::kNo,
     "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kSubnetMask, "subnet-mask", kText, kDec, ItemKind::kAdapter, Change::kYes,
     "a dotted IPv4 mask with contiguous one-bits", "the subnet mask"},
    {kest::tag::kGateway, "gateway", kText, kDec, ItemKind::kAdapter, Change::kYes,
     "a dotted IPv4 address in the adapter's subnet, or 0.0.0.0", "the default gateway"},
    {kest::tag::kDnsServer, "dns-server", kText, kDec, ItemKind::kAdapter, Change::kYes,
     "a dotted IPv4 address", "the DNS server"},
    {kest::tag::kPreferredMediaMode, "preferred-media-mode", kULong, kHex, ItemKind::kAdapter,
     Change::kYes, "", "the link speed and duplex the adapter prefers"},
    {kest::tag::kSupportedMediaModes, "supported-media-modes", kULong, kHex, ItemKind::kAdapter,
     Change::kNo, "", "the link modes the adapter supports"},
    {kest::tag::kCurrentMediaMode, "media-mode", kULong, kHex, ItemKind::kAdapter, Change::kNo, "",
     "the link mode in use"},
    {kest::tag::kEtherCATMasterId, "ethercat-master-id", kULong, kDec, ItemKind::kAdapter,
     Change::kYes, "0 to 255", "the EtherCAT master identifier (EtherCAT mode)"},
    {kest::tag::kEtherCATFlag, "ethercat-flag", kBool, kDec, ItemKind::kAdapter, Change::kYes,
     "true or false", "the EtherCAT flag (EtherCAT mode)"},
    // The Ethernet adapter's own rows.
    {kest::tag::kEthernetFixedULong, "fixed-0d12c", kULong, kDec, ItemKind::kAdapter, Change::kNo,
     "", "a fixed fact the controller reports to configuration hosts"},
    {kest::tag::kAdapterMode, "adapter-mode", kULong, kHex, ItemKind::kAdapter,
     Change::kAfterRestart, "",
     "what the adapter is used for (a change to or from EtherCAT needs a restart)"},
    {kest::tag::kSupportedAdapterModes, "supported-adapter-modes", kULong, kHex, ItemKind::kAdapter,
     Change::kNo, "", "the adapter modes the adapter supports"},
    {kest::tag::kSupportedPollingModes, "supported-polling-modes", kULong, kHex, ItemKind::kAdapter,
     Change::kNo, "", "the polling modes the adapter supports"},
    {kest::tag::kPollingMode, "polling-mode", kULong, kHex, ItemKind::kAdapter, Change::kYes, "",
     "whether the adapter is polled"},
    {kest::tag::kPollingInterval, "polling-interval", kULong, kDec, ItemKind::kAdapter,
     Change::kYes, "1 to 10000 (milliseconds)",
     "the polling interval in milliseconds (polling mode)"},
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

const std::vector<const PropertyDescription*>& AllProperties() {
    static const std::vector<const PropertyDescription*> all = [] {
        std::vector<const PropertyDescription*> rows;
        for (const PropertyDescription& description : kCatalogue) {
            rows.push_back(&description);
        }
        return rows;
    }();
    return all;
}

Change ChangeOn(const PropertyDescription& description, bool chassis) {
    const bool ofThisKind = description.kind == ItemKind::kAny
                                ? chassis  // only the chassis takes a new host name
                                : (description.kind == ItemKind::kChassis) == chassis;
    return ofThisKind ? description.change : Change::kNo;
}

bool IsSetting(const PropertyDescription& description, bool chassis) {
    return ChangeOn(description, chassis) != Change::kNo &&
           description.type != UX_PROPERTY_TYPE_TIMESTAMP;
}

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

}  // namespace kest::cfg
