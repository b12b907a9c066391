// Serialised lists.
#include "Routes/DocumentCache.h"

namespace zohub {

std::shared_ptr<Body const> DocumentCache::FindOrMake(std::string const& inKey,
                                                      std::function<std::string()> const& inMake) {
    std::promise<Shared> promise;
    std::shared_future<Shared> future;
    bool isMaker = false;
    {
        std::lock_guard const lock(mMutex);
        if (auto const found = mByKey.find(inKey); found != mByKey.end()) {
            mEntries.splice(mEntries.begin(), mEntries, found->second);
            return found->second->body;
        }
        auto const [at, isFirst] = mInTheMaking.try_emplace(inKey);
        isMaker = isFirst;
        if (isFirst)
            at->second = promise.get_future().share();
        future = at->second;
    }
    if (!isMaker)
        return future.get();
    try {
        promise.set_value(std::make_shared<Body const>(inMake()));
    } catch (...) {
        promise.set_exception(std::current_exception());
    }
    {
        std::lock_guard const lock(mMutex);
        mInTheMaking.erase(inKey);
    }
    Shared const body = future.get();
    Keep(inKey, body);
    return body;
}

void DocumentCache::Keep(std::string const& inKey, Shared const& inBody) {
    if (inBody->Size() > mMaxBytes)
        return;
    std::lock_guard const lock(mMutex);
    if (mByKey.count(inKey))
        return;
    mBytes += inBody->Size();
    mEntries.push_front({inKey, inBody});
    mByKey[inKey] = mEntries.begin();
    while (mBytes > mMaxBytes) {
        Entry const& last = mEntries.back();
        mBytes -= last.body->Size();
        mByKey.erase(last.key);
        mEntries.pop_back();
    }
}

}  // namespace zohub
