// The item manager of the KEST chassis: the system item first, then the Ethernet adapter "eth0"
// when the controller has one.
#pragma once

#include "items/ItemManagerBase.h"
#include "uxsys/Types.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: as ItemManagerBase; EnumerateItems builds the list under the item lock.
class KestItemManager : public ItemManagerBase {
  public:
    KestItemManager() = default;

    // Not supported: E_NOTIMPL.
    HRESULT ReservedManagerOperation() override;
    // Discovers the items (EnumerateItems) and returns its status.
    HRESULT RefreshItems() override;
    // When the list is empty: appends the system item's handler, then the handler of the first
    // Ethernet device whose interface name is "eth0" ignoring case; returns S_OK. S_FALSE when
    // the list was built already; a failure's status otherwise (appended handlers stay).
    HRESULT EnumerateItems() override;

  protected:
    ~KestItemManager() override = default;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
