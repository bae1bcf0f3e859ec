#include "ItemChange.h"

#include "Interruption.h"

#include <algorithm>

#include "BagValues.h"
#include "ExitCodes.h"
#include "ItemAccess.h"
#include "PropertyCatalogue.h"
#include "PropertyText.h"
#include "StatusNames.h"
#include "ValueText.h"
#include "hostkit/HostPropertyBag.h"
#include "hostkit/HostText.h"
#include "kest/ChassisTags.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

std::optional<PropertyValue> Lookup(const std::vector<std::pair<uint32_t, PropertyValue>>& values,
                                    uint32_t tag) {
    for (const auto& [known, value] : values) {
        if (known == tag) {
            return value;
        }
    }
    return std::nullopt;
}

}  // namespace

ItemChange::ItemChange(IuxSysExpert3* expert, std::wstring item, std::ostream& err)
    : expert_(expert), item_(std::move(item)), bag_(HostPropertyBag::Create()) {
    InterfaceRef<IuxSysPropertyBag2> current;
    const HRESULT status = CurrentProperties(expert_, item_, &current);
    if (status == UX_E_ITEM_NOT_FOUND) {
        throw CommandFailure(kExitUsageError, "there is no item " + ItemText(item_), status);
    }
    if (status < 0) {
        err << "kestcfg: warning: cannot read the current properties of "
            << PrintableText(ItemText(item_)) << " (" << StatusWithName(status)
            << "); sending only the changes\n";
        return;
    }
    for (const uint32_t tag : AllTags(current.Get())) {
        PropertyValue value;
        if (ReadBagValue(current.Get(), tag, &value) >= 0) {
            const HRESULT written = WriteBagValue(bag_.Get(), tag, value);
            if (written < 0) {
                throw Failure("copying a property into the change bag failed with " +
                              StatusWithName(written));
            }
            before_.emplace_back(tag, std::move(value));
        }
    }
    bag_->ClearAllModified();
}

std::optional<PropertyValue> ItemChange::Current(uint32_t tag) const {
    return Lookup(before_, tag);
}

uint32_t ItemChange::TypeOf(uint32_t tag) const {
    if (const std::optional<PropertyValue> value = Current(tag)) {
        return TypeCodeOf(*value);
    }
    const PropertyDescription* description = FindProperty(tag);
    return description != nullptr ? description->type : 0;
}

void ItemChange::Request(uint32_t tag, const PropertyValue& value) {
    const HRESULT written = WriteBagValue(bag_.Get(), tag, value);
    if (written < 0) {
        throw Failure("storing " + TagDisplayName(tag) + " in the change bag failed with " +
                      StatusWithName(written));
    }
    requested_.emplace_back(tag, value);
}

Validation ItemChange::Validate() {
    InterfaceRef<IuxSysEnumPropertyTag> validated;
    CvqBStr message = nullptr;
    Validation result;
    result.status =
        expert_->ValidatePropertyChanges(item_.c_str(), bag_.Get(), validated.Receive(), &message);
    result.message = TakeHostString(message);
    if (result.status < 0) {
        return result;
    }
    const std::vector<uint32_t> accepted = RemainingTags(validated.Get());
    for (const auto& [tag, value] : requested_) {
        if (std::find(accepted.begin(), accepted.end(), tag) == accepted.end()) {
            result.refused.push_back(tag);
        }
    }
    return result;
}

HRESULT ItemChange::Persist(bool* restartRequired) {
    // From here the controller changes: an interruption waits until the plug-in has finished,
    // so that an interface it takes down comes up again.
    DeferInterruptions();
    int32_t restart = 0;
    const HRESULT status = expert_->PersistPropertyChanges(item_.c_str(), bag_.Get(), &restart);
    *restartRequired = restart != 0;
    return status;
}

