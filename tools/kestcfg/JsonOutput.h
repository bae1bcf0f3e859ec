// The JSON documents kestcfg writes and reads: members keep the order in which they are added.
#pragma once

#include <nlohmann/json.hpp>
#include <string>

namespace kest::cfg {

using Json = nlohmann::ordered_json;

// The document as text without a final newline; on one line unless `indent` is not negative.
// Text that is not valid UTF-8 is written with U+FFFD in place of the bad bytes.
inline std::string JsonText(const Json& document, int indent = -1) {
    return document.dump(indent, ' ', false, Json::error_handler_t::replace);
}

}  // namespace kest::cfg
