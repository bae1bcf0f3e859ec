// A property's value as people read and type it: by its type, and by name for modes.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "hostkit/PropertyValue.h"

namespace kest::cfg {

// The value of `tag` for people: modes and mode masks with their names ("0x02 tcpip"), masks in
// hexadecimal, everything else as ValueForPeople shows it.
std::string PropertyValueText(uint32_t tag, const kest::hostkit::PropertyValue& value);

// Parses text typed for `tag` as a value of bag type `type`: a mode's name or any text that
// ParseValue accepts. Nothing when it fits neither.
std::optional<kest::hostkit::PropertyValue> ParsePropertyValue(uint32_t tag,
                                                               const std::string& text,
                                                               uint32_t type);

// What ParsePropertyValue accepts for `tag`, for error messages.
std::string AcceptedPropertyForm(uint32_t tag, uint32_t type);

}  // namespace kest::cfg
