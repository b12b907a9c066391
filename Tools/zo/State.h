// What zo remembers between runs: who signed in where, without tokens, and the open production of each.
#pragma once

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

    const std::string& Path() const noexcept { return mPath; }

private:
    struct Content {
        std::vector<LoginRecord> logins;
        std::vector<OpenRecord> open;
    };
    Content Read() const;
    template <class Change>
    void Update(Change inChange);

    std::string mDirectory;
    std::string mPath;
};

}  // namespace zo
