#include "vq/dsc/StringBase.h"

#include "support/Exceptions.h"
#include "support/TextConversion.h"

namespace vq {
namespace dsc {
namespace detail {

void ConvertText(const wchar_t* text, std::size_t count, NarrowString& target) {
    const std::string converted = NarrowFromWide(text, count);
    target.assign(converted.data(), converted.size());
}

void ConvertText(const char* text, std::size_t count, WideString& target) {
    const std::wstring converted = WideFromNarrow(text, count);
    target.assign(converted.data(), converted.size());
}

void RaiseStringOffsetOutOfRange() {
    throw exception::OutOfRange2("String offset out of range");
}

}  // namespace detail
}  // namespace dsc
}  // namespace vq
