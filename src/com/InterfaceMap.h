// Interface maps: the ordered table of the interfaces an object answers in QueryInterface. Each
// row holds the interface identifier and the byte offset of that interface's subobject inside the
// object; the table ends with an all-zero row, and the first row's subobject is the identity.
//
// A class lists its rows as a type, for example
//   using InterfaceMap = ComInterfaceMap<ComInterface<&IID_IuxSysPropertyBag, IuxSysPropertyBag4>,
//                                        ComInterface<&IID_IuxSysPropertyBag2,
//                                        IuxSysPropertyBag4>>;
// and CVQComObject<T> turns that list into the table for its own layout.
#pragma once

#include <array>
#include <cstddef>

#include "uxsys/Types.h"

struct InterfaceMapEntry {
    const IID* iid;
    std::ptrdiff_t offset;
};

// One row: identifier `Iid` yields the `Interface` subobject.
template <const IID* Iid, class Interface>
struct ComInterface {};

template <class... Rows>
struct ComInterfaceMap {};

// The subobject of `object` that answers `iid`, or null. The identifier of IUnknown answers with
// the first row's subobject; other identifiers are compared in row order over all 16 bytes.
void* FindInterfaceInMap(void* object, const InterfaceMapEntry* map, const IID& iid);

// The table of `Object`'s map rows, with the offsets taken from `object`, ending in a zero row.
template <class Object, const IID*... Iids, class... Interfaces>
std::array<InterfaceMapEntry, sizeof...(Interfaces) + 1> BuildInterfaceMap(
    Object* object, ComInterfaceMap<ComInterface<Iids, Interfaces>...>) {
    static_assert(sizeof...(Interfaces) > 0, "an interface map needs at least one row");
    const char* start = reinterpret_cast<const char*>(object);
    return {{{Iids, reinterpret_cast<const char*>(static_cast<Interfaces*>(object)) - start}...,
             {nullptr, 0}}};
}
