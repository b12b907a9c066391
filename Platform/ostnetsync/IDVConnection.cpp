// Keeps the machine's identifier: written aside and linked into place, so that the first of several wins.
#include "ostnetsync/IDVConnection.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ostcore/config/StateDirectories.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/filesupport/File.h"
#include "ostcore/utility/Guid.h"
#include "ostnetsync/detail/DeviceIDFile.h"

namespace ostnetsync {
namespace {

using ostcore::filesupport::Dir;
using ostcore::filesupport::File;
using ostcore::utility::Guid;

constexpr const char* kFileName = "machine-id";
constexpr std::size_t kTextSize = 36;

std::string MakeID() {
    return Guid::CreateUnique().ToString();
}

/// Empty for anything but a regular file of ours that holds a GUID; links are not followed.
std::string ReadID(const std::string& inPath) {
    const int descriptor = ::open(inPath.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
    if (descriptor < 0) {
        return std::string();
    }
    struct stat status {};
    char text[kTextSize];
    const bool isOurs = ::fstat(descriptor, &status) == 0 && S_ISREG(status.st_mode) &&
                        status.st_uid == ::geteuid() &&
                        ::read(descriptor, text, sizeof text) == static_cast<ssize_t>(sizeof text);
    ::close(descriptor);
    Guid id;
    if (!isOurs || !Guid::Parse(std::string_view(text, sizeof text), id) || id.IsNull()) {
        return std::string();
    }
    return id.ToString();
}

/// True when the identifier stands under the name, put there by this call or by another process before.
bool PutInPlace(const Dir& inDirectory, const std::string& inPath) {
    const std::string id = MakeID();
    const std::string aside = inDirectory.FilePath(std::string(kFileName) + "." + id);
    if (!File::ReplaceAtomically(aside, id + "\n", 0600)) {
        return false;
    }
    ::link(aside.c_str(), inPath.c_str());
    File::Remove(aside);
    return !ReadID(inPath).empty();
}

}  // namespace

std::string ReadOrMakeDeviceID(const Dir& inDirectory) {
    const std::string path = inDirectory.FilePath(kFileName);
    std::string id = ReadID(path);
    if (!id.empty() || !inDirectory.CreatePrivate()) {
        return id;
    }
    if (!PutInPlace(inDirectory, path)) {
        // Something else stands there.
        File::ReplaceAtomically(path, MakeID() + "\n", 0600);
    }
    return ReadID(path);
}

std::string IDVConnection::GetIDVDeviceID() {
    static const std::string sID = [] {
        const Dir directory = ostcore::config::GetStateDirectory();
        std::string id = directory.IsEmpty() ? std::string() : ReadOrMakeDeviceID(directory);
        if (id.empty()) {
            ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                                  "The machine's identifier could not be kept under " + directory.Path() +
                                      "; this run uses one of its own.");
            id = MakeID();
        }
        return id;
    }();
    return sID;
}

}  // namespace ostnetsync
