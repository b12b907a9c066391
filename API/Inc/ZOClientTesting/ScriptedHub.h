// A small hub made of canned documents over a scripted processor: enough to connect, sign in and sign out,
// and a place to hang further routes on.
#pragma once

#include <string>

#include "ZOClientTesting/ScriptedProcessor.h"

namespace ZOClientTesting {

/// Serves discovery document, links document, login form and logout; every other path asks for a valid token
/// and goes to the routes. Sets itself as the handler of the processor, which keeps it alive.
///
/// Threads: any.
class ScriptedHub {
public:
    static constexpr const char* kDefaultBaseURL = "http://hub.test:60138";
    /// What the relations of the hub's links begin with.
    static constexpr const char* kRelationBase = "http://ns.meridane.example/zo/rel";
    using Route = function<ScriptedAnswer(const RecordedRequest& inRequest)>;

    explicit ScriptedHub(const shared_ptr<ScriptedProcessor>& inProcessor,
                         const std::string& inBaseURL = kDefaultBaseURL);

    const std::string& BaseURL() const noexcept;
    void AddUser(const std::string& inName, const std::string& inPassword);
    /// A link of the links document for those who are signed in; the relation is given behind kRelationBase.
    void AddServiceLink(const std::string& inRelation, const std::string& inHRef);
    /// The answer to a verb on a path, in the place of a former one.
    void AddRoute(const std::string& inVerb, const std::string& inPath, Route inRoute);
    void SetVersion(const std::string& inVersion);
    /// What the hub answers; for handlers that change or delay its answers.
    ScriptedAnswer Answer(const RecordedRequest& inRequest) const;
    /// Refuses every token that was given so far.
    void ExpireTokens();
    /// How many times somebody signed in with success.
    std::size_t LoginCount() const;
    /// Whether a cookie text holds a token that is valid now.
    bool IsSignedIn(const std::string& inCookie) const;

private:
    class Core;
    shared_ptr<Core> mCore;
};

}  // namespace ZOClientTesting
