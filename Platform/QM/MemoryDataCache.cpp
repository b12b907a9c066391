// The cache in memory: a table with an order of use, bounded by bytes.
#include <list>
#include <unordered_map>

#include "ostcore/threads/Mutex.h"
#include "QM/DataCache.h"

namespace QM {
namespace {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

class MemoryDataCache final : public DataCache {
public:
    explicit MemoryDataCache(std::uint64_t inMaximumBytes) : mMaximumBytes(inMaximumBytes) {}

    std::vector<ImmutableString> ListNames(const ImmutableString& inKey) override {
        std::vector<ImmutableString> names;
        MutexLock lock(mMutex);
        const auto found = mEntries.find(inKey);
        if (found != mEntries.end()) {
            for (const Item& item : found->second) {
                names.push_back(item->name);
            }
        }
        return names;
    }

    int Read(const ImmutableString& inKey, const ImmutableString& inName, const ReadCompletion&,
             Payload& outPayload) override {
        MutexLock lock(mMutex);
        const Item item = Find(inKey, inName);
        if (item == mOrder.end()) {
            return kResultFailure;
        }
        mOrder.splice(mOrder.begin(), mOrder, item);
        outPayload = item->payload;
        return kResultContentAvailable;
    }

    bool Contains(const ImmutableString& inKey, const ImmutableString& inName) override {
        MutexLock lock(mMutex);
        return Find(inKey, inName) != mOrder.end();
    }

    bool Write(const ImmutableString& inKey, const ImmutableString& inName,
               const Payload& inPayload) override {
        if (inKey.empty() || inName.empty() || !inPayload || inPayload->size() > mMaximumBytes / 4) {
            return false;
        }
        std::list<Entry> dropped;
        MutexLock lock(mMutex);
        if (mIsClosed) {
            return false;
        }
        Drop(Find(inKey, inName), dropped);
        mOrder.push_front({inKey, inName, inPayload});
        mEntries[inKey].push_back(mOrder.begin());
        mBytes += inPayload->size();
        while (mBytes > mMaximumBytes) {
            Drop(std::prev(mOrder.end()), dropped);
        }
        lock.Unlock();
        return true;
    }

    void Remove(const ImmutableString& inKey, const ImmutableString& inName) override {
        std::list<Entry> dropped;
        MutexLock lock(mMutex);
        Drop(Find(inKey, inName), dropped);
        lock.Unlock();
    }

    bool WaitForWrites(std::uint32_t) override { return true; }

    void Close(std::uint32_t) override {
        std::list<Entry> dropped;
        MutexLock lock(mMutex);
        mIsClosed = true;
        mEntries.clear();
        mBytes = 0;
        dropped.swap(mOrder);
        lock.Unlock();
    }

private:
    struct Entry {
        ImmutableString key;
        ImmutableString name;
        Payload payload;
    };
    using Item = std::list<Entry>::iterator;

    Item Find(const ImmutableString& inKey, const ImmutableString& inName) ZO_REQUIRES(mMutex) {
        const auto found = mEntries.find(inKey);
        if (found == mEntries.end()) {
            return mOrder.end();
        }
        const auto item = std::find_if(found->second.begin(), found->second.end(),
                                       [&](const Item& inItem) { return inItem->name == inName; });
        return item == found->second.end() ? mOrder.end() : *item;
    }

    /// Moves an entry to those that are released outside the lock.
    void Drop(const Item& inItem, std::list<Entry>& outDropped) ZO_REQUIRES(mMutex) {
        if (inItem == mOrder.end()) {
            return;
        }
        const auto found = mEntries.find(inItem->key);
        std::vector<Item>& items = found->second;
        items.erase(std::find(items.begin(), items.end(), inItem));
        if (items.empty()) {
            mEntries.erase(found);
        }
        mBytes -= inItem->payload->size();
        outDropped.splice(outDropped.begin(), mOrder, inItem);
    }

    const std::uint64_t mMaximumBytes;
    Mutex mMutex;
    /// Newest use first.
    std::list<Entry> mOrder ZO_GUARDED_BY(mMutex);
    std::unordered_map<ImmutableString, std::vector<Item>> mEntries ZO_GUARDED_BY(mMutex);
    std::uint64_t mBytes ZO_GUARDED_BY(mMutex) = 0;
    bool mIsClosed ZO_GUARDED_BY(mMutex) = false;
};

}  // namespace

shared_ptr<DataCache> CreateDataCacheInMemory(std::uint64_t inMaximumBytes) {
    return boost::make_shared<MemoryDataCache>(inMaximumBytes);
}

}  // namespace QM
