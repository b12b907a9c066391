// The pool behind ImmutableString: sharded by hash, one allocation per entry, no lock for a copy.
#include "ostcore/utility/ImmutableString.h"

#include <chrono>
#include <cstring>
#include <new>
#include <ostream>
#include <thread>

#include "ostcore/threads/ThreadAnnotations.h"
#include "ostcore/utility/TextHash.h"

namespace ostcore {
namespace utility {

namespace {

using Entry = ImmutableString::Entry;
constexpr std::size_t kShardCount = 128;
constexpr std::size_t kFirstBucketCount = 32;

/// The lock of a shard, made for the few instructions of a look-up: one atomic step to take it, a plain store
/// to let it go. Who finds it held spins for about as long as a look-up takes, then lets others run; the naps
/// in the end are for the case that the holder was put off the processor by a waiter of higher priority.
class ZO_CAPABILITY("mutex") ShardMutex {
public:
    void Lock() const ZO_ACQUIRE() {
        if (mIsHeld.exchange(true, std::memory_order_acquire)) {
            WaitAndLock();
        }
    }
    void Unlock() const ZO_RELEASE() { mIsHeld.store(false, std::memory_order_release); }

private:
    void WaitAndLock() const {
        constexpr int kSpins = 64;
        constexpr int kYields = 256;
        for (int tries = 0;; ++tries) {
            if (tries >= kYields) {
                std::this_thread::sleep_for(std::chrono::microseconds(50));
            } else if (tries >= kSpins) {
                std::this_thread::yield();
            }
            if (!mIsHeld.load(std::memory_order_relaxed) &&
                !mIsHeld.exchange(true, std::memory_order_acquire)) {
                return;
            }
        }
    }
    mutable std::atomic<bool> mIsHeld{false};
};

class ZO_SCOPED_CAPABILITY ShardLock {
public:
    explicit ShardLock(const ShardMutex& inMutex) ZO_ACQUIRE(inMutex) : mMutex(inMutex) { inMutex.Lock(); }
    ~ShardLock() ZO_RELEASE() { mMutex.Unlock(); }
    ShardLock(const ShardLock&) = delete;
    ShardLock& operator=(const ShardLock&) = delete;

private:
    const ShardMutex& mMutex;
};

/// One part of the pool: a chained hash table under its own lock.
///
/// The race that matters is between the drop of the last reference and a look-up of the same text. Were the
/// count allowed to fall to 0 outside the lock, a look-up could find the entry dead, raise it, drop it again,
/// and two threads would free it; or the first dropper would still read the entry (to find its shard) while
/// the second had freed it. Therefore:
///   - an entry in a table always has a count of at least 1 as seen under the shard's lock;
///   - outside the lock a count only moves between values of 1 and above: a copy adds to a reference that its
///     maker holds, and Release takes the fast way only down to 1;
///   - the step from 1 to 0 is taken under the lock, and the entry leaves the table before the lock is let
///   go.
/// A look-up that got the lock first has raised the count, so the dropper sees 2 and leaves the entry alone;
/// one that comes after finds no entry. The dropper holds a reference until that step, so the entry that it
/// reads is alive. Two droppers that both saw 2 race by compare-and-swap: one gets to 1, the other retries.
class alignas(64) Shard {
public:
    Entry* Intern(std::string_view inText, std::uint64_t inHash) ZO_EXCLUDES(mMutex) {
        ShardLock lock(mMutex);
        for (Entry* entry = mBuckets[BucketOf(inHash)]; entry; entry = entry->next) {
            if (entry->hash == inHash && entry->size == inText.size() &&
                std::memcmp(entry->Text(), inText.data(), inText.size()) == 0) {
                entry->count.fetch_add(1, std::memory_order_relaxed);
                return entry;
            }
        }
        if (mSize >= mBuckets.size()) {
            Grow();
        }
        return Insert(inText, inHash);
    }

    void DropLast(Entry* inEntry) ZO_EXCLUDES(mMutex) {
        if (RemoveIfLast(inEntry)) {
            inEntry->~Entry();
            ::operator delete(inEntry);
        }
    }

