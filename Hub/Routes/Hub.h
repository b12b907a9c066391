// The hub's application: storage, clock and caches, and the way of a request through its route.
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Base/Clock.h"
#include "Http/Message.h"
#include "Http/Multipart.h"
#include "Http/Server.h"
#include "Model/Repository.h"
#include "Routes/DocumentCache.h"
#include "Store/Storage.h"

namespace zohub {

struct BulkForm;

struct HubSettings {
    std::string id;  ///< of this hub, stable over its life
    std::string name = "zohub";
    std::string description = "Development hub";
    Micros tokenLifetime = kDay;
    std::size_t documentCacheBytes = 384u << 20;
    std::int64_t maxKeptAnswers = 200000;  ///< to requests with a key; older ones go first
};

/// What a route makes of a large body before the database is locked for writing.
struct Payload {
    std::shared_ptr<Form const> form;  ///< when the payload came as a field of one
    std::string_view bytes;            ///< in the request's body
    std::string type;                  ///< media type as the client stated it, or empty
    std::string hash;
    std::shared_ptr<BulkForm const> bulk = nullptr;  ///< all of it, for the routes of bulk forms
};

/// One request on its way through a route, inside its database transaction.
struct Call {
    Request const& request;
    std::vector<std::string> const& parameters;  ///< the {} parts of the route's pattern, in order
    HubSettings const& settings;
    DocumentCache& cache;
    Transaction& transaction;
    Repository repository;
    Actor actor;            ///< with an empty name when nobody is signed in
    std::string tokenHash;  ///< of the token that the request came with
    Micros now = 0;
    std::string api;  ///< "http://host:port/zo/1"
    Payload payload;  ///< of a route that prepares one

    /// For documents whose tag is known before they are made: the 304, when the client has them already.
    bool HasCurrent(std::string const& inETag) const { return IfNoneMatchHits(request, inETag); }
};

enum class SignIn { Needed, Optional };

struct Route {
    std::string method;
    std::string pattern;  ///< "p/{}/a"; {} stands for one segment
    SignIn signIn = SignIn::Needed;
    std::function<Response(Call&)> handle = nullptr;
    std::function<Payload(Request const&)> prepare = nullptr;
};

inline constexpr char kApiPath[] = "zo/1";
inline constexpr char kDiscoveryPath[] = "content/zo/api/discovery.json";

/// Thread-safe.
class Hub {
public:
    Hub(Storage& inStorage, HubSettings inSettings, Clock inClock);
    ~Hub();

    /// Runs the request inside one transaction. What is refused or fails is undone and answered as JSON.
    Response Handle(Request const& inRequest);
    static Lane LaneOf(Request const& inRequest);
    /// Ends the life of the token that the request came with, when it has one.
    void ForgetToken(Request const& inRequest);

private:
    struct Match;
    Match FindRoute(Request const& inRequest) const;
    Response Run(Request const& inRequest);
    Response RunRoute(Request const& inRequest, Match const& inMatch);
    Response RunMutation(Call& ioCall, Route const& inRoute, std::string const& inFingerprint);
    void RefuseStrangers(Request const& inRequest, Route const& inRoute) const;

    struct CompiledRoute;
    Storage& mStorage;
    HubSettings const mSettings;
    Clock const mClock;
    DocumentCache mCache;
    std::atomic<std::uint64_t> mKeptAnswers{0};
    std::vector<CompiledRoute> mRoutes;
};

}  // namespace zohub
