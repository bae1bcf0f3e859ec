// One item's change as a configuration host makes it: a bag with the item's current properties
// and the new values marked modified, validated and persisted by the plug-in, and afterwards
// read back to tell what the controller stored.
#pragma once

#include <cstdint>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "JsonOutput.h"
#include "hostkit/InterfaceRef.h"
#include "hostkit/PropertyValue.h"
#include "uxsys/Expert.h"

namespace kest::cfg {

// What became of one requested value, judged by reading the item afterwards.
enum class Outcome {
    kStored,             // the item reports the value asked for
    kStoredDifferently,  // it reports another value than before and than asked for
    kNotStored,          // it reports the value it had before, or none
    kNotReadBack,        // a value the item does not report back (the clock)
};

struct ChangeOutcome {
    uint32_t tag;
    kest::hostkit::PropertyValue requested;
    std::optional<kest::hostkit::PropertyValue> now;  // what the item reports afterwards
    Outcome outcome;
};

// The result of the plug-in's validation.
struct Validation {
    HRESULT status;
    std::string message;            // the plug-in's message, empty when it gave none
    std::vector<uint32_t> refused;  // requested tags the plug-in did not accept
};

class ItemChange {
  public:
    // Reads the item's current properties into the change bag. Throws a usage error naming the
    // item when the plug-in does not know it; warns on `err` and sends only the changes when its
    // properties cannot be read.
    ItemChange(IuxSysExpert3* expert, std::wstring item, std::ostream& err);

    const std::wstring& Item() const { return item_; }

    // The item's current value of `tag`, when it reports one.
    std::optional<kest::hostkit::PropertyValue> Current(uint32_t tag) const;

    // The type a new value of `tag` takes: the type the item holds, else the catalogue's; zero
    // when neither knows it.
    uint32_t TypeOf(uint32_t tag) const;

    // Adds a requested value. Throws a failure when the bag refuses it.
    void Request(uint32_t tag, const kest::hostkit::PropertyValue& value);

    bool Empty() const { return requested_.empty(); }

    // Has the plug-in validate the requested values.
    Validation Validate();

    // Has the plug-in persist them; returns its status and sets `restartRequired`.
    HRESULT Persist(bool* restartRequired);

    // Reads the item afresh and judges each requested value. `persisted` says whether the
    // persist succeeded, which decides for values that cannot be read back.
    std::vector<ChangeOutcome> ReadBack(bool persisted) const;

  private:
    IuxSysExpert3* expert_;
    std::wstring item_;
    kest::hostkit::InterfaceRef<IuxSysPropertyBag4> bag_;
    std::vector<std::pair<uint32_t, kest::hostkit::PropertyValue>>
        before_;  // the item's values at the start
    std::vector<std::pair<uint32_t, kest::hostkit::PropertyValue>> requested_;
};

// "stored", "stored differently", "not stored" or "not read back".
const char* OutcomeName(Outcome outcome);

// Prints the outcomes of one item's change: stored values on `out` ("ITEM: NAME set to VALUE"),
// the others on `err`, and adds them to `json` as NAME: {requested, stored, result}. Returns the
// number of values not stored as asked.
size_t ReportOutcomes(const std::string& item, const std::vector<ChangeOutcome>& outcomes,
                      std::ostream* out, std::ostream& err, Json& json);

// Reports a change the plug-in refused at `step` ("validating", "persisting") in the document
// and ends the command: exit status 1 for a rejected value, else 3.
[[noreturn]] void RefuseChange(Json& document, const std::string& item, const char* step,
                               HRESULT status, const std::string& message);

// Ends the command like RefuseChange when the validation failed or left a requested value
// unaccepted (exit status 1).
void CheckValidation(Json& document, const ItemChange& change, const Validation& validation);

}  // namespace kest::cfg
