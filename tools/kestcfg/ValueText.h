// Property values as text: shown to people, written as JSON, and parsed from the command line.
#pragma once

#include <optional>
#include <string>

#include "JsonOutput.h"
#include "PropertyCatalogue.h"
#include "hostkit/PropertyValue.h"

namespace kest::cfg {

// The value for people: true/false, numbers (unsigned ones in hexadecimal when `style` says so),
// text as it is, GUIDs in registry form, timestamps in ISO 8601 UTC or "(no time)".
std::string ValueForPeople(const kest::hostkit::PropertyValue& value, NumberStyle style);

// The value as a JSON value: booleans, numbers, strings; a timestamp as its ISO 8601 text, or
// null for "no time".
Json ValueAsJson(const kest::hostkit::PropertyValue& value);

// True when both values are of the same kind and equal.
bool SameValue(const kest::hostkit::PropertyValue& a, const kest::hostkit::PropertyValue& b);

// Parses command-line text as a value of bag type `type`. Booleans: true/false, yes/no, on/off,
// 1/0. Integers: decimal, or hexadecimal with "0x"; out of range fails. Timestamps: ISO 8601 UTC
// or "now". Text: any valid UTF-8. Nothing when the text does not fit the type.
std::optional<kest::hostkit::PropertyValue> ParseValue(const std::string& text, uint32_t type);

// A short word for a type code ("boolean", "text", ...); "type N" for an unknown code.
std::string TypeCodeName(uint32_t type);

// What ParseValue accepts for `type`, for error messages ("true or false", ...).
std::string AcceptedForm(uint32_t type);

}  // namespace kest::cfg