std::vector<ChangeOutcome> ItemChange::ReadBack(bool persisted) const {
    std::vector<std::pair<uint32_t, PropertyValue>> now;
    InterfaceRef<IuxSysPropertyBag2> current;
    if (CurrentProperties(expert_, item_, &current) >= 0) {
        for (const auto& [tag, value] : requested_) {
            PropertyValue read;
            if (ReadBagValue(current.Get(), tag, &read) >= 0) {
                now.emplace_back(tag, std::move(read));
            }
        }
    }
    std::vector<ChangeOutcome> outcomes;
    for (const auto& [tag, value] : requested_) {
        ChangeOutcome outcome{tag, value, Lookup(now, tag), Outcome::kNotStored};
        const std::optional<PropertyValue> before = Current(tag);
        if (tag == kest::tag::kCurrentTime) {
            outcome.outcome = persisted ? Outcome::kNotReadBack : Outcome::kNotStored;
        } else if (outcome.now && SameValue(*outcome.now, value)) {
            outcome.outcome = Outcome::kStored;
        } else if (outcome.now && !(before && SameValue(*outcome.now, *before))) {
            outcome.outcome = Outcome::kStoredDifferently;
        }
        outcomes.push_back(std::move(outcome));
    }
    return outcomes;
}

const char* OutcomeName(Outcome outcome) {
    switch (outcome) {
        case Outcome::kStored:
            return "stored";
        case Outcome::kStoredDifferently:
            return "stored differently";
        case Outcome::kNotStored:
            return "not stored";
        default:
            return "not read back";
    }
}

size_t ReportOutcomes(const std::string& item, const std::vector<ChangeOutcome>& outcomes,
                      std::ostream* out, std::ostream& err, Json& json) {
    size_t notAsAsked = 0;
    const std::string shownItem = PrintableText(item);
    for (const ChangeOutcome& outcome : outcomes) {
        const std::string name = TagDisplayName(outcome.tag);
        const std::string asked = PrintableText(PropertyValueText(outcome.tag, outcome.requested));
        json[name] = {{"requested", ValueAsJson(outcome.requested)},
                      {"stored", outcome.now ? ValueAsJson(*outcome.now) : Json(nullptr)},
                      {"result", OutcomeName(outcome.outcome)}};
        const std::string now =
            outcome.now ? PrintableText(PropertyValueText(outcome.tag, *outcome.now)) : "";
        switch (outcome.outcome) {
            case Outcome::kStored:
            case Outcome::kNotReadBack:
                if (out != nullptr) {
                    *out << shownItem << ": " << name << " set to " << asked << "\n";
                }
                break;
            case Outcome::kStoredDifferently:
                ++notAsAsked;
                err << "kestcfg: " << shownItem << ": " << name << " was stored as " << now
                    << ", not as " << asked << "\n";
                break;
            case Outcome::kNotStored:
                ++notAsAsked;
                err << "kestcfg: " << shownItem << ": " << name << " was not stored ("
                    << (outcome.now ? "it is still " + now
                                    : std::string("the item does not report it"))
                    << "; asked for " << asked << ")\n";
                break;
        }
    }
    return notAsAsked;
}

[[noreturn]] void RefuseChange(Json& document, const std::string& item, const char* step,
                               HRESULT status, const std::string& message) {
    document["item"] = item;
    document["accepted"] = false;
    document["message"] = message.empty() ? Json(nullptr) : Json(message);
    const bool rejected = IsValueRejection(status);
    std::string text = rejected ? item + " rejected the change with " + StatusWithName(status)
                                : std::string(step) + " the change of " + item + " failed with " +
                                      StatusWithName(status);
    if (!message.empty()) {
        text += ": " + message;
    }
    throw CommandFailure(rejected ? kExitRejectedValue : kExitFailure, text, status);
}

void CheckValidation(Json& document, const ItemChange& change, const Validation& validation) {
    const std::string item = ItemText(change.Item());
    if (validation.status < 0) {
        RefuseChange(document, item, "validating", validation.status, validation.message);
    }
    if (!validation.refused.empty()) {
        std::vector<std::string> names;
        std::string list;
        for (const uint32_t tag : validation.refused) {
            names.push_back(TagDisplayName(tag));
            list += (list.empty() ? "" : ", ") + names.back();
        }
        document["item"] = item;
        document["accepted"] = false;
        document["notAccepted"] = names;
        throw CommandFailure(kExitRejectedValue, item + " does not accept changes to " + list +
                                                     "; nothing was changed");
    }
}

}  // namespace kest::cfg
