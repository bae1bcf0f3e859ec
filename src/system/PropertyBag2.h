// Access to the timestamp and modified-set operations of a bag handed in as IuxSysPropertyBag.
#pragma once

#include "com/CountedPtr.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// The bag's IuxSysPropertyBag2 interface; a bag that does not offer it throws E_NOINTERFACE as
// a status (long).
inline CountedPtr<IuxSysPropertyBag2> QueryPropertyBag2(IuxSysPropertyBag* bag) {
    CountedPtr<IuxSysPropertyBag2> bag2;
    if (bag->QueryInterface(IID_IuxSysPropertyBag2, bag2.ReceiveVoid()) < 0 || !bag2) {
        throw static_cast<long>(E_NOINTERFACE);
    }
    return bag2;
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
