#include "ModeNames.h"

#include <strings.h>

#include <cstdio>

#include "kest/ChassisTags.h"

namespace kest::cfg {

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
    static const std::vector<NamedMode> media = {{kest::media_mode::kAuto, "auto"},
                                                 {kest::media_mode::kHalfDuplex10, "10-half"},
                                                 {kest::media_mode::kFullDuplex10, "10-full"},
                                                 {kest::media_mode::kHalfDuplex100, "100-half"},
                                                 {kest::media_mode::kFullDuplex100, "100-full"},
                                                 {kest::media_mode::kHalfDuplex1000, "1000-half"},
                                                 {kest::media_mode::kFullDuplex1000, "1000-full"}};
    static const std::vector<ModeProperty> modes = {
        {kest::tag::kAdapterMode,
         kest::tag::kSupportedAdapterModes,
         {{kest::adapter_mode::kDisabled, "disabled"},
          {kest::adapter_mode::kTcpIp, "tcpip"},
          {kest::adapter_mode::kEtherCAT, "ethercat"}}},
        {kest::tag::kRequestMode,
         kest::tag::kSupportedRequestModes,
         {{kest::request_mode::kStatic, "static"}, {kest::request_mode::kDynamic, "dynamic"}}},
        {kest::tag::kPreferredMediaMode, kest::tag::kSupportedMediaModes, media},
        {kest::tag::kCurrentMediaMode, kest::tag::kSupportedMediaModes, media},
        {kest::tag::kPollingMode,
         kest::tag::kSupportedPollingModes,
         {{kest::polling_mode::kOff, "off"}, {kest::polling_mode::kPolling, "polling"}}},
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

}  // namespace kest::cfg
