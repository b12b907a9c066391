// A map whose entries leave when there are too many of them and they have not been asked for lately.
#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <unordered_map>
#include <utility>
#include <vector>

#include "ostcore/threads/DelayedCall.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/threads/Scheduler.h"
#include "ostcore/Types.h"

namespace ostnet {
namespace http {

/// How many entries a map keeps in any case, how long it keeps the others, and how often it looks.
struct ExpiryLimits {
    std::uint32_t maxEntries = 0;
    std::uint32_t maxAgeSeconds = 0;
    std::uint32_t sweepIntervalSeconds = 0;
};

/// A map with last-access times.
///
/// While there are more than maxEntries, each insertion queues a sweep, unless one is queued. The sweep drops
/// an entry only when it is both beyond the number and older than the age: the maxEntries that were used last
/// stay however old they are, and what was used within maxAgeSeconds stays however many there are. As long as
/// there are too many, another sweep follows; a map that is within its number keeps no timer. Time is that of
/// the global scheduler at the map's construction.
///
/// Threads: any. Values are copied in and out under the map's own lock, so they should be small (a shared
/// pointer, a flag); they are released outside it.
template <typename Key, typename Value>
class ExpiringEntryMap {
public:
    /// The sweep runs on inExecutor.
    ExpiringEntryMap(const ExpiryLimits& inLimits, shared_ptr<ostcore::threads::Executor> inExecutor)
        : mCore(boost::make_shared<Core>(inLimits)) {
        mCore->SetSweeper(std::move(inExecutor));
    }
    ExpiringEntryMap(const ExpiringEntryMap&) = delete;
    ExpiringEntryMap& operator=(const ExpiringEntryMap&) = delete;

    /// The value under a key, which counts as used now; none when there is none.
    optional<Value> Lookup(const Key& inKey) { return mCore->Lookup(inKey); }
    /// Returns the value whose place it takes, for the caller to release where that does no harm.
    optional<Value> Insert(const Key& inKey, Value inValue) {
        return mCore->Insert(inKey, std::move(inValue));
    }
    /// Takes all entries out and releases them on this thread.
    void Clear() { mCore->Clear(); }
    std::size_t Size() const { return mCore->Size(); }

private:
    /// Outlives the map while a sweep runs.
    class Core : public enable_shared_from_this<Core> {
    public:
        explicit Core(const ExpiryLimits& inLimits) : mLimits(inLimits) {}

        void SetSweeper(shared_ptr<ostcore::threads::Executor> inExecutor) {
            mSweeper.emplace(std::move(inExecutor), [weak = weak_ptr<Core>(this->shared_from_this())] {
                if (const auto self = weak.lock()) {
                    self->Sweep();
                }
            });
        }

        optional<Value> Lookup(const Key& inKey) ZO_EXCLUDES(mMutex) {
            const Time now = mScheduler->Now();
            ostcore::threads::MutexLock lock(mMutex);
            const auto found = mEntries.find(inKey);
            if (found == mEntries.end()) {
                return {};
            }
            found->second.lastAccess = now;
            return found->second.value;
        }

        optional<Value> Insert(const Key& inKey, Value&& inValue) ZO_EXCLUDES(mMutex) {
            const Time now = mScheduler->Now();
            optional<Value> former;
            bool areTooMany = false;
            {
                ostcore::threads::MutexLock lock(mMutex);
                const auto found = mEntries.find(inKey);
                if (found == mEntries.end()) {
                    mEntries.emplace(inKey, Entry{now, std::move(inValue)});
                } else {
                    former = std::exchange(found->second.value, std::move(inValue));
                    found->second.lastAccess = now;
                }
                areTooMany = mEntries.size() > mLimits.maxEntries;
            }
            if (areTooMany) {
                QueueSweep();
            }
            return former;
        }

        void Clear() ZO_EXCLUDES(mMutex) {
            Entries dropped;
            ostcore::threads::MutexLock lock(mMutex);
            dropped.swap(mEntries);
            lock.Unlock();
        }

        std::size_t Size() const ZO_EXCLUDES(mMutex) {
            ostcore::threads::MutexLock lock(mMutex);
            return mEntries.size();
        }

    private:
        using Time = ostcore::threads::MonotonicTime;
        struct Entry {
            Time lastAccess;
            Value value;
        };
        using Entries = std::unordered_map<Key, Entry>;

        void QueueSweep() { mSweeper->QueueOnlyOnce(mLimits.sweepIntervalSeconds * 1000); }

        void Sweep() ZO_EXCLUDES(mMutex) {
            const Time cutOff = mScheduler->Now() - std::chrono::seconds(mLimits.maxAgeSeconds);
            std::vector<typename Entries::node_type> dropped;
            bool areTooMany = false;
            {
                ostcore::threads::MutexLock lock(mMutex);
                if (mEntries.size() <= mLimits.maxEntries) {
                    return;
                }
                TakeExpired(cutOff, dropped);
                areTooMany = mEntries.size() > mLimits.maxEntries;
            }
            if (areTooMany) {
                QueueSweep();
            }
        }

        /// Moves out what is neither among the maxEntries used last nor used after the cut-off.
        void TakeExpired(Time inCutOff, std::vector<typename Entries::node_type>& outDropped)
            ZO_REQUIRES(mMutex) {
            std::vector<typename Entries::iterator> old;
            for (auto entry = mEntries.begin(); entry != mEntries.end(); ++entry) {
                if (entry->second.lastAccess <= inCutOff) {
                    old.push_back(entry);
                }
            }
            const std::size_t young = mEntries.size() - old.size();
            const std::size_t kept = (std::min)(
                old.size(), mLimits.maxEntries - (std::min<std::size_t>)(young, mLimits.maxEntries));
            const auto firstDropped = old.begin() + static_cast<std::ptrdiff_t>(kept);
            std::nth_element(old.begin(), firstDropped, old.end(), [](auto inLeft, auto inRight) {
                return inLeft->second.lastAccess > inRight->second.lastAccess;
            });
            for (auto entry = firstDropped; entry != old.end(); ++entry) {
                outDropped.push_back(mEntries.extract(*entry));
            }
        }

        const ExpiryLimits mLimits;
        const shared_ptr<ostcore::threads::Scheduler> mScheduler = ostcore::threads::GetGlobalScheduler();
        mutable ostcore::threads::Mutex mMutex;
        Entries mEntries ZO_GUARDED_BY(mMutex);
        optional<ostcore::threads::DeferredCaller> mSweeper;
    };

    const shared_ptr<Core> mCore;
};

}  // namespace http
}  // namespace ostnet
