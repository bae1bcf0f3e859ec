// kestcfg sim init DIR: creates a demo controller for the other commands to work on.
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include "Commands.h"
#include "ExitCodes.h"
#include "ProgramLocation.h"
#include "hostkit/DemoController.h"
#include "hostkit/HostText.h"

namespace kest::cfg {

using namespace kest::hostkit;

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

bool Exists(const std::string& path) {
    struct stat status {};
    return stat(path.c_str(), &status) == 0;
}

// The time-zone table shipped with kestcfg: "timezone.ini" beside the program, in the installed
// data directory, else in the source tree's data directory. Throws a failure naming the places
// searched.
std::string FindTimeZoneTable() {
    std::string besideProgram = ProgramDirectory() + "timezone.ini";
    if (Exists(besideProgram)) {
        return besideProgram;
    }
    std::string installed = ProgramDirectory() + KESTCFG_DATA_DIR_FROM_PROGRAM "/timezone.ini";
    if (Exists(installed)) {
        return installed;
    }
    std::string inSources = std::string(KESTCFG_SOURCE_DATA_DIR) + "/timezone.ini";
    if (Exists(inSources)) {
        return inSources;
    }
    throw Failure("cannot find the time-zone table timezone.ini: looked for " + besideProgram +
                  ", " + installed + " and " + inSources);
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

}  // namespace kest::cfg
