// kestcfg describe [ITEM]: what each property of an item is, whether and how it can be changed.
#include <algorithm>

#include "BagValues.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "ItemAccess.h"
#include "ModeNames.h"
#include "PropertyCatalogue.h"
#include "StatusNames.h"
#include "TextTable.h"
#include "ValueText.h"
#include "hostkit/HostText.h"
#include "kest/ChassisTags.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

struct DescribedProperty {
    uint32_t tag;
    std::string name;
    std::string type;
    Change change;
    std::vector<std::string> values;
    std::string meaning;
};

std::string ChangeWord(Change change) {
    switch (change) {
        case Change::kNo:
            return "no";
        case Change::kYes:
            return "yes";
        default:
            return "after restart";
    }
}

// The values a change may take: the named modes the adapter's mask offers, the locales the
// chassis supports, or the catalogue's description.
std::vector<std::string> ValuesOf(const PropertyDescription& description, IuxSysPropertyBag2* bag) {
    if (description.change == Change::kNo) {
        return {};
    }
    if (const ModeProperty* mode = FindModeProperty(description.tag)) {
        PropertyValue mask;
        if (bag != nullptr && ReadBagValue(bag, mode->maskTag, &mask) >= 0 &&
            std::holds_alternative<uint32_t>(mask)) {
            return OfferedModes(*mode, std::get<uint32_t>(mask));
        }
        std::vector<std::string> all;
        for (const NamedMode& named : mode->names) {
            all.push_back(ModeText(mode->tag, named.value));
        }
        return all;
    }
    PropertyValue locales;
    if (description.tag == kest::tag::kLocaleCode && bag != nullptr &&
        ReadBagValue(bag, kest::tag::kSupportedLocaleCodes, &locales) >= 0 &&
        std::holds_alternative<std::wstring>(locales)) {
        return {"one of " + ValueForPeople(locales, NumberStyle::kDecimal)};
    }
    return {description.values};
}

// Every property the item reports, and those the catalogue knows for its kind but that it
// reports only on a refresh or in another mode, in catalogue order; unknown tags at the end.
std::vector<DescribedProperty> DescribeItem(const std::wstring& item, IuxSysPropertyBag2* bag) {
    const bool chassis = item == kChassisItem;
    std::vector<uint32_t> reported = bag != nullptr ? AllTags(bag) : std::vector<uint32_t>();
    std::vector<DescribedProperty> described;
    for (const PropertyDescription* description : AllProperties()) {
        const bool ofThisKind = description->kind == ItemKind::kAny ||
                                (description->kind == ItemKind::kChassis) == chassis;
        const auto found = std::find(reported.begin(), reported.end(), description->tag);
        if (!ofThisKind && found == reported.end()) {
            continue;
        }
        if (found != reported.end()) {
            reported.erase(found);
        }
        const Change change = ChangeOn(*description, chassis);
        DescribedProperty property{
            description->tag,    description->name, TypeCodeName(description->type), change, {},
            description->meaning};
        if (change != Change::kNo) {
            property.values = ValuesOf(*description, bag);
        }
        described.push_back(std::move(property));
    }
    for (const uint32_t tag : reported) {
        uint32_t type = 0;
        bag->GetTagType(tag, &type);
        described.push_back({tag,
                             TagText(tag),
                             TypeCodeName(type),
                             Change::kNo,
                             {},
                             "a property kestcfg does not know"});
    }
    return described;
}

Json DescriptionAsJson(const std::string& item, const std::vector<DescribedProperty>& properties) {
    Json list = Json::array();
    for (const DescribedProperty& property : properties) {
        list.push_back({{"name", property.name},
                        {"tag", TagText(property.tag)},
                        {"type", property.type},
                        {"changeable", property.change != Change::kNo},
                        {"restartRequired", property.change == Change::kAfterRestart},
                        {"values", property.values},
                        {"meaning", property.meaning}});
    }
    return {{"item", item}, {"properties", std::move(list)}};
}

void WriteDescription(std::ostream& out, const std::string& item,
                      const std::vector<DescribedProperty>& properties) {
    out << PrintableText(item) << "\n";
    TextTable table({"NAME", "TAG", "TYPE", "CHANGEABLE", "VALUES", "MEANING"});
    for (const DescribedProperty& property : properties) {
        std::string values;
        for (const std::string& value : property.values) {
            values += (values.empty() ? "" : ", ") + value;
        }
        table.AddRow({property.name, TagText(property.tag), property.type,
                      ChangeWord(property.change), values.empty() ? "-" : values,
                      property.meaning});
    }
    table.Write(out, "  ");
}

}  // namespace

void RunDescribe(CommandContext& context) {
    const std::vector<std::wstring> items =
        context.arguments.empty() ? ItemNames(context.expert)
                                  : std::vector<std::wstring>{ItemArgument(context.arguments[0])};
    Json& described = context.document["items"] = Json::array();
    for (size_t i = 0; i < items.size(); ++i) {
        InterfaceRef<IuxSysPropertyBag2> bag;
        const HRESULT status = CurrentProperties(context.expert, items[i], &bag);
        if (status == UX_E_ITEM_NOT_FOUND) {
            throw CommandFailure(kExitUsageError, "there is no item " + ItemText(items[i]), status);
        }
        if (status < 0) {
            context.err << "kestcfg: warning: cannot read the properties of "
                        << PrintableText(ItemText(items[i])) << " (" << StatusWithName(status)
                        << "); describing what kestcfg knows of it\n";
        }
        const std::vector<DescribedProperty> properties =
            DescribeItem(items[i], status < 0 ? nullptr : bag.Get());
        described.push_back(DescriptionAsJson(ItemText(items[i]), properties));
        if (!context.options.json) {
            context.out << (i == 0 ? "" : "\n");
            WriteDescription(context.out, ItemText(items[i]), properties);
        }
    }
}

}  // namespace kest::cfg
