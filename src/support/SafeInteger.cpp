#include "vq/dsc/SafeInteger.h"

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace detail {

void RaiseOutOfRange() {
    throw exception::OutOfRange();
}

}  // namespace detail
}  // namespace dsc
}  // namespace vq
