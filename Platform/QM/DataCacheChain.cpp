// A quick cache in front of a slow one, and how caches are made.
#include "ostcore/debug/Trace.h"
#include "QM/DataCache.h"
#include "QM/detail/FileDataCache.h"

namespace QM {

DataCache::~DataCache() = default;
DiskCacheManager::ManagedDirectory::~ManagedDirectory() = default;

namespace {

class DataCacheChain final : public DataCache {
public:
    DataCacheChain(shared_ptr<DataCache> inFirst, shared_ptr<DataCache> inSecond)
        : mFirst(std::move(inFirst)), mSecond(std::move(inSecond)) {}

    std::vector<ImmutableString> ListNames(const ImmutableString& inKey) override {
        std::vector<ImmutableString> names = mFirst->ListNames(inKey);
        for (const ImmutableString& name : mSecond->ListNames(inKey)) {
            if (std::find(names.begin(), names.end(), name) == names.end()) {
                names.push_back(name);
            }
        }
        return names;
    }

    int Read(const ImmutableString& inKey, const ImmutableString& inName, const ReadCompletion& inCompletion,
             Payload& outPayload) override {
        const int result = mFirst->Read(inKey, inName, inCompletion, outPayload);
        if (result >= 0) {
            return result;
        }
        const shared_ptr<DataCache> first = mFirst;
        const int second = mSecond->Read(
            inKey, inName,
            [first, inKey, inName, inCompletion](int inResult, const Payload& inPayload) {
                if (inResult >= 0) {
                    first->Write(inKey, inName, inPayload);
                }
                inCompletion(inResult, inPayload);
            },
            outPayload);
        if (second == kResultContentAvailable) {
            first->Write(inKey, inName, outPayload);
        }
        return second;
    }

    bool Contains(const ImmutableString& inKey, const ImmutableString& inName) override {
        return mFirst->Contains(inKey, inName) || mSecond->Contains(inKey, inName);
    }

    bool Write(const ImmutableString& inKey, const ImmutableString& inName,
               const Payload& inPayload) override {
        const bool isInFirst = mFirst->Write(inKey, inName, inPayload);
        return mSecond->Write(inKey, inName, inPayload) || isInFirst;
    }

    void Remove(const ImmutableString& inKey, const ImmutableString& inName) override {
        mFirst->Remove(inKey, inName);
        mSecond->Remove(inKey, inName);
    }

    bool WaitForWrites(std::uint32_t inMilliseconds) override {
        return mFirst->WaitForWrites(inMilliseconds) && mSecond->WaitForWrites(inMilliseconds);
    }

    void Close(std::uint32_t inMilliseconds) override {
        mFirst->Close(inMilliseconds);
        mSecond->Close(inMilliseconds);
    }

private:
    const shared_ptr<DataCache> mFirst;
    const shared_ptr<DataCache> mSecond;
};

}  // namespace

shared_ptr<DataCache> CreateDataCacheChain(const shared_ptr<DataCache>& inFirst,
                                           const shared_ptr<DataCache>& inSecond) {
    if (!inFirst || !inSecond) {
        return inFirst ? inFirst : inSecond;
    }
    return boost::make_shared<DataCacheChain>(inFirst, inSecond);
}

shared_ptr<DataCache> CreateDataCacheInFilesystemAndManageDirectory(
    const std::string& inPath, shared_ptr<DiskCacheManager::ManagedDirectory>& outManagedDirectory,
    bool inCreateDirectory) {
    outManagedDirectory.reset();
    std::string error;
    const auto directory = detail::CacheDirectory::Open(inPath, inCreateDirectory,
                                                        boost::make_shared<detail::FileOperations>(), error);
    if (!directory) {
        ostcore::debug::Trace("QM.DataCache", ostcore::debug::kTraceLevel_Error,
                              "The cache directory " + inPath + " is not used: " + error +
                                  ". Payloads are kept in memory alone.");
        return {};
    }
    const auto cache = detail::FileDataCache::Create(directory);
    outManagedDirectory = cache;
    return cache;
}

}  // namespace QM
