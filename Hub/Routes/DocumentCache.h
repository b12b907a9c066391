// Serialised lists, kept so that a list of many thousand assets is put together once and not for every
// client.
#pragma once

#include <functional>
#include <future>
#include <list>
#include <memory>
#include <mutex>
#include <string>
#include <unordered_map>

#include "Http/Message.h"

namespace zohub {

/// Bounded by bytes; what was used longest ago goes first. Thread-safe. Bodies are immutable, and a key names
/// one state for ever, so nothing here can be stale.
class DocumentCache {
public:
    explicit DocumentCache(std::size_t inMaxBytes) : mMaxBytes(inMaxBytes) {}

    /// Makes the body when it is not here. Of several that ask at the same time one makes it and the others
    /// wait; what the maker throws reaches all of them.
    std::shared_ptr<Body const> FindOrMake(std::string const& inKey,
                                           std::function<std::string()> const& inMake);

private:
    using Shared = std::shared_ptr<Body const>;
    void Keep(std::string const& inKey, Shared const& inBody);

    struct Entry {
        std::string key;
        std::shared_ptr<Body const> body;
    };
    std::size_t const mMaxBytes;
    std::mutex mMutex;
    std::list<Entry> mEntries;  // under mMutex, most recently used first
    std::unordered_map<std::string, std::list<Entry>::iterator> mByKey;
    std::unordered_map<std::string, std::shared_future<Shared>> mInTheMaking;
    std::size_t mBytes = 0;
};

}  // namespace zohub
