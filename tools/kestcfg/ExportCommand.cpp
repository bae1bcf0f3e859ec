// kestcfg export [ITEM...]: the changeable settings of the items as one JSON document, which
// kestcfg apply reads.
#include "BagValues.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "ItemAccess.h"
#include "PropertyCatalogue.h"
#include "SettingsDocument.h"
#include "StatusNames.h"
#include "ValueText.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

Json ExportSettings(IuxSysExpert3* expert, const std::vector<std::wstring>& items) {
    Json settings = Json::object();
    for (const std::wstring& item : items) {
        InterfaceRef<IuxSysPropertyBag2> bag;
        const HRESULT status = CurrentProperties(expert, item, &bag);
        if (status < 0) {
            throw CommandFailure(
                status == UX_E_ITEM_NOT_FOUND ? kExitUsageError : kExitFailure,
                "cannot read the properties of " + ItemText(item) + ": " + StatusWithName(status),
                status);
        }
        Json values = Json::object();
        for (const PropertyDescription* description : AllProperties()) {
            PropertyValue value;
            if (IsSetting(*description, item == kChassisItem) &&
                ReadBagValue(bag.Get(), description->tag, &value) >= 0) {
                values[description->name] = ValueAsJson(value);
            }
        }
        settings[ItemText(item)] = std::move(values);
    }
    return {{"items", std::move(settings)}};
}

void RunExport(CommandContext& context) {
    std::vector<std::wstring> items;
    for (const std::string& argument : context.arguments) {
        items.push_back(ItemArgument(argument));
    }
    if (items.empty()) {
        items = ItemNames(context.expert);
    }
    context.document = ExportSettings(context.expert, items);
    if (!context.options.json) {
        context.out << JsonText(context.document, 2) << "\n";
    }
}

}  // namespace kest::cfg
