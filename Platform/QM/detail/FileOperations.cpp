#include "QM/detail/FileOperations.h"

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/syscall.h>
#include <unistd.h>
#include <cerrno>
#include <cstdio>

namespace QM {
namespace detail {

FileOperations::~FileOperations() = default;

int FileOperations::OpenAt(int inDirectory, const char* inPath, int inFlags, mode_t inMode) {
    return ::openat(inDirectory, inPath, inFlags, inMode);
}

int FileOperations::OpenBeneath(int inDirectory, const char* inPath, int inFlags) {
    open_how how{};
    how.flags = static_cast<__u64>(inFlags);
    how.resolve = RESOLVE_BENEATH | RESOLVE_NO_SYMLINKS;
    return static_cast<int>(::syscall(SYS_openat2, inDirectory, inPath, &how, sizeof how));
}

int FileOperations::Close(int inFile) {
    return ::close(inFile);
}

int FileOperations::FStat(int inFile, struct stat& outStatus) {
    return ::fstat(inFile, &outStatus);
}

int FileOperations::StatAt(int inDirectory, const char* inName, struct stat& outStatus) {
    return ::fstatat(inDirectory, inName, &outStatus, AT_SYMLINK_NOFOLLOW);
}

int FileOperations::FChMod(int inFile, mode_t inMode) {
    return ::fchmod(inFile, inMode);
}

int FileOperations::MkDirAt(int inDirectory, const char* inName, mode_t inMode) {
    return ::mkdirat(inDirectory, inName, inMode);
}

ssize_t FileOperations::ReadV(int inFile, const iovec* inParts, int inCount) {
    return ::readv(inFile, inParts, inCount);
}

ssize_t FileOperations::WriteV(int inFile, const iovec* inParts, int inCount) {
    return ::writev(inFile, inParts, inCount);
}

int FileOperations::RenameAt(int inDirectory, const char* inFrom, const char* inTo) {
    return ::renameat(inDirectory, inFrom, inDirectory, inTo);
}

int FileOperations::UnlinkAt(int inDirectory, const char* inName) {
    return ::unlinkat(inDirectory, inName, 0);
}

int FileOperations::Touch(int inFile) {
    return ::futimens(inFile, nullptr);
}

DIR* FileOperations::OpenDirectory(int inFile) {
    DIR* const directory = ::fdopendir(inFile);
    if (!directory) {
        ::close(inFile);
    }
    return directory;
}

const dirent* FileOperations::ReadDirectory(DIR* inDirectory) {
    errno = 0;
    return ::readdir(inDirectory);
}

void FileOperations::CloseDirectory(DIR* inDirectory) {
    ::closedir(inDirectory);
}

}  // namespace detail
}  // namespace QM
