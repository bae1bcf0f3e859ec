#include "ControllerState.h"

#include <algorithm>
#include <utility>

namespace kest::sim {
namespace {

constexpr char kDevicePrefix[] = "Device";
constexpr size_t kDevicePrefixLength = sizeof kDevicePrefix - 1;

int DigitValue(char c, int base) {
    int digit = -1;
    if (c >= '0' && c <= '9') {
        digit = c - '0';
    } else if (c >= 'a' && c <= 'f') {
        digit = c - 'a' + 10;
    } else if (c >= 'A' && c <= 'F') {
        digit = c - 'A' + 10;
    }
    return digit < base ? digit : -1;
}

// The number N of a section named "DeviceN" (prefix ASCII case-insensitive), or -1.
int64_t DeviceNumber(const std::string& section) {
    if (section.size() <= kDevicePrefixLength || section.size() > kDevicePrefixLength + 9 ||
        !EqualsIgnoringCase(section.substr(0, kDevicePrefixLength), kDevicePrefix)) {
        return -1;
    }
    int64_t number = 0;
    for (size_t i = kDevicePrefixLength; i < section.size(); ++i) {
        const int digit = DigitValue(section[i], 10);
        if (digit < 0) {
            return -1;
        }
        number = number * 10 + digit;
    }
    return number;
}

[[noreturn]] void ThrowMalformed(const std::string& section, const std::string& key,
                                 const std::string& value, const char* kind) {
    throw MalformedState("[" + section + "] " + key + " = \"" + value + "\" is not " + kind);
}

}  // namespace

bool ParseStateNumber(const std::string& text, int64_t& value) {
    size_t i = 0;
    const bool negative = !text.empty() && text[0] == '-';
    if (negative) {
        ++i;
    }
    int base = 10;
    if (text.compare(i, 2, "0x") == 0 || text.compare(i, 2, "0X") == 0) {
        base = 16;
        i += 2;
    }
    if (i == text.size()) {
        return false;
    }
    int64_t magnitude = 0;
    for (; i < text.size(); ++i) {
        const int digit = DigitValue(text[i], base);
        if (digit < 0) {
            return false;
        }
        magnitude = magnitude * base + digit;
        if (magnitude > 0xFFFFFFFFll) {
            return false;
        }
    }
    value = negative ? -magnitude : magnitude;
    return true;
}

bool ControllerState::GetText(const std::string& section, const std::string& key,
                              std::string& text) const {
    const std::string* value = document_.Find(section, key);
    if (value == nullptr) {
        return false;
    }
    text = *value;
    return true;
}

int64_t ControllerState::GetNumber(const std::string& section, const std::string& key, int64_t low,
                                   int64_t high, bool& present) const {
    const std::string* text = document_.Find(section, key);
    present = text != nullptr;
    if (!present) {
        return 0;
    }
    int64_t number = 0;
    if (!ParseStateNumber(*text, number) || number < low || number > high) {
        ThrowMalformed(section, key, *text, "a number in range");
    }
    return number;
}

bool ControllerState::GetUnsigned(const std::string& section, const std::string& key,
                                  uint32_t& value) const {
    bool present = false;
    const int64_t number = GetNumber(section, key, 0, UINT32_MAX, present);
    if (present) {
        value = static_cast<uint32_t>(number);
    }
    return present;
}

bool ControllerState::GetSigned(const std::string& section, const std::string& key,
                                int32_t& value) const {
    bool present = false;
    const int64_t number = GetNumber(section, key, INT32_MIN, INT32_MAX, present);
    if (present) {
        value = static_cast<int32_t>(number);
    }
    return present;
}

bool ControllerState::GetFlag(const std::string& section, const std::string& key,
                              bool& value) const {
    bool present = false;
    const int64_t number = GetNumber(section, key, INT32_MIN, UINT32_MAX, present);
    if (present) {
        value = number != 0;
    }
    return present;
}

bool ControllerState::GetAddress(const std::string& section, const std::string& key,
                                 vq::dsc::osdep::IPAddress& address) const {
    const std::string* text = document_.Find(section, key);
    if (text == nullptr) {
        return false;
    }
    vq::dsc::osdep::IPAddress parsed;
    if (!parsed.TryParse(*text)) {
        ThrowMalformed(section, key, *text, "an address");
    }
    address = parsed;
    return true;
}

void ControllerState::SetText(const std::string& section, const std::string& key,
                              const std::string& text) {
    document_.Set(section, key, text);
    modified_ = true;
}

void ControllerState::SetUnsigned(const std::string& section, const std::string& key,
                                  uint32_t value) {
    SetText(section, key, std::to_string(value));
}

void ControllerState::SetFlag(const std::string& section, const std::string& key, bool value) {
    SetText(section, key, value ? "1" : "0");
}

void ControllerState::SetAddress(const std::string& section, const std::string& key,
                                 const vq::dsc::osdep::IPAddress& address) {
    SetText(section, key, address.ToString());
}

std::vector<std::string> ControllerState::DeviceSections() const {
    std::vector<std::pair<int64_t, std::string>> numbered;
    for (const std::string& name : document_.SectionNames()) {
        const int64_t number = DeviceNumber(name);
        const bool seen = std::any_of(numbered.begin(), numbered.end(), [&](const auto& entry) {
            return EqualsIgnoringCase(entry.second, name);
        });
        if (number >= 0 && !seen) {
            numbered.emplace_back(number, name);
        }
    }
    std::stable_sort(numbered.begin(), numbered.end(),
                     [](const auto& a, const auto& b) { return a.first < b.first; });
    std::vector<std::string> sections;
    for (const auto& entry : numbered) {
        sections.push_back(entry.second);
    }
    return sections;
}

uint32_t ControllerState::DeviceIndex(const std::string& deviceSection) const {
    uint32_t index = static_cast<uint32_t>(DeviceNumber(deviceSection));
    GetUnsigned(deviceSection, "Index", index);
    return index;
}

std::string ControllerState::FindDevice(uint32_t index) const {
    for (const std::string& section : DeviceSections()) {
        if (DeviceIndex(section) == index) {
            return section;
        }
    }
    return std::string();
}

std::string ControllerState::FindDeviceWith(const std::string& key,
                                            const std::string& value) const {
    if (value.empty()) {
        return std::string();
    }
    for (const std::string& section : DeviceSections()) {
        std::string text;
        if (GetText(section, key, text) && EqualsIgnoringCase(text, value)) {
            return section;
        }
    }
    return std::string();
}

}  // namespace kest::sim
