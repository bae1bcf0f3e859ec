// Properties read from a bag, shown as an aligned table or as a JSON object.
#pragma once

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

#include "JsonOutput.h"
#include "hostkit/PropertyValue.h"
#include "uxsys/PropertyBag.h"

namespace kest::cfg {

struct PropertyEntry {
    uint32_t tag;
    HRESULT status;                      // of reading the value; S_OK when it was read
    kest::hostkit::PropertyValue value;  // meaningful when status is not negative
};

// Reads `tags` from the bag in the order given; a tag that cannot be read keeps its status.
std::vector<PropertyEntry> ReadProperties(IuxSysPropertyBag2* bag,
                                          const std::vector<uint32_t>& tags);

// Writes the columns TAG, NAME, TYPE and VALUE, each line starting with `indent`.
void WritePropertyTable(std::ostream& out, const std::vector<PropertyEntry>& entries,
                        const std::string& indent);

// A JSON object with one member per property, named as kestcfg names the tag:
// {"host-name":{"tag":"0x0101F000","type":"text","value":"kest-demo"},...}; a property that
// could not be read has "error" instead of "type" and "value".
Json PropertiesAsJson(const std::vector<PropertyEntry>& entries);

}  // namespace kest::cfg
