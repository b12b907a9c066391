// Reads and replaces the state file.
#include "State.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "ostcore/config/StateDirectories.h"
#include "ostcore/filesupport/File.h"
#include "ostcore/serialization/JSON.h"

namespace zo {
namespace {

using ostcore::serialization::AddToObject;
using ostcore::serialization::AppendToArray;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

constexpr std::size_t kMaximumStateBytes = std::size_t(1) << 20;
// Users that are not seen any more would otherwise gather for ever.
constexpr std::size_t kMaximumRecords = 100;

class LockFile {
public:
    explicit LockFile(const std::string& inPath)
        : mDescriptor(::open(inPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600)) {
        int locked = mDescriptor;
        while (locked >= 0 && (locked = ::flock(mDescriptor, LOCK_EX)) < 0 && errno == EINTR) {
            locked = mDescriptor;
        }
        if (locked < 0) {
            throw Failure(ExitCode::Failure, "locking " + inPath + " failed: " + std::strerror(errno),
                          "check the permissions of the directory");
        }
    }
    ~LockFile() { ::close(mDescriptor); }
    LockFile(const LockFile&) = delete;
    LockFile& operator=(const LockFile&) = delete;

private:
    int mDescriptor;
};

std::string TextOf(JSONView inObject, const char* inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsString() ? std::string(value.AsString()) : std::string();
}

bool IsTrue(JSONView inObject, const char* inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsBool() && value.AsBool();
}

LoginRecord ReadLogin(JSONView inObject) {
    return {TextOf(inObject, "server"), TextOf(inObject, "user"), IsTrue(inObject, "secure"),
            TextOf(inObject, "authorityFile")};
}

OpenRecord ReadOpen(JSONView inObject) {
    return {TextOf(inObject, "server"),     TextOf(inObject, "user"),       TextOf(inObject, "production"),
            TextOf(inObject, "name"),       TextOf(inObject, "commit"),     TextOf(inObject, "session"),
            TextOf(inObject, "seenCommit"), TextOf(inObject, "transaction")};
}

JSONValue Write(const LoginRecord& inLogin) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "server", inLogin.server);
    AddToObject(object, "user", inLogin.user);
    AddToObject(object, "secure", inLogin.secure);
    AddToObject(object, "authorityFile", inLogin.authorityFile);
    return object;
}

JSONValue Write(const OpenRecord& inOpen) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "server", inOpen.server);
    AddToObject(object, "user", inOpen.user);
    AddToObject(object, "production", inOpen.production);
    AddToObject(object, "name", inOpen.name);
    AddToObject(object, "commit", inOpen.commit);
    AddToObject(object, "session", inOpen.session);
    AddToObject(object, "seenCommit", inOpen.seenCommit);
    AddToObject(object, "transaction", inOpen.transaction);
    return object;
}

template <class Record>
JSONValue WriteList(const std::vector<Record>& inRecords) {
    JSONValue list = JSONValue::EmptyArray();
    for (const Record& record : inRecords) {
        AppendToArray(list, Write(record));
    }
    return list;
}

// In place of the records that it stands for, and before all others.
template <class Record, class Same>
void PutFirst(std::vector<Record>& ioRecords, const Record& inRecord, Same inSame) {
    ioRecords.erase(std::remove_if(ioRecords.begin(), ioRecords.end(), inSame), ioRecords.end());
    ioRecords.insert(ioRecords.begin(), inRecord);
    if (ioRecords.size() > kMaximumRecords) {
        ioRecords.resize(kMaximumRecords);
    }
}

}  // namespace

State::State()
    : mDirectory(ostcore::config::GetStateDirectory().Path()),
      mPath(ostcore::filesupport::Dir(mDirectory).FilePath("zo.json")) {}

std::vector<LoginRecord> State::Logins() const {
    return Read().logins;
}

void State::SetLogin(const LoginRecord& inLogin) {
    Update([&](Content& ioContent) {
        PutFirst(ioContent.logins, inLogin,
                 [&](const LoginRecord& inRecord) { return inRecord.user == inLogin.user; });
    });
}

std::optional<OpenRecord> State::Open(const std::string& inServer, const std::string& inUser) const {
    for (const OpenRecord& record : Read().open) {
        if (record.server == inServer && record.user == inUser) {
            return record;
        }
    }
    return std::nullopt;
}

void State::SetOpen(const OpenRecord& inOpen) {
    Update([&](Content& ioContent) {
        PutFirst(ioContent.open, inOpen, [&](const OpenRecord& inRecord) {
            return inRecord.server == inOpen.server && inRecord.user == inOpen.user;
        });
    });
}

void State::ChangeOpen(const std::string& inServer, const std::string& inUser,
                       const std::function<void(OpenRecord&)>& inChange) {
    Update([&](Content& ioContent) {
        for (OpenRecord& record : ioContent.open) {
            if (record.server == inServer && record.user == inUser) {
                inChange(record);
            }
        }
    });
}

std::string State::LockPath(const std::string& inName) const {
    MakePrivateDirectory();
    return ostcore::filesupport::Dir(mDirectory).FilePath(inName + ".lock");
}

State::Content State::Read() const {
    Content content;
    if (!ostcore::filesupport::File::Exists(mPath)) {
        return content;
    }
    std::string error;
    const auto bytes = ostcore::filesupport::File::Read(mPath, kMaximumStateBytes, &error);
    if (!bytes) {
        throw Failure(ExitCode::Failure, "reading the state of zo failed: " + error, "check " + mPath);
    }
    try {
        const JSONValue root = ostcore::serialization::JSONParse(bytes);
        JSONView(root).Find("logins").ForEachElement(
            [&](JSONView inElement) { content.logins.push_back(ReadLogin(inElement)); });
        JSONView(root).Find("open").ForEachElement(
            [&](JSONView inElement) { content.open.push_back(ReadOpen(inElement)); });
    } catch (const std::exception&) {
        throw Failure(ExitCode::Failure, "reading the state of zo failed: " + mPath + " is damaged",
                      "remove it and sign in again with 'zo login'");
    }
    return content;
}

void State::MakePrivateDirectory() const {
    std::string error;
    if (!ostcore::filesupport::Dir(mDirectory).CreatePrivate(&error)) {
        throw Failure(ExitCode::Failure, "making the state directory failed: " + error,
                      "check " + mDirectory);
    }
}

template <class Change>
void State::Update(Change inChange) {
    const LockFile lock(LockPath("zo"));
    std::string error;
    Content content = Read();
    inChange(content);
    JSONValue root = JSONValue::EmptyObject();
    AddToObject(root, "version", 1);
    AddToObject(root, "logins", WriteList(content.logins));
    AddToObject(root, "open", WriteList(content.open));
    const std::string text = ostcore::serialization::GetJSONUTF8String(root) + "\n";
    if (!ostcore::filesupport::File::ReplaceAtomically(mPath, text, 0600, &error)) {
        throw Failure(ExitCode::Failure, "writing the state of zo failed: " + error, "check " + mPath);
    }
}

}  // namespace zo
