// The diagnostics settings an expert starts its tracer with: the trace mask, the outputs and the
// low-disk threshold from "vqsysdiag.ini", and the log directory.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

class IniFileManager;

namespace kest::expert {
struct DiagnosticsSettings {
    uint32_t severity = 1;
    uint32_t target = 1;
    uint32_t lowDiskThreshold = 0;
};

// Reads the three keys from the settings file `path` through `cache`: each from the section
// "vqsyscfg", else from "AllComponents", else its default. A missing file, a failed read or a
// value that is not a decimal number from 0 to 4294967295 counts as absent.
DiagnosticsSettings ReadDiagnosticsSettings(IniFileManager& cache, const std::string& path);

// The value of a settings text: decimal digits with an optional leading '+', blanks (spaces or
// tabs) allowed around; nothing for anything else or for a number above 4294967295.
std::optional<uint32_t> ParseDiagnosticsValue(const std::string& text);

// The log directory with a final '/': "vqsyslog" in the shared settings directory when that
// directory exists, otherwise the fallback "vqsyslog" directory.
std::string ChooseLogDirectory();

}  // namespace kest::expert
