#include "property/PropertyTagEnumerator.h"

#include <utility>

CuxSysEnumPropertyTagsSTL::CuxSysEnumPropertyTagsSTL(PropertyTagList ascendingTags)
    : PropertyTagEnumeratorBase(nullptr, &tags_, {}), tags_(std::move(ascendingTags)) {
    Reset();
}

CuxSysEnumPropertyTagsSTL::CuxSysEnumPropertyTagsSTL(const std::set<uint32_t>& tags)
    : PropertyTagEnumeratorBase(nullptr, &tags_, {}), tags_(tags.begin(), tags.end()) {
    Reset();
}

namespace kest::property {
CountedPtr<IuxSysEnumPropertyTag> CreatePropertyTagEnumerator(PropertyTagList ascendingTags) {
    return CreateCountedComObject<CuxSysEnumPropertyTagsSTL>(std::move(ascendingTags));
}

CountedPtr<IuxSysEnumPropertyTag> CreatePropertyTagEnumerator(const std::set<uint32_t>& tags) {
    return CreateCountedComObject<CuxSysEnumPropertyTagsSTL>(tags);
}

}  // namespace kest::property
