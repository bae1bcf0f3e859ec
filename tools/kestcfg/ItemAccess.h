// Reaching the plug-in's items: their names and their current properties.
#pragma once

#include <string>
#include <vector>

#include "hostkit/InterfaceRef.h"
#include "uxsys/Expert.h"

namespace kest::cfg {

// The chassis item's name, and the short name users may type for it.
inline constexpr wchar_t kChassisItem[] = L"VQ KEST Chassis";
inline constexpr char kChassisAlias[] = "chassis";

// The item name a user typed, as wide text; "chassis" (in any case) names the chassis item.
// Throws a usage error for text that is not UTF-8.
std::wstring ItemArgument(const std::string& text);

// The names of all items in the plug-in's order. Throws a failure with the status, or when there
// is no item at all (the chassis item is always there unless it cannot be read).
std::vector<std::wstring> ItemNames(IuxSysExpert3* expert);

// The item's current properties (GetPropertiesOfItem) as a bag with the timestamp operations.
// Returns the plug-in's status; the bag is set only on success.
HRESULT CurrentProperties(IuxSysExpert3* expert, const std::wstring& item,
                          kest::hostkit::InterfaceRef<IuxSysPropertyBag2>* bag);

// The item name as UTF-8 for output.
std::string ItemText(const std::wstring& item);

}  // namespace kest::cfg
