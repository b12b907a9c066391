// The canned documents and the few rules of the scripted hub.
#include "ZOClientTesting/ScriptedHub.h"

#include <map>
#include <set>

#include "ostcore/threads/Mutex.h"

namespace ZOClientTesting {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

namespace {

constexpr const char* kDiscoveryPath = "/content/zo/api/discovery.json";
constexpr const char* kLinksPath = "/zo/links";
constexpr const char* kLoginPath = "/zo/login";
constexpr const char* kLogoutPath = "/zo/logout";
constexpr const char* kTokenName = "login-token=";

std::string Escaped(const std::string& inText) {
    std::string result;
    for (const char character : inText) {
        if (character == '"' || character == '\\') {
            result += '\\';
        }
        result += character;
    }
    return result;
}

std::string LinkText(const std::string& inRelation, const std::string& inHRef) {
    return "{\"rel\":\"" + Escaped(ScriptedHub::kRelationBase + inRelation) + "\",\"href\":\"" +
           Escaped(inHRef) + "\"}";
}

/// The value of the token in a cookie text; empty when there is none.
std::string TokenOf(const std::string& inCookie) {
    const std::size_t start = inCookie.find(kTokenName);
    if (start == std::string::npos) {
        return {};
    }
    const std::size_t value = start + std::string(kTokenName).size();
    return inCookie.substr(value, inCookie.find(';', value) - value);
}

}  // namespace

class ScriptedHub::Core {
public:
    explicit Core(std::string inBaseURL) : mBaseURL(std::move(inBaseURL)) {}

    const std::string& BaseURL() const noexcept { return mBaseURL; }

    ScriptedAnswer Answer(const RecordedRequest& inRequest) {
        const std::string path = inRequest.Path();
        if (path == kDiscoveryPath) {
            return Document({LinkText("/discovery/v1", mBaseURL + kLinksPath)});
        }
        if (path == kLinksPath) {
            return LinksDocument(inRequest);
        }
        if (path == kLoginPath && inRequest.verb == "POST") {
            return Login(inRequest);
        }
        if (!IsSignedIn(inRequest.Header("Cookie"))) {
            return ScriptedAnswer::Status(401);
        }
        if (path == kLogoutPath && inRequest.verb == "POST") {
            MutexLock lock(mMutex);
            mTokens.erase(TokenOf(inRequest.Header("Cookie")));
            return ScriptedAnswer::Status(204);
        }
        const Route route = FindRoute(inRequest.verb, path);
        return route ? route(inRequest) : ScriptedAnswer::Status(404);
    }

    bool IsSignedIn(const std::string& inCookie) {
        MutexLock lock(mMutex);
        return mTokens.count(TokenOf(inCookie)) > 0;
    }
    void AddUser(const std::string& inName, const std::string& inPassword) {
        MutexLock lock(mMutex);
        mUsers[inName] = inPassword;
    }
    void AddServiceLink(const std::string& inRelation, const std::string& inHRef) {
        MutexLock lock(mMutex);
        mServiceLinks.push_back(LinkText(inRelation, inHRef));
    }
    void AddRoute(const std::string& inVerb, const std::string& inPath, Route inRoute) {
        MutexLock lock(mMutex);
        mRoutes[inVerb + " " + inPath].swap(inRoute);
    }
    void SetVersion(const std::string& inVersion) {
        MutexLock lock(mMutex);
        mVersion = inVersion;
    }
    void ExpireTokens() {
        MutexLock lock(mMutex);
        mTokens.clear();
    }
    std::size_t LoginCount() {
        MutexLock lock(mMutex);
        return mLoginCount;
    }

private:
    ScriptedAnswer Document(const std::vector<std::string>& inLinks) {
        std::string links;
        for (const std::string& link : inLinks) {
            links += (links.empty() ? "" : ",") + link;
        }
        MutexLock lock(mMutex);
        return ScriptedAnswer::JSON(
            "{\"server\":{\"id\":\"scripted\",\"name\":\"Scripted hub\",\"description\":\"\","
            "\"version\":\"" +
            Escaped(mVersion) +
            "\",\"configuration\":{\"renderProtocolVersions\":[1]}},"
            "\"properties\":{\"majorVersion\":1,\"minorVersion\":2},\"links\":[" +
            links + "]}");
    }

