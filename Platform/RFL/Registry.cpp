// Keys and values over the store.
#include "RFL/Registry.h"

#include <algorithm>

#include "ostcore/utility/StringConversion.h"
#include "RFL/detail/RegistryStore.h"
#include "RFL/RFLUnknown.h"

namespace RFL {

namespace {

using Mode = RegistryConnection::Mode;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;

enum class ValueType : std::int64_t { String = 1, UInt32 = 2, Boolean = 3 };

constexpr std::size_t kLongestName = 255;
constexpr std::size_t kMostLevels = 32;

/// One part of a path or the name of a value.
bool IsGoodName(std::string_view inName) {
    return !inName.empty() && inName.size() <= kLongestName && inName.find('\0') == std::string_view::npos;
}

int TakeRevision(RegistryConnection& inConnection, std::int64_t& outRevision) {
    RegistryStatement statement = inConnection.Prepare("UPDATE sequence SET value=value+1 RETURNING value");
    int result = statement.Step();
    if (result == kResultRegistryMissing) {
        return kResultRegistryDamaged;
    }
    if (result == kResultSuccess) {
        outRevision = statement.Number(0);
        result = statement.Run();
    }
    return result;
}

int FindKey(RegistryConnection& inConnection, const std::string& inPath) {
    return inConnection.Prepare("SELECT 1 FROM keys WHERE path=?1").Bind(1, inPath).Step();
}

/// Marks the key as changed, making it and its parents when they are missing. Inside of a transaction.
int TouchKey(RegistryConnection& inConnection, const std::string& inPath) {
    std::int64_t revision = 0;
    int result = TakeRevision(inConnection, revision);
    for (std::size_t end = inPath.find('\\'); result == kResultSuccess && end != std::string::npos;
         end = inPath.find('\\', end + 1)) {
        result = inConnection.Prepare("INSERT OR IGNORE INTO keys VALUES(?1,?2)")
                     .Bind(1, std::string_view(inPath).substr(0, end))
                     .Bind(2, revision)
                     .Run();
    }
    if (result == kResultSuccess) {
        result = inConnection
                     .Prepare(
                         "INSERT INTO keys VALUES(?1,?2) ON CONFLICT(path) DO UPDATE SET "
                         "revision=excluded.revision")
                     .Bind(1, inPath)
                     .Bind(2, revision)
                     .Run();
    }
    return result;
}

struct Value {
    ValueType type = ValueType::String;
    std::string text;
    std::int64_t number = 0;
};

int ReadValue(RegistryConnection& inConnection, const std::string& inPath, const std::string& inName,
              Value& outValue) {
    RegistryStatement statement =
        inConnection.Prepare("SELECT type,data FROM vals WHERE path=?1 AND name=?2");
    const int result = statement.Bind(1, inPath).Bind(2, inName).Step();
    if (result != kResultSuccess) {
        return result;
    }
    outValue.type = static_cast<ValueType>(statement.Number(0));
    if (outValue.type == ValueType::String) {
        outValue.text = statement.Text(1);
        return kResultSuccess;
    }
    const bool isNumber = statement.IsNumber(1);
    outValue.number = statement.Number(1);
    const std::int64_t highest = outValue.type == ValueType::Boolean ? 1 : 0xFFFFFFFF;
    return isNumber && outValue.number >= 0 && outValue.number <= highest ? kResultSuccess
                                                                          : kResultRegistryDamaged;
}

int WriteValue(RegistryConnection& inConnection, const std::string& inPath, const std::string& inName,
               const Value& inValue) {
    RegistryStatement statement = inConnection.Prepare("INSERT OR REPLACE INTO vals VALUES(?1,?2,?3,?4)");
    statement.Bind(1, inPath).Bind(2, inName).Bind(3, static_cast<std::int64_t>(inValue.type));
    if (inValue.type == ValueType::String) {
        statement.Bind(4, inValue.text);
    } else {
        statement.Bind(4, inValue.number);
    }
    return statement.Run();
}

int RemoveValue(RegistryConnection& inConnection, const std::string& inPath, const std::string& inName) {
    return inConnection.Prepare("DELETE FROM vals WHERE path=?1 AND name=?2")
        .Bind(1, inPath)
        .Bind(2, inName)
        .Run();
}

/// Lends a connection for reading. A user's own store is opened for writing also then, since reading a
/// write-ahead log takes the right to write.
int LendForReading(RegistryRoot inRoot, LentConnection& outConnection) {
    return outConnection.Acquire(inRoot, inRoot == RegistryRoot::User ? Mode::ReadWrite : Mode::ReadOnly);
}

int HasKey(RegistryRoot inRoot, const std::string& inPath) {
    LentConnection connection;
    const int result = LendForReading(inRoot, connection);
    return result == kResultSuccess ? FindKey(*connection, inPath) : result;
}

/// Runs inWork(connection) as one write transaction that counts only when its result is success.
template <class Work>
int Write(RegistryRoot inRoot, RegistryAccess inAccess, Work&& inWork) {
    if (inAccess != RegistryAccess::ReadWrite) {
        return kResultRegistryReadOnly;
    }
    LentConnection connection;
    int result = connection.Acquire(inRoot, Mode::Create);
    if (result < 0) {
        return result;
    }
    RegistryTransaction transaction(*connection);
    result = transaction.Begin();
    if (result == kResultSuccess) {
        result = inWork(*connection);
    }
    return result == kResultSuccess ? transaction.Commit() : result;
}

template <class Take>
int Read(RegistryRoot inRoot, const std::string& inPath, const UString& inName, ValueType inType,
         Take&& inTake) {
    const std::string name = ToUTF8(inName);
    if (inPath.empty() || !IsGoodName(name)) {
        return kResultRegistryBadName;
    }
    LentConnection connection;
    int result = LendForReading(inRoot, connection);
    Value value;
    if (result == kResultSuccess) {
        result = ReadValue(*connection, inPath, name, value);
    }
    if (result != kResultSuccess) {
        return result;
    }
    if (value.type != inType) {
        return kResultRegistryWrongType;
    }
    inTake(value);
    return kResultSuccess;
}

/// The condition of a change: success when it holds.
int CheckCondition(RegistryConnection& inConnection, const std::string& inPath,
                   const RegistryChange& inChange, const std::string& inName) {
    Value value;
    const int result = ReadValue(inConnection, inPath, inName, value);
    if (result != kResultSuccess && result != kResultRegistryMissing) {
        return result;
    }
    const bool isThere = result == kResultSuccess;
    const bool holds =
        inChange.kind == RegistryChange::Kind::ExpectAbsent
            ? !isThere
            : isThere && value.type == ValueType::String && value.text == ToUTF8(inChange.text);
    return holds ? kResultSuccess : kResultRegistryChanged;
}

int ApplyChange(RegistryConnection& inConnection, const std::string& inPath, const RegistryChange& inChange) {
    const std::string name = ToUTF8(inChange.name);
    if (!IsGoodName(name)) {
        return kResultRegistryBadName;
    }
    switch (inChange.kind) {
        case RegistryChange::Kind::SetString:
            return WriteValue(inConnection, inPath, name, Value{ValueType::String, ToUTF8(inChange.text), 0});
        case RegistryChange::Kind::SetUInt32:
            return WriteValue(inConnection, inPath, name, Value{ValueType::UInt32, {}, inChange.number});
        case RegistryChange::Kind::SetBoolean:
            return WriteValue(inConnection, inPath, name,
                              Value{ValueType::Boolean, {}, inChange.number != 0});
        case RegistryChange::Kind::Delete:
            return RemoveValue(inConnection, inPath, name);
        default:
            return CheckCondition(inConnection, inPath, inChange, name);
    }
}

int Enumerate(RegistryStatement inStatement, std::vector<UString>& outNames) {
    std::vector<UString> names;
    int result = inStatement.Step();
    for (; result == kResultSuccess; result = inStatement.Step()) {
        names.push_back(ToUTF16(inStatement.Text(0)));
    }
    if (result != kResultRegistryMissing) {
        return result;
    }
    outNames = std::move(names);
    return kResultSuccess;
}

}  // namespace

bool NormaliseRegistryPath(const UString& inPath, std::string& outPath) {
    const std::string text = ToUTF8(inPath);
    std::string path;
    std::size_t levels = 0;
    for (std::size_t start = 0; start <= text.size();) {
        const std::size_t end = std::min(text.find('\\', start), text.size());
        const std::string_view part = std::string_view(text).substr(start, end - start);
        start = end + 1;
        if (part.empty()) {
            continue;
        }
        if (!IsGoodName(part) || ++levels > kMostLevels) {
            return false;
        }
        path.append(path.empty() ? "" : "\\").append(part);
    }
    outPath = path;
    return !path.empty();
}

RegistryChange RegistryChange::SetString(UString inName, UString inText) {
    return RegistryChange{Kind::SetString, std::move(inName), std::move(inText), 0};
}
RegistryChange RegistryChange::SetUInt32(UString inName, std::uint32_t inNumber) {
    return RegistryChange{Kind::SetUInt32, std::move(inName), UString(), inNumber};
}
RegistryChange RegistryChange::SetBoolean(UString inName, bool inValue) {
    return RegistryChange{Kind::SetBoolean, std::move(inName), UString(), inValue ? 1u : 0u};
}
RegistryChange RegistryChange::Delete(UString inName) {
    return RegistryChange{Kind::Delete, std::move(inName), UString(), 0};
}
RegistryChange RegistryChange::ExpectString(UString inName, UString inText) {
    return RegistryChange{Kind::ExpectString, std::move(inName), std::move(inText), 0};
}
RegistryChange RegistryChange::ExpectAbsent(UString inName) {
    return RegistryChange{Kind::ExpectAbsent, std::move(inName), UString(), 0};
}

int RegistryKey::Open(RegistryRoot inRoot, const UString& inPath, RegistryAccess inAccess,
                      RegistryKey& outKey) {
    RegistryKey key;
    key.mRoot = inRoot;
    key.mAccess = inAccess;
    if (!NormaliseRegistryPath(inPath, key.mPath)) {
        return kResultRegistryBadName;
    }
    const int result = HasKey(inRoot, key.mPath);
    if (result == kResultSuccess) {
        outKey = key;
    }
    return result;
}

int RegistryKey::Create(RegistryRoot inRoot, const UString& inPath, RegistryKey& outKey, bool* outCreated) {
    RegistryKey key;
    key.mRoot = inRoot;
    key.mAccess = RegistryAccess::ReadWrite;
    if (!NormaliseRegistryPath(inPath, key.mPath)) {
        return kResultRegistryBadName;
    }
    bool isNew = false;
    int result = HasKey(inRoot, key.mPath);
    if (result == kResultRegistryMissing) {
        result = Write(inRoot, key.mAccess, [&](RegistryConnection& inConnection) {
            const int found = FindKey(inConnection, key.mPath);
            isNew = found == kResultRegistryMissing;
            return isNew ? TouchKey(inConnection, key.mPath) : found;
        });
    }
    if (result == kResultSuccess) {
        outKey = key;
        if (outCreated) {
            *outCreated = isNew;
        }
    }
    return result;
}

int RegistryKey::OpenSubKey(const UString& inName, RegistryAccess inAccess, RegistryKey& outKey) const {
    return IsValid() ? Open(mRoot, ToUTF16(mPath) + u"\\" + inName, inAccess, outKey)
                     : kResultRegistryBadName;
}

int RegistryKey::CreateSubKey(const UString& inName, RegistryKey& outKey, bool* outCreated) const {
    if (!IsValid()) {
        return kResultRegistryBadName;
    }
    if (mAccess != RegistryAccess::ReadWrite) {
        return kResultRegistryReadOnly;
    }
    return Create(mRoot, ToUTF16(mPath) + u"\\" + inName, outKey, outCreated);
}

int RegistryKey::GetStringValue(const UString& inName, UString& outValue) const {
    return Read(mRoot, mPath, inName, ValueType::String,
                [&](const Value& inValue) { outValue = ToUTF16(inValue.text); });
}

int RegistryKey::GetUInt32Value(const UString& inName, std::uint32_t& outValue) const {
    return Read(mRoot, mPath, inName, ValueType::UInt32,
                [&](const Value& inValue) { outValue = static_cast<std::uint32_t>(inValue.number); });
}

int RegistryKey::GetBooleanValue(const UString& inName, bool& outValue) const {
    return Read(mRoot, mPath, inName, ValueType::Boolean,
                [&](const Value& inValue) { outValue = inValue.number != 0; });
}

int RegistryKey::SetStringValue(const UString& inName, const UString& inValue) {
    return Apply({RegistryChange::SetString(inName, inValue)});
}

int RegistryKey::SetUInt32Value(const UString& inName, std::uint32_t inValue) {
    return Apply({RegistryChange::SetUInt32(inName, inValue)});
}

int RegistryKey::SetBooleanValue(const UString& inName, bool inValue) {
    return Apply({RegistryChange::SetBoolean(inName, inValue)});
}

int RegistryKey::DeleteValue(const UString& inName) {
    const std::string name = ToUTF8(inName);
    if (!IsValid() || !IsGoodName(name)) {
        return kResultRegistryBadName;
    }
    const int deleted = Write(mRoot, mAccess, [&](RegistryConnection& inConnection) {
        Value value;
        const int found = ReadValue(inConnection, mPath, name, value);
        if (found != kResultSuccess && found != kResultRegistryDamaged) {
            return found;
        }
        const int result = RemoveValue(inConnection, mPath, name);
        return result == kResultSuccess ? TouchKey(inConnection, mPath) : result;
    });
    return EraseAfter(deleted);
}

int RegistryKey::DeleteSubKey(const UString& inName) {
    std::string path;
    if (!IsValid() || !NormaliseRegistryPath(ToUTF16(mPath) + u"\\" + inName, path) || path == mPath) {
        return kResultRegistryBadName;
    }
    const int deleted = Write(mRoot, mAccess, [&](RegistryConnection& inConnection) {
        int result = FindKey(inConnection, path);
        // What lies below begins with the path and a backslash, and so comes before the path and a ']'.
        const std::string first = path + "\\";
        const std::string last = path + "]";
        for (const char* sql : {"DELETE FROM vals WHERE path=?1 OR (path>=?2 AND path<?3)",
                                "DELETE FROM keys WHERE path=?1 OR (path>=?2 AND path<?3)"}) {
            if (result == kResultSuccess) {
                result = inConnection.Prepare(sql).Bind(1, path).Bind(2, first).Bind(3, last).Run();
            }
        }
        return result == kResultSuccess ? TouchKey(inConnection, mPath) : result;
    });
    return EraseAfter(deleted);
}

int RegistryKey::EraseOldData() {
    if (mAccess != RegistryAccess::ReadWrite) {
        return kResultRegistryReadOnly;
    }
    LentConnection connection;
    const int result = connection.Acquire(mRoot, Mode::ReadWrite);
    return result == kResultSuccess ? connection->EmptyLog() : result;
}

int RegistryKey::EraseAfter(int inDeleted) {
    if (inDeleted == kResultSuccess) {
        EraseOldData();
    }
    return inDeleted;
}

int RegistryKey::EnumerateSubKeys(std::vector<UString>& outNames) const {
    if (!IsValid()) {
        return kResultRegistryBadName;
    }
    LentConnection connection;
    const int result = LendForReading(mRoot, connection);
    if (result < 0) {
        return result;
    }
    const std::string first = mPath + "\\";
    const std::string last = mPath + "]";
    RegistryStatement statement = connection->Prepare(
        "SELECT substr(path,length(?1)+1) FROM keys WHERE path>=?1 AND path<?2"
        " AND instr(substr(path,length(?1)+1),char(92))=0 ORDER BY path");
    statement.Bind(1, first).Bind(2, last);
    return Enumerate(std::move(statement), outNames);
}

int RegistryKey::EnumerateValues(std::vector<UString>& outNames) const {
    if (!IsValid()) {
        return kResultRegistryBadName;
    }
    LentConnection connection;
    const int result = LendForReading(mRoot, connection);
    if (result < 0) {
        return result;
    }
    RegistryStatement statement = connection->Prepare("SELECT name FROM vals WHERE path=?1 ORDER BY name");
    statement.Bind(1, mPath);
    return Enumerate(std::move(statement), outNames);
}

int RegistryKey::Apply(const std::vector<RegistryChange>& inChanges) {
    if (!IsValid()) {
        return kResultRegistryBadName;
    }
    return Write(mRoot, mAccess, [&](RegistryConnection& inConnection) {
        int result = kResultSuccess;
        for (const RegistryChange& change : inChanges) {
            result = ApplyChange(inConnection, mPath, change);
            if (result != kResultSuccess) {
                return result;
            }
        }
        return TouchKey(inConnection, mPath);
    });
}

int RegistryKey::DeleteStringValueIf(const UString& inName, const UString& inExpected) {
    return EraseAfter(
        Apply({RegistryChange::ExpectString(inName, inExpected), RegistryChange::Delete(inName)}));
}

int RegistryKey::IncrementUInt32Value(const UString& inName, std::uint32_t inStep, std::uint32_t& outValue) {
    const std::string name = ToUTF8(inName);
    if (!IsValid() || !IsGoodName(name)) {
        return kResultRegistryBadName;
    }
    std::uint32_t sum = 0;
    const int result = Write(mRoot, mAccess, [&](RegistryConnection& inConnection) {
        Value value;
        const int found = ReadValue(inConnection, mPath, name, value);
        if (found != kResultSuccess && found != kResultRegistryMissing) {
            return found;
        }
        if (found == kResultSuccess && value.type != ValueType::UInt32) {
            return kResultRegistryWrongType;
        }
        sum = static_cast<std::uint32_t>(value.number) + inStep;
        const int written = WriteValue(inConnection, mPath, name, Value{ValueType::UInt32, {}, sum});
        return written == kResultSuccess ? TouchKey(inConnection, mPath) : written;
    });
    if (result == kResultSuccess) {
        outValue = sum;
    }
    return result;
}

int RegistryKey::SyncAppPrefs() const {
    LentConnection connection;
    return LendForReading(mRoot, connection);
}

const char* DescribeRegistryResult(int inResult) noexcept {
    switch (inResult) {
        case kResultSuccess:
            return "success";
        case kResultRegistryMissing:
            return "the registry key or value does not exist";
        case kResultRegistryBusy:
            return "another process is holding the registry; try again, and if this lasts look for a stopped "
                   "one";
        case kResultRegistryDamaged:
            return "the registry file is damaged, is no registry or is of a newer version; move it away to "
                   "begin anew";
        case kResultRegistryReadOnly:
            return "the registry was opened for reading only or may not be written; check its permissions";
        case kResultRegistryWrongType:
            return "the registry value is of another type";
        case kResultRegistryChanged:
            return "the registry value was changed by somebody else; read it again";
        case kResultRegistryBadName:
            return "the registry path or name is empty, too long or holds a NUL";
        default:
            return "the registry could not be read or written; check its directory and the free disk space";
    }
}

}  // namespace RFL
