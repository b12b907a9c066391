// Walks the folder and opens files in it step by step, so that a link put in the way leads nowhere.
#include "MediaFolder.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <map>
#include <set>
#include <utility>

#include "Failure.h"
#include "MediaFiles.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

namespace fs = std::filesystem;

constexpr int kDeepest = 64;
constexpr std::uint64_t kEdge = 64 * 1024;

std::string FolderOf(const std::string& inPath) {
    const std::size_t slash = inPath.rfind('/');
    return slash == std::string::npos ? std::string() : inPath.substr(0, slash);
}

bool HasControlCharacter(const std::string& inText) {
    return std::any_of(inText.begin(), inText.end(), [](char inCharacter) {
        const auto code = static_cast<unsigned char>(inCharacter);
        return code < 0x20 || code == 0x7F;
    });
}

bool IsUsableName(const std::string& inName) {
    return ostcore::utility::IsValidUTF8(inName) && !HasControlCharacter(inName) &&
           inName.find('\\') == std::string::npos;
}

std::string Shown(std::string inPath) {
    for (char& character : inPath) {
        if (static_cast<unsigned char>(character) < 0x20 || character == 0x7F) {
            character = '?';
        }
    }
    return ostcore::utility::ReplaceInvalidUTF8(inPath);
}

class Walk {
public:
    Walk(const std::string& inRoot, const std::function<void()>& inCheck) : mRoot(inRoot), mCheck(inCheck) {}

    MediaFolder Run() {
        OpenRoot();
        Visit("", 0);
        std::sort(
            mFolder.files.begin(), mFolder.files.end(),
            [](const FolderFile& inLeft, const FolderFile& inRight) { return inLeft.path < inRight.path; });
        for (FolderFile& file : mFolder.files) {
            FindSidecar(file);
        }
        for (const auto& [path, bytes] : mSidecars) {
            if (mTaken.count(path) == 0) {
                Leave(path, "is the sidecar of no media file here", false);
            }
        }
        CollectFolders();
        return std::move(mFolder);
    }

private:
    void OpenRoot() const {
        std::error_code error;
        if (!fs::is_directory(mRoot, error)) {
            throw Failure(fs::exists(mRoot, error) ? ExitCode::Usage : ExitCode::NotFound,
                          mRoot.string() + " is no directory", "name the folder that the media lie in");
        }
        fs::directory_iterator at(mRoot, error);
        if (error) {
            throw Failure(ExitCode::Failure, "reading " + mRoot.string() + " failed: " + error.message(),
                          "check its permissions");
        }
    }

    void Visit(const std::string& inFolder, int inDepth) {
        mCheck();
        if (inDepth > kDeepest) {
            return Leave(inFolder, "is nested too deeply", true);
        }
        std::error_code error;
        for (fs::directory_iterator at(mRoot / inFolder, error), end; !error && at != end;
             at.increment(error)) {
            const std::string name = at->path().filename().string();
            if (name[0] != '.') {
                VisitEntry(*at, inFolder.empty() ? name : inFolder + "/" + name, name, inDepth);
            }
        }
        if (error) {
            Leave(inFolder, "cannot be read: " + error.message(), true);
        }
    }

    void VisitEntry(const fs::directory_entry& inEntry, const std::string& inPath, const std::string& inName,
                    int inDepth) {
        std::error_code error;
        const auto kind = inEntry.symlink_status(error).type();
        const bool isFolder = kind == fs::file_type::directory;
        const std::string extension = ExtensionOf(inName);
        const auto mediaType = MediaTypeOfName(inName);
        if (!IsUsableName(inName)) {
            const bool isWanted = isFolder || extension == "xmp" || mediaType;
            return Leave(inPath, "has a name that is not well-formed", isWanted);
        }
        if (isFolder) {
            return Visit(inPath, inDepth + 1);
        }
        if (kind == fs::file_type::symlink) {
            return Leave(inPath, "is a symbolic link", false);
        }
        if (kind != fs::file_type::regular) {
            return Leave(inPath, "is no regular file", false);
        }
        const std::uint64_t bytes = inEntry.file_size(error);
        if (extension == "xmp") {
            mSidecars[inPath] = error ? 0 : bytes;
        } else if (mediaType) {
            const bool canBeShown = !error && bytes <= kLargestRendition;
            mFolder.files.push_back(
                {inPath, "", canBeShown ? *mediaType : std::string(), error ? 0 : bytes, 0});
        } else {
            Leave(inPath, "is no known media", false);
        }
    }

