// A hub that serves one small production and can be told to misbehave at any step of a client's way to it.
#pragma once

#include <cstddef>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "net/RawServer.h"

namespace faults {

using zotest::net::Connection;
using zotest::net::RawServer;
using zotest::net::ReceivedRequest;
using zotest::net::ServerIdentity;

/// The documents in the order in which a client meets them.
enum class Step {
    kDiscovery,
    kLinks,
    kLogin,
    kSignedInLinks,
    kProductions,
    kProduction,
    kAssets,
    kEnclosures,
    kPayload,
    kLogout,
    kOther
};
constexpr Step kConnectSteps[] = {Step::kDiscovery, Step::kLinks, Step::kLogin, Step::kSignedInLinks};
constexpr Step kLoadSteps[] = {Step::kProductions, Step::kProduction, Step::kAssets, Step::kEnclosures};
const char* NameOf(Step inStep);

/// An answer before it is put into bytes.
struct HubAnswer {
    int status = 200;
    std::string headers;  // extra lines, each with its CR LF
    std::string body;

    /// As a sound server would send it, the length being that of the body.
    std::string Bytes() const { return RawServer::Answer(status, body, headers); }
    HubAnswer WithBody(std::string inBody) const;
    HubAnswer WithHeaders(std::string inHeaders) const;
};

/// The name, password and token with which a client signs in. Each is a text that occurs nowhere else, so
/// that a search for it finds any leak.
extern const char kUsername[];
extern const char kPassword[];
extern const char kTokenValue[];

class BadHub {
public:
    BadHub() : mServer(MakeHandler()) {}
    explicit BadHub(const ServerIdentity& inIdentity) : mServer(MakeHandler(), inIdentity) {}

    /// Takes the place of the sound answer; false ends the connection.
    using Interference = std::function<bool(Connection&, const ReceivedRequest&, const HubAnswer&)>;
    void Interfere(Step inStep, Interference inInterference);
    /// Sends what the function makes of the sound answer.
    void Change(Step inStep, std::function<HubAnswer(const HubAnswer&)> inChange);
    /// Sends these bytes and ends the connection.
    void Say(Step inStep, std::string inBytes);
    void ChangeBody(Step inStep, std::string inBody);
    /// From now on, all is well again.
    void BeGood();

    /// What a sound hub answers.
    HubAnswer GoodAnswer(Step inStep) const;
    std::string URL(std::string_view inPath) const { return mServer.URL(inPath); }
    std::uint16_t Port() const { return mServer.Port(); }
    RawServer& Server() { return mServer; }
    std::vector<ReceivedRequest> Requests() const { return mServer.Requests(); }
    std::size_t CountRequests(std::string_view inMethod, std::string_view inTarget) const;

    static Step StepOf(const ReceivedRequest& inRequest);
    /// The link record of a relation of this system.
    static std::string MakeLink(std::string_view inRelation, std::string_view inHRef);

private:
    RawServer::Handler MakeHandler();
    bool Serve(Connection& ioConnection, const ReceivedRequest& inRequest);

    std::mutex mMutex;
    std::map<Step, Interference> mInterferences;
    RawServer mServer;
};

/// Writes a text with the escapes of JSON.
std::string Quote(std::string_view inText);

}  // namespace faults
