// Turning the plug-in's answers into printable text: host strings to UTF-8, identifiers to their
// registry form, statuses to hexadecimal, and text made safe for a terminal.
#pragma once

#include <optional>
#include <string>

#include "uxsys/Types.h"

namespace kest::hostkit {

// UTF-8 text of `count` wide characters; characters outside Unicode become U+FFFD.
std::string Utf8FromWide(const wchar_t* text, size_t count);

// Wide text of UTF-8 `text`; nothing when it is not valid UTF-8 or holds a zero character.
std::optional<std::wstring> WideFromUtf8(const std::string& text);

// Takes ownership of a host string from the plug-in, frees it, and returns it as UTF-8.
std::string TakeHostString(CvqBStr str);

// Takes ownership of a host string from the plug-in, frees it, and returns its wide text (empty
// for a null string).
std::wstring TakeWideHostString(CvqBStr str);

// Lower-case registry form, for example "999d9aa4-5475-4ca7-a560-93c51b5bfceb".
std::string GuidText(const GUID& guid);

// "0x" and eight upper-case hexadecimal digits.
std::string StatusText(HRESULT status);

// `text` with its control characters (C0, DEL and the UTF-8 encoded C1 range) written as
// escapes (\n, \t, \r, \xNN, \u00NN), so that a value cannot steer the terminal.
std::string PrintableText(const std::string& text);

}  // namespace kest::hostkit
