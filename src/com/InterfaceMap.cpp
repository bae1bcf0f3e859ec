#include "com/InterfaceMap.h"

#include <cstring>

#include "uxsys/IUnknown.h"

void* FindInterfaceInMap(void* object, const InterfaceMapEntry* map, const IID& iid) {
    char* start = static_cast<char*>(object);
    if (std::memcmp(&iid, &IID_IUnknown, sizeof(IID)) == 0) {
        return start + map[0].offset;
    }
    for (const InterfaceMapEntry* row = map; row->iid != nullptr; ++row) {
        if (std::memcmp(&iid, row->iid, sizeof(IID)) == 0) {
            return start + row->offset;
        }
    }
    return nullptr;
}
