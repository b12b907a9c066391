// Walks a folder of media.
#include "Commands/MediaFolder.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <map>
#include <set>
#include <stdexcept>
#include <utility>

#include "Base/Digest.h"
#include "Base/Text.h"

namespace zohub {

namespace fs = std::filesystem;

namespace {

constexpr int kMaxFolderDepth = 64;
constexpr std::size_t kMaxName = 255;
constexpr std::size_t kEdge = 1 << 20;

// Extension to the media type under which such a file can be shown as it is; empty for none.
std::map<std::string, std::string> const& MediaTypes() {
    static std::map<std::string, std::string> const kTypes = {{"jpg", "image/jpeg"}, {"jpeg", "image/jpeg"},
                                                              {"png", "image/png"},  {"mp4", "video/mp4"},
                                                              {"m4v", "video/mp4"},  {"mov", ""},
                                                              {"mxf", ""},           {"avi", ""},
                                                              {"mkv", ""},           {"mts", ""},
                                                              {"mpg", ""},           {"wav", ""},
                                                              {"aif", ""},           {"aiff", ""},
                                                              {"mp3", ""},           {"m4a", ""},
                                                              {"flac", ""},          {"tif", ""},
                                                              {"tiff", ""},          {"bmp", ""},
                                                              {"gif", ""},           {"exr", ""},
                                                              {"dpx", ""},           {"dng", ""}};
    return kTypes;
}

class Descriptor {
public:
    explicit Descriptor(int inValue) : mValue(inValue) {}
    ~Descriptor() {
        if (mValue >= 0)
            close(mValue);
    }
    Descriptor(Descriptor&& inOther) noexcept : mValue(std::exchange(inOther.mValue, -1)) {}
    Descriptor& operator=(Descriptor&& inOther) noexcept {
        std::swap(mValue, inOther.mValue);
        return *this;
    }
    int Get() const { return mValue; }

private:
    int mValue;
};

// Opens step by step, so that a link put in the way meanwhile leads nowhere.
Descriptor OpenBelow(fs::path const& inRoot, std::string const& inPath) {
    Descriptor at(open(inRoot.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    auto const steps = Split(inPath, '/');
    for (std::size_t i = 0; i < steps.size() && at.Get() >= 0; ++i) {
        bool const isLast = i + 1 == steps.size();
        int const flags = O_RDONLY | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK | (isLast ? 0 : O_DIRECTORY);
        at = Descriptor(openat(at.Get(), std::string(steps[i]).c_str(), flags));
    }
    return at;
}

bool ReadExactly(int inDescriptor, std::string& outBytes, std::uint64_t inOffset, std::size_t inSize) {
    outBytes.resize(inSize);
    std::size_t done = 0;
    while (done < inSize) {
        ssize_t const count =
            pread(inDescriptor, outBytes.data() + done, inSize - done, static_cast<off_t>(inOffset + done));
        if (count <= 0)
            return false;
        done += static_cast<std::size_t>(count);
    }
    return true;
}

bool IsRegular(int inDescriptor, struct stat& outStatus) {
    return inDescriptor >= 0 && fstat(inDescriptor, &outStatus) == 0 && S_ISREG(outStatus.st_mode);
}

bool IsUsableName(std::string const& inName) {
    return inName.size() <= kMaxName && IsValidUtf8(inName) && !HasControlCharacter(inName) &&
           inName.find('\\') == std::string::npos;
}

std::string ExtensionOf(std::string const& inName) {
    std::size_t const dot = inName.rfind('.');
    return dot == std::string::npos || dot == 0 ? std::string() : ToLower(inName.substr(dot + 1));
}

std::string FolderOf(std::string const& inPath) {
    std::size_t const slash = inPath.rfind('/');
    return slash == std::string::npos ? std::string() : inPath.substr(0, slash);
}

// A name as it may be told on a terminal.
std::string Shown(std::string inName) {
    for (char& c : inName)
        if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F)
            c = '?';
    return inName;
}

class Walk {
public:
    explicit Walk(fs::path inRoot) : mRoot(std::move(inRoot)) {}

    MediaFolder Run() {
        if (!fs::is_directory(mRoot))
            throw std::runtime_error("cannot import " + mRoot.string() +
                                     ": it is not a directory that can be read");
        Visit("", 0);
        std::sort(mFolder.files.begin(), mFolder.files.end(),
                  [](MediaFile const& a, MediaFile const& b) { return a.path < b.path; });
        for (auto& file : mFolder.files)
            FindSidecar(file);
        CollectFolders();
        return std::move(mFolder);
    }

private:
    void Visit(std::string const& inFolder, int inDepth) {
        if (inDepth > kMaxFolderDepth)
            return Note(inFolder, "is nested too deeply");
        std::error_code error;
        for (fs::directory_iterator at(mRoot / inFolder, error), end; !error && at != end;
             at.increment(error)) {
            std::string const name = at->path().filename().string();
            std::string const path = inFolder.empty() ? name : inFolder + "/" + name;
            if (!IsUsableName(name))
                Note(path, "has a name that cannot be used");
            else if (name[0] != '.')
                VisitEntry(*at, path, name, inDepth);
        }
        if (error)
            Note(inFolder, "cannot be read: " + error.message());
    }

    void VisitEntry(fs::directory_entry const& inEntry, std::string const& inPath, std::string const& inName,
                    int inDepth) {
        std::error_code error;
        auto const kind = inEntry.symlink_status(error).type();
        if (kind == fs::file_type::symlink)
            return Note(inPath, "is a symbolic link");
        if (kind == fs::file_type::directory)
            return Visit(inPath, inDepth + 1);
        if (kind != fs::file_type::regular)
            return Note(inPath, "is no regular file");
        std::string const extension = ExtensionOf(inName);
        if (extension == "xmp") {
            mSidecars.insert(inPath);
            return;
        }
        auto const type = MediaTypes().find(extension);
        if (type == MediaTypes().end())
            return Note(inPath, "is of no known media type");
        MediaFile file;
        file.path = inPath;
        file.folder = FolderOf(inPath);
        file.name = inName;
        file.size = inEntry.file_size(error);
        file.renditionType = type->second;
        mFolder.files.push_back(std::move(file));
    }

    void FindSidecar(MediaFile& ioFile) const {
        std::string const stem = ioFile.path.substr(0, ioFile.path.rfind('.'));
        for (auto const& candidate :
             {ioFile.path + ".xmp", ioFile.path + ".XMP", stem + ".xmp", stem + ".XMP"}) {
            if (mSidecars.count(candidate)) {
                ioFile.sidecar = candidate;
                return;
            }
        }
    }

    void CollectFolders() {
        std::set<std::string> folders;
        for (auto const& file : mFolder.files)
            for (std::string at = file.folder; !at.empty() && folders.insert(at).second; at = FolderOf(at))
                continue;
        mFolder.folders.assign(folders.begin(), folders.end());
    }

    void Note(std::string const& inPath, std::string const& inWhy) {
        mFolder.notes.push_back(Shown(inPath) + " " + inWhy);
    }

    fs::path const mRoot;
    MediaFolder mFolder;
    std::set<std::string> mSidecars;
};

}  // namespace

MediaFolder ScanMediaFolder(fs::path const& inRoot) {
    return Walk(inRoot).Run();
}

std::optional<std::string> ReadBelow(fs::path const& inRoot, std::string const& inPath,
                                     std::uint64_t inMaxSize) {
    Descriptor const file = OpenBelow(inRoot, inPath);
    struct stat status {};
    if (!IsRegular(file.Get(), status) || static_cast<std::uint64_t>(status.st_size) > inMaxSize)
        return std::nullopt;
    std::string bytes;
    if (!ReadExactly(file.Get(), bytes, 0, static_cast<std::size_t>(status.st_size)))
        return std::nullopt;
    return bytes;
}

std::optional<std::string> FingerprintBelow(fs::path const& inRoot, std::string const& inPath,
                                            std::uint64_t inFullLimit) {
    Descriptor const file = OpenBelow(inRoot, inPath);
    struct stat status {};
    if (!IsRegular(file.Get(), status))
        return std::nullopt;
    auto const size = static_cast<std::uint64_t>(status.st_size);
    Sha256 hash;
    std::string bytes;
    if (size <= inFullLimit) {
        for (std::uint64_t at = 0; at < size; at += bytes.size()) {
            if (!ReadExactly(file.Get(), bytes, at,
                             static_cast<std::size_t>(std::min<std::uint64_t>(kEdge, size - at))))
                return std::nullopt;
            hash.Update(bytes);
        }
        return hash.FinishHex();
    }
    hash.Update(std::to_string(size) + " " + std::to_string(status.st_mtim.tv_sec) + " " +
                std::to_string(status.st_mtim.tv_nsec));
    for (std::uint64_t const at : {std::uint64_t{0}, size - kEdge}) {
        if (!ReadExactly(file.Get(), bytes, at, kEdge))
            return std::nullopt;
        hash.Update(bytes);
    }
    return hash.FinishHex();
}

}  // namespace zohub
