// Conversions of stored INI values: integers, booleans and floating-point numbers with their
// exact error results, and the backslash escapes of escaped strings.
// Thread safety: keeps no state; may run concurrently.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace kest::ini {

// Each returns 1 and the value, 0 for an empty or blank text, or the engine failure of its type.
int ParseUInt32(std::string_view text, uint32_t* value);
int ParseInt32(std::string_view text, int32_t* value);
int ParseBoolean(std::string_view text, bool* value);
int ParseDouble(const std::string& text, double* value);

// Replaces `out` with `text` whose backslash escapes are decoded.
void DecodeEscapes(std::string_view text, std::string& out);
// `text` with backslash, double quote and control characters written as escapes.
std::string EncodeEscapes(std::string_view text);

}  // namespace kest::ini
