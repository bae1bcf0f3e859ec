// kestcfg set ITEM NAME=VALUE...: builds a bag of changes as a host does (the item's current
// properties, with the new values marked modified), has the plug-in validate it, and persists it.
#include <algorithm>

#include "BagValues.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "HostPropertyBag.h"
#include "HostText.h"
#include "Interruption.h"
#include "ItemAccess.h"
#include "PropertyCatalogue.h"
#include "StatusNames.h"
#include "ValueText.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace {

struct Assignment {
    std::string word;  // the name or number as typed
    uint32_t tag;
    std::string text;  // the value as typed
};

// Splits NAME=VALUE arguments and resolves the names. Throws usage errors.
std::vector<Assignment> ParseAssignments(const std::vector<std::string>& arguments) {
    std::vector<Assignment> assignments;
    for (size_t i = 1; i < arguments.size(); ++i) {
        const std::string& argument = arguments[i];
        const size_t equals = argument.find('=');
        if (equals == std::string::npos || equals == 0) {
            throw UsageError("expected NAME=VALUE, got " + argument);
        }
        const std::string word = argument.substr(0, equals);
        const std::optional<uint32_t> tag = TagFromWord(word);
        if (!tag) {
            throw UsageError("unknown property " + word +
                             "; give a name that kestcfg get shows or a tag number");
        }
        for (const Assignment& earlier : assignments) {
            if (earlier.tag == *tag) {
                throw UsageError("property " + word + " is given twice");
            }
        }
        assignments.push_back({word, *tag, argument.substr(equals + 1)});
    }
    return assignments;
}

// Fills `changes` with the item's current properties, none marked modified, so that the plug-in
// sees the whole setting it validates. When they cannot be read the bag holds only the changes,
// which suffices for items that look at modified properties only.
void CopyCurrentProperties(CommandContext& context, const std::wstring& item,
                           IuxSysPropertyBag4* changes) {
    InterfaceRef<IuxSysPropertyBag2> current;
    const HRESULT status = CurrentProperties(context.expert, item, &current);
    if (status == UX_E_ITEM_NOT_FOUND) {
        throw Failure("there is no item " + ItemText(item) + " (" + StatusWithName(status) + ")");
    }
    if (status < 0) {
        context.err << "kestcfg: warning: cannot read the current properties of " << ItemText(item)
                    << " (" << StatusWithName(status) << "); sending only the changes\n";
        return;
    }
    for (const uint32_t tag : AllTags(current.Get())) {
        PropertyValue value;
        if (ReadBagValue(current.Get(), tag, &value) >= 0) {
            const HRESULT written = WriteBagValue(changes, tag, value);
            if (written < 0) {
                throw Failure("copying a property into the change bag failed with " +
                              StatusWithName(written));
            }
        }
    }
    changes->ClearAllModified();
}

// The type a new value of `tag` takes: the type the item already holds, else the catalogue's.
uint32_t ValueType(IuxSysPropertyBag4* changes, const Assignment& assignment) {
    uint32_t type = 0;
    if (changes->GetTagType(assignment.tag, &type) >= 0 && IsKnownTypeCode(type)) {
        return type;
    }
    if (const PropertyDescription* description = FindProperty(assignment.tag)) {
        return description->type;
    }
    throw UsageError("the type of property " + assignment.word +
                     " is unknown: the item does not report it");
}

// The exit code for a status with which the plug-in turned the change down.
ExitCode ExitCodeFor(HRESULT status) {
    return IsValueRejection(status) ? kExitRejectedValue : kExitFailure;
}

// Reports a change the plug-in turned down and ends the command.
[[noreturn]] void Refuse(CommandContext& context, const std::string& item, const char* step,
                         HRESULT status, const std::string& message) {
    if (context.json) {
        const std::string name = StatusName(status);
        context.out << "{\"item\":" << JsonQuoted(item) << ",\"accepted\":false,\"status\":"
                    << (name.empty() ? std::string("null") : JsonQuoted(name))
                    << ",\"code\":" << JsonQuoted(StatusText(status))
                    << ",\"message\":" << (message.empty() ? "null" : JsonQuoted(message)) << "}\n";
    }
    const bool rejected = IsValueRejection(status);
    std::string text = rejected ? item + " rejected the change with " + StatusWithName(status)
                                : std::string(step) + " the change of " + item + " failed with " +
                                      StatusWithName(status);
    if (!message.empty()) {
        text += ": " + message;
    }
    throw CommandFailure(ExitCodeFor(status), text);
}