    ScriptedAnswer LinksDocument(const RecordedRequest& inRequest) {
        if (!IsSignedIn(inRequest.Header("Cookie"))) {
            return Document({LinkText("/system/login", mBaseURL + kLoginPath)});
        }
        std::vector<std::string> links{LinkText("/system/logout", mBaseURL + kLogoutPath)};
        {
            MutexLock lock(mMutex);
            links.insert(links.end(), mServiceLinks.begin(), mServiceLinks.end());
        }
        return Document(links);
    }

    ScriptedAnswer Login(const RecordedRequest& inRequest) {
        MutexLock lock(mMutex);
        const auto user = mUsers.find(inRequest.Field("j_username"));
        if (user == mUsers.end() || user->second != inRequest.Field("j_password")) {
            return ScriptedAnswer::Status(401);
        }
        const std::string token = "scripted-" + std::to_string(++mLoginCount);
        mTokens.insert(token);
        return ScriptedAnswer::Status(200).With("Set-Cookie", kTokenName + token + "; Path=/; HttpOnly");
    }

    Route FindRoute(const std::string& inVerb, const std::string& inPath) {
        MutexLock lock(mMutex);
        const auto found = mRoutes.find(inVerb + " " + inPath);
        return found == mRoutes.end() ? Route() : found->second;
    }

    const std::string mBaseURL;
    mutable Mutex mMutex;
    std::string mVersion ZO_GUARDED_BY(mMutex) = "1.0.0";
    std::map<std::string, std::string> mUsers ZO_GUARDED_BY(mMutex);
    std::set<std::string> mTokens ZO_GUARDED_BY(mMutex);
    std::vector<std::string> mServiceLinks ZO_GUARDED_BY(mMutex);
    std::map<std::string, Route> mRoutes ZO_GUARDED_BY(mMutex);
    std::size_t mLoginCount ZO_GUARDED_BY(mMutex) = 0;
};

ScriptedHub::ScriptedHub(const shared_ptr<ScriptedProcessor>& inProcessor, const std::string& inBaseURL)
    : mCore(boost::make_shared<Core>(inBaseURL)) {
    inProcessor->SetHandler(
        [core = mCore](const RecordedRequest& inRequest) { return core->Answer(inRequest); });
}

const std::string& ScriptedHub::BaseURL() const noexcept {
    return mCore->BaseURL();
}

void ScriptedHub::AddUser(const std::string& inName, const std::string& inPassword) {
    mCore->AddUser(inName, inPassword);
}

void ScriptedHub::AddServiceLink(const std::string& inRelation, const std::string& inHRef) {
    mCore->AddServiceLink(inRelation, inHRef);
}

void ScriptedHub::AddRoute(const std::string& inVerb, const std::string& inPath, Route inRoute) {
    mCore->AddRoute(inVerb, inPath, std::move(inRoute));
}

void ScriptedHub::SetVersion(const std::string& inVersion) {
    mCore->SetVersion(inVersion);
}

ScriptedAnswer ScriptedHub::Answer(const RecordedRequest& inRequest) const {
    return mCore->Answer(inRequest);
}

void ScriptedHub::ExpireTokens() {
    mCore->ExpireTokens();
}

std::size_t ScriptedHub::LoginCount() const {
    return mCore->LoginCount();
}

bool ScriptedHub::IsSignedIn(const std::string& inCookie) const {
    return mCore->IsSignedIn(inCookie);
}

}  // namespace ZOClientTesting
