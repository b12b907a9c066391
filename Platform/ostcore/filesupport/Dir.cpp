// A directory by its path.
#include "ostcore/filesupport/Dir.h"

#include <filesystem>
#include <system_error>

#include <sys/stat.h>

namespace ostcore {
namespace filesupport {
namespace {

namespace fs = std::filesystem;

constexpr mode_t kPrivateMode = 0700;

void Tell(std::string* outError, const std::string& inPath, const std::error_code& inReason) {
    if (outError) {
        *outError = "Could not create the directory " + inPath + ": " + inReason.message() +
                    ". Check that its parent can be written to.";
    }
}

// Makes one directory; another process may make it at the same time.
bool MakeOne(const fs::path& inPath) {
    return ::mkdir(inPath.c_str(), kPrivateMode) == 0 || errno == EEXIST;
}

}  // namespace

std::string Dir::FilePath(std::string_view inName) const {
    if (mPath.empty()) {
        return std::string(inName);
    }
    return (mPath.back() == '/' ? mPath : mPath + "/") + std::string(inName);
}

bool Dir::Exists() const {
    std::error_code error;
    return !mPath.empty() && fs::is_directory(mPath, error);
}

bool Dir::CreatePrivate(std::string* outError) const {
    if (Exists()) {
        return true;
    }
    if (mPath.empty()) {
        Tell(outError, "\"\"", std::make_error_code(std::errc::invalid_argument));
        return false;
    }
    fs::path path;
    for (const fs::path& part : fs::path(mPath)) {
        path /= part;
        std::error_code error;
        if (fs::is_directory(path, error)) {
            continue;
        }
        if (!MakeOne(path)) {
            Tell(outError, mPath, std::error_code(errno, std::generic_category()));
            return false;
        }
    }
    if (!Exists()) {
        Tell(outError, mPath, std::make_error_code(std::errc::not_a_directory));
        return false;
    }
    return true;
}

std::vector<std::string> Dir::ListFiles() const {
    std::vector<std::string> names;
    std::error_code error;
    for (fs::directory_iterator it(mPath, error), end; !error && it != end; it.increment(error)) {
        std::error_code statError;
        if (fs::is_regular_file(it->symlink_status(statError))) {
            names.push_back(it->path().filename().string());
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

bool Dir::RemoveAll() const {
    std::error_code error;
    return !mPath.empty() && fs::remove_all(mPath, error) != static_cast<std::uintmax_t>(-1);
}

}  // namespace filesupport
}  // namespace ostcore
