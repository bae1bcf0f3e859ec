// A demo controller on disk: the files the simulated controller library, the plug-in and their
// external tools find under a sysroot, describing a chassis with one Ethernet adapter.
#pragma once

#include <string>
#include <vector>

// The time-zone table shipped with kestcfg: "timezone.ini" beside the program, in the installed
// data directory, else in the source tree's data directory. Throws a failure naming the places
// searched.
std::string FindTimeZoneTable();

// Creates the demo controller under `root`, creating the directory (mode 0700) when missing,
// and returns the system paths of the files written. Throws a failure when `root` is not a new
// directory or an empty one of the caller that neither group nor others may write, or when a
// file cannot be written. `root` must be absolute.
std::vector<std::string> CreateDemoController(const std::string& root,
                                              const std::string& timeZoneTable);
