// The cache in files: what is known of the directory, what waits to be written, and who does it.
#pragma once

#include <chrono>
#include <deque>
#include <set>
#include <unordered_map>

#include <boost/container/static_vector.hpp>

#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Mutex.h"
#include "QM/DataCache.h"
#include "QM/detail/CacheDirectory.h"
#include "QM/detail/DirectoryIndex.h"

namespace QM {
namespace detail {

/// Writes, evictions and looks at the whole directory run one after the other on a sub-executor; reads run
/// beside them, a few at a time, on the executor above it. A turn on a thread goes on for as long as there is
/// work of its kind: to wake a thread for a payload of some KiB would cost more than the payload. So the
/// count needs no guard against other writers of this process: room for a file is made before it appears, by
/// the only one that makes files appear.
///
/// The directory is looked at as a whole before the first write, and again after so many writes of this
/// process, because other processes add and remove files too. The new picture takes the place of the old one
/// in one step. What readers do meanwhile, a touch or the drop of a damaged file, can be missing in it: then
/// the order is a little off, or a file is counted that is gone, both until the next look.
///
/// What waits to be written is served from memory; there is a bound on it, beyond which writes are refused.
class ZOPLATFORM_EXPORT FileDataCache final : public DataCache,
                                              public DiskCacheManager::ManagedDirectory,
                                              public ostcore::enable_shared_from_this<FileDataCache> {
public:
    static shared_ptr<FileDataCache> Create(shared_ptr<CacheDirectory> inDirectory);

    std::vector<ImmutableString> ListNames(const ImmutableString& inKey) override;
    int Read(const ImmutableString& inKey, const ImmutableString& inName, const ReadCompletion& inCompletion,
             Payload& outPayload) override;
    bool Contains(const ImmutableString& inKey, const ImmutableString& inName) override;
    bool Write(const ImmutableString& inKey, const ImmutableString& inName,
               const Payload& inPayload) override;
    void Remove(const ImmutableString& inKey, const ImmutableString& inName) override;
    bool WaitForWrites(std::uint32_t inMilliseconds) override;
    void Close(std::uint32_t inMilliseconds) override;

    void SetMaxFileCount(std::size_t inCount) override;
    void SetMaxByteCount(std::uint64_t inBytes) override;
    std::size_t GetFileCount() const override;
    std::uint64_t GetByteCount() const override;

private:
    using Pending = std::unordered_map<EntryKey, Payload, EntryKeyHash>;
    struct WaitingRead {
        std::uint64_t number = 0;
        EntryKey key;
        ReadCompletion completion;
        /// The size when the file bears a stamp of the last minute.
        FileState state;
    };
    using Reads = boost::container::static_vector<WaitingRead, 8>;

    explicit FileDataCache(shared_ptr<CacheDirectory> inDirectory);
    bool QueueRead(const EntryKey& inKey, const FileState& inState, const ReadCompletion& inCompletion,
                   std::uint64_t& outNumber) ZO_REQUIRES(mMutex);
    bool PostReads(std::uint64_t inNumber);
    bool TakeReads(Reads& ioReads);
    void RunReads();
    bool PostWrites(const EntryKey& inKey);
    bool TakeKeyToWrite(EntryKey& outKey);
    void RunWrites();
    void WritePending(const EntryKey& inKey);
    void WriteWithinBounds(const EntryKey& inKey, const Payload& inPayload);
    void DropPending(const EntryKey& inKey) ZO_REQUIRES(mMutex);
    Payload FindPending(const EntryKey& inKey);
    void RemoveFile(const EntryKey& inKey);
    void PostMakeRoom();
    bool MakeRoom(const EntryKey* inFor, std::uint64_t inSize);
    bool TakeVictim(const EntryKey* inFor, std::uint64_t inSize, EntryKey& outVictim, std::uint64_t& outSize);
    bool LookAtDirectory();
    bool LookIfItIsTime();
    void PostLook();
    bool IsStored(const EntryKey& inKey);
    bool IsKnown(const EntryKey& inKey) const ZO_REQUIRES(mMutex);
    void NoteState(const EntryKey& inKey, const FileState& inState);
    void ReadFile(WaitingRead& ioRead);

    const shared_ptr<CacheDirectory> mDirectory;
    const shared_ptr<ostcore::threads::AsyncThreadedExecutor> mReaders;
    const shared_ptr<ostcore::threads::AsyncThreadedExecutor> mWriter;
    std::atomic<bool> mIsClosed{false};

    // Of the writer alone.
    std::size_t mWritesSinceLook = 0;
    std::uint64_t mBytesSinceLook = 0;
    std::size_t mCountAtLook = 0;
    std::uint64_t mBytesAtLook = 0;
    std::chrono::steady_clock::time_point mLastLook;

    mutable ostcore::threads::Mutex mMutex;
    ostcore::threads::ConditionVariable mWritten;
    shared_ptr<DirectoryIndex> mIndex ZO_GUARDED_BY(mMutex);
    /// Whether the index is that of a look; before the first it holds what this process has touched.
    bool mHasLooked ZO_GUARDED_BY(mMutex) = false;
    bool mIsLookPosted ZO_GUARDED_BY(mMutex) = false;
    std::size_t mLookups ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mMaximumCount ZO_GUARDED_BY(mMutex) = DiskCacheManager::kDefaultMaximumFileCount;
    std::uint64_t mMaximumBytes ZO_GUARDED_BY(mMutex) = DiskCacheManager::kDefaultMaximumByteCount;
    std::set<std::string> mKnownNames ZO_GUARDED_BY(mMutex);
    std::deque<WaitingRead> mReads ZO_GUARDED_BY(mMutex);
    std::uint64_t mLastRead ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mReadTurns ZO_GUARDED_BY(mMutex) = 0;
    std::deque<EntryKey> mKeysToWrite ZO_GUARDED_BY(mMutex);
    bool mHasWriteTurn ZO_GUARDED_BY(mMutex) = false;
    Pending mPending ZO_GUARDED_BY(mMutex);
    std::uint64_t mPendingBytes ZO_GUARDED_BY(mMutex) = 0;
};

}  // namespace detail
}  // namespace QM
