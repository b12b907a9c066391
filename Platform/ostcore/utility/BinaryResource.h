// Files that were compiled into a library: layouts, icons, dictionaries.
#pragma once

#include <cstddef>
#include <string_view>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace utility {

/// One compiled-in file. The bytes belong to the library that holds them.
struct BinaryEntry {
    /// "LYRA" a layout, "SVG" an icon, "TEXT" a dictionary.
    const char* type;
    /// The file's name without its ending.
    const char* name;
    const unsigned char* bytes;
    std::size_t size;
};

/// What stands for a library's handle: the table of its files.
struct BinaryModule {
    const BinaryEntry* entries;
    std::size_t count;
};

/// The bytes of a file, shared by all that copy this. Null when there is no such file.
struct BinaryResource {
    shared_ptr<const char[]> bytes;
    std::size_t size = 0;

    std::string_view View() const noexcept { return {bytes.get(), size}; }
    explicit operator bool() const noexcept { return bytes.get() != nullptr; }
};

/// A copy of the bytes of a file, which outlives the library that held it. The type is taken without regard
/// to case, the name as it is written. Threads: any.
ZOPLATFORM_EXPORT BinaryResource GetBinaryFromModule(const BinaryModule& inModule, std::string_view inType,
                                                     std::string_view inName);

/// The names of all files of a type, in order. Threads: any.
ZOPLATFORM_EXPORT std::vector<std::string> GetBinaryNames(const BinaryModule& inModule,
                                                          std::string_view inType);

/// Bytes that come from elsewhere, in the form of a file's. Threads: any.
ZOPLATFORM_EXPORT BinaryResource MakeBinaryResource(std::string_view inBytes);

}  // namespace utility
}  // namespace ostcore
