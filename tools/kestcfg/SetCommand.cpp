// kestcfg set ITEM NAME=VALUE...: builds a bag of changes as a host does (the item's current
// properties, with the new values marked modified), has the plug-in validate and persist it, and
// reads the item back to report what the controller stored.
#include "Commands.h"
#include "ConfirmableChange.h"
#include "ExitCodes.h"
#include "Interruption.h"
#include "ItemAccess.h"
#include "ItemChange.h"
#include "PropertyCatalogue.h"
#include "PropertyText.h"
#include "StatusNames.h"
#include "hostkit/HostText.h"

namespace kest::cfg {

using namespace kest::hostkit;

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
                             "; give a name that kestcfg describe shows or a tag number");
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

}  // namespace

void RunSet(CommandContext& context) {
    const std::vector<Assignment> assignments = ParseAssignments(context.arguments);
    ItemChange change(context.expert, ItemArgument(context.arguments[0]), context.err);
    const std::string item = ItemText(change.Item());
    ItemRequest request{change.Item(), {}};
    for (const Assignment& assignment : assignments) {
        const uint32_t type = change.TypeOf(assignment.tag);
        if (type == 0) {
            throw UsageError("the type of property " + assignment.word +
                             " is unknown: the item does not report it");
        }
        const std::optional<PropertyValue> value =
            ParsePropertyValue(assignment.tag, assignment.text, type);
        if (!value) {
            throw UsageError("bad value for " + assignment.word + ": expected " +
                             AcceptedPropertyForm(assignment.tag, type));
        }
        change.Request(assignment.tag, *value);
        request.values.emplace_back(assignment.tag, *value);
    }

    const Validation validation = change.Validate();
    CheckValidation(context.document, change, validation);
    const ConfirmWatch watch = PrepareConfirmableChange(context, {request});
    bool restartRequired = false;
    const HRESULT persisted = change.Persist(&restartRequired);
    const std::vector<ChangeOutcome> outcomes = change.ReadBack(persisted >= 0);

    context.document["item"] = item;
    context.document["accepted"] = true;
    Json& changes = context.document["changes"] = Json::object();
    const size_t notAsAsked = ReportOutcomes(
        item, outcomes, context.options.json ? nullptr : &context.out, context.err, changes);
    context.document["restartRequired"] = restartRequired;
    if (persisted < 0) {
        if (notAsAsked == outcomes.size()) {
            RefuseChange(context.document, item, "persisting", persisted, std::string());
        }
        throw CommandFailure(kExitPartlyDone,
                             "persisting the change of " + item + " failed part-way with " +
                                 StatusWithName(persisted) + ": not every change was stored",
                             persisted);
    }
    if (notAsAsked != 0) {
        throw CommandFailure(kExitPartlyDone, "the controller did not store every change as asked");
    }
    if (context.options.json) {
        return;
    }
    if (!validation.message.empty()) {
        context.out << PrintableText(item) << ": " << PrintableText(validation.message) << "\n";
    }
    if (restartRequired) {
        context.out << "The change takes full effect after the controller restarts.\n";
    }
}

}  // namespace kest::cfg
