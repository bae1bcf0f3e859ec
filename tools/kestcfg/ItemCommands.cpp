// kestcfg items, get and refresh: reading the items and their properties.
#include <algorithm>

#include "BagValues.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "ItemAccess.h"
#include "PropertyCatalogue.h"
#include "PropertyListing.h"
#include "StatusNames.h"
#include "hostkit/HostText.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

// The tags the user named, each once, in the order given. Throws a usage error for a name that
// is neither a catalogue name nor a tag number.
std::vector<uint32_t> NamedTags(const std::vector<std::string>& words) {
    std::vector<uint32_t> tags;
    for (const std::string& word : words) {
        const std::optional<uint32_t> tag = TagFromWord(word);
        if (!tag) {
            throw UsageError("unknown property " + word +
                             "; give a name that kestcfg describe shows or a tag number");
        }
        if (std::find(tags.begin(), tags.end(), *tag) == tags.end()) {
            tags.push_back(*tag);
        }
    }
    return tags;
}

// Splits `requested` into the tags the bag holds and those it lacks.
void SplitByPresence(IuxSysPropertyBag* bag, const std::vector<uint32_t>& requested,
                     std::vector<uint32_t>* present, std::vector<uint32_t>* missing) {
    for (const uint32_t tag : requested) {
        (bag->HasTag(tag) == S_OK ? present : missing)->push_back(tag);
    }
}

Json MissingAsJson(const std::vector<uint32_t>& missing) {
    Json names = Json::array();
    for (const uint32_t tag : missing) {
        names.push_back(TagDisplayName(tag));
    }
    return names;
}

void ReportMissing(CommandContext& context, const std::string& item,
                   const std::vector<uint32_t>& missing, const char* verb) {
    for (const uint32_t tag : missing) {
        context.err << "kestcfg: " << PrintableText(item) << " " << verb << " "
                    << TagDisplayName(tag) << "\n";
    }
}

// Shows one item's properties, all or only `named` ones; returns false when some could not be
// read or are missing (reported already).
bool ShowItemProperties(CommandContext& context, const std::wstring& item,
                        const std::vector<uint32_t>* named, bool headed, Json& items) {
    InterfaceRef<IuxSysPropertyBag2> bag;
    const HRESULT status = CurrentProperties(context.expert, item, &bag);
    const std::string name = ItemText(item);
    if (status < 0) {
        if (status == UX_E_ITEM_NOT_FOUND && named != nullptr) {
            throw CommandFailure(kExitUsageError, "there is no item " + name, status);
        }
        items.push_back(
            {{"item", name},
             {"error", {{"status", StatusName(status)}, {"code", StatusText(status)}}}});
        context.err << "kestcfg: cannot read the properties of " << PrintableText(name) << ": "
                    << StatusWithName(status) << "\n";
        return false;
    }
    std::vector<uint32_t> tags;
    std::vector<uint32_t> missing;
    if (named != nullptr) {
        SplitByPresence(bag.Get(), *named, &tags, &missing);
    } else {
        tags = AllTags(bag.Get());
    }
    const std::vector<PropertyEntry> entries = ReadProperties(bag.Get(), tags);
    Json shown = {{"item", name}, {"properties", PropertiesAsJson(entries)}};
    if (named != nullptr) {
        shown["missing"] = MissingAsJson(missing);
    }
    items.push_back(std::move(shown));
    if (!context.options.json) {
        if (headed) {
            context.out << PrintableText(name) << "\n";
        }
        WritePropertyTable(context.out, entries, headed ? "  " : "");
    }
    ReportMissing(context, name, missing, "has no property");
    return missing.empty();
}

}  // namespace

void RunItems(CommandContext& context) {
    Json items = Json::array();
    for (const std::wstring& item : ItemNames(context.expert)) {
        items.push_back(ItemText(item));
        if (!context.options.json) {
            context.out << PrintableText(ItemText(item)) << "\n";
        }
    }
    context.document["items"] = std::move(items);
}

void RunGet(CommandContext& context) {
    Json& items = context.document["items"] = Json::array();
    if (!context.arguments.empty()) {
        const std::wstring item = ItemArgument(context.arguments[0]);
        const std::vector<std::string> words(context.arguments.begin() + 1,
                                             context.arguments.end());
        const std::vector<uint32_t> named = NamedTags(words);
        if (!ShowItemProperties(context, item, words.empty() ? nullptr : &named, false, items)) {
            throw CommandFailure(kExitFailure, "");
        }
        return;
    }
    bool allShown = true;
    bool first = true;
    for (const std::wstring& item : ItemNames(context.expert)) {
        if (!first && !context.options.json) {
            context.out << "\n";
        }
        first = false;
        allShown = ShowItemProperties(context, item, nullptr, true, items) && allShown;
    }
    if (!allShown) {
        throw CommandFailure(kExitFailure, "");
    }
}

void RunRefresh(CommandContext& context) {
    const std::wstring item = ItemArgument(context.arguments[0]);
    const std::vector<uint32_t> requested =
        NamedTags(std::vector<std::string>(context.arguments.begin() + 1, context.arguments.end()));

    InterfaceRef<IuxSysPropertyBag> refreshed;
    const HRESULT status = context.expert->PopulateOrRefreshProperties(
        item.c_str(), static_cast<uint32_t>(requested.size()), requested.data(),
        refreshed.Receive());
    if (status < 0) {
        throw CommandFailure(
            kExitFailure,
            "refreshing properties of " + ItemText(item) + " failed with " + StatusWithName(status),
            status);
    }
    const InterfaceRef<IuxSysPropertyBag2> bag =
        QueryInterfaceAs<IuxSysPropertyBag2>(refreshed.Get(), IID_IuxSysPropertyBag2);
    if (!bag) {
        throw Failure("the refreshed property bag does not offer its timestamp operations");
    }
    std::vector<uint32_t> present;
    std::vector<uint32_t> missing;
    SplitByPresence(bag.Get(), requested, &present, &missing);
    const std::vector<PropertyEntry> entries = ReadProperties(bag.Get(), present);
    context.document = {{"item", ItemText(item)},
                        {"properties", PropertiesAsJson(entries)},
                        {"missing", MissingAsJson(missing)}};
    if (!context.options.json) {
        WritePropertyTable(context.out, entries, "");
    }
    ReportMissing(context, ItemText(item), missing, "did not provide");
}

}  // namespace kest::cfg
