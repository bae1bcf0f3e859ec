#include "system/KestDeviceItemHandler.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

KestDeviceItemHandler::KestDeviceItemHandler()
    : ItemHandler(kItemName, kItemName, kNumericAttribute) {}

KestDeviceItemHandler::~KestDeviceItemHandler() = default;

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
