// Helpers shared by the INI engine tests: documents that destroy themselves, loading from text
// through a file, and value lookups that say whether the key was there.
#pragma once

#include <gtest/gtest.h>

#include <fstream>
#include <memory>
#include <optional>
#include <sstream>
#include <string>

#include "common/TempSysroot.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"

inline IniTextPtr NewIniText() {
    return IniTextPtr(IniText_Create());
}

inline void WriteBytes(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
}

inline std::string ReadBytes(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

// A document loaded from `bytes` with the given read flags; `result` receives the load result.
inline IniTextPtr LoadFromBytes(const kest::test::TempSysroot& dir, const std::string& bytes,
                                uint32_t readFlags = kIniDefaultReadFlags, int* result = nullptr) {
    std::string path = dir.PathOf("/loaded.ini");
    WriteBytes(path, bytes);
    IniTextPtr ini = NewIniText();
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
