// Reference counting and interface query for objects of one interface.
#pragma once

#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Made by new, destroyed by its last reference.
template <class Interface>
class CountedObject : public Interface {
public:
    std::uint32_t AddRef() noexcept override { return mCount.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mCount.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const int result = QueryInterfaceNoAddRef(inID, outInterface);
        if (result == RFL::kResultSuccess) {
            AddRef();
        }
        return result;
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        if (inID == Interface::kInterfaceID) {
            *outInterface = static_cast<Interface*>(this);
        } else if (inID == RFL::RFLUnknown::kInterfaceID) {
            *outInterface = static_cast<RFL::RFLUnknown*>(this);
        } else {
            *outInterface = nullptr;
            return RFL::kResultInterfaceNotSupported;
        }
        return RFL::kResultSuccess;
    }

protected:
    ~CountedObject() override = default;

private:
    RFL::RefCount mCount;
};

}  // namespace OrvaneXMPCompareAndMerge
