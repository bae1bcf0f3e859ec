// The plug-in's dynamic symbol table defines the factory and nothing else.
#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

namespace kest::test::e2e {

namespace {

struct PipeCloser {
    void operator()(FILE* pipe) const { pclose(pipe); }
};

// Lines of `nm -D --defined-only` for the plug-in: "ADDRESS TYPE NAME".
std::vector<std::string> DefinedDynamicSymbols() {
    const std::string command = std::string("nm -D --defined-only '") + KEST_PLUGIN_PATH + "'";
    std::unique_ptr<FILE, PipeCloser> pipe(popen(command.c_str(), "r"));
    EXPECT_NE(nullptr, pipe) << command;
    std::vector<std::string> lines;
    if (pipe == nullptr) {
        return lines;
    }
    char buffer[512];
    while (std::fgets(buffer, sizeof buffer, pipe.get()) != nullptr) {
        std::string line(buffer);
        if (!line.empty() && line.back() == '\n') {
            line.pop_back();
        }
        lines.push_back(line);
    }
    return lines;
}

TEST(ExportedSymbolsTest, OnlyTheFactoryIsDefined) {
    const std::vector<std::string> lines = DefinedDynamicSymbols();
    ASSERT_EQ(1u, lines.size()) << testing::PrintToString(lines);
    std::istringstream fields(lines[0]);
    std::string address, type, name;
    fields >> address >> type >> name;
    EXPECT_EQ("T", type);
    EXPECT_EQ("createKestSysApiChassisExpert", name);
}

}  // namespace

}  // namespace kest::test::e2e
