#include "ModeNames.h"

#include <strings.h>

#include <cstdio>

namespace {

std::string Hex(uint32_t value) {
    char text[16];
    std::snprintf(text, sizeof text, "0x%02X", value);
    return text;
}

const char* NameOf(const ModeProperty& mode, uint32_t value) {
    for (const NamedMode& named : mode.names) {
        if (named.value == value) {
            return named.name;
        }
    }
    return nullptr;
}

}  // namespace

const ModeProperty* FindModeProperty(uint32_t tag) {
    // Values without a name here are accepted as numbers; what they select is the device's
    // business.
    static const std::vector<NamedMode> media = {
        {0x01, "auto"},     {0x02, "10-half"},   {0x04, "10-full"},  {0x08, "100-half"},
        {0x10, "100-full"}, {0x20, "1000-half"}, {0x40, "1000-full"}};
    static const std::vector<ModeProperty> modes = {
        {0x0D102000, 0x0D103000, {{0x01, "disabled"}, {0x02, "tcpip"}, {0x08, "ethercat"}}},
        {0x0D105000, 0x0D106000, {{0x01, "static"}, {0x02, "dynamic"}}},
        {0x0D10F000, 0x0D110000, media},
        {0x0D111000, 0x0D110000, media},
        {0x0D11A000, 0x0D119000, {{0x01, "off"}, {0x02, "polling"}}},
    };
    for (const ModeProperty& mode : modes) {
        if (mode.tag == tag || mode.maskTag == tag) {
            return &mode;
        }
    }
    return nullptr;
}

std::optional<uint32_t> ModeFromName(uint32_t tag, const std::string& word) {
    const ModeProperty* mode = FindModeProperty(tag);
    if (mode == nullptr || mode->maskTag == tag) {
        return std::nullopt;
    }
    for (const NamedMode& named : mode->names) {
        if (strcasecmp(named.name, word.c_str()) == 0) {
            return named.value;
        }
    }
    return std::nullopt;
}

std::string ModeText(uint32_t tag, uint32_t value) {
    const ModeProperty* mode = FindModeProperty(tag);
    if (mode == nullptr) {
        return Hex(value);
    }
    if (mode->maskTag != tag) {
        const char* name = NameOf(*mode, value);
        return name != nullptr ? Hex(value) + " " + name : Hex(value);
    }
    std::string names;
    for (uint32_t bit = 1; bit != 0 && bit <= value; bit <<= 1) {
        if ((value & bit) != 0) {
            const char* name = NameOf(*mode, bit);
            names += (names.empty() ? "" : ",") + (name != nullptr ? std::string(name) : Hex(bit));
        }
    }
    return names.empty() ? Hex(value) : Hex(value) + " " + names;
}

std::vector<std::string> OfferedModes(const ModeProperty& mode, uint32_t mask) {
    std::vector<std::string> offered;
    for (uint32_t bit = 1; bit != 0 && bit <= mask; bit <<= 1) {
        if ((mask & bit) != 0) {
            offered.push_back(ModeText(mode.tag, bit));
        }
    }
    return offered;
}
