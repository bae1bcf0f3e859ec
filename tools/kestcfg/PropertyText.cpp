#include "PropertyText.h"

#include "ModeNames.h"
#include "PropertyCatalogue.h"
#include "ValueText.h"

namespace kest::cfg {

using namespace kest::hostkit;

std::string PropertyValueText(uint32_t tag, const PropertyValue& value) {
    if (const uint32_t* number = std::get_if<uint32_t>(&value);
        number != nullptr && FindModeProperty(tag) != nullptr) {
        return ModeText(tag, *number);
    }
    const PropertyDescription* description = FindProperty(tag);
    return ValueForPeople(value,
                          description != nullptr ? description->style : NumberStyle::kDecimal);
}

std::optional<PropertyValue> ParsePropertyValue(uint32_t tag, const std::string& text,
                                                uint32_t type) {
    if (type == UX_PROPERTY_TYPE_ULONG) {
        if (const std::optional<uint32_t> mode = ModeFromName(tag, text)) {
            return PropertyValue(std::in_place_type<uint32_t>, *mode);
        }
    }
    return ParseValue(text, type);
}

std::string AcceptedPropertyForm(uint32_t tag, uint32_t type) {
    const ModeProperty* mode = FindModeProperty(tag);
    if (mode == nullptr || mode->tag != tag || mode->names.empty()) {
        return AcceptedForm(type);
    }
    std::string names;
    for (const NamedMode& named : mode->names) {
        names += (names.empty() ? "" : ", ") + std::string(named.name);
    }
    return "a mode name (" + names + ") or number";
}

}  // namespace kest::cfg
