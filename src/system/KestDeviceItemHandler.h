// The handler of the system item: the chassis itself, always the first item.
#pragma once

#include "items/ItemHandler.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

class KestDeviceItemHandler : public ItemHandler {
  public:
    // The item name and the second name of the system item.
    static constexpr const wchar_t* kItemName = L"VQ KEST Chassis";

    KestDeviceItemHandler();

  protected:
    ~KestDeviceItemHandler() override;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
