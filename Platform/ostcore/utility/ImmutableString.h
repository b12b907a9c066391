// Interned immutable UTF-8 strings: equal texts share one entry, so equality is identity.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <iosfwd>
#include <string>
#include <string_view>

#include "ostcore/Export.h"

namespace ostcore {
namespace utility {

/// An interned immutable UTF-8 string.
///
/// The text of a given value is held once in a process-wide pool; two strings are equal exactly when they
/// refer to the same entry, so comparison is one pointer comparison, exact and case-sensitive. The null
/// string and the empty string are one value. Bytes are kept as given, NUL included; the pool does not
/// judge encodings.
///
/// Threads: any. Copying, reading, comparing and hashing take no lock; making a string from text takes the
/// lock of one shard of the pool for the time of a look-up. An entry leaves the pool when the last string
/// that refers to it is gone.
class ZOPLATFORM_EXPORT ImmutableString {
public:
    /// The null string. Takes no part in the pool.
    constexpr ImmutableString() noexcept = default;
    ImmutableString(const char* inText);
    ImmutableString(const char* inText, std::size_t inSize);
    explicit ImmutableString(std::string_view inText);
    explicit ImmutableString(const std::string& inText) : ImmutableString(std::string_view(inText)) {}

    ImmutableString(const ImmutableString& inOther) noexcept : mEntry(inOther.mEntry) { Retain(); }
    ImmutableString(ImmutableString&& inOther) noexcept : mEntry(inOther.mEntry) { inOther.mEntry = nullptr; }
    ImmutableString& operator=(const ImmutableString& inOther) noexcept;
    ImmutableString& operator=(ImmutableString&& inOther) noexcept;
    ~ImmutableString() { Release(); }

    /// True for the null string, which is also the empty one.
    bool empty() const noexcept { return mEntry == nullptr; }
    bool IsNull() const noexcept { return mEntry == nullptr; }
    inline std::size_t size() const noexcept;
    /// NUL-terminated; valid as long as any string with this text lives.
    inline const char* c_str() const noexcept;
    std::string_view view() const noexcept { return {c_str(), size()}; }
    std::string str() const { return std::string(view()); }
    operator std::string_view() const noexcept { return view(); }

    void swap(ImmutableString& ioOther) noexcept { std::swap(mEntry, ioOther.mEntry); }

    friend bool operator==(const ImmutableString& inLeft, const ImmutableString& inRight) noexcept {
        return inLeft.mEntry == inRight.mEntry;
    }
    friend bool operator!=(const ImmutableString& inLeft, const ImmutableString& inRight) noexcept {
        return inLeft.mEntry != inRight.mEntry;
    }
    /// An order that is stable within one run of the process and says nothing about the alphabet.
    friend bool operator<(const ImmutableString& inLeft, const ImmutableString& inRight) noexcept {
        return std::less<const void*>()(inLeft.mEntry, inRight.mEntry);
    }
    std::size_t Hash() const noexcept { return std::hash<const void*>()(mEntry); }

    /// The number of distinct texts now in the pool, for tests and diagnostics.
    static std::size_t PoolSize();

    struct Entry;

private:
    inline void Retain() noexcept;
    void Release() noexcept {
        if (mEntry) {
            ReleaseEntry();
        }
    }
    void ReleaseEntry() noexcept;

    Entry* mEntry = nullptr;
};

/// Head of an entry; the bytes and a NUL follow it in the same allocation.
struct ImmutableString::Entry {
    std::atomic<std::uint32_t> count;
    std::uint32_t unused;
    std::uint64_t hash;
    std::size_t size;
    Entry* next;

    char* Text() noexcept { return reinterpret_cast<char*>(this + 1); }
};

inline std::size_t ImmutableString::size() const noexcept {
    return mEntry ? mEntry->size : 0;
}

inline const char* ImmutableString::c_str() const noexcept {
    return mEntry ? mEntry->Text() : "";
}

inline void ImmutableString::Retain() noexcept {
    if (mEntry) {
        mEntry->count.fetch_add(1, std::memory_order_relaxed);
    }
}

/// Orders by text, for output that people read.
struct AlphabeticLess {
    bool operator()(const ImmutableString& inLeft, const ImmutableString& inRight) const noexcept {
        return inLeft.view() < inRight.view();
    }
};

ZOPLATFORM_EXPORT std::ostream& operator<<(std::ostream& ioStream, const ImmutableString& inString);

}  // namespace utility
}  // namespace ostcore

namespace std {
template <>
struct hash<ostcore::utility::ImmutableString> {
    size_t operator()(const ostcore::utility::ImmutableString& inString) const noexcept {
        return inString.Hash();
    }
};
}  // namespace std
