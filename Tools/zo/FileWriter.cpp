// Temporary file, sync, rename.
#include "FileWriter.h"

#include <fcntl.h>
#include <stdio.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <system_error>

#include "Failure.h"
#include "ostcore/utility/Guid.h"

namespace zo {
namespace {

Failure FileFailure(const std::string& inWhat, const std::string& inPath, int inError) {
    return Failure(ExitCode::Failure, inWhat + " " + inPath + " failed: " + std::strerror(inError),
                   inError == ENOSPC ? "make room and try again" : "check the folder and its permissions");
}

Failure ExistsFailure(const std::string& inPath) {
    return Failure(ExitCode::Failure, "writing " + inPath + " failed: the file exists already",
                   "give another place with -o, or --force to replace it");
}

// A file aside that is removed unless it was given its name.
class TemporaryFile {
public:
    explicit TemporaryFile(const std::string& inTarget)
        : mTarget(inTarget),
          mPath((std::filesystem::path(inTarget).parent_path() /
                 (".zo-" + ostcore::utility::Guid::CreateUnique().ToString()))
                    .string()),
          mDescriptor(::open(mPath.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666)) {
        if (mDescriptor < 0) {
            throw FileFailure("writing", inTarget, errno);
        }
    }
    ~TemporaryFile() {
        if (mDescriptor >= 0) {
            ::close(mDescriptor);
        }
        if (!mNamed) {
            ::unlink(mPath.c_str());
        }
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    void Write(std::string_view inBytes) {
        while (!inBytes.empty()) {
            const ssize_t written = ::write(mDescriptor, inBytes.data(), inBytes.size());
            if (written < 0 && errno != EINTR) {
                throw FileFailure("writing", mTarget, errno);
            }
            inBytes.remove_prefix(written < 0 ? 0 : static_cast<std::size_t>(written));
        }
    }

    void Finish() {
        if (::fsync(mDescriptor) != 0) {
            throw FileFailure("writing", mTarget, errno);
        }
        const int descriptor = mDescriptor;
        mDescriptor = -1;
        if (::close(descriptor) != 0) {
            throw FileFailure("writing", mTarget, errno);
        }
    }

    void GiveName(Overwrite inOverwrite) {
        if (inOverwrite == Overwrite::Replace) {
            Check(::rename(mPath.c_str(), mTarget.c_str()));
            mNamed = true;
            return;
        }
        if (::renameat2(AT_FDCWD, mPath.c_str(), AT_FDCWD, mTarget.c_str(), RENAME_NOREPLACE) == 0) {
            mNamed = true;
            return;
        }
        if (errno != EINVAL && errno != ENOSYS) {
            Check(-1);
        }
        // A file system without RENAME_NOREPLACE: a hard link never replaces; the first name goes away with
        // this object.
        Check(::link(mPath.c_str(), mTarget.c_str()));
    }

private:
    void Check(int inResult) const {
        if (inResult != 0) {
            throw errno == EEXIST ? ExistsFailure(mTarget) : FileFailure("writing", mTarget, errno);
        }
    }

    const std::string mTarget;
    const std::string mPath;
    int mDescriptor;
    bool mNamed = false;
};

}  // namespace

void CheckMayWrite(const std::string& inPath, Overwrite inOverwrite) {
    struct stat found;
    if (::lstat(inPath.c_str(), &found) != 0) {
        return;
    }
    if (S_ISDIR(found.st_mode)) {
        throw Failure(ExitCode::Failure, "writing " + inPath + " failed: it is a folder",
                      "give another name with -o");
    }
    if (inOverwrite == Overwrite::Never) {
        throw ExistsFailure(inPath);
    }
}

void WriteFileWhole(const std::string& inPath, std::string_view inBytes, Overwrite inOverwrite) {
    CheckMayWrite(inPath, inOverwrite);
    TemporaryFile file(inPath);
    file.Write(inBytes);
    file.Finish();
    file.GiveName(inOverwrite);
}

void MakeDirectory(const std::string& inPath) {
    std::error_code error;
    std::filesystem::create_directories(inPath, error);
    if (error) {
        throw FileFailure("making the folder", inPath, error.value());
    }
}

}  // namespace zo
