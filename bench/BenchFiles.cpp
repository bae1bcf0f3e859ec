#include "BenchFiles.h"

#include <cstdio>
#include <fstream>
#include <map>
#include <stdexcept>

#include "common/TempSysroot.h"

namespace kest::bench {
namespace {

constexpr int kKeysPerSection = 10;
constexpr size_t kLookupKeyCount = 16;

std::string SectionName(size_t section) {
    char name[32];
    std::snprintf(name, sizeof name, "Section%06zu", section);
    return name;
}

std::string KeyName(int key) {
    return "Key" + std::to_string(key);
}

// Appends one section with its comment line and keys.
void AppendSection(size_t section, std::string& text) {
    text +=
        "\n; Settings of unit " + std::to_string(section) + "\n[" + SectionName(section) + "]\n";
    for (int key = 0; key < kKeysPerSection; ++key) {
        text += KeyName(key) + " = ";
        if (key % 3 == 0) {
            text += "\"/usr/share/unit " + std::to_string(section) + "/file.dat\"\n";
        } else {
            text += std::to_string(section * 31 + static_cast<size_t>(key)) + "\n";
        }
    }
}

IniFile WriteIniFile(size_t bytes) {
    std::string text = "; Generated for the benchmarks\n";
    size_t sections = 0;
    while (text.size() < bytes) {
        AppendSection(sections++, text);
    }
    IniFile file;
    file.path = ScratchDirectory() + "/bench-" + std::to_string(bytes) + ".ini";
    std::ofstream stream(file.path, std::ios::binary | std::ios::trunc);
    stream << text;
    if (!stream.flush()) {
        throw std::runtime_error("cannot write " + file.path);
    }
    for (size_t i = 0; i < kLookupKeyCount; ++i) {
        file.lookupKeys.emplace_back(SectionName(i * sections / kLookupKeyCount),
                                     KeyName(static_cast<int>(i % kKeysPerSection)));
    }
    return file;
}

}  // namespace

const std::string& ScratchDirectory() {
    static kest::test::TempSysroot scratch;
    return scratch.Root();
}

const IniFile& IniFileOfSize(size_t bytes) {
    static std::map<size_t, IniFile> files;
    auto found = files.find(bytes);
    if (found == files.end()) {
        found = files.emplace(bytes, WriteIniFile(bytes)).first;
    }
    return found->second;
}

}  // namespace kest::bench
