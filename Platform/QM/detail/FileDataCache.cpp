#include "QM/detail/FileDataCache.h"

#include <algorithm>
#include <ctime>
#include <iterator>
#include <thread>

#include "ostcore/debug/Trace.h"
#include "ostcore/threads/detail/GuardedCall.h"

namespace QM {
namespace detail {

using ostcore::threads::MutexLock;

namespace {

const ostcore::debug::TraceChannel& Channel() {
    static const ostcore::debug::TraceChannel sChannel("QM.DataCache");
    return sChannel;
}

constexpr std::uint64_t kMaximumPendingBytes = 64ull << 20;
/// The look at a large directory costs a fraction of a second, which a short-lived process need not pay for a
/// few reads.
constexpr std::size_t kLookupsBeforeLook = 32;
constexpr std::size_t kMaximumKnownNames = 16;
constexpr std::size_t kWritesInATurn = 256;
constexpr std::size_t kReadsInSight = 8;
constexpr std::chrono::minutes kLookPeriod{10};
constexpr std::int64_t kNanoseconds = 1000000000;

/// Who lists the names of a key reads one of them next, on the same thread.
EntryKey KeyWithoutName(const ImmutableString& inKey) {
    thread_local ImmutableString lastText;
    thread_local EntryKey lastKey;
    if (lastText != inKey) {
        lastKey = MakeEntryKeyWithoutName(inKey.view());
        lastText = inKey;
    }
    return lastKey;
}

bool KeyOf(const ImmutableString& inKey, const ImmutableString& inName, EntryKey& outKey) {
    if (inKey.empty()) {
        return false;
    }
    outKey = KeyWithoutName(inKey);
    return SetName(outKey, inName.view());
}

/// The size alone, while the stamp is young enough to need no other.
FileState KnownStateOf(const FileState& inFile) {
    const bool isYoung = std::abs(std::time(nullptr) - inFile.stamp) <= CacheDirectory::kStampSeconds;
    return {isYoung ? inFile.size : 0, 0};
}

/// More would contend for the processor, fewer would let one slow read hold up all others.
std::size_t MostReadTurns() {
    static const std::size_t sMost = std::clamp<std::size_t>(std::thread::hardware_concurrency(), 2, 8);
    return sMost;
}

/// How much this process may add before another look is worth while. A look costs as much as there are files,
/// so that a directory with room is looked at less often: four processes that fill it at once keep the bound.
template <class Amount>
Amount AddedBetweenLooks(Amount inMaximum, Amount inHeld) {
    return std::max<Amount>({inMaximum / 32, inMaximum > inHeld ? (inMaximum - inHeld) / 4 : 0, 64});
}

}  // namespace

shared_ptr<FileDataCache> FileDataCache::Create(shared_ptr<CacheDirectory> inDirectory) {
    return shared_ptr<FileDataCache>(new FileDataCache(std::move(inDirectory)));
}

FileDataCache::FileDataCache(shared_ptr<CacheDirectory> inDirectory)
    : mDirectory(std::move(inDirectory)),
      mReaders(ostcore::threads::CreateIOBoundExecutor("content cache")),
      mWriter(ostcore::threads::CreateSubExecutor(mReaders)),
      mIndex(boost::make_shared<DirectoryIndex>()) {}

// --- Looking up and reading.

/// Whether there is such a file, by what is known or else by a question to the system: another process may
/// have written it.
bool FileDataCache::IsStored(const EntryKey& inKey) {
    {
        MutexLock lock(mMutex);
        if (IsKnown(inKey)) {
            return true;
        }
    }
    return mDirectory->Exists(inKey);
}

bool FileDataCache::IsKnown(const EntryKey& inKey) const {
    return mPending.count(inKey) > 0 || mIndex->Contains(inKey);
}

std::vector<ImmutableString> FileDataCache::ListNames(const ImmutableString& inKey) {
    std::vector<ImmutableString> found;
    if (inKey.empty() || mIsClosed) {
        return found;
    }
    EntryKey key = KeyWithoutName(inKey);
    std::vector<std::string> names, candidates;
    bool areNamesKnown = false;
    bool isLookDue = false;
    {
        MutexLock lock(mMutex);
        areNamesKnown = mHasLooked;
        isLookDue = ++mLookups == kLookupsBeforeLook;
        for (const std::string& name : mKnownNames) {
            if (SetName(key, name)) {
                (IsKnown(key) ? names : candidates).push_back(name);
            }
        }
    }
    if (isLookDue) {
        PostLook();
    }
    // Before the first look nobody knows which names there are.
    if (!areNamesKnown) {
        const std::vector<std::string> listed = mDirectory->ListNames(key);
        candidates.insert(candidates.end(), listed.begin(), listed.end());
    }
    // Another process may have written it.
    for (const std::string& name : candidates) {
        const bool isTold = std::find(names.begin(), names.end(), name) != names.end();
        if (!isTold && SetName(key, name) && mDirectory->Exists(key)) {
            names.push_back(name);
        }
    }
    std::sort(names.begin(), names.end());
    for (const std::string& name : names) {
        found.emplace_back(name);
    }
    return found;
}

bool FileDataCache::Contains(const ImmutableString& inKey, const ImmutableString& inName) {
    EntryKey key;
    return !mIsClosed && KeyOf(inKey, inName, key) && IsStored(key);
}

int FileDataCache::Read(const ImmutableString& inKey, const ImmutableString& inName,
                        const ReadCompletion& inCompletion, Payload& outPayload) {
    EntryKey key;
    if (mIsClosed || !inCompletion || !KeyOf(inKey, inName, key)) {
        return kResultFailure;
    }
    std::uint64_t number = 0;
    bool isKnown = false, needsTurn = false;
    {
        MutexLock lock(mMutex);
        const auto pending = mPending.find(key);
        if (pending != mPending.end()) {
            outPayload = pending->second;
            return kResultContentAvailable;
        }
        const FileState* const file = mIndex->Find(key);
        isKnown = file != nullptr;
        needsTurn = isKnown && QueueRead(key, KnownStateOf(*file), inCompletion, number);
    }
    if (!isKnown) {
        if (!mDirectory->Exists(key)) {
            return kResultFailure;
        }
        MutexLock lock(mMutex);
        needsTurn = QueueRead(key, {}, inCompletion, number);
    }
    return !needsTurn || PostReads(number) ? kResultContentPending : kResultFailure;
}

/// Whether another thread is to take a turn for it.
bool FileDataCache::QueueRead(const EntryKey& inKey, const FileState& inState,
                              const ReadCompletion& inCompletion, std::uint64_t& outNumber) {
    outNumber = ++mLastRead;
    mReads.push_back({outNumber, inKey, inCompletion, inState});
    if (mReadTurns >= MostReadTurns()) {
        return false;
    }
    ++mReadTurns;
    return true;
}

/// False when the read of that number will not take place.
bool FileDataCache::PostReads(std::uint64_t inNumber) {
    const auto self = shared_from_this();
    if (mReaders->Post([self] { self->RunReads(); })) {
        return true;
    }
    WaitingRead dropped;
    MutexLock lock(mMutex);
    --mReadTurns;
    const auto found = std::find_if(mReads.begin(), mReads.end(), [inNumber](const WaitingRead& inRead) {
        return inRead.number == inNumber;
    });
    if (found == mReads.end()) {
        return true;
    }
    dropped = std::move(*found);
    mReads.erase(found);
    lock.Unlock();
    return false;
}

/// Takes the next reads, after it has marked what the last ones have used: all that needs the lock, in one
/// go. Many at a time only when so many wait that a slow one among them holds up few of all. False when none
/// waits; then the turn has ended.
bool FileDataCache::TakeReads(Reads& ioReads) {
    MutexLock lock(mMutex);
    for (const WaitingRead& read : ioReads) {
        mIndex->Touch(read.key);
    }
    ioReads.clear();
    const std::size_t count =
        std::min(ioReads.capacity(), (mReads.size() + kReadsInSight - 1) / kReadsInSight);
    const auto end = mReads.begin() + static_cast<std::ptrdiff_t>(count);
    std::move(mReads.begin(), end, std::back_inserter(ioReads));
    mReads.erase(mReads.begin(), end);
    mReadTurns -= count == 0 ? 1 : 0;
    return count > 0;
}

void FileDataCache::RunReads() {
    Reads reads;
    while (TakeReads(reads)) {
        for (WaitingRead& read : reads) {
            ostcore::threads::CallGuarded([&] { ReadFile(read); }, "a read of a cache");
            read.completion.clear();
        }
    }
}

void FileDataCache::ReadFile(WaitingRead& ioRead) {
    shared_ptr<RecycledMemory> payload;
    const CacheDirectory::Outcome outcome = mDirectory->Read(ioRead.key, ioRead.state, payload);
    if (outcome == CacheDirectory::Outcome::kRead && ioRead.state.stamp != 0) {
        NoteState(ioRead.key, ioRead.state);
    } else if (outcome == CacheDirectory::Outcome::kMissing || outcome == CacheDirectory::Outcome::kDamaged) {
        MutexLock lock(mMutex);
        mIndex->Remove(ioRead.key);
    }
    if (outcome == CacheDirectory::Outcome::kDamaged) {
        ostcore::debug::Trace(
            Channel(), ostcore::debug::kTraceLevel_Error,
            "A file of the cache was damaged and has been dropped: " + FileNameOf(ioRead.key));
    }
    ioRead.completion(payload ? 0 : kResultFailure, payload);
}

/// A file that another process has written counts from its first use on.
void FileDataCache::NoteState(const EntryKey& inKey, const FileState& inState) {
    MutexLock lock(mMutex);
    mIndex->Insert(inKey, inState);
    const bool isTooMuch = mIndex->Count() > mMaximumCount || mIndex->Bytes() > mMaximumBytes;
    lock.Unlock();
    if (isTooMuch) {
        PostMakeRoom();
    }
}

// --- Writing.

bool FileDataCache::Write(const ImmutableString& inKey, const ImmutableString& inName,
                          const Payload& inPayload) {
    EntryKey key;
    if (mIsClosed || !inPayload || inPayload->size() > CacheDirectory::kMaximumPayloadSize ||
        !KeyOf(inKey, inName, key)) {
        return false;
    }
    {
        MutexLock lock(mMutex);
        const bool isQueueFull =
            !mPending.empty() && mPendingBytes + inPayload->size() > kMaximumPendingBytes;
        if (isQueueFull || inPayload->size() > mMaximumBytes / 4) {
            return false;
        }
        mPendingBytes += inPayload->size();
        if (mKnownNames.size() < kMaximumKnownNames) {
            mKnownNames.emplace(inName.view());
        }
        Payload& pending = mPending[key];
        const bool isOnItsWay = pending != nullptr;
        if (isOnItsWay) {
            mPendingBytes -= pending->size();
        }
        pending = inPayload;
        if (isOnItsWay) {
            return true;
        }
        mKeysToWrite.push_back(key);
        if (mHasWriteTurn) {
            return true;
        }
        mHasWriteTurn = true;
    }
    return PostWrites(key);
}

/// The executor refuses nothing but what comes after the end of use.
bool FileDataCache::PostWrites(const EntryKey& inKey) {
    const auto self = shared_from_this();
    if (mWriter->Post([self] { self->RunWrites(); })) {
        return true;
    }
    MutexLock lock(mMutex);
    mKeysToWrite.clear();
    DropPending(inKey);
    return false;
}

/// False when there is none; then the turn has ended.
bool FileDataCache::TakeKeyToWrite(EntryKey& outKey) {
    MutexLock lock(mMutex);
    if (mKeysToWrite.empty()) {
        mHasWriteTurn = false;
        return false;
    }
    outKey = mKeysToWrite.front();
    mKeysToWrite.pop_front();
    return true;
}

/// Lets the other work of the writer through from time to time.
void FileDataCache::RunWrites() {
    EntryKey key;
    for (std::size_t count = 0; count < kWritesInATurn; ++count) {
        if (mIsClosed || !TakeKeyToWrite(key)) {
            return;
        }
        ostcore::threads::CallGuarded([&] { WritePending(key); }, "a write of a cache");
    }
    PostWrites(key);
}

void FileDataCache::DropPending(const EntryKey& inKey) {
    const auto found = mPending.find(inKey);
    if (found != mPending.end()) {
        mPendingBytes -= found->second->size();
        mPending.erase(found);
        if (mPending.empty()) {
            mWritten.NotifyAll();
        }
    }
}

Payload FileDataCache::FindPending(const EntryKey& inKey) {
    MutexLock lock(mMutex);
    const auto found = mPending.find(inKey);
    return found == mPending.end() ? Payload() : found->second;
}

/// Writes what waits under the key, and what came in its place meanwhile.
void FileDataCache::WritePending(const EntryKey& inKey) {
    while (const Payload payload = FindPending(inKey)) {
        WriteWithinBounds(inKey, payload);
        MutexLock lock(mMutex);
        const auto found = mPending.find(inKey);
        if (found != mPending.end() && found->second == payload) {
            DropPending(inKey);
            return;
        }
        const bool isRemoved = found == mPending.end();
        lock.Unlock();
        if (isRemoved) {
            RemoveFile(inKey);
        }
    }
}

void FileDataCache::WriteWithinBounds(const EntryKey& inKey, const Payload& inPayload) {
    if (!LookIfItIsTime()) {
        return;
    }
    const std::uint64_t size = CacheDirectory::FileSizeOf(inPayload->size());
    if (MakeRoom(&inKey, size) && mDirectory->Write(inKey, inPayload->view())) {
        MutexLock lock(mMutex);
        mIndex->Insert(inKey, {size, std::time(nullptr)});
    }
    ++mWritesSinceLook;
    mBytesSinceLook += size;
}

/// Takes the file out of the index whose turn it is to go, if one has to.
bool FileDataCache::TakeVictim(const EntryKey* inFor, std::uint64_t inSize, EntryKey& outVictim,
                               std::uint64_t& outSize) {
    MutexLock lock(mMutex);
    const bool isNew = inFor && !mIndex->Contains(*inFor);
    const std::uint64_t replaced = inFor ? mIndex->SizeOf(*inFor) : 0;
    const bool fits = mIndex->Count() + (isNew ? 1 : 0) <= mMaximumCount &&
                      mIndex->Bytes() - replaced + inSize <= mMaximumBytes;
    return !fits && mIndex->TakeOldest(outVictim, outSize);
}

/// Removes files until one of that size can be added; with null, until the bounds are kept as it is. False
/// when one could not be removed, which counts on, behind all others.
bool FileDataCache::MakeRoom(const EntryKey* inFor, std::uint64_t inSize) {
    EntryKey victim;
    std::uint64_t size = 0;
    while (TakeVictim(inFor, inSize, victim, size)) {
        if (!mDirectory->Remove(victim)) {
            MutexLock lock(mMutex);
            mIndex->Insert(victim, {size, 0});
            return false;
        }
    }
    return true;
}

void FileDataCache::PostMakeRoom() {
    const auto self = shared_from_this();
    mWriter->Post([self] { self->MakeRoom(nullptr, 0); });
}

void FileDataCache::Remove(const ImmutableString& inKey, const ImmutableString& inName) {
    EntryKey key;
    if (!KeyOf(inKey, inName, key)) {
        return;
    }
    {
        MutexLock lock(mMutex);
        DropPending(key);
    }
    RemoveFile(key);
}

void FileDataCache::RemoveFile(const EntryKey& inKey) {
    mDirectory->Remove(inKey);
    MutexLock lock(mMutex);
    mIndex->Remove(inKey);
}

// --- Looking at the directory.

/// False when nothing is known of the directory, so that nothing may be added to it.
bool FileDataCache::LookIfItIsTime() {
    bool isTime = false, hasLooked = false;
    {
        MutexLock lock(mMutex);
        hasLooked = mHasLooked;
        isTime = mWritesSinceLook >= AddedBetweenLooks(mMaximumCount, mCountAtLook) ||
                 mBytesSinceLook >= AddedBetweenLooks(mMaximumBytes, mBytesAtLook);
    }
    if (hasLooked && !isTime && std::chrono::steady_clock::now() - mLastLook < kLookPeriod) {
        return true;
    }
    return LookAtDirectory() || hasLooked;
}

bool FileDataCache::LookAtDirectory() {
    std::vector<CacheDirectory::Found> files;
    if (!mDirectory->ListAll(mIsClosed, files)) {
        return false;
    }
    auto index = boost::make_shared<DirectoryIndex>();
    index->Reserve(files.size());
    std::set<std::string> names;
    for (const CacheDirectory::Found& file : files) {
        index->Insert(file.key, {file.size, file.lastUse / kNanoseconds});
        if (names.size() < kMaximumKnownNames) {
            names.emplace(file.key.Name());
        }
    }
    mWritesSinceLook = 0;
    mBytesSinceLook = 0;
    mCountAtLook = index->Count();
    mBytesAtLook = index->Bytes();
    mLastLook = std::chrono::steady_clock::now();
    {
        MutexLock lock(mMutex);
        mIndex.swap(index);
        mHasLooked = true;
        if (mKnownNames.size() < kMaximumKnownNames) {
            mKnownNames.merge(names);
        }
    }
    MakeRoom(nullptr, 0);
    return true;
}

void FileDataCache::PostLook() {
    {
        MutexLock lock(mMutex);
        if (mHasLooked || mIsLookPosted) {
            return;
        }
        mIsLookPosted = true;
    }
    const auto self = shared_from_this();
    mWriter->Post([self] { self->LookIfItIsTime(); });
}

// --- Bounds.

void FileDataCache::SetMaxFileCount(std::size_t inCount) {
    MutexLock lock(mMutex);
    mMaximumCount = std::max<std::size_t>(inCount, 1);
    const bool isTooMuch = mIndex->Count() > mMaximumCount;
    lock.Unlock();
    if (isTooMuch) {
        PostMakeRoom();
    }
}

void FileDataCache::SetMaxByteCount(std::uint64_t inBytes) {
    MutexLock lock(mMutex);
    mMaximumBytes = inBytes;
    const bool isTooMuch = mIndex->Bytes() > mMaximumBytes;
    lock.Unlock();
    if (isTooMuch) {
        PostMakeRoom();
    }
}

std::size_t FileDataCache::GetFileCount() const {
    MutexLock lock(mMutex);
    return mIndex->Count();
}

std::uint64_t FileDataCache::GetByteCount() const {
    MutexLock lock(mMutex);
    return mIndex->Bytes();
}

// --- The end.

bool FileDataCache::WaitForWrites(std::uint32_t inMilliseconds) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
    MutexLock lock(mMutex);
    while (!mPending.empty()) {
        if (!mWritten.WaitUntil(lock, end) && !mPending.empty()) {
            return false;
        }
    }
    return true;
}

void FileDataCache::Close(std::uint32_t inMilliseconds) {
    WaitForWrites(inMilliseconds);
    mIsClosed = true;
    mWriter->Stop();
    // A read can hang in the system, on a disk that is somewhere else; the end of the host must not.
    mReaders->Wait(inMilliseconds);
    MutexLock lock(mMutex);
    mPending.clear();
    mPendingBytes = 0;
}

}  // namespace detail
}  // namespace QM
