#include "BadHub.h"

#include <cstdio>
#include <utility>

namespace faults {

const char kUsername[] = "ann";
const char kPassword[] = "canary-password-Zq7vT2";
const char kTokenValue[] = "canary-token-9fKx31mW";

namespace {

constexpr std::string_view kRelationBase = "http://ns.meridane.example/zo/rel";
constexpr char kJSON[] = "Content-Type: application/json;charset=utf-8\r\n";

struct Place {
    Step step;
    const char* name;
    const char* target;
};
constexpr Place kPlaces[] = {
    {Step::kDiscovery, "discovery", "/content/zo/api/discovery.json"},
    {Step::kLinks, "links", "/links"},
    {Step::kLogin, "login", "/login"},
    {Step::kSignedInLinks, "signed-in links", "/links"},
    {Step::kProductions, "productions", "/p"},
    {Step::kProduction, "production", "/p/1"},
    {Step::kAssets, "assets", "/p/1/full"},
    {Step::kEnclosures, "enclosures", "/p/1/e"},
    {Step::kPayload, "payload", "/e/1"},
    {Step::kLogout, "logout", "/logout"},
};

std::string ServerBlock() {
    return R"("server":{"id":"hub-1","name":"Faulty","description":"A hub for tests","version":"1.0.0",)"
           R"("configuration":{"renderProtocolVersions":[1,2]}},)"
           R"("properties":{"majorVersion":1,"minorVersion":2})";
}

std::string Asset(const std::string& inNumber, const std::function<std::string(std::string)>& inURL) {
    const std::string home = "/p/1/a/" + inNumber;
    return R"({"zo:assetId":"a)" + inNumber + R"(","zo:etag":"\"t)" + inNumber +
           R"(\"","zo:assetContentId":"c)" + inNumber + R"(","properties":{"name":"Clip )" + inNumber +
           R"(","description":"A clip","cdzo:assetType":"masterclip","mediaLocator":"m)" + inNumber +
           R"(","zo:parent":"bin","tags":["red","blue"],"isMulticamEnabled":true,)" +
           R"("zeroPoint":{"ticks":254016000000},"subClip":{"mStartBoundary":{"ticks":1},)" +
           R"("mEndBoundary":{"ticks":2},"mBoundaryIsHard":false}},"links":[)" +
           BadHub::MakeLink("self", inURL(home)) + "," + BadHub::MakeLink("edit", inURL(home)) + "," +
           BadHub::MakeLink("/enclosures", inURL(home + "/e")) + R"(],"enclosures":{"enclosures":[{)" +
           R"("zo:etag":"\"e\"","zo:enclosureContentId":"ec","zo:enclosureId":"ei","name":"xmp","links":[)" +
           BadHub::MakeLink("/enclosures/enclosure", inURL("/e/1")) + R"(]}],"links":[)" +
           BadHub::MakeLink("self", inURL(home + "/e")) + "]}}";
}

}  // namespace

const char* NameOf(Step inStep) {
    for (const Place& place : kPlaces) {
        if (place.step == inStep) {
            return place.name;
        }
    }
    return "other";
}

HubAnswer HubAnswer::WithBody(std::string inBody) const {
    HubAnswer answer = *this;
    answer.body = std::move(inBody);
    return answer;
}

HubAnswer HubAnswer::WithHeaders(std::string inHeaders) const {
    HubAnswer answer = *this;
    answer.headers = std::move(inHeaders);
    return answer;
}

std::string Quote(std::string_view inText) {
    std::string text = "\"";
    for (const char character : inText) {
        const auto byte = static_cast<unsigned char>(character);
        if (byte < 0x20 || character == '"' || character == '\\') {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04x", byte);
            text += escape;
        } else {
            text += character;
        }
    }
    return text + '"';
}

std::string BadHub::MakeLink(std::string_view inRelation, std::string_view inHRef) {
    std::string relation(inRelation.substr(0, 1) == "/" ? kRelationBase : "");
    relation += inRelation;
    return R"({"rel":)" + Quote(relation) + R"(,"href":)" + Quote(inHRef) + "}";
}

HubAnswer BadHub::GoodAnswer(Step inStep) const {
    const auto url = [this](const std::string& inPath) { return URL(inPath); };
    const auto document = [](std::string inBody) {
        return HubAnswer{200, std::string(kJSON) + "ETag: \"one\"\r\n", std::move(inBody)};
    };
    switch (inStep) {
        case Step::kDiscovery:
            return document("{" + ServerBlock() + R"(,"links":[)" + MakeLink("/discovery/v1", url("/links")) +
                            "]}");
        case Step::kLinks:
            return document("{" + ServerBlock() + R"(,"links":[)" + MakeLink("/system/login", url("/login")) +
                            "]}");
        case Step::kLogin:
            return {200,
                    "Set-Cookie: login-token=" + std::string(kTokenValue) + "; Path=/; HttpOnly\r\n" + kJSON,
                    "{}"};
        case Step::kSignedInLinks:
            return document("{" + ServerBlock() + R"(,"links":[)" +
                            MakeLink("/system/logout", url("/logout")) + "," +
                            MakeLink("/productions", url("/p")) + "," +
                            MakeLink("/productions/production#byIdAndCommitId", url("/p/{productionId}")) +
                            "," + MakeLink("/enclosures", url("/p/1/e")) + "," +
                            MakeLink("/medialocator#byMediaLocatorId", url("/l/{mediaLocatorId}")) + "]}");
        case Step::kProductions:
            return document(
                R"({"links":[)" + MakeLink("self", url("/p")) +
                R"(],"productions":[{"zo:productionId":"p1","zo:owner":"ann","zo:lastModified":)" +
                R"("2026-01-02T03:04:05.5Z","properties":{"name":"One","description":"First"},)" +
                R"("hasBin":true,"links":[)" + MakeLink("self", url("/p/1")) + "]}]}");
        case Step::kProduction:
            return document(
                R"({"zo:productionId":"p1","zo:commitId":"c1","owner":"ann","created":"2026-01-02T03:04:05Z",)"
                R"("properties":{"name":"One","description":"First","tags":["a","b"],"x:unknown":[1,2]},)"
                R"("metadata":{"applicationName":"tests","machineName":"here"},"links":[)" +
                MakeLink("self", url("/p/1")) + "," + MakeLink("edit", url("/p/1")) + "," +
                MakeLink("latest-version", url("/p/1")) + "," + MakeLink("/assets", url("/p/1/a")) + "," +
                MakeLink("/assets#full", url("/p/1/full")) + "," + MakeLink("/enclosures", url("/p/1/e")) +
                "]}");
        case Step::kAssets:
            return document(R"({"assets":[)" + Asset("1", url) + "," + Asset("2", url) +
                            R"(],"stats":{"count":2},"links":[)" + MakeLink("self", url("/p/1/full")) + "]}");
        case Step::kEnclosures:
            return document(
                R"({"enclosures":[{"zo:etag":"\"e1\"","zo:enclosureContentId":"ec1","zo:enclosureId":"e1",)"
                R"("name":"notes","links":[)" +
                MakeLink("/enclosures/enclosure", url("/e/1")) + R"(]}],"links":[)" +
                MakeLink("self", url("/p/1/e")) + "]}");
        case Step::kPayload:
            return {200, "Content-Type: text/plain\r\n", "payload of the enclosure"};
        case Step::kLogout:
            return {204, "", ""};
        case Step::kOther:
            break;
    }
    return {404, "", ""};
}

