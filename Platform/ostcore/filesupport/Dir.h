// A directory by its path.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ostcore/Export.h"

namespace ostcore {
namespace filesupport {

/// A directory, which need not exist. A plain value; paths are UTF-8. Operations return false on failure and
/// give the reason where asked.
class ZOPLATFORM_EXPORT Dir {
public:
    Dir() = default;
    explicit Dir(std::string inPath) : mPath(std::move(inPath)) {}

    const std::string& Path() const noexcept { return mPath; }
    bool IsEmpty() const noexcept { return mPath.empty(); }
    /// The path of a file or directory in it. The name is taken as it is: sanitise what came from outside.
    std::string FilePath(std::string_view inName) const;
    Dir SubDir(std::string_view inName) const { return Dir(FilePath(inName)); }

    bool Exists() const;
    /// Makes it and its missing parents, all that are new with mode 0700. True when it stands afterwards. An
    /// existing directory keeps its mode.
    bool CreatePrivate(std::string* outError = nullptr) const;
    /// The names of its regular files in alphabetic order; links are not followed.
    std::vector<std::string> ListFiles() const;
    /// Removes it and all below it; links are removed, not followed. True when it is gone afterwards.
    bool RemoveAll() const;

private:
    std::string mPath;
};

}  // namespace filesupport
}  // namespace ostcore
