// Paths of the controller's files as kestcfg reads them itself.
#pragma once

#include <string>
#include <vector>

namespace kest::cfg {

// `systemPath` under the sysroot KEST_SYSROOT names (the path itself without one).
std::string ControllerPath(const std::string& systemPath);

// The files the plug-in needs to read the chassis that are missing, under the sysroot.
std::vector<std::string> MissingControllerFiles();

}  // namespace kest::cfg
