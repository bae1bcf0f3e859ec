#include "ItemAccess.h"

#include <strings.h>

#include "ControllerPath.h"
#include "ExitCodes.h"
#include "StatusNames.h"
#include "hostkit/HostText.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

std::wstring ItemArgument(const std::string& text) {
    if (strcasecmp(text.c_str(), kChassisAlias) == 0) {
        return kChassisItem;
    }
    std::optional<std::wstring> item = WideFromUtf8(text);
    if (!item) {
        throw UsageError("the item name is not valid UTF-8 text");
    }
    return *item;
}

std::vector<std::wstring> ItemNames(IuxSysExpert3* expert) {
    InterfaceRef<IuxSysEnumStringList> names;
    const HRESULT status = expert->SearchForItemNames(names.Receive());
    if (status < 0 || !names) {
        throw Failure("listing the items failed with " + StatusWithName(status));
    }
    std::vector<std::wstring> result;
    for (;;) {
        CvqBStrHolder name;
        uint32_t fetched = 0;
        const HRESULT next = names->Next(1, name.Receive(), &fetched);
        if (next < 0) {
            throw Failure("reading the item names failed with " + StatusWithName(next));
        }
        if (next != S_OK || fetched != 1) {
            break;
        }
        result.emplace_back(name.Get() != nullptr ? name.Get() : L"", CvqBStrLength(name.Get()));
    }
    if (result.empty()) {
        std::string missing;
        for (const std::string& file : MissingControllerFiles()) {
            missing += (missing.empty() ? "; missing: " : ", ") + file;
        }
        throw Failure(
            "the plug-in reports no items: the chassis could not be read (is "
            "KEST_SYSROOT or --sysroot a controller made by 'kestcfg sim init'?)" +
            missing);
    }
    return result;
}

HRESULT CurrentProperties(IuxSysExpert3* expert, const std::wstring& item,
                          InterfaceRef<IuxSysPropertyBag2>* bag) {
    InterfaceRef<IuxSysPropertyBag> properties;
    const HRESULT status = expert->GetPropertiesOfItem(item.c_str(), properties.Receive());
    if (status < 0) {
        return status;
    }
    *bag = QueryInterfaceAs<IuxSysPropertyBag2>(properties.Get(), IID_IuxSysPropertyBag2);
    return *bag ? status : E_NOINTERFACE;
}

std::string ItemText(const std::wstring& item) {
    return Utf8FromWide(item.data(), item.size());
}

}  // namespace kest::cfg
