// A private sysroot for one test: a fresh directory under /tmp that KEST_SYSROOT names for the
// object's lifetime. The previous value of KEST_SYSROOT is restored and the tree removed when
// the object goes away. Paths given to the helpers are system paths such as "/etc/adjtime";
// they are placed under the sysroot.
//
//     kest::test::TempSysroot sysroot;
//     sysroot.WriteFile("/etc/korvane/version", "1.2.3\n");
//     sysroot.WriteScript("/sbin/hwclock", "echo \"$@\" > '" + sysroot.PathOf("/hwclock.args") +
//     "'\n");
//     ... code under test ...
//     EXPECT_EQ(sysroot.ReadFile("/hwclock.args"), "--systohc\n");
#pragma once

#include <ftw.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

namespace kest::test {

class TempSysroot {
  public:
    TempSysroot() {
        char pathTemplate[] = "/tmp/kest-sysroot-XXXXXX";
        if (mkdtemp(pathTemplate) == nullptr) {
            throw std::runtime_error("cannot create a temporary sysroot");
        }
        root_ = pathTemplate;
        const char* previous = getenv("KEST_SYSROOT");
        hadPrevious_ = previous != nullptr;
        if (hadPrevious_) {
            previous_ = previous;
        }
        setenv("KEST_SYSROOT", root_.c_str(), 1);
    }

    ~TempSysroot() {
        if (hadPrevious_) {
            setenv("KEST_SYSROOT", previous_.c_str(), 1);
        } else {
            unsetenv("KEST_SYSROOT");
        }
        // Depth first and without following links, so nothing outside the tree is touched.
        nftw(root_.c_str(), &RemoveEntry, 16, FTW_DEPTH | FTW_PHYS);
    }

    TempSysroot(const TempSysroot&) = delete;
    TempSysroot& operator=(const TempSysroot&) = delete;

    // The sysroot directory itself (no final slash).
    const std::string& Root() const { return root_; }

    // The place of `systemPath` (absolute, e.g. "/etc/adjtime") inside the sysroot.
    std::string PathOf(const std::string& systemPath) const { return root_ + systemPath; }

    // Creates the directory `systemPath` and its parents inside the sysroot.
    void MakeDirectory(const std::string& systemPath) const {
        const std::string path = PathOf(systemPath);
        for (size_t slash = root_.size() + 1; slash != std::string::npos;) {
            slash = path.find('/', slash + 1);
            mkdir(path.substr(0, slash).c_str(), 0755);
        }
    }

    // Writes `content` to `systemPath` inside the sysroot, creating parent directories.
    void WriteFile(const std::string& systemPath, const std::string& content) const {
        MakeDirectory(systemPath.substr(0, systemPath.rfind('/')));
        std::ofstream file(PathOf(systemPath), std::ios::binary | std::ios::trunc);
        file << content;
        if (!file.flush()) {
            throw std::runtime_error("cannot write " + PathOf(systemPath));
        }
    }

    // Writes an executable shell script with the given body (a "#!/bin/sh" line is prepended).
    void WriteScript(const std::string& systemPath, const std::string& body) const {
        WriteFile(systemPath, "#!/bin/sh\n" + body);
        chmod(PathOf(systemPath).c_str(), 0755);
    }

    // The content of `systemPath` inside the sysroot; empty when it cannot be read.
    std::string ReadFile(const std::string& systemPath) const {
        std::ifstream file(PathOf(systemPath), std::ios::binary);
        std::ostringstream content;
        content << file.rdbuf();
        return content.str();
    }

    // True when something exists at `systemPath` inside the sysroot.
    bool Exists(const std::string& systemPath) const {
        return access(PathOf(systemPath).c_str(), F_OK) == 0;
    }

  private:
    static int RemoveEntry(const char* path, const struct stat*, int, struct FTW*) {
        remove(path);
        return 0;
    }

    std::string root_;
    std::string previous_;
    bool hadPrevious_ = false;
};

}  // namespace kest::test
