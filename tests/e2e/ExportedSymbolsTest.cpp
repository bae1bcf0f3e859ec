// The plug-in's dynamic symbol table defines the factory and nothing else.
#include <gtest/gtest.h>

#include <cstdio>
#include <regex>
#include <string>

namespace kest::test::e2e {
namespace {

TEST(ExportedSymbolsTest, OnlyTheFactoryIsDefined) {
    const std::string command = std::string("nm -D --defined-only '") + KEST_PLUGIN_PATH + "'";
    FILE* pipe = popen(command.c_str(), "r");
    ASSERT_NE(nullptr, pipe) << command;
    std::string lines;
    char buffer[512];
    while (std::fgets(buffer, sizeof buffer, pipe) != nullptr) {
        lines += buffer;
    }
    pclose(pipe);
    EXPECT_TRUE(std::regex_match(lines, std::regex("[0-9a-f]+ T createKestSysApiChassisExpert\n")))
        << lines;
}

}  // namespace
}  // namespace kest::test::e2e
