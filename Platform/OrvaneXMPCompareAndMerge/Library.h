// The way into the library: its start, its end, and the factory of its objects.
#pragma once

#include "OrvaneXMPCompareAndMerge/IThreeWayMerge_v1.h"
#include "ostcore/Export.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// CreateObject was called before StartLibrary, or after the last EndLibrary.
constexpr int kResultNotStarted = static_cast<int>(0xA00B0001u);

/// Starts are counted, and each is to have its end. Threads: any.
ZOPLATFORM_EXPORT void StartLibrary();
/// Objects that are still held stay usable. An end without a start does nothing.
ZOPLATFORM_EXPORT void EndLibrary();

/// A new object of the interface: IThreeWayMerge_v1. On success *outObject carries a reference and the result
/// is 0; otherwise it is null and the result kResultNotStarted or RFL::kResultInterfaceNotSupported. Throws
/// std::bad_alloc alone. Threads: any.
ZOPLATFORM_EXPORT int CreateObject(const RFL::InterfaceID& inID, void** outObject);

/// As above; null on failure.
template <class T>
RFL::InterfaceRef<T> Create() {
    void* object = nullptr;
    return CreateObject(T::kInterfaceID, &object) < 0 ? RFL::InterfaceRef<T>()
                                                      : RFL::InterfaceRef<T>::Adopt(static_cast<T*>(object));
}

}  // namespace OrvaneXMPCompareAndMerge
