// Which system tools the plug-in may start. Under a sysroot the tools are ordinary files of a
// private tree, and a tool that someone else could have replaced must not run as root.
#pragma once

#include <string>

namespace kest {

// The path to start for the tool at `path`. Under a sysroot the symbolic links are resolved and
// the tool and its directory must be owned by root or the effective user and writable by
// neither group nor others; otherwise vq::dsc::osdep::PosixError (EPERM, or the error of a
// missing path) is raised. Without a sysroot `path` is returned as it is.
std::string TrustedToolPath(const std::string& path);

}  // namespace kest
