// A table of names with what is known of each, for names that come many times.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <deque>
#include <memory>
#include <string_view>
#include <vector>

#include "ostcore/utility/TextHash.h"

namespace OrvaneXMP {

/// What is known stays in its place as long as the table lives. T has a default.
template <class T>
class NameTable {
public:
    explicit NameTable(std::size_t inMost) : mMost(inMost), mSlots(kFirstSlots) {}

    /// The default when the name is new; null when it is new and the table is full.
    T* Find(std::string_view inName) {
        Entry* const entry = FindEntry(inName);
        return entry ? &entry->known : nullptr;
    }

    /// The same, for names in the order of a document: what has followed a name follows it again most often,
    /// and takes no more than a comparison then.
    T* FindInTurn(const char* inName) {
        Entry* entry = mLast ? mLast->next : nullptr;
        if (!entry || std::strcmp(entry->text, inName) != 0) {
            entry = FindEntry(inName);
            if (!entry) {
                return nullptr;
            }
            if (mLast) {
                mLast->next = entry;
            }
        }
        mLast = entry;
        return &entry->known;
    }

private:
    struct Entry {
        /// Ended by a NUL.
        const char* text;
        std::size_t size;
        std::uint64_t hash;
        Entry* next;
        T known;
    };
    struct Slot {
        Entry* entry = nullptr;
        std::uint32_t mark = 0;
    };
    static constexpr std::size_t kFirstSlots = 256;
    static constexpr std::size_t kBlockSize = 4096;

    Entry* FindEntry(std::string_view inName) {
        const std::uint64_t hash = ostcore::utility::HashText(inName, mSeed);
        const auto mark = static_cast<std::uint32_t>(hash >> 32);
        std::size_t at = hash & (mSlots.size() - 1);
        for (; mSlots[at].entry; at = (at + 1) & (mSlots.size() - 1)) {
            Entry& entry = *mSlots[at].entry;
            if (mSlots[at].mark == mark && entry.size == inName.size() &&
                std::memcmp(entry.text, inName.data(), inName.size()) == 0) {
                return &entry;
            }
        }
        return mEntries.size() < mMost ? Add(inName, hash) : nullptr;
    }

    Entry* Add(std::string_view inName, std::uint64_t inHash) {
        if ((mEntries.size() + 1) * 2 > mSlots.size()) {
            std::vector<Slot>(mSlots.size() * 2).swap(mSlots);
            for (Entry& entry : mEntries) {
                Insert(entry);
            }
        }
        mEntries.push_back({Keep(inName), inName.size(), inHash, nullptr, T()});
        Insert(mEntries.back());
        return &mEntries.back();
    }

    void Insert(Entry& ioEntry) noexcept {
        std::size_t at = ioEntry.hash & (mSlots.size() - 1);
        while (mSlots[at].entry) {
            at = (at + 1) & (mSlots.size() - 1);
        }
        mSlots[at] = {&ioEntry, static_cast<std::uint32_t>(ioEntry.hash >> 32)};
    }

    const char* Keep(std::string_view inName) {
        const std::size_t size = inName.size() + 1;
        if (size > mLeft) {
            mLeft = size > kBlockSize ? size : kBlockSize;
            mBlocks.push_back(std::make_unique<char[]>(mLeft));
            mNext = mBlocks.back().get();
        }
        char* const kept = mNext;
        std::memcpy(kept, inName.data(), inName.size());
        kept[inName.size()] = '\0';
        mNext += size;
        mLeft -= size;
        return kept;
    }

    std::size_t mMost;
    std::uint64_t mSeed = ostcore::utility::TextHashSeed();
    std::vector<Slot> mSlots;
    std::deque<Entry> mEntries;
    Entry* mLast = nullptr;
    std::vector<std::unique_ptr<char[]>> mBlocks;
    char* mNext = nullptr;
    std::size_t mLeft = 0;
};

}  // namespace OrvaneXMP