// After a failed persist: ends with kExitPartlyDone, naming what was stored and what not, when the
// item now shows some of the new values but not all. A value that equalled the old one tells
// nothing and is left out. Returns when nothing or everything changed.
void RefuseIfPartlyDone(CommandContext& context, const std::wstring& item,
                        const std::vector<Assignment>& assignments,
                        const std::vector<PropertyValue>& oldValues,
                        const std::vector<PropertyValue>& values) {
    InterfaceRef<IuxSysPropertyBag2> current;
    if (CurrentProperties(context.expert, item, &current) < 0) {
        return;
    }
    std::string stored;
    std::string notStored;
    for (size_t i = 0; i < assignments.size(); ++i) {
        if (ValueAsJson(oldValues[i]) == ValueAsJson(values[i])) {
            continue;
        }
        PropertyValue now;
        const bool isNew = ReadBagValue(current.Get(), assignments[i].tag, &now) >= 0 &&
                           ValueAsJson(now) == ValueAsJson(values[i]);
        std::string& list = isNew ? stored : notStored;
        list += (list.empty() ? "" : ", ") + assignments[i].word;
    }
    if (!stored.empty() && !notStored.empty()) {
        throw CommandFailure(kExitPartlyDone, ItemText(item) + ": only some changes were stored: " +
                                                  stored + "; not stored: " + notStored);
    }
}

}  // namespace

void RunSet(CommandContext& context) {
    const std::wstring item = ItemArgument(context.arguments[0]);
    const std::string itemText = ItemText(item);
    const std::vector<Assignment> assignments = ParseAssignments(context.arguments);

    const InterfaceRef<IuxSysPropertyBag4> changes = HostPropertyBag::Create();
    CopyCurrentProperties(context, item, changes.Get());
    std::vector<PropertyValue> values;
    std::vector<PropertyValue> oldValues;
    for (const Assignment& assignment : assignments) {
        PropertyValue oldValue;
        ReadBagValue(changes.Get(), assignment.tag, &oldValue);
        oldValues.push_back(oldValue);
        const uint32_t type = ValueType(changes.Get(), assignment);
        std::optional<PropertyValue> value = ParseValue(assignment.text, type);
        if (!value) {
            throw UsageError("bad value for " + assignment.word + ": expected " +
                             AcceptedForm(type));
        }
        const HRESULT written = WriteBagValue(changes.Get(), assignment.tag, *value);
        if (written < 0) {
            throw Failure("storing " + assignment.word + " in the change bag failed with " +
                          StatusWithName(written));
        }
        values.push_back(std::move(*value));
    }

    InterfaceRef<IuxSysEnumPropertyTag> validated;
    CvqBStr rawMessage = nullptr;
    const HRESULT validation = context.expert->ValidatePropertyChanges(
        item.c_str(), changes.Get(), validated.Receive(), &rawMessage);
    const std::string message = TakeHostString(rawMessage);
    if (validation < 0) {
        Refuse(context, itemText, "validating", validation, message);
    }
    const std::vector<uint32_t> accepted = RemainingTags(validated.Get());
    std::vector<std::string> refused;
    for (const Assignment& assignment : assignments) {
        if (std::find(accepted.begin(), accepted.end(), assignment.tag) == accepted.end()) {
            refused.push_back(assignment.word);
        }
    }
    if (!refused.empty()) {
        std::string list;
        for (const std::string& word : refused) {
            list += (list.empty() ? "" : ", ") + word;
        }
        if (context.json) {
            context.out << "{\"item\":" << JsonQuoted(itemText)
                        << ",\"accepted\":false,\"notAccepted\":[";
            for (size_t i = 0; i < refused.size(); ++i) {
                context.out << (i == 0 ? "" : ",") << JsonQuoted(refused[i]);
            }
            context.out << "]}\n";
        }
        throw CommandFailure(kExitRejectedValue, itemText + " does not accept changes to " + list +
                                                     "; nothing was changed");
    }

    // From here the controller changes: an interruption waits until the plug-in has finished,
    // so that an interface it takes down comes up again.
    DeferInterruptions();
    int32_t restartRequired = 0;
    const HRESULT persisted =
        context.expert->PersistPropertyChanges(item.c_str(), changes.Get(), &restartRequired);
    if (persisted < 0) {
        RefuseIfPartlyDone(context, item, assignments, oldValues, values);
        Refuse(context, itemText, "persisting", persisted, std::string());
    }

    if (context.json) {
        context.out << "{\"item\":" << JsonQuoted(itemText) << ",\"accepted\":true,\"changed\":{";
        for (size_t i = 0; i < assignments.size(); ++i) {
            context.out << (i == 0 ? "" : ",") << JsonQuoted(TagDisplayName(assignments[i].tag))
                        << ":" << ValueAsJson(values[i]);
        }
        context.out << "},\"restartRequired\":" << (restartRequired != 0 ? "true" : "false")
                    << "}\n";
        return;
    }
    for (size_t i = 0; i < assignments.size(); ++i) {
        const PropertyDescription* description = FindProperty(assignments[i].tag);
        context.out << itemText << ": " << TagDisplayName(assignments[i].tag) << " set to "
                    << ValueForPeople(values[i], description != nullptr ? description->style
                                                                        : NumberStyle::kDecimal)
                    << "\n";
    }
    if (!message.empty()) {
        context.out << itemText << ": " << message << "\n";
    }
    if (restartRequired != 0) {
        context.out << "The change takes full effect after the controller restarts.\n";
    }
}
