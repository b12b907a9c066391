#include "QM/detail/CacheDirectory.h"

#include <fcntl.h>
#include <unistd.h>
#include <algorithm>
#include <cerrno>
#include <ctime>
#include <new>
#include <system_error>

#include "ostcore/filesupport/Dir.h"
#include "ostcore/utility/Guid.h"

namespace QM {
namespace detail {
namespace {

constexpr int kShards = 256;
/// Not blocking, so that a pipe in the place of a file does not hold us up before it is refused.
constexpr int kReadFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
// The time of access is nobody's concern here, and to note it costs the file system as much as the read. Of a
// file of somebody else the system refuses it; then the longer way is taken.
constexpr int kQuickReadFlags = kReadFlags | O_NOATIME;
constexpr std::int64_t kSweepAfterSeconds = 3600;
constexpr std::string_view kAsidePrefix = ".new-";

std::string SystemReason() {
    return std::generic_category().message(errno);
}

std::string ShardName(int inNumber) {
    EntryKey key;
    key.digest[0] = static_cast<unsigned char>(inNumber);
    return DirectoryNameOf(key);
}

std::string AsideName() {
    return std::string(kAsidePrefix) + ostcore::utility::Guid::CreateUnique().ToString();
}

bool IsAsideName(std::string_view inName) {
    return inName.substr(0, kAsidePrefix.size()) == kAsidePrefix;
}

/// Whose the directory is, too.
uid_t User() {
    static const uid_t sUser = ::geteuid();
    return sUser;
}

bool IsOwnRegularFile(const struct stat& inStatus) {
    return S_ISREG(inStatus.st_mode) && inStatus.st_uid == User();
}

/// Moves on by so many bytes; returns how many parts are left.
int Advance(iovec*& ioParts, int inCount, std::size_t inBytes) {
    while (inCount > 0 && inBytes >= ioParts->iov_len) {
        inBytes -= ioParts->iov_len;
        ++ioParts;
        --inCount;
    }
    if (inCount > 0) {
        ioParts->iov_base = static_cast<char*>(ioParts->iov_base) + inBytes;
        ioParts->iov_len -= inBytes;
    }
    return inCount;
}

/// Calls until no more than so many parts are left, and returns how many are. More are left after a failure,
/// and when nothing moves any more.
template <class Call>
int Transfer(const Call& inCall, iovec* inParts, int inCount, int inEnough = 0) {
    inCount = Advance(inParts, inCount, 0);
    while (inCount > inEnough) {
        const ssize_t moved = inCall(inParts, inCount);
        if (moved < 0 && errno == EINTR) {
            continue;
        }
        if (moved <= 0) {
            break;
        }
        inCount = Advance(inParts, inCount, static_cast<std::size_t>(moved));
    }
    return inCount;
}

/// There is no such directory, or nothing in it can be used anyway.
bool IsUnusable(int inError) {
    return inError == ENOENT || inError == ENOTDIR || inError == ELOOP || inError == EACCES;
}

class Listing {
public:
    Listing(FileOperations& inOperations, OpenFile ioFile)
        : mOperations(inOperations),
          mDirectory(ioFile.IsOpen() ? inOperations.OpenDirectory(ioFile.Release()) : nullptr) {}
    ~Listing() {
        if (mDirectory) {
            mOperations.CloseDirectory(mDirectory);
        }
    }
    Listing(const Listing&) = delete;
    Listing& operator=(const Listing&) = delete;

