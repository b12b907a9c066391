// Reference counting and interface query, the foundation of every object that crosses the boundary.
#pragma once

#include <atomic>
#include <cstdint>
#include <exception>
#include <utility>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace RFL {

/// The constant 128-bit identifier of an interface.
struct InterfaceID {
    std::uint64_t high;
    std::uint64_t low;
    friend constexpr bool operator==(const InterfaceID& inLeft, const InterfaceID& inRight) noexcept {
        return inLeft.high == inRight.high && inLeft.low == inRight.low;
    }
    friend constexpr bool operator!=(const InterfaceID& inLeft, const InterfaceID& inRight) noexcept {
        return !(inLeft == inRight);
    }
};

constexpr int kResultSuccess = 0;
constexpr int kResultInterfaceNotSupported = static_cast<int>(0xA00A0001u);

/// The root of all interfaces. Objects are made with no reference; an InterfaceRef takes the first.
/// Threads: any.
class ZOPLATFORM_EXPORT RFLUnknown {
public:
    static constexpr InterfaceID kInterfaceID{0x52464C556E6B6E6Full, 0x776E000000000001ull};

    virtual std::uint32_t AddRef() noexcept = 0;
    virtual std::uint32_t Release() noexcept = 0;

protected:
    virtual ~RFLUnknown();

public:
    /// On success *outInterface is the interface with a reference added and the result is 0; otherwise it is
    /// null and the result is kResultInterfaceNotSupported.
    virtual int QueryInterface(const InterfaceID& inID, void** outInterface) noexcept = 0;
    /// As QueryInterface, without adding a reference. For use while another reference is held.
    virtual int QueryInterfaceNoAddRef(const InterfaceID& inID, void** outInterface) noexcept = 0;
};

class ZOPLATFORM_EXPORT Exception : public std::exception {
public:
    explicit Exception(std::string inText) : mText(std::move(inText)) {}
    ~Exception() override;
    const char* what() const noexcept override { return mText.c_str(); }

private:
    std::string mText;
};

/// "A NULL interface pointer has been dereferenced."
class ZOPLATFORM_EXPORT NullInterfaceException : public Exception {
public:
    NullInterfaceException();
    ~NullInterfaceException() override;
};
[[noreturn]] ZOPLATFORM_EXPORT void ThrowNullInterface();

/// Holds one reference to an object through interface T. A null reference throws on dereference.
/// As shared_ptr: distinct references may be used from different threads; one object may not be written
/// while another thread reads it.
template <class T>
class InterfaceRef {
public:
    InterfaceRef() noexcept = default;
    InterfaceRef(std::nullptr_t) noexcept {}
    explicit InterfaceRef(T* inPointer) noexcept : mPointer(inPointer) { Retain(); }
    InterfaceRef(const InterfaceRef& inOther) noexcept : mPointer(inOther.mPointer) { Retain(); }
    InterfaceRef(InterfaceRef&& inOther) noexcept : mPointer(std::exchange(inOther.mPointer, nullptr)) {}
    /// Up the inheritance of interfaces, without a query.
    template <class U,
              class = std::enable_if_t<std::is_convertible<U*, T*>::value && !std::is_same<U, T>::value>>
    InterfaceRef(const InterfaceRef<U>& inOther) noexcept : mPointer(inOther.GetUnchecked()) {
        Retain();
    }
    ~InterfaceRef() {
        if (mPointer) {
            mPointer->Release();
        }
    }
    InterfaceRef& operator=(InterfaceRef inOther) noexcept {
        std::swap(mPointer, inOther.mPointer);
        return *this;
    }

    T* operator->() const {
        if (!mPointer) {
            ThrowNullInterface();
        }
        return mPointer;
    }
    T& operator*() const { return *operator->(); }
    explicit operator bool() const noexcept { return mPointer != nullptr; }
    /// The pointer, null allowed, no reference added.
    T* GetUnchecked() const noexcept { return mPointer; }
    void Reset() noexcept { *this = InterfaceRef(); }

    friend bool operator==(const InterfaceRef& inLeft, const InterfaceRef& inRight) noexcept {
        return inLeft.mPointer == inRight.mPointer;
    }
    friend bool operator!=(const InterfaceRef& inLeft, const InterfaceRef& inRight) noexcept {
        return inLeft.mPointer != inRight.mPointer;
    }

    /// Takes over a pointer that already carries a reference for us.
    static InterfaceRef Adopt(T* inPointer) noexcept {
        InterfaceRef result;
        result.mPointer = inPointer;
        return result;
    }

private:
    void Retain() noexcept {
        if (mPointer) {
            mPointer->AddRef();
        }
    }
    T* mPointer = nullptr;
};

/// Asks an object for another interface; null when it has none or the reference is null.
template <class T, class U>
InterfaceRef<T> QueryInterface(const InterfaceRef<U>& inObject) noexcept {
    void* found = nullptr;
    if (!inObject || inObject.GetUnchecked()->QueryInterface(T::kInterfaceID, &found) < 0) {
        return InterfaceRef<T>();
    }
    return InterfaceRef<T>::Adopt(static_cast<T*>(found));
}

/// The reference count of an object. A concrete class derives from it once, forwards AddRef and Release to
/// it, and is destroyed by its last reference.
class RefCount {
public:
    std::uint32_t Add() noexcept { return mCount.fetch_add(1, std::memory_order_relaxed) + 1; }
    /// The count after the release; 0 tells the caller to delete the object.
    std::uint32_t Drop() noexcept { return mCount.fetch_sub(1, std::memory_order_acq_rel) - 1; }

private:
    std::atomic<std::uint32_t> mCount{0};
};

}  // namespace RFL
