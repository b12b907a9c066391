// The way of a request: route, transaction, sign-in, idempotency, handler, conditional answer.
#include "Routes/Hub.h"

#include <iostream>
#include <set>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kMaxIdempotencyKey = 128;
constexpr std::uint64_t kAnswersBetweenCounts = 256;
constexpr char kLoginSegments[] = "zo/1/system/login";

std::string JoinedPath(Request const& inRequest) {
    std::string path;
    for (auto const& segment : inRequest.segments)
        path += (path.empty() ? "" : "/") + segment;
    return path;
}

std::string Fingerprint(Request const& inRequest) {
    return Sha256Hex(inRequest.method + "\n" + inRequest.target + "\n" + Sha256Hex(inRequest.body));
}

Response AnswerOf(AnswerRecord const& inRecord) {
    Response response;
    response.status = inRecord.status;
    Json const headers = Json::parse(inRecord.headers);
    for (auto const& [name, value] : headers.items()) {
        if (name == "ETag")
            response.etag = value.get<std::string>();
        else if (name == "Content-Type")
            response.contentType = value.get<std::string>();
        else
            response.headers.emplace_back(name, value.get<std::string>());
    }
    if (!response.contentType.empty())
        response.body = std::make_shared<Body const>(inRecord.body);
    return response;
}

AnswerRecord RecordOf(Response const& inResponse, Call const& inCall, std::string const& inKey,
                      std::string const& inFingerprint) {
    Json headers = Json::object();
    for (auto const& [name, value] : inResponse.headers)
        headers[name] = value;
    if (!inResponse.etag.empty())
        headers["ETag"] = inResponse.etag;
    if (!inResponse.contentType.empty())
        headers["Content-Type"] = inResponse.contentType;
    return {inCall.actor.name, inKey,
            inFingerprint,     inResponse.status,
            JsonText(headers), inResponse.body ? inResponse.body->Plain() : std::string(),
            inCall.now};
}

void FinishRead(Request const& inRequest, Response& ioResponse) {
    if (ioResponse.status != 200)
        return;
    if (ioResponse.etag.empty() && ioResponse.body)
        ioResponse.etag = MakeETag(ioResponse.body->Plain());
    if (!IfNoneMatchHits(inRequest, ioResponse.etag))
        return;
    ioResponse.status = 304;
    ioResponse.body.reset();
    ioResponse.contentType.clear();
}

struct Identity {
    Actor actor;
    std::string tokenHash;
};

// Whose token is it? Nothing when the request has none that is valid.
std::optional<Identity> Identify(Request const& inRequest, Transaction& inTransaction, Micros inNow) {
    std::string const token = inRequest.Cookie("login-token");
    if (token.empty() || token.size() > 256)
        return std::nullopt;
    std::string hash = Sha256Hex(token);
    auto const record = inTransaction.FindToken(hash);
    if (!record || record->expires <= inNow)
        return std::nullopt;
    auto const user = inTransaction.FindUser(record->user);
    if (!user)
        return std::nullopt;
    return Identity{{user->name, user->isAdmin}, std::move(hash)};
}

[[noreturn]] void FailNotSignedIn() {
    throw Failure(401, "not-signed-in", "The request has no valid login token; sign in and repeat it.");
}

// So long that one looks first whether the sender may send anything.
constexpr std::size_t kLargeBody = 64 * 1024;

}  // namespace

struct Hub::CompiledRoute {
    Route route;
    std::vector<std::string> segments;

    bool Matches(std::vector<std::string> const& inSegments, std::vector<std::string>& outParameters) const {
        if (inSegments.size() != segments.size())
            return false;
        outParameters.clear();
        for (std::size_t i = 0; i < segments.size(); ++i) {
            if (segments[i] == "{}")
                outParameters.push_back(inSegments[i]);
            else if (segments[i] != inSegments[i])
                return false;
        }
        return true;
    }
};

struct Hub::Match {
    Route const* route = nullptr;
    std::vector<std::string> parameters;
};

Hub::Hub(Storage& inStorage, HubSettings inSettings, Clock inClock)
    : mStorage(inStorage),
      mSettings(std::move(inSettings)),
      mClock(std::move(inClock)),
      mCache(mSettings.documentCacheBytes) {
    std::vector<Route> routes;
    AddSystemRoutes(routes);
    AddProductionRoutes(routes);
    AddAssetRoutes(routes);
    AddEnclosureRoutes(routes);
    AddRenditionRoutes(routes);
    AddLocatorRoutes(routes);
    AddSessionRoutes(routes);
    AddTransactionRoutes(routes);
    AddBulkRoutes(routes);
    AddHistoryRoutes(routes);
    AddDifferenceRoutes(routes);
    AddAcceptRoutes(routes);
    for (auto& route : routes) {
        CompiledRoute compiled;
        for (auto segment : Split(route.pattern, '/'))
            compiled.segments.emplace_back(segment);
        compiled.route = std::move(route);
        mRoutes.push_back(std::move(compiled));
    }
}

Hub::~Hub() = default;

Lane Hub::LaneOf(Request const& inRequest) {
    if (inRequest.IsRead())
        return Lane::Read;
    bool const isSignIn = inRequest.method == "POST" && JoinedPath(inRequest) == kLoginSegments;
    return isSignIn ? Lane::SignIn : Lane::Write;
}

