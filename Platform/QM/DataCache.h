// Caches of payloads by key and stored name: in memory, in files, and one in front of the other.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"
#include "QM/DiskCacheManager.h"

namespace QM {

using ostcore::function;
using ostcore::shared_ptr;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;

using Payload = shared_ptr<RecycledMemory const>;

/// The payload was at hand.
constexpr int kResultContentAvailable = 0x20330001;
/// The payload, or the news that it cannot be had, comes through the completion.
constexpr int kResultContentPending = 0x20330002;
constexpr int kResultFailure = static_cast<int>(0xA00F0001u);

/// Gets 0 and the payload, or a failure and null. Called exactly once for a read that was answered with
/// kResultContentPending, never on the stack of the call, on a thread of the cache with no lock held.
using ReadCompletion = function<void(int inResult, const Payload& inPayload)>;

/// A cache may lose anything at any time, and never gives out anything but what was stored: a failure of the
/// medium below is a miss.
///
/// A key is any text that is not empty. A stored name tells the form in which the payload is kept: 1 to 12
/// lower-case letters and digits. Threads: any.
class ZOPLATFORM_EXPORT DataCache {
public:
    virtual ~DataCache();
    /// The names under which there is something for the key.
    virtual std::vector<ImmutableString> ListNames(const ImmutableString& inKey) = 0;
    /// kResultContentAvailable: outPayload is set and the completion is not called. kResultContentPending: it
    /// will be. A failure: there is nothing, and it is not called.
    virtual int Read(const ImmutableString& inKey, const ImmutableString& inName,
                     const ReadCompletion& inCompletion, Payload& outPayload) = 0;
    virtual bool Contains(const ImmutableString& inKey, const ImmutableString& inName) = 0;
    /// Keeps a payload in the place of what was there. True: accepted; a medium that is slow gets it later.
    virtual bool Write(const ImmutableString& inKey, const ImmutableString& inName,
                       const Payload& inPayload) = 0;
    /// Drops what there is, for a payload that turned out to be of no use.
    virtual void Remove(const ImmutableString& inKey, const ImmutableString& inName) = 0;
    /// Waits until what was accepted is written; false when the time passed first.
    virtual bool WaitForWrites(std::uint32_t inMilliseconds) = 0;
    /// The end of use: what was accepted is written, and the work of the cache comes to its end, if the time
    /// allows it. Everything fails from then on. Not from a completion.
    virtual void Close(std::uint32_t inMilliseconds) = 0;
};

constexpr std::uint64_t kDefaultMemoryCacheBytes = 64ull << 20;

/// Holds up to so many bytes and lets the least recently used go. A payload of more than a quarter of them is
/// not taken.
ZOPLATFORM_EXPORT shared_ptr<DataCache> CreateDataCacheInMemory(
    std::uint64_t inMaximumBytes = kDefaultMemoryCacheBytes);

/// A cache in the files of a directory that any number of processes may share, with its manager. The
/// directory is made, with mode 0700, when inCreateDirectory says so. Null, and a trace, when it cannot be
/// used: it, or the directory that it lies in, is a symbolic link, it belongs to another user, or it cannot
/// be opened.
ZOPLATFORM_EXPORT shared_ptr<DataCache> CreateDataCacheInFilesystemAndManageDirectory(
    const std::string& inPath, shared_ptr<DiskCacheManager::ManagedDirectory>& outManagedDirectory,
    bool inCreateDirectory);

/// Asks the first, then the second; what the second gives goes into the first as well, and what is written
/// goes into both. With only one of them the chain is that one.
ZOPLATFORM_EXPORT shared_ptr<DataCache> CreateDataCacheChain(const shared_ptr<DataCache>& inFirst,
                                                             const shared_ptr<DataCache>& inSecond);

}  // namespace QM
