// Locale codes and the language names the controller stores for them.
#pragma once

#include <string>

#include "ControllerState.h"

namespace kest::sim {

// The language name for `localeCode` (compared exactly): first the entries "Name = code" of the
// optional [Languages] section in file order, then English en, German de, French fr, Chinese zh,
// Korean kr, Japanese ja. Empty when the code is empty or unknown.
std::string LanguageNameForCode(const ControllerState& state, const std::string& localeCode);

}  // namespace kest::sim
