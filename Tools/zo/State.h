// What zo remembers between runs: who signed in where, without tokens, and what each works on: the open
// production, the session, and a transaction that was left open.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace zo {

/// Who signed in where. The registry holds one token for each user name, so there is one record for each.
struct LoginRecord {
    /// With scheme and port.
    std::string server;
    std::string user;
    bool secure = false;
    /// Absolute path of the authority file that the login named; empty when it named none.
    std::string authorityFile;
};

/// The production that a user works on.
struct OpenRecord {
    std::string server;
    std::string user;
    std::string production;
    std::string name;
    std::string commit;
    /// URL of the user's session on it; empty while the shared production is read.
    std::string session = {};
    /// The commit of the session that this user saw last.
    std::string seenCommit = {};
    /// URL of the transaction that was left open; empty when there is none.
    std::string transaction = {};
};

/// zo.json in the state directory, mode 0600. Each operation reads the file anew; changes are made under a
/// lock file and replace the file as one step, so that several zo processes do not undo each other's.
/// Errors throw a Failure that names the file.
class State {
public:
    State();

    /// Newest first.
    std::vector<LoginRecord> Logins() const;
    /// Becomes the newest; the former login of this user name is forgotten.
    void SetLogin(const LoginRecord& inLogin);
    std::optional<OpenRecord> Open(const std::string& inServer, const std::string& inUser) const;
    void SetOpen(const OpenRecord& inOpen);
    /// Changes the record of the open production of a user; nothing when there is none.
    void ChangeOpen(const std::string& inServer, const std::string& inUser,
                    const std::function<void(OpenRecord&)>& inChange);
    /// A file beside the state, for a lock; its directory is there afterwards.
    std::string LockPath(const std::string& inName) const;

    const std::string& Path() const noexcept { return mPath; }

private:
    struct Content {
        std::vector<LoginRecord> logins;
        std::vector<OpenRecord> open;
    };
    void MakePrivateDirectory() const;
    Content Read() const;
    template <class Change>
    void Update(Change inChange);

    std::string mDirectory;
    std::string mPath;
};

}  // namespace zo
