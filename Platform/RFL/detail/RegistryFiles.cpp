// Files of the registry on POSIX systems.
#include "RFL/detail/RegistryFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <cerrno>
#include <cstdlib>
#include <vector>

#include "ostcore/config/StateDirectories.h"
#include "ostcore/filesupport/Dir.h"
#include "RFL/detail/RegistryStore.h"
#include "RFL/RFLUnknown.h"

namespace RFL {

namespace {

std::string DirectoryOf(const std::string& inFile) {
    const std::size_t slash = inFile.rfind('/');
    if (slash == std::string::npos) {
        return ".";
    }
    return slash == 0 ? "/" : inFile.substr(0, slash);
}

/// Makes a directory and its missing parents; only what is made here gets the mode.
bool MakeDirectory(const std::string& inPath, mode_t inMode) {
    struct stat status;
    if (::stat(inPath.c_str(), &status) == 0) {
        return S_ISDIR(status.st_mode);
    }
    if (inPath == "/" || inPath == "." || !MakeDirectory(DirectoryOf(inPath), inMode)) {
        return false;
    }
    if (::mkdir(inPath.c_str(), inMode) != 0) {
        return errno == EEXIST;
    }
    return ::chmod(inPath.c_str(), inMode) == 0;
}

bool Identify(const struct stat& inStatus, RegistryFileIdentity& outIdentity) {
    if (!S_ISREG(inStatus.st_mode)) {
        return false;
    }
    outIdentity.device = static_cast<std::uint64_t>(inStatus.st_dev);
    outIdentity.inode = static_cast<std::uint64_t>(inStatus.st_ino);
    return true;
}

}  // namespace

std::string RegistryFile(RegistryRoot inRoot) {
    if (inRoot == RegistryRoot::Machine) {
        const char* file = std::getenv("ZOCLIENT_MACHINE_CONFIG");
        return file && *file ? file : "/etc/zoclient/registry.sqlite";
    }
    return ostcore::config::GetConfigDirectory().Path() + "/registry.sqlite";
}

std::string RegistryDirectory(const std::string& inFile) {
    return DirectoryOf(inFile);
}

bool MakeRegistryDirectory(RegistryRoot inRoot, const std::string& inFile) {
    return MakeDirectory(DirectoryOf(inFile), inRoot == RegistryRoot::User ? 0700 : 0755);
}

int CheckRegistryFile(RegistryRoot inRoot, const std::string& inFile) {
    struct stat status;
    if (::lstat(inFile.c_str(), &status) != 0) {
        return errno == ENOENT || errno == ENOTDIR ? kResultRegistryMissing : kResultRegistryFailed;
    }
    if (!S_ISREG(status.st_mode)) {
        return kResultRegistryDamaged;
    }
    // The file is not opened to change its mode: closing any descriptor of a file drops all locks that this
    // process has on it, those of SQLite included.
    const bool isOfUser = inRoot == RegistryRoot::User && status.st_uid == ::geteuid();
    const bool isTooWide = isOfUser && (status.st_mode & 07177) != 0;
    return isTooWide && ::chmod(inFile.c_str(), 0600) != 0 ? kResultRegistryFailed : kResultSuccess;
}

int CreateRegistryFile(RegistryRoot inRoot, const std::string& inFile) {
    const bool isOfUser = inRoot == RegistryRoot::User;
    const mode_t mode = isOfUser ? 0600 : 0644;
    if (!MakeRegistryDirectory(inRoot, inFile)) {
        return kResultRegistryFailed;
    }
    const int descriptor = ::open(inFile.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC | O_NOFOLLOW, mode);
    if (descriptor < 0) {
        return errno == EEXIST ? CheckRegistryFile(inRoot, inFile) : kResultRegistryFailed;
    }
    const bool isNarrow = ::fchmod(descriptor, mode) == 0;
    ::close(descriptor);
    return isNarrow ? kResultSuccess : kResultRegistryFailed;
}

int ResolveRegistryFile(const std::string& inFile, std::string& outFile, RegistryFileIdentity& outIdentity) {
    const std::unique_ptr<char, decltype(&std::free)> directory(
        ::realpath(DirectoryOf(inFile).c_str(), nullptr), &std::free);
    if (!directory) {
        return errno == ENOENT || errno == ENOTDIR ? kResultRegistryMissing : kResultRegistryFailed;
    }
    const std::size_t slash = inFile.rfind('/');
    const std::string name = slash == std::string::npos ? inFile : inFile.substr(slash + 1);
    outFile = std::string(directory.get()) + "/" + name;
    struct stat status;
    if (::lstat(outFile.c_str(), &status) != 0) {
        return errno == ENOENT ? kResultRegistryMissing : kResultRegistryFailed;
    }
    return Identify(status, outIdentity) ? kResultSuccess : kResultRegistryDamaged;
}

bool IdentifyRegistryFile(const std::string& inFile, RegistryFileIdentity& outIdentity) {
    struct stat status;
    return ::lstat(inFile.c_str(), &status) == 0 && Identify(status, outIdentity);
}

}  // namespace RFL