    /// Empty at the end, and after a failure, which errno tells.
    std::string_view Next() {
        const dirent* const entry = mDirectory ? mOperations.ReadDirectory(mDirectory) : nullptr;
        return entry ? std::string_view(entry->d_name) : std::string_view();
    }
    bool IsOpen() const { return mDirectory != nullptr; }
    int Descriptor() const { return ::dirfd(mDirectory); }

private:
    FileOperations& mOperations;
    DIR* const mDirectory;
};

/// Opens a directory that lies in a directory, neither of them by way of a link.
int OpenLastTwo(FileOperations& inOperations, const std::string& inPath) {
    const std::size_t end = inPath.find_last_not_of('/');
    const std::string path = inPath.substr(0, end == std::string::npos ? 0 : end + 1);
    const std::size_t slash = path.rfind('/');
    const std::string parent = slash == std::string::npos ? "." : slash == 0 ? "/" : path.substr(0, slash);
    const std::string name = slash == std::string::npos ? path : path.substr(slash + 1);
    constexpr int kFlags = O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    const OpenFile above(inOperations, inOperations.OpenAt(AT_FDCWD, parent.c_str(), O_PATH | kFlags, 0));
    return above.IsOpen() ? inOperations.OpenAt(above.Get(), name.c_str(), O_RDONLY | kFlags, 0) : -1;
}

bool IsOurs(FileOperations& inOperations, int inDirectory, std::string& outError) {
    struct stat status {};
    if (inOperations.FStat(inDirectory, status) != 0) {
        outError = SystemReason();
        return false;
    }
    if (status.st_uid != User()) {
        outError = "it belongs to another user";
        return false;
    }
    if ((status.st_mode & 077) != 0 && inOperations.FChMod(inDirectory, 0700) != 0) {
        outError = "others may read it, and this cannot be changed: " + SystemReason();
        return false;
    }
    return true;
}

}  // namespace

shared_ptr<CacheDirectory> CacheDirectory::Open(const std::string& inPath, bool inCreate,
                                                const shared_ptr<FileOperations>& inOperations,
                                                std::string& outError) {
    if (inCreate && !ostcore::filesupport::Dir(inPath).CreatePrivate(&outError)) {
        return {};
    }
    OpenFile root(*inOperations, OpenLastTwo(*inOperations, inPath));
    if (!root.IsOpen()) {
        outError = SystemReason();
        return {};
    }
    if (!IsOurs(*inOperations, root.Get(), outError)) {
        return {};
    }
    return boost::make_shared<CacheDirectory>(inOperations, root.Release());
}

CacheDirectory::CacheDirectory(shared_ptr<FileOperations> inOperations, int inRoot)
    : mOperations(std::move(inOperations)), mRoot(inRoot) {}

CacheDirectory::~CacheDirectory() {
    mOperations->Close(mRoot);
}

OpenFile CacheDirectory::OpenShard(const std::string& inName, int inFlags) const {
    return {*mOperations,
            mOperations->OpenAt(mRoot, inName.c_str(), inFlags | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC, 0)};
}

OpenFile CacheDirectory::MakeShard(const std::string& inName) const {
    OpenFile shard = OpenShard(inName, O_PATH);
    if (shard.IsOpen() || errno != ENOENT) {
        return {*mOperations, shard.Release()};
    }
    if (mOperations->MkDirAt(mRoot, inName.c_str(), 0700) != 0 && errno != EEXIST) {
        return {*mOperations, -1};
    }
    return OpenShard(inName, O_PATH);
}

/// False as well when the file goes on behind the payload.
bool CacheDirectory::ReadWhole(int inFile, Header& outHeader, RecycledMemory& outPayload) const {
    char more = 0;
    iovec parts[] = {
        {outHeader.data(), outHeader.size()}, {outPayload.data(), outPayload.size()}, {&more, 1}};
    errno = 0;
    return Transfer([&](const iovec* inParts,
                        int inCount) { return mOperations->ReadV(inFile, inParts, inCount); },
                    parts, 3, 1) == 1;
}

/// Of a file of that size. The size can come from the disk, so there may be too little memory for it.
CacheDirectory::Outcome CacheDirectory::ReadContent(int inFile, const EntryKey& inKey, std::uint64_t inSize,
                                                    shared_ptr<RecycledMemory>& outPayload) const {
    shared_ptr<RecycledMemory> payload;
    try {
        payload = RecycledMemory::Create(static_cast<std::size_t>(inSize - kHeaderSize));
    } catch (const std::bad_alloc&) {
        return Outcome::kFailed;
    }
    Header header{};
    if (!ReadWhole(inFile, header, *payload)) {
        return errno != 0 ? Outcome::kFailed : Outcome::kDamaged;
    }
    std::uint64_t length = 0;
    if (!ReadHeader(header, inKey, length) || length != payload->size() ||
        !IsPayloadOf(header, payload->view())) {
        return Outcome::kDamaged;
    }
    outPayload = payload;
    return Outcome::kRead;
}

CacheDirectory::Outcome CacheDirectory::ReadOpened(int inFile, const EntryKey& inKey, FileState& outState,
                                                   shared_ptr<RecycledMemory>& outPayload) const {
    struct stat status {};
    if (mOperations->FStat(inFile, status) != 0) {
        return Outcome::kFailed;
    }
    const auto size = static_cast<std::uint64_t>(std::max<off_t>(status.st_size, 0));
    if (!IsOwnRegularFile(status) || size < kHeaderSize || size > FileSizeOf(kMaximumPayloadSize)) {
        return Outcome::kDamaged;
    }
    const Outcome outcome = ReadContent(inFile, inKey, size, outPayload);
    const std::int64_t now = std::time(nullptr);
    outState = {size, status.st_mtim.tv_sec};
    if (outcome == Outcome::kRead && std::abs(now - outState.stamp) > kStampSeconds) {
        mOperations->Touch(inFile);
        outState.stamp = now;
    }
    return outcome;
}

CacheDirectory::Outcome CacheDirectory::Read(const EntryKey& inKey, FileState& ioState,
                                             shared_ptr<RecycledMemory>& outPayload) const {
    const std::string path = DirectoryNameOf(inKey) + "/" + FileNameOf(inKey);
    const OpenFile file(*mOperations, mOperations->OpenBeneath(mRoot, path.c_str(), kQuickReadFlags));
    if (!file.IsOpen()) {
        return errno == ENOENT ? Outcome::kMissing : ReadStepByStep(inKey, ioState, outPayload);
    }
    const bool isKnown = ioState.size >= kHeaderSize;
    const Outcome outcome = isKnown ? ReadContent(file.Get(), inKey, ioState.size, outPayload)
                                    : ReadOpened(file.Get(), inKey, ioState, outPayload);
    // Not as known, or damaged: the longer way sees it again and knows where to remove it.
    return outcome == Outcome::kDamaged ? ReadStepByStep(inKey, ioState, outPayload) : outcome;
}

CacheDirectory::Outcome CacheDirectory::ReadStepByStep(const EntryKey& inKey, FileState& outState,
                                                       shared_ptr<RecycledMemory>& outPayload) const {
    const std::string name = FileNameOf(inKey);
    const OpenFile shard = OpenShard(DirectoryNameOf(inKey), O_PATH);
    if (!shard.IsOpen()) {
        return errno == ENOENT ? Outcome::kMissing : Outcome::kFailed;
    }
    const OpenFile file(*mOperations, mOperations->OpenAt(shard.Get(), name.c_str(), kReadFlags, 0));
    const bool isLink = !file.IsOpen() && errno == ELOOP;
    if (!file.IsOpen() && !isLink) {
        return errno == ENOENT ? Outcome::kMissing : Outcome::kFailed;
    }
    const Outcome outcome = isLink ? Outcome::kDamaged : ReadOpened(file.Get(), inKey, outState, outPayload);
    if (outcome == Outcome::kDamaged) {
        mOperations->UnlinkAt(shard.Get(), name.c_str());
    }
    return outcome;
}

bool CacheDirectory::WriteWhole(int inFile, const EntryKey& inKey, std::string_view inPayload) const {
    Header header = MakeHeader(inKey, inPayload);
    iovec parts[] = {{header.data(), header.size()}, {const_cast<char*>(inPayload.data()), inPayload.size()}};
    return Transfer([&](const iovec* inParts,
                        int inCount) { return mOperations->WriteV(inFile, inParts, inCount); },
                    parts, 2) == 0;
}

bool CacheDirectory::Write(const EntryKey& inKey, std::string_view inPayload) const {
    const OpenFile shard = MakeShard(DirectoryNameOf(inKey));
    if (!shard.IsOpen()) {
        return false;
    }
    const std::string aside = AsideName();
    OpenFile file(*mOperations,
                  mOperations->OpenAt(shard.Get(), aside.c_str(),
                                      O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    if (!file.IsOpen()) {
        return false;
    }
    const bool isWhole = WriteWhole(file.Get(), inKey, inPayload);
    // The file systems of networks tell only at the end that there was no room.
    const bool isClosed = mOperations->Close(file.Release()) == 0;
    if (isWhole && isClosed &&
        mOperations->RenameAt(shard.Get(), aside.c_str(), FileNameOf(inKey).c_str()) == 0) {
        return true;
    }
    mOperations->UnlinkAt(shard.Get(), aside.c_str());
    return false;
}

bool CacheDirectory::Exists(const EntryKey& inKey) const {
    const OpenFile shard = OpenShard(DirectoryNameOf(inKey), O_PATH);
    struct stat status {};
    return shard.IsOpen() && mOperations->StatAt(shard.Get(), FileNameOf(inKey).c_str(), status) == 0 &&
           IsOwnRegularFile(status);
}

std::vector<std::string> CacheDirectory::ListNames(const EntryKey& inKey) const {
    std::vector<std::string> names;
    Listing listing(*mOperations, OpenShard(DirectoryNameOf(inKey), O_RDONLY));
    for (std::string_view name = listing.Next(); !name.empty(); name = listing.Next()) {
        EntryKey key;
        if (ParseFileName(name, key) && key.digest == inKey.digest) {
            names.emplace_back(key.Name());
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

bool CacheDirectory::Remove(const EntryKey& inKey) const {
    const std::string name = FileNameOf(inKey);
    const OpenFile shard = OpenShard(DirectoryNameOf(inKey), O_PATH);
    return (shard.IsOpen() && mOperations->UnlinkAt(shard.Get(), name.c_str()) == 0) || errno == ENOENT;
}

bool CacheDirectory::ListShard(const std::string& inName, std::vector<Found>& outFound) const {
    Listing listing(*mOperations, OpenShard(inName, O_RDONLY));
    if (!listing.IsOpen()) {
        return IsUnusable(errno);
    }
    const std::int64_t now = std::time(nullptr);
    for (std::string_view name = listing.Next(); !name.empty(); name = listing.Next()) {
        Found found;
        const bool isAside = IsAsideName(name);
        struct stat status {};
        // A name from readdir ends with NUL.
        if ((!isAside && !ParseFileName(name, found.key)) ||
            mOperations->StatAt(listing.Descriptor(), name.data(), status) != 0) {
            continue;
        }
        if (!isAside) {
            found.size = static_cast<std::uint64_t>(std::max<off_t>(status.st_size, 0));
            found.lastUse = status.st_mtim.tv_sec * 1000000000 + status.st_mtim.tv_nsec;
            outFound.push_back(found);
        } else if (now - status.st_mtim.tv_sec > kSweepAfterSeconds) {
            mOperations->UnlinkAt(listing.Descriptor(), name.data());
        }
    }
    return errno == 0;
}

bool CacheDirectory::ListAll(const std::atomic<bool>& inStop, std::vector<Found>& outFound) const {
    for (int number = 0; number < kShards; ++number) {
        if (inStop.load(std::memory_order_relaxed) || !ListShard(ShardName(number), outFound)) {
            return false;
        }
    }
    std::sort(outFound.begin(), outFound.end(),
              [](const Found& inLeft, const Found& inRight) { return inLeft.lastUse < inRight.lastUse; });
    return true;
}

}  // namespace detail
}  // namespace QM
