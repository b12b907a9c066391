// The registry: a small hierarchical store of named values that all processes of a user share.
#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace RFL {

// Results of registry operations; kResultSuccess (0) otherwise.
/// Generic failure: the file system refused, the disk is full.
constexpr int kResultRegistryFailed = static_cast<int>(0xA00F0001u);
/// The key or the value does not exist.
constexpr int kResultRegistryMissing = static_cast<int>(0xA00F0003u);
/// Another process or thread held the store for longer than the time limit; nothing was changed. May be
/// tried again.
constexpr int kResultRegistryBusy = static_cast<int>(0xA0460001u);
/// The file is damaged, is no registry, or was written by a newer version; nothing was changed.
constexpr int kResultRegistryDamaged = static_cast<int>(0xA0460002u);
/// The store or the key was opened for reading only.
constexpr int kResultRegistryReadOnly = static_cast<int>(0xA0460003u);
/// The value is there but of another type.
constexpr int kResultRegistryWrongType = static_cast<int>(0xA0460004u);
/// The condition of a conditional change did not hold; nothing was changed.
constexpr int kResultRegistryChanged = static_cast<int>(0xA0460005u);
/// The path or name cannot be: empty, with NUL, too long, or too deep.
constexpr int kResultRegistryBadName = static_cast<int>(0xA0460006u);

enum class RegistryRoot : std::uint8_t {
    /// Of the user: registry.sqlite in the configuration directory, mode 0600 in a directory of mode 0700.
    User,
    /// Of the machine: /etc/zoclient/registry.sqlite or the file that ZOCLIENT_MACHINE_CONFIG names. Read by
    /// everybody, written by a site or an installer.
    Machine
};

enum class RegistryAccess : std::uint8_t { Read, ReadWrite };

/// One change of RegistryKey::Apply.
struct ZOPLATFORM_EXPORT RegistryChange {
    enum class Kind : std::uint8_t {
        SetString,
        SetUInt32,
        SetBoolean,
        Delete,
        /// Conditions: when one does not hold, the whole batch has no effect.
        ExpectString,
        ExpectAbsent
    };
    Kind kind;
    UString name;
    UString text;
    std::uint32_t number = 0;

    static RegistryChange SetString(UString inName, UString inText);
    static RegistryChange SetUInt32(UString inName, std::uint32_t inNumber);
    static RegistryChange SetBoolean(UString inName, bool inValue);
    static RegistryChange Delete(UString inName);
    static RegistryChange ExpectString(UString inName, UString inText);
    static RegistryChange ExpectAbsent(UString inName);
};

/// A key of the registry, which holds values and further keys.
///
/// Paths are parts joined by backslashes, as "Software\\A\\B\\"; leading, trailing and doubled backslashes do
/// not count. Parts and names are compared exactly, case included. Text is stored as UTF-8; a lone surrogate
/// becomes U+FFFD.
///
/// A key object is a name, not a lock: it stays usable when another process deletes the key (reads then give
/// kResultRegistryMissing, writes make it again).
///
/// Threads and processes: any number. Each operation is one transaction; either it happened as a whole or
/// not at all, also when the process is killed in its middle. Readers of the user's root are never kept
/// waiting by a writer, nor is Create of a key that exists. A writer waits for another one for at most the
/// time limit (SetRegistryTimeLimit) and then gives kResultRegistryBusy; so every operation blocks for a
/// bounded time only, even when the process that holds the store is stopped. After fork() a child opens its
/// own connections at its first operation; between fork and exec the registry may only be used when no other
/// thread of the parent was using it at the fork.
class ZOPLATFORM_EXPORT RegistryKey {
public:
    RegistryKey() = default;

    /// Opens a key that exists; kResultRegistryMissing when it does not or the store was never written.
    static int Open(RegistryRoot inRoot, const UString& inPath, RegistryAccess inAccess, RegistryKey& outKey);
    /// Opens a key for reading and writing, making it and its parents when they are missing. outCreated, when
    /// given, tells whether the key was made by this call.
    static int Create(RegistryRoot inRoot, const UString& inPath, RegistryKey& outKey,
                      bool* outCreated = nullptr);

    bool IsValid() const noexcept { return !mPath.empty(); }
    /// A key below this one.
    int OpenSubKey(const UString& inName, RegistryAccess inAccess, RegistryKey& outKey) const;
    int CreateSubKey(const UString& inName, RegistryKey& outKey, bool* outCreated = nullptr) const;

    /// The target keeps what it held unless the result is success.
    int GetStringValue(const UString& inName, UString& outValue) const;
    int GetUInt32Value(const UString& inName, std::uint32_t& outValue) const;
    int GetBooleanValue(const UString& inName, bool& outValue) const;
    int SetStringValue(const UString& inName, const UString& inValue);
    int SetUInt32Value(const UString& inName, std::uint32_t inValue);
    int SetBooleanValue(const UString& inName, bool inValue);

    /// kResultRegistryMissing when there was no such value. What was deleted is also erased from the files
    /// (EraseOldData); a store that is too busy for that does not make the deletion fail.
    int DeleteValue(const UString& inName);
    /// Deletes a key below this one with all that it holds, and erases it as DeleteValue does.
    int DeleteSubKey(const UString& inName);
    /// Erases from the files what deleted and replaced values have left in them. Waits for readers and
    /// writers until the time limit; kResultRegistryBusy when they did not let it.
    int EraseOldData();
    /// The names of the keys directly below, sorted by their UTF-8 bytes.
    int EnumerateSubKeys(std::vector<UString>& outNames) const;
    int EnumerateValues(std::vector<UString>& outNames) const;

    /// All changes as one transaction, in order; kResultRegistryChanged when a condition did not hold.
    int Apply(const std::vector<RegistryChange>& inChanges);
    /// Deletes a string value, as DeleteValue does, if it still has this text; kResultRegistryChanged when it
    /// has another.
    int DeleteStringValueIf(const UString& inName, const UString& inExpected);
    /// Adds to a number, an absent one being 0, and gives the sum; it wraps at 32 bits.
    int IncrementUInt32Value(const UString& inName, std::uint32_t inStep, std::uint32_t& outValue);

    /// Makes later reads see all that other processes have written. Reads always do, so this only finds out
    /// whether the store can be read at all.
    int SyncAppPrefs() const;

private:
    friend class RegistryChangeNotifier;
    int EraseAfter(int inDeleted);
    RegistryRoot mRoot = RegistryRoot::User;
    RegistryAccess mAccess = RegistryAccess::Read;
    /// Normalised UTF-8, parts joined by backslashes.
    std::string mPath;
};

/// How long an operation waits for others at most; 5 seconds unless set. For the whole process.
ZOPLATFORM_EXPORT void SetRegistryTimeLimit(std::chrono::milliseconds inLimit) noexcept;

/// Lets go of all idle connections, for a clean end and for tests that change the environment. The next
/// operation finds the files anew.
ZOPLATFORM_EXPORT void CloseRegistry();

/// A path or a result, for messages: what happened and what to do next.
ZOPLATFORM_EXPORT const char* DescribeRegistryResult(int inResult) noexcept;

}  // namespace RFL
