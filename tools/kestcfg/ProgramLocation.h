// Where the running kestcfg lies, to find the files shipped beside it.
#pragma once

#include <string>

namespace kest::cfg {

// The directory of the running program, with a final "/". Throws a failure when it cannot be
// determined.
std::string ProgramDirectory();

}  // namespace kest::cfg