Hub::Match Hub::FindRoute(Request const& inRequest) const {
    std::string const method = inRequest.method == "HEAD" ? "GET" : inRequest.method;
    std::set<std::string> allowed;
    Match match;
    for (auto const& compiled : mRoutes) {
        if (!compiled.Matches(inRequest.segments, match.parameters))
            continue;
        if (compiled.route.method == method) {
            match.route = &compiled.route;
            return match;
        }
        allowed.insert(compiled.route.method);
    }
    if (allowed.empty() && JoinedPath(inRequest) != kLoginSegments)
        throw Failure(404, "no-such-address",
                      "There is nothing at this address; start from the discovery document.");
    throw Failure(405, "method-not-allowed",
                  "The method " + inRequest.method + " has no meaning at this address.");
}

Response Hub::Handle(Request const& inRequest) {
    try {
        Response response = Run(inRequest);
        if (inRequest.IsRead())
            FinishRead(inRequest, response);
        return response;
    } catch (Failure const& failure) {
        Response response = ErrorResponse(failure.Status(), failure.Code(), failure.what());
        if (failure.Status() == 401)
            response.headers.emplace_back("WWW-Authenticate", "Form realm=\"zohub\"");
        if (failure.Status() == 503)
            response.headers.emplace_back("Retry-After", "1");
        return response;
    } catch (std::exception const& error) {
        std::string const reference = RandomHex(6);
        std::cerr << "zohub: error " + reference + " at " + inRequest.method + " " + JoinedPath(inRequest) +
                         ": " + error.what() + "\n";
        return ErrorResponse(
            500, "internal-error",
            "The hub failed at this request; its log has the cause under " + reference + ".");
    }
}

void Hub::ForgetToken(Request const& inRequest) {
    auto const transaction = mStorage.BeginWrite();
    transaction->RemoveToken(Sha256Hex(inRequest.Cookie("login-token")));
    transaction->Commit();
}

Response Hub::Run(Request const& inRequest) {
    if (LaneOf(inRequest) == Lane::SignIn)
        return SignInByForm(inRequest, mStorage, mSettings, mClock());
    return RunRoute(inRequest, FindRoute(inRequest));
}

// Before much work is done for a request, and outside of the lock that its own transaction will hold.
void Hub::RefuseStrangers(Request const& inRequest, Route const& inRoute) const {
    bool const isCheap = inRequest.body.size() < kLargeBody;
    if (isCheap || inRoute.signIn != SignIn::Needed)
        return;
    if (!Identify(inRequest, *mStorage.BeginRead(), mClock()))
        FailNotSignedIn();
}

Response Hub::RunRoute(Request const& inRequest, Match const& inMatch) {
    Route const& route = *inMatch.route;
    Payload payload;
    std::string fingerprint;
    if (!inRequest.IsRead()) {
        RefuseStrangers(inRequest, route);
        if (route.prepare)
            payload = route.prepare(inRequest);
        if (!inRequest.Header("Idempotency-Key").empty())
            fingerprint = Fingerprint(inRequest);
    }
    auto const transaction = inRequest.IsRead() ? mStorage.BeginRead() : mStorage.BeginWrite();
    Call call{inRequest,         inMatch.parameters,
              mSettings,         mCache,
              *transaction,      Repository(*transaction),
              Actor(),           std::string(),
              mClock(),          inRequest.baseUrl + "/" + kApiPath,
              std::move(payload)};
    if (auto identity = Identify(inRequest, *transaction, call.now)) {
        call.actor = std::move(identity->actor);
        call.tokenHash = std::move(identity->tokenHash);
    }
    if (route.signIn == SignIn::Needed && call.actor.name.empty())
        FailNotSignedIn();
    return inRequest.IsRead() ? route.handle(call) : RunMutation(call, route, fingerprint);
}

Response Hub::RunMutation(Call& ioCall, Route const& inRoute, std::string const& inFingerprint) {
    std::string const key(ioCall.request.Header("Idempotency-Key"));
    if (key.size() > kMaxIdempotencyKey)
        throw Failure(400, "idempotency-key-too-long", "An Idempotency-Key has at most 128 bytes.");
    if (!key.empty()) {
        auto const stored = ioCall.transaction.FindAnswer(ioCall.actor.name, key, ioCall.now - kDay);
        if (stored && stored->fingerprint != inFingerprint)
            throw Failure(422, "idempotency-key-reused",
                          "This Idempotency-Key belongs to another request; use a fresh one.");
        if (stored)
            return AnswerOf(*stored);
    }
    Response response = inRoute.handle(ioCall);
    if (!key.empty()) {
        ioCall.transaction.RemoveAnswersBefore(ioCall.now - kDay);
        // Now and then: the count may go a little beyond what is kept.
        if (++mKeptAnswers % kAnswersBetweenCounts == 0)
            ioCall.transaction.KeepNewestAnswers(mSettings.maxKeptAnswers);
        ioCall.transaction.AddAnswer(RecordOf(response, ioCall, key, inFingerprint));
    }
    ioCall.transaction.Commit();
    return response;
}

}  // namespace zohub
