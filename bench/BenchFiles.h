// Files the in-process benchmarks work on: one temporary sysroot for the whole run (the tracer's
// lock and log live there) and generated INI files of a requested size.
#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace kest::bench {

// The run's temporary sysroot directory, created on first use and removed at exit.
const std::string& ScratchDirectory();

struct IniFile {
    std::string path;
    // Section and key names that exist in the file, spread over its content.
    std::vector<std::pair<std::string, std::string>> lookupKeys;
};

// An INI file of at least `bytes` bytes, written on first use: sections of ten keys each, with
// comment lines and quoted values as configuration files have.
const IniFile& IniFileOfSize(size_t bytes);

}  // namespace kest::bench
