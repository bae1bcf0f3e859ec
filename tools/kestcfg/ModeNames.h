// Names for the values of the adapter's mode properties (adapter, address request, media and
// polling modes) and of their supported-mode masks, whose values are bits.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace kest::cfg {

struct NamedMode {
    uint32_t value;
    const char* name;
};

struct ModeProperty {
    uint32_t tag;      // the mode
    uint32_t maskTag;  // the mask of the modes the adapter supports
    std::vector<NamedMode> names;
};

// The mode property `tag` is, or whose supported-mode mask it is; null for other tags.
const ModeProperty* FindModeProperty(uint32_t tag);

// The value of mode `tag` that `word` names (compared case-insensitively); nothing for a word
// that is not a name of that mode.
std::optional<uint32_t> ModeFromName(uint32_t tag, const std::string& word);

// "0x02 tcpip" for a mode; "0x0B disabled,tcpip,ethercat" for a mask; the number alone for a
// value without a name.
std::string ModeText(uint32_t tag, uint32_t value);

// The modes a mask offers, "0x02 tcpip" each, in ascending order.
std::vector<std::string> OfferedModes(const ModeProperty& mode, uint32_t mask);

}  // namespace kest::cfg
