// Helpers shared by the INI tests: loading a document from bytes and reading values back.
#pragma once

#include <gtest/gtest.h>

#include <fstream>
#include <optional>
#include <sstream>
#include <string>

#include "common/TempSysroot.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"

namespace kest::test::config {

inline void WriteBytes(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
}

inline std::string ReadBytes(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

// A document loaded from `bytes`; `result` receives the load result.
inline IniTextPtr LoadFromBytes(const kest::test::TempSysroot& dir, const std::string& bytes,
                                uint32_t readFlags = kIniDefaultReadFlags, int* result = nullptr) {
    std::string path = dir.PathOf("/loaded.ini");
    WriteBytes(path, bytes);
    IniTextPtr ini(IniText_Create());
    IniText_SetReadOptions(ini.get(), readFlags);
    int loaded = IniText_Load(ini.get(), path.c_str());
    if (result != nullptr) {
        *result = loaded;
    }
    return ini;
}

// The stored value, or nothing when the key is not found.
inline std::optional<std::string> ValueOf(const IniText* ini, const char* section,
                                          const char* key) {
    const char* value = nullptr;
    if (IniText_GetString(ini, section, key, &value) != kIniFound) {
        return std::nullopt;
    }
    return std::string(value);
}

// Sections and keys in order, as "[s] k=v k2=v2 [t] ..."; a section found by name.
inline std::string Dump(const IniText* ini) {
    std::string text;
    const char* section = nullptr;
    for (int s = 1; IniText_GetSectionName(ini, s, &section) == kIniFound; ++s) {
        text += (s > 1 ? " [" : "[") + std::string(section) + "]";
        const char* key = nullptr;
        const char* value = nullptr;
        for (int k = 1; IniText_GetKeyByIndex(ini, section, k, &key, &value) == kIniFound; ++k) {
            text += " " + std::string(key) + "=" + value;
        }
    }
    return text;
}

// What IniText_Save writes for `ini` under the given write options.
inline std::string SavedText(const kest::test::TempSysroot& dir, IniText* ini, uint32_t flags = 0,
                             int maxLineLength = kIniNoMaxLineLength, int split = 0) {
    std::string path = dir.PathOf("/saved.ini");
    IniText_SetWriteOptions(ini, maxLineLength, split, flags);
    EXPECT_EQ(IniText_Save(ini, path.c_str()), 0);
    return ReadBytes(path);
}

}  // namespace kest::test::config
