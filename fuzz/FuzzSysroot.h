// A private sysroot for fuzz targets that reach fixed system paths: a fresh directory under /tmp
// that KEST_SYSROOT names for the rest of the process, removed when the process exits normally.
#pragma once

#include <ftw.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <cstdio>
#include <string>

namespace kest::fuzz {

inline std::string& Root() {
    static std::string root;
    return root;
}

inline int RemoveEntry(const char* path, const struct stat*, int, struct FTW*) {
    std::remove(path);
    return 0;
}

inline void RemoveTree() {
    nftw(Root().c_str(), &RemoveEntry, 16, FTW_DEPTH | FTW_PHYS);
}

// Creates the sysroot and points KEST_SYSROOT at it; aborts when that is impossible.
inline void Create() {
    char pathTemplate[] = "/tmp/kest-fuzz-XXXXXX";
    if (mkdtemp(pathTemplate) == nullptr) {
        std::abort();
    }
    Root() = pathTemplate;
    setenv("KEST_SYSROOT", pathTemplate, 1);
    std::atexit(RemoveTree);
}

// Writes `content` to `systemPath` (absolute, such as "/etc/korvane/version") inside the
// sysroot, creating its directories.
inline void WriteFile(const std::string& systemPath, const std::string& content) {
    const std::string path = Root() + systemPath;
    for (size_t slash = path.find('/', Root().size() + 1); slash != std::string::npos;
         slash = path.find('/', slash + 1)) {
        mkdir(path.substr(0, slash).c_str(), 0755);
    }
    FILE* file = std::fopen(path.c_str(), "wb");
    if (file == nullptr || std::fwrite(content.data(), 1, content.size(), file) != content.size()) {
        std::abort();
    }
    std::fclose(file);
}

}  // namespace kest::fuzz
