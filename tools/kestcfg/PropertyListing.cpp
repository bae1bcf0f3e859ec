#include "PropertyListing.h"

#include "BagValues.h"
#include "PropertyCatalogue.h"
#include "PropertyText.h"
#include "StatusNames.h"
#include "TextTable.h"
#include "ValueText.h"
#include "hostkit/HostText.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

std::vector<PropertyEntry> ReadProperties(IuxSysPropertyBag2* bag,
                                          const std::vector<uint32_t>& tags) {
    std::vector<PropertyEntry> entries;
    entries.reserve(tags.size());
    for (const uint32_t tag : tags) {
        PropertyEntry entry{tag, S_OK, PropertyValue()};
        entry.status = ReadBagValue(bag, tag, &entry.value);
        entries.push_back(std::move(entry));
    }
    return entries;
}

void WritePropertyTable(std::ostream& out, const std::vector<PropertyEntry>& entries,
                        const std::string& indent) {
    TextTable table({"TAG", "NAME", "TYPE", "VALUE"});
    for (const PropertyEntry& entry : entries) {
        if (entry.status < 0) {
            table.AddRow({TagText(entry.tag), TagDisplayName(entry.tag), "-",
                          "(unreadable: " + StatusWithName(entry.status) + ")"});
        } else {
            table.AddRow({TagText(entry.tag), TagDisplayName(entry.tag),
                          TypeCodeName(TypeCodeOf(entry.value)),
                          PropertyValueText(entry.tag, entry.value)});
        }
    }
    table.Write(out, indent);
}

Json PropertiesAsJson(const std::vector<PropertyEntry>& entries) {
    Json json = Json::object();
    for (const PropertyEntry& entry : entries) {
        Json property = {{"tag", TagText(entry.tag)}};
        if (entry.status < 0) {
            property["error"] = StatusWithName(entry.status);
        } else {
            property["type"] = TypeCodeName(TypeCodeOf(entry.value));
            property["value"] = ValueAsJson(entry.value);
        }
        json[TagDisplayName(entry.tag)] = std::move(property);
    }
    return json;
}

}  // namespace kest::cfg
