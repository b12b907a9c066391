// Serialised lists.
#include "Routes/DocumentCache.h"

namespace zohub {

std::shared_ptr<Body const> DocumentCache::Find(std::string const& inKey) {
    std::lock_guard const lock(mMutex);
    auto const found = mByKey.find(inKey);
    if (found == mByKey.end())
        return nullptr;
    mEntries.splice(mEntries.begin(), mEntries, found->second);
    return found->second->body;
}

void DocumentCache::Put(std::string const& inKey, std::shared_ptr<Body const> inBody) {
    if (inBody->Size() > mMaxBytes)
        return;
    std::lock_guard const lock(mMutex);
    if (mByKey.count(inKey))
        return;
    mBytes += inBody->Size();
    mEntries.push_front({inKey, std::move(inBody)});
    mByKey[inKey] = mEntries.begin();
    while (mBytes > mMaxBytes) {
        Entry const& last = mEntries.back();
        mBytes -= last.body->Size();
        mByKey.erase(last.key);
        mEntries.pop_back();
    }
}

}  // namespace zohub
