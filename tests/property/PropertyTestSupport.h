// Helpers shared by the property-model tests.
#pragma once

#include <cstdint>
#include <vector>

#include "uxsys/Enumerators.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::property {

// The tags an enumerator yields from its position to the end (none for a null enumerator).
inline std::vector<uint32_t> DrainTags(IuxSysEnumPropertyTag* tags) {
    std::vector<uint32_t> drained;
    uint32_t tag = 0;
    while (tags != nullptr && tags->Next(1, &tag, nullptr) == S_OK) {
        drained.push_back(tag);
    }
    return drained;
}

}  // namespace kest::test::property
