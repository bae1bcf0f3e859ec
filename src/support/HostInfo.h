// Facts about the host's network adapters that the plug-in needs for identifiers.
#pragma once

#include <string>

namespace vq {
namespace dsc {
namespace osdep {

// Hardware address of the first network adapter whose address is not all zero, as
// "aa:bb:cc:dd:ee:ff" (lower-case hex); "00:00:00:00:00:00" when there is none.
std::string FirstAdapterHardwareAddress();

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
