#include "Connection/ContentCache.h"

#include <sys/stat.h>
#include <unistd.h>

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/Mutex.h"
#include "RFL/DirectoryRegistry.h"

namespace ZOCL {

namespace {

using ostcore::debug::DebugDatabase;
using ostcore::filesupport::Dir;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

constexpr const char* kChannel = "ZOCL.ContentCache";
constexpr std::size_t kMaximumFiles = 100000;
constexpr std::uint32_t kDefaultDiskMegabytes = 16384;
constexpr std::uint32_t kDefaultMemoryMegabytes = 64;
constexpr std::uint32_t kCloseMilliseconds = 10000;

/// Never destroyed: completions may ask for it until the very end of the process.
struct TheCache {
    Mutex mutex;
    bool isSet ZO_GUARDED_BY(mutex) = false;
    shared_ptr<QM::DataCache> cache ZO_GUARDED_BY(mutex);

    bool Get(shared_ptr<QM::DataCache>& outCache) {
        MutexLock lock(mutex);
        outCache = cache;
        return isSet;
    }
    shared_ptr<QM::DataCache> Exchange(bool inIsSet, shared_ptr<QM::DataCache> inCache) {
        MutexLock lock(mutex);
        isSet = inIsSet;
        cache.swap(inCache);
        return inCache;
    }
    /// What stands there afterwards: another thread may have been quicker.
    shared_ptr<QM::DataCache> SetIfNone(const shared_ptr<QM::DataCache>& inCache) {
        MutexLock lock(mutex);
        if (!isSet) {
            isSet = true;
            cache = inCache;
        }
        return cache;
    }
};

TheCache& Holder() {
    static auto* const sCache = new TheCache;
    return *sCache;
}

std::uint64_t Megabytes(const char* inKey, std::uint32_t inDefault) {
    return static_cast<std::uint64_t>(DebugDatabase::GetUInt32(inKey, inDefault)) << 20;
}

shared_ptr<QM::DataCache> BuildContentCache() {
    Dir base;
    if (!GetZOCacheBaseDir(base)) {
        return {};
    }
    shared_ptr<QM::DiskCacheManager::ManagedDirectory> managedDirectory;
    const auto files = QM::CreateDataCacheInFilesystemAndManageDirectory(
        base.SubDir("ZOClient").SubDir("Content").Path(), managedDirectory, true);
    if (managedDirectory) {
        managedDirectory->SetMaxFileCount(kMaximumFiles);
        managedDirectory->SetMaxByteCount(Megabytes("ZOClient.ContentCacheMegabytes", kDefaultDiskMegabytes));
    }
    const auto memory = QM::CreateDataCacheInMemory(
        Megabytes("ZOClient.ContentCacheMemoryMegabytes", kDefaultMemoryMegabytes));
    return QM::CreateDataCacheChain(memory, files);
}

/// No link, the user's own, and nobody else can put anything into it.
bool IsOwnDirectory(const std::string& inPath) {
    struct stat status {};
    if (::lstat(inPath.c_str(), &status) != 0 || !S_ISDIR(status.st_mode) || status.st_uid != ::geteuid()) {
        return false;
    }
    return (status.st_mode & 022) == 0 || ::chmod(inPath.c_str(), 0700) == 0;
}

}  // namespace

bool GetZOCacheBaseDir(Dir& outDirectory) {
    Dir documents;
    if (!RFL::DirectoryRegistry::FindDirectory(RFL::DirectoryRegistry::kDirectory_SharedDocuments,
                                               documents)) {
        return false;
    }
    const Dir base = documents.SubDir("MeridaneCache");
    std::string reason;
    if (!base.CreatePrivate(&reason) || !IsOwnDirectory(base.Path())) {
        ostcore::debug::Trace(
            kChannel, ostcore::debug::kTraceLevel_Error,
            ostcore::debug::StructuredText("GetZOCacheBaseDir(): Can't create cache folder!")
                .Add("path", base.Path())
                .Add("reason",
                     reason.empty() ? "it is a link or not the user's own" : std::string_view(reason)));
        return false;
    }
    outDirectory = base;
    return true;
}

shared_ptr<QM::DataCache> GetContentCache() {
    shared_ptr<QM::DataCache> cache;
    if (Holder().Get(cache)) {
        return cache;
    }
    const shared_ptr<QM::DataCache> built = BuildContentCache();
    cache = Holder().SetIfNone(built);
    if (built && built != cache) {
        built->Close(0);
    }
    return cache;
}

void ReleaseContentCache() {
    if (const auto cache = Holder().Exchange(false, nullptr)) {
        cache->Close(kCloseMilliseconds);
    }
}

void ReplaceContentCache(const shared_ptr<QM::DataCache>& inCache) {
    Holder().Exchange(true, inCache);
}

const ImmutableString& ContentName() {
    static const ImmutableString sName("gz");
    return sName;
}

}  // namespace ZOCL
