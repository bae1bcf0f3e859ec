#include "expert/FirmwareToolRun.h"

#include <unistd.h>

#include "support/ExternalApplication.h"
#include "support/TextConversion.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// The argument the tool expects after the image path.
constexpr wchar_t kUpdateMode[] = L"3";

// A child process that gives the program an empty environment: nothing of the host's settings
// reaches the tool.
class EmptyEnvironmentApplication : public vq::dsc::osdep::ExternalApplication {
  public:
    EmptyEnvironmentApplication() : ExternalApplication(LaunchMode::Fork) {}

  protected:
    // Runs in the child only, between fork and exec: assigning one pointer is all it does.
    void PrepareChild() override {
        static char* emptyEnvironment[] = {nullptr};
        environ = emptyEnvironment;
    }
};

}  // namespace

bool RunFirmwareTool(const std::string& tool, const std::string& stagingPath) {
    EmptyEnvironmentApplication application;
    const bool started = application.Start(
        vq::dsc::WideFromNarrow(tool), {vq::dsc::WideFromNarrow(stagingPath), kUpdateMode}, true);
    if (!started || !application.Wait(-1, false, true)) {
        return false;
    }
    // A negative result is the signal that ended the tool: the update did not finish.
    return application.ExitResult() == 0;
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
