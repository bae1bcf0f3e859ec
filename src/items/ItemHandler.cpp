#include "items/ItemHandler.h"

#include <cwctype>
#include <utility>

#include "kest/ChassisTags.h"
#include "support/StatusHolder.h"
#include "uxsys/StatusCodes.h"

using namespace kest::items;

namespace {
// The value of the fixed unsigned row every item reports.
constexpr uint32_t kFixedValue = 0x150000;
}  // namespace

namespace kest::items {
bool EqualIgnoringCase(const std::wstring& a, const std::wstring& b) {
    if (a.size() != b.size()) {
        return false;
    }
    for (size_t i = 0; i < a.size(); ++i) {
        if (std::towupper(static_cast<wint_t>(a[i])) != std::towupper(static_cast<wint_t>(b[i]))) {
            return false;
        }
    }
    return true;
}
}  // namespace kest::items

ItemHandler::ItemHandler(std::wstring itemName, std::wstring secondName, uint32_t numericAttribute)
    : itemName_(std::move(itemName)),
      secondName_(std::move(secondName)),
      numericAttribute_(numericAttribute) {}

ItemHandler::~ItemHandler() = default;

bool ItemHandler::HasItemName(const std::wstring& name) const {
    return EqualIgnoringCase(itemName_, name);
}

HRESULT ItemHandler::GetItemProperties(IuxSysPropertyBag* bag) {
    if (bag == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = bag->SetLong(kest::tag::kItemFixedLong, 1);
    status = bag->SetString(kest::tag::kItemName, itemName_.c_str());
    status = bag->SetLong(kest::tag::kNumericAttribute, static_cast<int32_t>(numericAttribute_));
    // The second name stands in the host-name row until a handler writes the real host name.
    status = bag->SetString(kest::tag::kHostName, secondName_.c_str());
    status = bag->SetULong(kest::tag::kItemFixedULong, kFixedValue);
    return S_OK;
}

HRESULT ItemHandler::RefreshProperties(uint32_t /*count*/, const uint32_t* /*tags*/,
                                       IuxSysPropertyBag* /*bag*/) {
    return S_OK;
}

HRESULT ItemHandler::ValidatePropertyChanges(IuxSysPropertyBag* /*changes*/,
                                             PropertyTagSet& /*validated*/, CvqBStr* /*message*/) {
    return S_OK;
}

HRESULT ItemHandler::PersistPropertyChanges(
    IuxSysPropertyBag* /*changes*/, int32_t& /*persistFlag*/,
    CountedPtr<vq::targetcfg::IDeviceHandler>& /*deviceHandler*/, bool& /*adapterDisabled*/) {
    return S_OK;
}

HRESULT ItemHandler::OnDeferredPersist(
    IuxSysPropertyBag* /*changes*/, CountedPtr<vq::targetcfg::IDeviceHandler>& /*deviceHandler*/) {
    return S_OK;
}

HRESULT ItemHandler::GetImportableTags(PropertyTagSet& /*tags*/) {
    return S_OK;
}

bool ItemHandler::IsMatchingItem(IuxSysPropertyBag* /*description*/, bool& /*exactMatch*/) {
    return false;
}

bool ItemHandler::NeedsInterfaceRestart() {
    return false;
}
