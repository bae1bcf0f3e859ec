// The property tags kestcfg knows by name: every tag the chassis item and the Ethernet adapter
// item report, with the type the plug-in writes and how a value is best shown.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace kest::cfg {

// How an unsigned value is shown: most as decimal numbers, masks and bit-valued modes in
// hexadecimal (they are compared bit by bit).
enum class NumberStyle { kDecimal, kHexadecimal };

// Which items report a property.
enum class ItemKind { kAny, kChassis, kAdapter };

// Whether a property can be changed, and when a change takes effect.
enum class Change { kNo, kYes, kAfterRestart };

struct PropertyDescription {
    uint32_t tag;
    const char* name;  // lower case words joined by "-"
    uint32_t type;     // a bag type code, UX_PROPERTY_TYPE_*
    NumberStyle style;
    ItemKind kind;
    Change change;
    const char* values;   // the values a change may take, for people; empty when unchangeable
    const char* meaning;  // one line
};

// Every property kestcfg knows, in the order the items report them.
const std::vector<const PropertyDescription*>& AllProperties();

// Whether the property can be changed on the chassis item (`chassis`) or on an adapter item.
Change ChangeOn(const PropertyDescription& description, bool chassis);

// True for the properties export writes and apply reads: those that can be changed on such an
// item, except the clock, which is not a setting.
bool IsSetting(const PropertyDescription& description, bool chassis);

// The description of `tag`, or null for a tag kestcfg does not know.
const PropertyDescription* FindProperty(uint32_t tag);

// The description named `name` (compared case-insensitively), or null.
const PropertyDescription* FindPropertyByName(const std::string& name);

// The tag a user means by `word`: a catalogue name, or a tag number in hexadecimal with "0x" or
// in decimal. Nothing when it is neither.
std::optional<uint32_t> TagFromWord(const std::string& word);

// The tag as "0x" and eight upper-case hexadecimal digits.
std::string TagText(uint32_t tag);

// The name kestcfg shows for `tag`: its catalogue name, or its number for an unknown tag.
std::string TagDisplayName(uint32_t tag);

}  // namespace kest::cfg