    void FindSidecar(FolderFile& ioFile) {
        const std::string stem = ioFile.path.substr(0, ioFile.path.rfind('.'));
        for (const std::string& candidate :
             {ioFile.path + ".xmp", ioFile.path + ".XMP", stem + ".xmp", stem + ".XMP"}) {
            const auto found = mSidecars.find(candidate);
            if (found != mSidecars.end()) {
                ioFile.sidecar = candidate;
                ioFile.sidecarBytes = found->second;
                mTaken.insert(candidate);
                return;
            }
        }
    }

    void CollectFolders() {
        std::set<std::string> folders;
        for (const FolderFile& file : mFolder.files) {
            for (std::string at = file.Folder(); !at.empty() && folders.insert(at).second;) {
                at = FolderOf(at);
            }
        }
        mFolder.folders.assign(folders.begin(), folders.end());
    }

    void Leave(const std::string& inPath, const std::string& inReason, bool inIsFailure) {
        mFolder.leftOut.push_back({Shown(inPath), inReason, inIsFailure});
    }

    const fs::path mRoot;
    const std::function<void()>& mCheck;
    MediaFolder mFolder;
    std::map<std::string, std::uint64_t> mSidecars;
    std::set<std::string> mTaken;
};

class OpenFile {
public:
    OpenFile(const std::string& inRoot, const std::string& inPath) : OpenFile(inPath) {
        mDescriptor = ::open(inRoot.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        for (std::size_t begin = 0; begin <= inPath.size() && mDescriptor >= 0;) {
            const std::size_t end = std::min(inPath.find('/', begin), inPath.size());
            Step(inPath.substr(begin, end - begin), end == inPath.size());
            begin = end + 1;
        }
        struct stat found {};
        if (mDescriptor < 0 || ::fstat(mDescriptor, &found) < 0) {
            Fail(std::strerror(errno));
        }
        if (!S_ISREG(found.st_mode)) {
            Fail("it is no regular file");
        }
        mBytes = static_cast<std::uint64_t>(found.st_size);
    }
    ~OpenFile() {
        if (mDescriptor >= 0) {
            ::close(mDescriptor);
        }
    }
    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    std::uint64_t Bytes() const { return mBytes; }

    // A file that was made shorter meanwhile is a failure; what was added to it is left for the next time.
    void ReadAt(std::uint64_t inOffset, char* outBytes, std::size_t inSize) const {
        for (std::size_t done = 0; done < inSize;) {
            const ssize_t got =
                ::pread(mDescriptor, outBytes + done, inSize - done, static_cast<off_t>(inOffset + done));
            if (got < 0 && errno == EINTR) {
                continue;
            }
            if (got <= 0) {
                Fail(got == 0 ? "it was changed meanwhile" : std::strerror(errno));
            }
            done += static_cast<std::size_t>(got);
        }
    }
    [[noreturn]] void Fail(const std::string& inReason) const {
        throw Failure(ExitCode::Failure, "reading " + mPath + " failed: " + inReason,
                      "check the file, then run the command again");
    }

private:
    explicit OpenFile(const std::string& inPath) : mPath(inPath) {}
    void Step(const std::string& inName, bool inIsLast) {
        const int flags = O_RDONLY | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK | (inIsLast ? 0 : O_DIRECTORY);
        const int next = ::openat(mDescriptor, inName.c_str(), flags);
        const int error = errno;
        ::close(std::exchange(mDescriptor, next));
        errno = error;
    }

    const std::string mPath;
    int mDescriptor = -1;
    std::uint64_t mBytes = 0;
};

}  // namespace

std::string FolderFile::Folder() const {
    return FolderOf(path);
}

std::string FolderFile::Name() const {
    return FileNameOf(path);
}

MediaFolder LookThroughFolder(const std::string& inRoot, const std::function<void()>& inCheck) {
    return Walk(inRoot, inCheck).Run();
}

Payload FolderReader::Read(const std::string& inPath, std::uint64_t inLargest) const {
    const OpenFile file(mRoot, inPath);
    if (file.Bytes() > inLargest) {
        file.Fail("it is larger than " + std::to_string(inLargest >> 20) + " MiB");
    }
    const auto size = static_cast<std::size_t>(file.Bytes());
    const auto memory = ostcore::utility::RecycledMemory::Create(size);
    file.ReadAt(0, memory->data(), size);
    return memory;
}

std::string FolderReader::Fingerprint(const std::string& inPath) const {
    const OpenFile file(mRoot, inPath);
    const std::uint64_t edge = std::min(file.Bytes(), kEdge);
    std::string bytes(2 * edge, '\0');
    file.ReadAt(0, bytes.data(), edge);
    file.ReadAt(file.Bytes() - edge, bytes.data() + edge, edge);
    return std::to_string(file.Bytes()) + "\n" + bytes;
}

}  // namespace zo
