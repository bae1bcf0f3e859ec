// Every row of a property bag in tag order as one text, so a whole catalogue is compared at once.
#pragma once

#include <sstream>
#include <string>

#include "com/CountedPtr.h"
#include "support/TextConversion.h"
#include "uxsys/HostString.h"
#include "uxsys/PropertyBag.h"

namespace kest::test {

// "tag=<type><value>;" per row, the tag in hexadecimal; types: b boolean, l signed, u unsigned
// (hexadecimal), s text, t timestamp (seconds).
inline std::string Listing(IuxSysPropertyBag2* bag) {
    std::ostringstream rows;
    CountedPtr<IuxSysEnumPropertyTag> tags;
    bag->GetTagEnumerator(tags.Receive());
    for (uint32_t tag = 0; tags && tags->Next(1, &tag, nullptr) == S_OK;) {
        int32_t number = 0;
        uint32_t unsignedNumber = 0;
        CvqBStrHolder text;
        uxSysAttrTimestampUTC time{};
        rows << std::hex << tag << '=' << std::dec;
        if (bag->GetBool(tag, &number) == S_OK) {
            rows << 'b' << number;
        } else if (bag->GetLong(tag, &number) == S_OK) {
            rows << 'l' << number;
        } else if (bag->GetULong(tag, &unsignedNumber) == S_OK) {
            rows << 'u' << std::hex << unsignedNumber;
        } else if (bag->GetString(tag, text.Receive()) == S_OK) {
            rows << 's' << vq::dsc::NarrowFromWide(text.Get());
        } else if (bag->GetTimestamp(tag, &time) == S_OK) {
            rows << 't' << time.seconds;
        }
        rows << ';';
    }
    return rows.str();
}

}  // namespace kest::test
