// Adds interfaces to a resource class: reference counting and the query for them, written once.
#pragma once

#include "Resources/ServerResource.h"

namespace ZOCL {

/// Interfaces of the list are answered always.
template <class... Interfaces>
struct Readable {};
/// Interfaces of the list are answered only while the resource is writable.
template <class... Interfaces>
struct Writable {};

template <class Base, class ReadInterfaces, class WriteInterfaces = Writable<>>
class Implements;

/// Base is ServerResource or a class derived from it; each interface derives from RFLUnknown alone.
template <class Base, class... Reads, class... Writes>
class Implements<Base, Readable<Reads...>, Writable<Writes...>>
    : public Base, public Reads..., public Writes... {
public:
    std::uint32_t AddRef() noexcept override { return Base::AddRef(); }
    std::uint32_t Release() noexcept override { return Base::Release(); }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        return Base::QueryInterface(inID, outInterface);
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        if ((Answers<Reads>(inID, outInterface) || ...)) {
            return kResultSuccess;
        }
        if (this->IsWritable() && (Answers<Writes>(inID, outInterface) || ...)) {
            return kResultSuccess;
        }
        return Base::QueryInterfaceNoAddRef(inID, outInterface);
    }

private:
    template <class Interface>
    bool Answers(const RFL::InterfaceID& inID, void** outInterface) noexcept {
        if (inID != Interface::kInterfaceID) {
            return false;
        }
        *outInterface = static_cast<Interface*>(this);
        return true;
    }
};

}  // namespace ZOCL
