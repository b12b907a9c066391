// The rows that the hub keeps, as plain values.
#pragma once

#include <cstdint>
#include <string>

#include "Base/Clock.h"

namespace zohub {

struct UserRecord {
    std::string name;
    std::string passwordHash;
    std::string firstName;
    std::string lastName;
    std::string email;
    bool isAdmin = false;
    Micros created = 0;
};

/// One sign-in. The token itself is not kept, only its hash.
struct TokenRecord {
    std::string tokenHash;
    std::string user;
    std::string address;
    std::string userAgent;
    Micros created = 0;
    Micros expires = 0;
};

/// A line of commits: a shared production or a template, a user's session on one, or a transaction on a
/// session.
struct LineRecord {
    std::string id;
    std::string kind;
    std::string parent;      ///< the line below it; empty for productions and templates
    std::string production;  ///< the production it belongs to; its own id for a production or template
    std::string owner;
    std::string baseCommit;  ///< the commit of the parent that it stands on
    std::string headCommit;
    std::string metadata;  ///< JSON of the client that made it, or empty
    bool isTemporary = false;
    Micros created = 0;
    Micros modified = 0;
    bool isEnded = false;  ///< a transaction that was committed
};

inline constexpr char kLineProduction[] = "production";
inline constexpr char kLineTemplate[] = "template";
inline constexpr char kLineSession[] = "session";
inline constexpr char kLineTransaction[] = "transaction";

struct CommitRecord {
    std::string id;
    std::string production;
    std::string parent;
    std::string tree;
    std::string title;
    std::string committer;
    Micros time = 0;
    std::string line;         ///< on which it was made; the production for a shared one
    std::int64_t number = 0;  ///< one more than its parent's; along a shared line it tells older from newer
};

/// One item that a merge could not decide: the session keeps its own side until its owner accepts one.
struct ConflictRecord {
    std::string session;
    std::string kind;           ///< one of the kConflict constants
    std::string item;           ///< asset; empty for the production's own enclosures and properties
    std::string name;           ///< of the enclosure, else empty
    std::string theirsContent;  ///< content identifier of their state, or "removed"
    std::string baseCommit;     ///< the common ancestor
};

inline constexpr char kConflictAsset[] = "asset";
inline constexpr char kConflictEnclosure[] = "enclosure";
inline constexpr char kConflictProperties[] = "properties";

/// An enclosure that is kept with a session and is no part of any commit.
struct NoteRecord {
    std::string session;
    std::string id;
    std::string name;
    std::string type;
    std::string content;
    std::uint64_t size = 0;
};

/// Says that a production has, or once had, this content; it is what makes content readable through it. What
/// only a session has seen so far is listed under the session instead.
struct ReferenceRecord {
    std::string production;
    std::string kind;  ///< one of the kReference constants
    std::string key;   ///< a hash, or the identifier of a media locator
    std::string item;  ///< identifier of the enclosure or rendition
    std::string name;
    std::string type;
};

inline constexpr char kReferenceAsset[] = "asset";
inline constexpr char kReferenceEnclosure[] = "enclosure";
inline constexpr char kReferenceRendition[] = "rendition";
inline constexpr char kReferenceLocator[] = "locator";

struct LocatorRecord {
    std::string id;
    std::string owner;
    std::string properties;  ///< JSON object as the client sent it
    Micros created = 0;
    Micros modified = 0;
};

/// The answer to a mutating request that carried an idempotency key.
struct AnswerRecord {
    std::string user;
    std::string key;
    std::string fingerprint;  ///< hash of method, path and body, to notice a key that is used twice
    int status = 0;
    std::string headers;  ///< JSON object name to value
    std::string body;
    Micros created = 0;
};

}  // namespace zohub
