// kestcfg sim init DIR: creates a demo controller for the other commands to work on.
#include <limits.h>
#include <unistd.h>

#include "Commands.h"
#include "DemoController.h"
#include "ExitCodes.h"
#include "HostText.h"

namespace {

// `directory` as an absolute path without resolving links; the scripts of the demo controller
// name their files by it.
std::string AbsoluteDirectory(const std::string& directory) {
    std::string path = directory;
    if (path.front() != '/') {
        char current[PATH_MAX];
        if (getcwd(current, sizeof current) == nullptr) {
            throw Failure("cannot determine the current directory");
        }
        path = std::string(current) + "/" + path;
    }
    while (path.size() > 1 && path.back() == '/') {
        path.pop_back();
    }
    return path;
}

}  // namespace

void RunSim(CommandContext& context) {
    const std::string root = AbsoluteDirectory(context.arguments[0]);
    const std::vector<std::string> files = CreateDemoController(root, FindTimeZoneTable());
    context.document = {{"sysroot", root}, {"files", files}};
    if (context.options.json) {
        return;
    }
    context.out << "Created a demo controller in " << PrintableText(root) << ":\n";
    for (const std::string& file : files) {
        context.out << "  " << PrintableText(file) << "\n";
    }
    context.out << "Use it with: kestcfg --sysroot " << PrintableText(root) << " items\n"
                << "         or: export KEST_SYSROOT=" << PrintableText(root) << "\n";
}
