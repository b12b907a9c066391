// Serialised lists, kept so that a list of many thousand assets is put together once and not for every
// client.
#pragma once

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

    std::shared_ptr<Body const> Find(std::string const& inKey);
    void Put(std::string const& inKey, std::shared_ptr<Body const> inBody);

private:
    struct Entry {
        std::string key;
        std::shared_ptr<Body const> body;
    };
    std::size_t const mMaxBytes;
    std::mutex mMutex;
    std::list<Entry> mEntries;  // under mMutex, most recently used first
    std::unordered_map<std::string, std::list<Entry>::iterator> mByKey;
    std::size_t mBytes = 0;
};

}  // namespace zohub
