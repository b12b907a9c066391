// What a process knows of the files of a cache: which there are, how large, and in which order they were
// used.
#pragma once

#include <cstddef>
#include <cstdint>
#include <unordered_map>

#include "QM/detail/CacheEntry.h"

namespace QM {
namespace detail {

/// A table with an order of use. Every operation but the destructor takes constant time. Threads: one at a
/// time.
class ZOPLATFORM_EXPORT DirectoryIndex {
public:
    DirectoryIndex() = default;
    DirectoryIndex(const DirectoryIndex&) = delete;
    DirectoryIndex& operator=(const DirectoryIndex&) = delete;

    bool Contains(const EntryKey& inKey) const { return mEntries.count(inKey) > 0; }
    /// Marks it as used last; false when it is not known.
    bool Touch(const EntryKey& inKey);
    /// Null when it is not known. Good until the next change.
    const FileState* Find(const EntryKey& inKey) const;
    /// Adds it, or changes what is known of it, as used last.
    void Insert(const EntryKey& inKey, const FileState& inFile);
    bool Remove(const EntryKey& inKey);
    /// Takes out the one that was not used for longest; false when there is none.
    bool TakeOldest(EntryKey& outKey, std::uint64_t& outSize);

    /// 0 for what is not known.
    std::uint64_t SizeOf(const EntryKey& inKey) const;
    std::size_t Count() const noexcept { return mEntries.size(); }
    std::uint64_t Bytes() const noexcept { return mBytes; }
    void Reserve(std::size_t inCount) { mEntries.reserve(inCount); }

private:
    struct Entry {
        FileState file;
        const EntryKey* key = nullptr;
        Entry* older = nullptr;
        Entry* newer = nullptr;
    };
    void Unlink(Entry& ioEntry);
    void LinkNewest(Entry& ioEntry);

    /// Its nodes stay where they are, so entries can point at each other.
    std::unordered_map<EntryKey, Entry, EntryKeyHash> mEntries;
    std::uint64_t mBytes = 0;
    Entry* mOldest = nullptr;
    Entry* mNewest = nullptr;
};

}  // namespace detail
}  // namespace QM
