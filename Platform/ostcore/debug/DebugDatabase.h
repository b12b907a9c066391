// The developers' switches, read by key with a default: from the environment, then from a file.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "ostcore/Export.h"

namespace ostcore {
namespace debug {

/// The developers' switches. In order of strength: overrides set in code, the environment (ZOCLIENT_DEBUG_
/// and the key with its dots as underscores), the file. The file is the one that ZOCLIENT_DEBUG_DB names,
/// else debug.conf in the configuration directory; its lines are `key = value`, `#` begins a comment line.
/// Both are read once, at the first question. A value that does not read as the type asked for counts as
/// absent. Threads: any.
class ZOPLATFORM_EXPORT DebugDatabase {
public:
    /// true, yes, on, 1 and false, no, off, 0, in either case.
    static bool GetBool(std::string_view inKey, bool inDefault);
    /// Decimal, or hexadecimal with 0x.
    static std::uint32_t GetUInt32(std::string_view inKey, std::uint32_t inDefault);
    static std::string GetString(std::string_view inKey, std::string_view inDefault);

    /// Sets a value over all others, for tests.
    static void SetOverride(std::string_view inKey, std::string_view inValue);
    static void ClearOverrides();
    /// Reads the file again at the next question.
    static void Reload();
};

}  // namespace debug
}  // namespace ostcore
