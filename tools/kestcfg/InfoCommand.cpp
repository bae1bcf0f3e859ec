// kestcfg info: the expert's class identifier, display name, version and programmatic name.
#include "Commands.h"
#include "ExitCodes.h"
#include "StatusNames.h"
#include "hostkit/HostText.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

// Throws a failure naming the operation when `status` is negative.
void CheckStatus(HRESULT status, const char* operation) {
    if (status < 0) {
        throw Failure(std::string(operation) + " failed with " + StatusWithName(status));
    }
}

// A string answer of the expert's identity operations.
template <class Operation>
std::string IdentityString(IuxSysExpert3* expert, Operation operation, const char* name) {
    CvqBStr text = nullptr;
    const HRESULT status = (expert->*operation)(&text);
    std::string result = TakeHostString(text);
    CheckStatus(status, name);
    return result;
}

}  // namespace

void RunInfo(CommandContext& context) {
    GUID classId{};
    CheckStatus(context.expert->GetExpertClassId(&classId), "GetExpertClassId");
    const std::string displayName = IdentityString(
        context.expert, &IuxSysExpert3::GetExpertDisplayName, "GetExpertDisplayName");
    const std::string version =
        IdentityString(context.expert, &IuxSysExpert3::GetExpertVersion, "GetExpertVersion");
    const std::string programmaticName = IdentityString(
        context.expert, &IuxSysExpert3::GetExpertProgrammaticName, "GetExpertProgrammaticName");

    if (context.options.json) {
        context.document = {{"classId", GuidText(classId)},
                            {"displayName", displayName},
                            {"version", version},
                            {"programmaticName", programmaticName}};
        return;
    }
    context.out << "Class identifier:  " << GuidText(classId) << "\n"
                << "Display name:      " << PrintableText(displayName) << "\n"
                << "Version:           " << PrintableText(version) << "\n"
                << "Programmatic name: " << PrintableText(programmaticName) << "\n";
}

}  // namespace kest::cfg
