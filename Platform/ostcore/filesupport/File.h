// Whole files: read with a bound, replaced as one step that a crash cannot halve.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/utility/RecycledMemory.h"

namespace ostcore {
namespace filesupport {

constexpr std::size_t kDefaultMaximumFileSize = std::size_t(1) << 30;

/// Operations on whole files. Errors tell what was tried, on which file, and why it failed. Threads: any.
class ZOPLATFORM_EXPORT File {
public:
    /// The content of a regular file; null when it cannot be read, is larger than the bound, or was written
    /// to while it was read, as far as the file system's times tell.
    static shared_ptr<utility::RecycledMemory> Read(const std::string& inPath,
                                                    std::size_t inMaximumSize = kDefaultMaximumFileSize,
                                                    std::string* outError = nullptr);
    /// Replaces or makes a file: written aside in the same directory, synced, renamed over the old one, and
    /// the directory synced. Afterwards the whole new content stands under the name; on failure the whole old
    /// one does. The mode is given to the new file whatever the old one had.
    static bool ReplaceAtomically(const std::string& inPath, std::string_view inBytes, unsigned inMode = 0600,
                                  std::string* outError = nullptr);
    static bool Exists(const std::string& inPath);
    /// True when it is gone afterwards.
    static bool Remove(const std::string& inPath);
};

/// A name for a file made from text of any origin: no separators, control characters or characters that a
/// common file system refuses, not "." or "..", no name that a device has, no leading or trailing dots or
/// blanks, well-formed UTF-8, at most inMaximumBytes, cut between characters with a short extension kept.
/// Never empty: "_" stands for nothing. Different texts can give one name.
ZOPLATFORM_EXPORT std::string SanitizeFileName(std::string_view inText, std::size_t inMaximumBytes = 200);

}  // namespace filesupport
}  // namespace ostcore
