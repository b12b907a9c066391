#include "Connection/ContentPacking.h"

#include <exception>

#include "Connection/ContentCache.h"
#include "ostnet/http/Compression.h"

namespace ZOCL {

namespace {

using ostcore::threads::MutexLock;

constexpr int kItemsPerTurn = 16;

/// A cache may lose anything: what does not fit into memory is not kept.
void PackAndStore(const ImmutableString& inContentID, const shared_ptr<RecycledMemory const>& inPayload) {
    try {
        const auto cache = GetContentCache();
        if (cache && !cache->Contains(inContentID, ContentName())) {
            cache->Write(inContentID, ContentName(), ostnet::http::CompressPayload(inPayload));
        }
    } catch (const std::exception&) {
    }
}

}  // namespace

void ContentPacking::Add(const ImmutableString& inContentID,
                         const shared_ptr<RecycledMemory const>& inPayload) {
    if (inContentID.empty() || !inPayload || inPayload->empty()) {
        return;
    }
    const auto cache = GetContentCache();
    if (!cache || cache->Contains(inContentID, ContentName())) {
        return;
    }
    {
        MutexLock lock(mMutex);
        mItems.emplace_back(inContentID, inPayload);
        if (std::exchange(mHasTurn, true)) {
            return;
        }
    }
    PostTurn();
}

void ContentPacking::PostTurn() {
    if (!mWorkers->PostFunction([self = shared_from_this()] { self->RunTurn(); }, 0)) {
        std::deque<Item> dropped;
        MutexLock lock(mMutex);
        dropped.swap(mItems);
        mHasTurn = false;
    }
}

void ContentPacking::RunTurn() {
    Item item;
    for (int done = 0; done < kItemsPerTurn; ++done) {
        if (!Take(item)) {
            return;
        }
        PackAndStore(item.first, item.second);
    }
    PostTurn();
}

bool ContentPacking::Take(Item& outItem) {
    MutexLock lock(mMutex);
    if (mItems.empty()) {
        mHasTurn = false;
        return false;
    }
    outItem = std::move(mItems.front());
    mItems.pop_front();
    return true;
}

}  // namespace ZOCL
