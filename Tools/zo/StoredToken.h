// The login token of one user, where the library keeps it: under the user's key in the registry.
#pragma once

#include <optional>
#include <string>

namespace zo {

/// Tokens are never printed and never leave this process except through the library. Blocks on the registry.
class StoredToken {
public:
    explicit StoredToken(std::string inUser) : mUser(std::move(inUser)) {}

    bool Exists() const;
    /// Removes the token and gives it out; nothing when there is none. Throws a Failure when the registry
    /// refuses.
    std::optional<std::u16string> Take();
    /// Puts a token back unless there is a new one.
    void PutBack(const std::u16string& inToken);

private:
    std::string mUser;
};

}  // namespace zo
