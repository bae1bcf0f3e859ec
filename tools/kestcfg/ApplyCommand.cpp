// kestcfg apply FILE [--check] [--diff]: makes the controller's settings match a document that
// kestcfg export wrote. Every differing item is validated before anything is persisted; then
// only the differing properties are persisted, item by item, so that applying the same file
// again changes nothing.
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <iostream>
#include <memory>
#include <sstream>

#include "Commands.h"
#include "ConfirmableChange.h"
#include "ExitCodes.h"
#include "ItemAccess.h"
#include "ItemChange.h"
#include "PropertyCatalogue.h"
#include "PropertyText.h"
#include "SettingsDocument.h"
#include "StatusNames.h"
#include "ValueText.h"
#include "hostkit/HostText.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

struct Difference {
    uint32_t tag;
    std::optional<PropertyValue> from;
    PropertyValue to;
};

struct ItemPlan {
    std::unique_ptr<ItemChange> change;
    std::vector<Difference> differences;
};

Json ReadSettingsFile(const std::string& path) {
    std::ostringstream text;
    if (path == "-") {
        text << std::cin.rdbuf();
    } else {
        std::ifstream file(path, std::ios::binary);
        if (!file) {
            throw UsageError("cannot read the settings file " + path + ": " + std::strerror(errno));
        }
        text << file.rdbuf();
        if (file.bad()) {
            throw UsageError("cannot read the settings file " + path);
        }
    }
    try {
        return Json::parse(text.str());
    } catch (const Json::exception& error) {
        throw UsageError("the settings file " + path + " is not JSON: " + error.what());
    }
}

// The value `json` gives for `tag`, of bag type `type`; nothing when it does not fit.
std::optional<PropertyValue> ValueFromJson(uint32_t tag, uint32_t type, const Json& json) {
    if (json.is_string()) {
        return ParsePropertyValue(tag, json.get<std::string>(), type);
    }
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL:
            if (json.is_boolean()) {
                return PropertyValue(std::in_place_type<bool>, json.get<bool>());
            }
            break;
        case UX_PROPERTY_TYPE_LONG:
            if (json.is_number_integer() && json.get<int64_t>() >= INT32_MIN &&
                json.get<int64_t>() <= INT32_MAX) {
                return PropertyValue(std::in_place_type<int32_t>,
                                     static_cast<int32_t>(json.get<int64_t>()));
            }
            break;
        case UX_PROPERTY_TYPE_ULONG:
            if (json.is_number_unsigned() && json.get<uint64_t>() <= UINT32_MAX) {
                return PropertyValue(std::in_place_type<uint32_t>,
                                     static_cast<uint32_t>(json.get<uint64_t>()));
            }
            break;
        case UX_PROPERTY_TYPE_DOUBLE:
            if (json.is_number()) {
                return PropertyValue(std::in_place_type<double>, json.get<double>());
            }
            break;
        default:
            break;
    }
    return std::nullopt;
}

// Checks the document's shape and names, and works out what differs on each item. Throws one
// usage error that names every unknown item and property, or the first unusable value.
std::vector<ItemPlan> PlanChanges(CommandContext& context, const Json& document,
                                  const std::string& path) {
    if (!document.is_object() || !document.contains("items") || !document["items"].is_object()) {
        throw UsageError("the settings file " + path +
                         " holds no \"items\" object (write one with kestcfg export)");
    }
    const std::vector<std::wstring> known = ItemNames(context.expert);
    std::string unknown;
    for (const auto& [name, settings] : document["items"].items()) {
        const std::wstring item = ItemArgument(name);
        if (std::find(known.begin(), known.end(), item) == known.end()) {
            unknown += (unknown.empty() ? "" : ", ") + ("item " + name);
            continue;
        }
        if (!settings.is_object()) {
            throw UsageError("the settings of " + name + " in " + path + " are not an object");
        }
        for (const auto& [property, value] : settings.items()) {
            const PropertyDescription* description = FindPropertyByName(property);
            if (description == nullptr || !IsSetting(*description, item == kChassisItem)) {
                unknown += (unknown.empty() ? "" : ", ") + name + " property " + property;
            }
        }
    }
    if (!unknown.empty()) {
        throw UsageError("the settings file " + path +
                         " names what cannot be set (see kestcfg describe): " + unknown);
    }

    std::vector<ItemPlan> plans;
    for (const auto& [name, settings] : document["items"].items()) {
        ItemPlan plan{std::make_unique<ItemChange>(context.expert, ItemArgument(name), context.err),
                      {}};
        for (const auto& [property, json] : settings.items()) {
            const uint32_t tag = FindPropertyByName(property)->tag;
            const uint32_t type = plan.change->TypeOf(tag);
            const std::optional<PropertyValue> value = ValueFromJson(tag, type, json);
            if (!value) {
                throw UsageError("bad value for " + name + " property " + property + " in " + path +
                                 ": expected " + AcceptedPropertyForm(tag, type));
            }
            const std::optional<PropertyValue> current = plan.change->Current(tag);
            if (!current || !SameValue(*current, *value)) {
                plan.differences.push_back({tag, current, *value});
                plan.change->Request(tag, *value);
            }
        }
        if (!plan.differences.empty()) {
            plans.push_back(std::move(plan));
        }
    }
    return plans;
}

