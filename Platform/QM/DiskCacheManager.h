// The bounds of a cache directory.
#pragma once

#include <cstddef>
#include <cstdint>

#include "ostcore/Export.h"

namespace QM {
namespace DiskCacheManager {

constexpr std::size_t kDefaultMaximumFileCount = 100000;
constexpr std::uint64_t kDefaultMaximumByteCount = 16ull << 30;

/// A directory whose files are kept within bounds: before a file is added, the least recently used ones go.
///
/// What this process knows of is never more than the bounds allow, at no moment. Other processes keep their
/// own count of the same directory; each looks at the whole directory again from time to time, so together
/// they may stand above the bounds by what the others have added since, and come down at the next look.
/// Threads: any.
class ZOPLATFORM_EXPORT ManagedDirectory {
public:
    virtual ~ManagedDirectory();
    /// Takes effect at once, also on what is there; at least 1.
    virtual void SetMaxFileCount(std::size_t inCount) = 0;
    /// The sum of the sizes of the files. A payload of more than a quarter of it is not taken.
    virtual void SetMaxByteCount(std::uint64_t inBytes) = 0;
    /// As this process knows them; nothing before the first look at the directory.
    virtual std::size_t GetFileCount() const = 0;
    virtual std::uint64_t GetByteCount() const = 0;
};

}  // namespace DiskCacheManager
}  // namespace QM