Step BadHub::StepOf(const ReceivedRequest& inRequest) {
    const std::string target = inRequest.target.substr(0, inRequest.target.find('?'));
    if (target == "/links") {
        return inRequest.Header("Cookie") ? Step::kSignedInLinks : Step::kLinks;
    }
    for (const Place& place : kPlaces) {
        if (target == place.target) {
            return place.step;
        }
    }
    return Step::kOther;
}

RawServer::Handler BadHub::MakeHandler() {
    return [this](Connection& ioConnection) {
        while (const auto request = ioConnection.ReadRequest()) {
            if (!Serve(ioConnection, *request)) {
                return;
            }
        }
    };
}

bool BadHub::Serve(Connection& ioConnection, const ReceivedRequest& inRequest) {
    const Step step = StepOf(inRequest);
    const HubAnswer good = GoodAnswer(step);
    Interference interference;
    {
        const std::lock_guard<std::mutex> lock(mMutex);
        const auto found = mInterferences.find(step);
        interference = found == mInterferences.end() ? Interference() : found->second;
    }
    return interference ? interference(ioConnection, inRequest, good) : ioConnection.Write(good.Bytes());
}

void BadHub::Interfere(Step inStep, Interference inInterference) {
    const std::lock_guard<std::mutex> lock(mMutex);
    mInterferences[inStep] = std::move(inInterference);
}

void BadHub::Change(Step inStep, std::function<HubAnswer(const HubAnswer&)> inChange) {
    Interfere(inStep, [change = std::move(inChange)](Connection& ioConnection, const ReceivedRequest&,
                                                     const HubAnswer& inGood) {
        return ioConnection.Write(change(inGood).Bytes());
    });
}

void BadHub::Say(Step inStep, std::string inBytes) {
    Interfere(inStep,
              [bytes = std::move(inBytes)](Connection& ioConnection, const ReceivedRequest&,
                                           const HubAnswer&) { return ioConnection.Write(bytes) && false; });
}

void BadHub::ChangeBody(Step inStep, std::string inBody) {
    Change(inStep, [body = std::move(inBody)](const HubAnswer& inGood) { return inGood.WithBody(body); });
}

void BadHub::BeGood() {
    const std::lock_guard<std::mutex> lock(mMutex);
    mInterferences.clear();
}

std::size_t BadHub::CountRequests(std::string_view inMethod, std::string_view inTarget) const {
    std::size_t count = 0;
    for (const ReceivedRequest& request : Requests()) {
        count += request.method == inMethod && request.target == inTarget ? 1 : 0;
    }
    return count;
}

}  // namespace faults
