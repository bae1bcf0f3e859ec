#include "expert/DiagnosticsSettings.h"

#include "config/IniFileManager.h"
#include "support/PathHelpers.h"
#include "support/Sysroot.h"
#include "uxsys/StatusCodes.h"

namespace kest::expert {

namespace {

constexpr const char* kSettingsSections[] = {"vqsyscfg", "AllComponents"};

bool IsBlank(char c) {
    return c == ' ' || c == '\t';
}

// The first valid value of `key` in the settings sections, or `fallback`.
uint32_t ReadSetting(IniFileManager& cache, const std::string& path, const char* key,
                     uint32_t fallback) {
    for (const char* section : kSettingsSections) {
        std::string text;
        if (cache.GetStringFromIni(path, section, key, text) != S_OK) {
            continue;
        }
        if (const std::optional<uint32_t> value = ParseDiagnosticsValue(text)) {
            return *value;
        }
    }
    return fallback;
}

}  // namespace

std::optional<uint32_t> ParseDiagnosticsValue(const std::string& text) {
    size_t begin = 0;
    size_t end = text.size();
    while (begin < end && IsBlank(text[begin])) {
        ++begin;
    }
    while (end > begin && IsBlank(text[end - 1])) {
        --end;
    }
    if (begin < end && text[begin] == '+') {
        ++begin;
    }
    if (begin == end) {
        return std::nullopt;
    }
    uint64_t value = 0;
    for (size_t i = begin; i < end; ++i) {
        if (text[i] < '0' || text[i] > '9') {
            return std::nullopt;
        }
        value = value * 10 + static_cast<uint64_t>(text[i] - '0');
        if (value > UINT32_MAX) {
            return std::nullopt;
        }
    }
    return static_cast<uint32_t>(value);
}

DiagnosticsSettings ReadDiagnosticsSettings(IniFileManager& cache, const std::string& path) {
    DiagnosticsSettings settings;
    settings.severity = ReadSetting(cache, path, "Severity", settings.severity);
    settings.target = ReadSetting(cache, path, "Target", settings.target);
    settings.lowDiskThreshold =
        ReadSetting(cache, path, "LowDiskThreshold", settings.lowDiskThreshold);
    return settings;
}

std::string ChooseLogDirectory() {
    const std::string primary = kest::paths::PrimaryLogDirectory();
    std::string directory =
        vq::dsc::osdep::IsDirectory(primary) ? primary : kest::paths::FallbackLogDirectory();
    if (directory.empty() || directory.back() != '/') {
        directory += '/';
    }
    return directory;
}

}  // namespace kest::expert