    std::size_t Size() const ZO_EXCLUDES(mMutex) {
        ShardLock lock(mMutex);
        return mSize;
    }

private:
    // The low bits choose the shard, the bits above them the bucket.
    std::size_t BucketOf(std::uint64_t inHash) const ZO_REQUIRES(mMutex) {
        return static_cast<std::size_t>(inHash / kShardCount) & (mBuckets.size() - 1);
    }

    bool RemoveIfLast(Entry* inEntry) ZO_EXCLUDES(mMutex) {
        ShardLock lock(mMutex);
        if (inEntry->count.fetch_sub(1, std::memory_order_acq_rel) != 1) {
            return false;  // a look-up was here first
        }
        Entry** link = &mBuckets[BucketOf(inEntry->hash)];
        while (*link != inEntry) {
            link = &(*link)->next;
        }
        *link = inEntry->next;
        --mSize;
        return true;
    }

    Entry* Insert(std::string_view inText, std::uint64_t inHash) ZO_REQUIRES(mMutex) {
        void* memory = ::operator new(sizeof(Entry) + inText.size() + 1);
        Entry*& head = mBuckets[BucketOf(inHash)];
        Entry* entry = new (memory) Entry{{1}, 0, inHash, inText.size(), head};
        std::memcpy(entry->Text(), inText.data(), inText.size());
        entry->Text()[inText.size()] = '\0';
        head = entry;
        ++mSize;
        return entry;
    }

    void Grow() ZO_REQUIRES(mMutex) {
        std::vector<Entry*> former(mBuckets.size() * 2);
        former.swap(mBuckets);
        for (Entry* entry : former) {
            while (entry) {
                Entry* const next = entry->next;
                Entry*& head = mBuckets[BucketOf(entry->hash)];
                entry->next = head;
                head = entry;
                entry = next;
            }
        }
    }

    ShardMutex mMutex;
    std::vector<Entry*> mBuckets ZO_GUARDED_BY(mMutex) = std::vector<Entry*>(kFirstBucketCount);
    std::size_t mSize ZO_GUARDED_BY(mMutex) = 0;
};

// Never destroyed: strings of static lifetime may go after everything else.
Shard* Shards() {
    static Shard* const shards = new Shard[kShardCount];
    return shards;
}

Shard& ShardOf(std::uint64_t inHash) {
    return Shards()[inHash % kShardCount];
}

Entry* InternText(std::string_view inText) {
    if (inText.empty()) {
        return nullptr;
    }
    const std::uint64_t hash = HashText(inText, TextHashSeed());
    return ShardOf(hash).Intern(inText, hash);
}

}  // namespace

ImmutableString::ImmutableString(const char* inText)
    : mEntry(inText ? InternText(std::string_view(inText)) : nullptr) {}

ImmutableString::ImmutableString(const char* inText, std::size_t inSize)
    : mEntry(inText ? InternText(std::string_view(inText, inSize)) : nullptr) {}

ImmutableString::ImmutableString(std::string_view inText) : mEntry(InternText(inText)) {}

ImmutableString& ImmutableString::operator=(const ImmutableString& inOther) noexcept {
    ImmutableString copy(inOther);
    swap(copy);
    return *this;
}

ImmutableString& ImmutableString::operator=(ImmutableString&& inOther) noexcept {
    ImmutableString moved(std::move(inOther));
    swap(moved);
    return *this;
}

void ImmutableString::ReleaseEntry() noexcept {
    std::uint32_t count = mEntry->count.load(std::memory_order_relaxed);
    while (count > 1) {
        if (mEntry->count.compare_exchange_weak(count, count - 1, std::memory_order_release,
                                                std::memory_order_relaxed)) {
            return;
        }
    }
    ShardOf(mEntry->hash).DropLast(mEntry);
}

std::size_t ImmutableString::PoolSize() {
    std::size_t size = 0;
    for (std::size_t i = 0; i < kShardCount; ++i) {
        size += Shards()[i].Size();
    }
    return size;
}

std::ostream& operator<<(std::ostream& ioStream, const ImmutableString& inString) {
    return ioStream << inString.view();
}

}  // namespace utility
}  // namespace ostcore
