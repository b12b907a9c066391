// Whole files: bounded reading and atomic replacement.
#include "ostcore/filesupport/File.h"

#include <cerrno>
#include <cstring>
#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ostcore/utility/Guid.h"

namespace ostcore {
namespace filesupport {
namespace {

using utility::RecycledMemory;

class Descriptor {
public:
    explicit Descriptor(int inDescriptor) : mDescriptor(inDescriptor) {}
    ~Descriptor() { Close(); }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    bool IsOpen() const { return mDescriptor >= 0; }
    int Get() const { return mDescriptor; }
    bool Close() {
        const int descriptor = std::exchange(mDescriptor, -1);
        return descriptor < 0 || ::close(descriptor) == 0;
    }

private:
    int mDescriptor;
};

void Tell(std::string* outError, const char* inAction, const std::string& inPath,
          const std::string& inReason) {
    if (outError) {
        *outError = std::string("Could not ") + inAction + " the file " + inPath + ": " + inReason + ".";
    }
}

std::string SystemReason() {
    return std::generic_category().message(errno);
}

bool WriteAll(int inDescriptor, std::string_view inBytes) {
    while (!inBytes.empty()) {
        const ssize_t written = ::write(inDescriptor, inBytes.data(), inBytes.size());
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            return false;
        }
        inBytes.remove_prefix(static_cast<std::size_t>(written));
    }
    return true;
}

// Reads to the end of the file, however its size changes meanwhile; false with errno set.
bool ReadAll(int inDescriptor, std::size_t inMaximumSize, RecycledMemory& ioMemory) {
    for (;;) {
        const std::size_t size = ioMemory.size();
        constexpr std::size_t kStep = 64 * 1024;
        const std::size_t room = std::min(std::max(kStep, size), inMaximumSize - size + 1);
        ioMemory.Resize(size + room);
        const ssize_t got = ::read(inDescriptor, ioMemory.data() + size, room);
        ioMemory.Resize(size + static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            return got == 0;
        }
        if (ioMemory.size() > inMaximumSize) {
            errno = EFBIG;
            return false;
        }
    }
}

std::string DirectoryOf(const std::string& inPath) {
    const std::size_t slash = inPath.rfind('/');
    if (slash == std::string::npos) {
        return ".";
    }
    return slash == 0 ? "/" : inPath.substr(0, slash);
}

bool SyncDirectory(const std::string& inDirectory) {
    const Descriptor directory(::open(inDirectory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    // Some file systems do not sync directories and say so with EINVAL.
    return directory.IsOpen() && (::fsync(directory.Get()) == 0 || errno == EINVAL);
}

// The new content under a name of its own, complete and on the disk.
bool WriteAside(const std::string& inPath, std::string_view inBytes, unsigned inMode) {
    Descriptor file(::open(inPath.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    return file.IsOpen() && ::fchmod(file.Get(), inMode) == 0 && WriteAll(file.Get(), inBytes) &&
           ::fsync(file.Get()) == 0 && file.Close();
}

// Whether nobody has written to the file since, as far as the file system tells.
bool IsUnchangedSince(int inFile, const struct stat& inBefore) {
    struct stat now {};
    return ::fstat(inFile, &now) == 0 && now.st_size == inBefore.st_size &&
           now.st_mtim.tv_sec == inBefore.st_mtim.tv_sec && now.st_mtim.tv_nsec == inBefore.st_mtim.tv_nsec;
}

}  // namespace

shared_ptr<RecycledMemory> File::Read(const std::string& inPath, std::size_t inMaximumSize,
                                      std::string* outError) {
    // Not blocking, so that a pipe in the place of the file does not hold us up before it is refused.
    const Descriptor file(::open(inPath.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    struct stat status {};
    if (!file.IsOpen() || ::fstat(file.Get(), &status) != 0) {
        Tell(outError, "read", inPath, SystemReason());
        return {};
    }
    if (!S_ISREG(status.st_mode)) {
        Tell(outError, "read", inPath, "it is not a regular file");
        return {};
    }
    const auto memory = boost::make_shared<RecycledMemory>();
    if (static_cast<std::size_t>(status.st_size) <= inMaximumSize) {
        memory->Reserve(static_cast<std::size_t>(status.st_size) + 1);
        if (ReadAll(file.Get(), inMaximumSize, *memory)) {
            if (IsUnchangedSince(file.Get(), status)) {
                return memory;
            }
            Tell(outError, "read", inPath, "it was changed meanwhile");
            return {};
        }
    } else {
        errno = EFBIG;
    }
    Tell(outError, "read", inPath,
         errno == EFBIG ? "it is larger than " + std::to_string(inMaximumSize) + " bytes" : SystemReason());
    return {};
}

bool File::ReplaceAtomically(const std::string& inPath, std::string_view inBytes, unsigned inMode,
                             std::string* outError) {
    const std::string directory = DirectoryOf(inPath);
    const std::string aside = directory + "/.zo-" + utility::Guid::CreateUnique().ToString() + ".new";
    if (!WriteAside(aside, inBytes, inMode) || ::rename(aside.c_str(), inPath.c_str()) != 0) {
        Tell(outError, "replace", inPath, SystemReason());
        ::unlink(aside.c_str());
        return false;
    }
    if (!SyncDirectory(directory)) {
        Tell(outError, "make lasting the replacement of", inPath, SystemReason());
        return false;
    }
    return true;
}

bool File::Exists(const std::string& inPath) {
    struct stat status {};
    return ::stat(inPath.c_str(), &status) == 0 && S_ISREG(status.st_mode);
}

bool File::Remove(const std::string& inPath) {
    return ::unlink(inPath.c_str()) == 0 || errno == ENOENT;
}

}  // namespace filesupport
}  // namespace ostcore
