// The character-type locale kestcfg and the plug-in convert text with.
#pragma once

namespace kest::cfg {

// Sets LC_CTYPE (only: numbers and times keep the C conventions) from the environment; when the
// environment names no UTF-8 locale, a UTF-8 locale is used instead, so that text the user types
// is converted, not replaced by "?".
void UseTextLocale();

}  // namespace kest::cfg