// The property whose value alone the item rejects, validated with the item's other values as
// they are; empty when only the combination is rejected.
std::string RejectedProperty(CommandContext& context, const ItemPlan& plan) {
    for (const Difference& difference : plan.differences) {
        ItemChange alone(context.expert, plan.change->Item(), context.err);
        alone.Request(difference.tag, difference.to);
        const Validation validation = alone.Validate();
        if (validation.status < 0 || !validation.refused.empty()) {
            return TagDisplayName(difference.tag);
        }
    }
    return std::string();
}

void ValidateAll(CommandContext& context, const std::vector<ItemPlan>& plans) {
    for (const ItemPlan& plan : plans) {
        const Validation validation = plan.change->Validate();
        if (validation.status >= 0 && validation.refused.empty()) {
            continue;
        }
        std::string property = RejectedProperty(context, plan);
        if (property.empty()) {
            for (const Difference& difference : plan.differences) {
                property += (property.empty() ? "" : "+") + TagDisplayName(difference.tag);
            }
        }
        context.document["rejected"] = {{"item", ItemText(plan.change->Item())},
                                        {"property", property}};
        try {
            CheckValidation(context.document, *plan.change, validation);
        } catch (const CommandFailure& failure) {
            throw CommandFailure(
                failure.Code(),
                std::string(failure.what()) + " (property " + property + "); nothing was persisted",
                failure.Status());
        }
    }
}

void ShowDifferences(CommandContext& context, const std::vector<ItemPlan>& plans, bool show) {
    Json differences = Json::array();
    for (const ItemPlan& plan : plans) {
        const std::string item = ItemText(plan.change->Item());
        for (const Difference& difference : plan.differences) {
            const std::string name = TagDisplayName(difference.tag);
            differences.push_back(
                {{"item", item},
                 {"property", name},
                 {"from", difference.from ? ValueAsJson(*difference.from) : Json(nullptr)},
                 {"to", ValueAsJson(difference.to)}});
            if (show && !context.options.json) {
                context.out << PrintableText(item) << ": " << name << ": "
                            << (difference.from ? PrintableText(PropertyValueText(difference.tag,
                                                                                  *difference.from))
                                                : std::string("(none)"))
                            << " -> "
                            << PrintableText(PropertyValueText(difference.tag, difference.to))
                            << "\n";
            }
        }
    }
    context.document["differences"] = std::move(differences);
}

}  // namespace

void RunApply(CommandContext& context) {
    const std::string& path = context.arguments[0];
    ApplySettings(context, ReadSettingsFile(path), path);
}

void ApplySettings(CommandContext& context, const Json& desired, const std::string& path) {
    const std::vector<ItemPlan> plans = PlanChanges(context, desired, path);
    context.document["check"] = context.options.check;
    ShowDifferences(context, plans, context.options.check || context.options.diff);
    if (plans.empty()) {
        if (!context.options.json) {
            context.out << "The controller's settings already match " << PrintableText(path)
                        << ".\n";
        }
        return;
    }
    ValidateAll(context, plans);
    if (context.options.check) {
        if (!context.options.json) {
            context.out << "All changes are valid; nothing was changed (--check).\n";
        }
        return;
    }

    std::vector<ItemRequest> requests;
    for (const ItemPlan& plan : plans) {
        ItemRequest& request = requests.emplace_back(ItemRequest{plan.change->Item(), {}});
        for (const Difference& difference : plan.differences) {
            request.values.emplace_back(difference.tag, difference.to);
        }
    }
    const ConfirmWatch watch = PrepareConfirmableChange(context, requests);
    Json& applied = context.document["applied"] = Json::object();
    bool restartRequired = false;
    size_t stored = 0;
    for (size_t i = 0; i < plans.size(); ++i) {
        ItemChange& change = *plans[i].change;
        const std::string item = ItemText(change.Item());
        bool restart = false;
        const HRESULT persisted = change.Persist(&restart);
        restartRequired = restartRequired || restart;
        const std::vector<ChangeOutcome> outcomes = change.ReadBack(persisted >= 0);
        const size_t notAsAsked =
            ReportOutcomes(item, outcomes, context.options.json ? nullptr : &context.out,
                           context.err, applied[item]);
        stored += outcomes.size() - notAsAsked;
        if (persisted < 0 || notAsAsked != 0) {
            std::string notApplied;
            for (size_t j = i + 1; j < plans.size(); ++j) {
                notApplied += (notApplied.empty() ? "" : ", ") + ItemText(plans[j].change->Item());
            }
            context.document["restartRequired"] = restartRequired;
            const std::string reason =
                persisted < 0
                    ? "persisting the settings of " + item + " failed with " +
                          StatusWithName(persisted)
                    : "the controller did not store every setting of " + item + " as asked";
            throw CommandFailure(
                stored == 0 ? kExitFailure : kExitPartlyDone,
                reason + (notApplied.empty() ? "" : "; not applied: " + notApplied),
                persisted < 0 ? std::optional<HRESULT>(persisted) : std::nullopt);
        }
    }
    context.document["restartRequired"] = restartRequired;
    if (restartRequired && !context.options.json) {
        context.out << "The change takes full effect after the controller restarts.\n";
    }
}

}  // namespace kest::cfg
