// kestcfg items, get and refresh: reading the items and their properties.
#include <algorithm>

#include "BagValues.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "HostText.h"
#include "ItemAccess.h"
#include "PropertyCatalogue.h"
#include "PropertyListing.h"
#include "StatusNames.h"
#include "uxsys/StatusCodes.h"

namespace {

// The JSON members that report a failed status.
std::string StatusJson(HRESULT status) {
    const std::string name = StatusName(status);
    return "\"status\":" + (name.empty() ? std::string("null") : JsonQuoted(name)) +
           ",\"code\":" + JsonQuoted(StatusText(status));
}

// Prints one item's properties; returns false when they could not be read (reported already).
bool ShowItemProperties(CommandContext& context, const std::wstring& item, bool headed) {
    InterfaceRef<IuxSysPropertyBag2> bag;
    const HRESULT status = CurrentProperties(context.expert, item, &bag);
    const std::string name = ItemText(item);
    if (status < 0) {
        const std::string problem =
            "cannot read the properties of " + name + ": " + StatusWithName(status);
        if (context.json) {
            context.out << "{\"item\":" << JsonQuoted(name) << ",\"error\":{" << StatusJson(status)
                        << "}}\n";
        }
        context.err << "kestcfg: " << problem << "\n";
        return false;
    }
    const std::vector<PropertyEntry> entries = ReadProperties(bag.Get(), AllTags(bag.Get()));
    if (context.json) {
        context.out << "{\"item\":" << JsonQuoted(name)
                    << ",\"properties\":" << PropertiesAsJson(entries) << "}\n";
    } else {
        if (headed) {
            context.out << name << "\n";
        }
        WritePropertyTable(context.out, entries, headed ? "  " : "");
    }
    return true;
}

}  // namespace

void RunItems(CommandContext& context) {
    for (const std::wstring& item : ItemNames(context.expert)) {
        if (context.json) {
            context.out << "{\"item\":" << JsonQuoted(ItemText(item)) << "}\n";
        } else {
            context.out << ItemText(item) << "\n";
        }
    }
}

void RunGet(CommandContext& context) {
    if (!context.arguments.empty()) {
        const std::wstring item = ItemArgument(context.arguments[0]);
        if (!ShowItemProperties(context, item, false)) {
            throw CommandFailure(kExitFailure, "");
        }
        return;
    }
    bool allShown = true;
    bool first = true;
    for (const std::wstring& item : ItemNames(context.expert)) {
        if (!first && !context.json) {
            context.out << "\n";
        }
        first = false;
        allShown = ShowItemProperties(context, item, true) && allShown;
    }
    if (!allShown) {
        throw CommandFailure(kExitFailure, "");
    }
}

void RunRefresh(CommandContext& context) {
    const std::wstring item = ItemArgument(context.arguments[0]);
    std::vector<uint32_t> requested;
    for (size_t i = 1; i < context.arguments.size(); ++i) {
        const std::optional<uint32_t> tag = TagFromWord(context.arguments[i]);
        if (!tag) {
            throw UsageError("unknown property " + context.arguments[i] +
                             "; give a name that kestcfg get shows or a tag number");
        }
        if (std::find(requested.begin(), requested.end(), *tag) == requested.end()) {
            requested.push_back(*tag);
        }
    }

    InterfaceRef<IuxSysPropertyBag> refreshed;
    const HRESULT status = context.expert->PopulateOrRefreshProperties(
        item.c_str(), static_cast<uint32_t>(requested.size()), requested.data(),
        refreshed.Receive());
    if (status < 0) {
        throw Failure("refreshing properties of " + ItemText(item) + " failed with " +
                      StatusWithName(status));
    }
    const InterfaceRef<IuxSysPropertyBag2> bag =
        QueryInterfaceAs<IuxSysPropertyBag2>(refreshed.Get(), IID_IuxSysPropertyBag2);
    if (!bag) {
        throw Failure("the refreshed property bag does not offer its timestamp operations");
    }
    std::vector<uint32_t> present;
    std::vector<uint32_t> missing;
    for (const uint32_t tag : requested) {
        (bag->HasTag(tag) == S_OK ? present : missing).push_back(tag);
    }
    const std::vector<PropertyEntry> entries = ReadProperties(bag.Get(), present);
    if (context.json) {
        context.out << "{\"item\":" << JsonQuoted(ItemText(item))
                    << ",\"properties\":" << PropertiesAsJson(entries) << ",\"missing\":[";
        for (size_t i = 0; i < missing.size(); ++i) {
            context.out << (i == 0 ? "" : ",") << JsonQuoted(TagDisplayName(missing[i]));
        }
        context.out << "]}\n";
    } else {
        WritePropertyTable(context.out, entries, "");
    }
    for (const uint32_t tag : missing) {
        context.err << "kestcfg: " << ItemText(item) << " did not provide " << TagDisplayName(tag)
                    << "\n";
    }
}
