// The enumerator over property tags that the bag and the expert hand to the host: it owns an
// ascending list of tags, and its clones share that list.
// Thread safety: as every enumerator, one thread at a time; its clones may serve other threads.
#pragma once

#include <cstdint>
#include <set>
#include <vector>

#include "com/CountedPtr.h"
#include "property/EnumOnSTL.h"
#include "uxsys/Enumerators.h"

using PropertyTagList = std::vector<uint32_t>;

using PropertyTagEnumeratorBase = CVQComEnumOnSTL<IuxSysEnumPropertyTag, &IID_IuxSysEnumPropertyTag,
                                                  uint32_t, PropertyTagList, PropertyTagCopy>;

// A tag enumerator that owns its tags, positioned at the first one.
class CuxSysEnumPropertyTagsSTL : public PropertyTagEnumeratorBase {
  public:
    // Takes over `ascendingTags`, which must be in ascending order without repeats.
    explicit CuxSysEnumPropertyTagsSTL(PropertyTagList ascendingTags);
    // Copies the tags of `tags`.
    explicit CuxSysEnumPropertyTagsSTL(const std::set<uint32_t>& tags);

  private:
    PropertyTagList tags_;
};

namespace kest::property {
// A new tag enumerator with one reference, owning `ascendingTags` (ascending, no repeats).
// A failed allocation is thrown as the status E_OUTOFMEMORY (a long).
CountedPtr<IuxSysEnumPropertyTag> CreatePropertyTagEnumerator(PropertyTagList ascendingTags);
// A new tag enumerator with one reference over a copy of `tags`; failures as above.
CountedPtr<IuxSysEnumPropertyTag> CreatePropertyTagEnumerator(const std::set<uint32_t>& tags);
}  // namespace kest::property
