// The calls to the system that the file cache makes, behind one interface, so that each of them can be made
// to fail.
#pragma once

#include <dirent.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <sys/uio.h>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace QM {
namespace detail {

/// As the system's calls of these names: -1 or null and errno on failure. Threads: any.
class ZOPLATFORM_EXPORT FileOperations {
public:
    virtual ~FileOperations();
    virtual int OpenAt(int inDirectory, const char* inPath, int inFlags, mode_t inMode);
    /// Opens what lies below a directory, through no link and never outside; fails with ENOSYS where the
    /// system has no such call.
    virtual int OpenBeneath(int inDirectory, const char* inPath, int inFlags);
    virtual int Close(int inFile);
    virtual int FStat(int inFile, struct stat& outStatus);
    /// Does not follow a link.
    virtual int StatAt(int inDirectory, const char* inName, struct stat& outStatus);
    virtual int FChMod(int inFile, mode_t inMode);
    virtual int MkDirAt(int inDirectory, const char* inName, mode_t inMode);
    virtual ssize_t ReadV(int inFile, const iovec* inParts, int inCount);
    virtual ssize_t WriteV(int inFile, const iovec* inParts, int inCount);
    virtual int RenameAt(int inDirectory, const char* inFrom, const char* inTo);
    virtual int UnlinkAt(int inDirectory, const char* inName);
    /// Sets the time of the last change to now.
    virtual int Touch(int inFile);
    /// Takes the descriptor over, also when it fails.
    virtual DIR* OpenDirectory(int inFile);
    /// Null at the end, with errno 0, and on failure.
    virtual const dirent* ReadDirectory(DIR* inDirectory);
    virtual void CloseDirectory(DIR* inDirectory);
};

/// A descriptor that is closed when its scope ends.
class OpenFile {
public:
    OpenFile(FileOperations& inOperations, int inFile) : mOperations(inOperations), mFile(inFile) {}
    ~OpenFile() {
        if (mFile >= 0) {
            mOperations.Close(mFile);
        }
    }
    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    bool IsOpen() const noexcept { return mFile >= 0; }
    int Get() const noexcept { return mFile; }
    int Release() noexcept {
        const int file = mFile;
        mFile = -1;
        return file;
    }

private:
    FileOperations& mOperations;
    int mFile;
};

}  // namespace detail
}  // namespace QM
