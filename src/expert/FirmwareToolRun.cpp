#include "expert/FirmwareToolRun.h"

#include "support/Exceptions.h"
#include "support/ExternalApplication.h"
#include "support/TextConversion.h"
#include "support/TrustedTool.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// The argument the tool expects after the image path.
constexpr wchar_t kUpdateMode[] = L"3";

}  // namespace

bool RunFirmwareTool(const std::string& tool, const std::string& stagingPath) {
    // The tool gets an empty environment: nothing of the host's settings reaches it.
    vq::dsc::osdep::ExternalApplication application;
    application.SetEnvironment({});
    std::string trustedTool;
    try {
        trustedTool = kest::TrustedToolPath(tool);
    } catch (const vq::dsc::exception::Exception&) {
        return false;
    }
    const bool started =
        application.Start(vq::dsc::WideFromNarrow(trustedTool),
                          {vq::dsc::WideFromNarrow(stagingPath), kUpdateMode}, true);
    if (!started || !application.Wait(-1, false, true)) {
        return false;
    }
    // A negative result is the signal that ended the tool: the update did not finish.
    return application.ExitResult() == 0;
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
