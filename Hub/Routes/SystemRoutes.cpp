// Discovery, the links document, sign-in, sign-out, users, health.
#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Password.h"
#include "Base/Text.h"
#include "Http/Multipart.h"
#include "Routes/DifferenceLinks.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kMaxPassword = 1024;
constexpr std::size_t kMaxUserAgent = 256;

// Versions of the media protocol that render jobs may ask for.
constexpr char kRenderProtocolVersions[] = "[1,2]";

Response Health(Call& ioCall) {
    (void)ioCall;
    return JsonResponse(200, "{\"status\":\"ok\"}");
}

void AppendServer(std::string& ioTarget, Call const& inCall) {
    ioTarget += "\"server\":{\"id\":";
    AppendJsonString(ioTarget, inCall.settings.id);
    ioTarget += ",\"name\":";
    AppendJsonString(ioTarget, inCall.settings.name);
    ioTarget += ",\"description\":";
    AppendJsonString(ioTarget, inCall.settings.description);
    ioTarget += ",\"version\":\"1.0.0\",\"configuration\":{\"renderProtocolVersions\":";
    ioTarget += kRenderProtocolVersions;
    ioTarget += "}},\"properties\":{\"majorVersion\":1,\"minorVersion\":2},\"links\":";
}

Response Discovery(Call& ioCall) {
    std::string text = "{";
    AppendServer(text, ioCall);
    { LinkWriter(text).Named("/discovery/v1", ioCall.api + "/links"); }
    text += '}';
    return JsonResponse(200, std::move(text));
}

Response ServiceLinks(Call& ioCall) {
    std::string text = "{";
    AppendServer(text, ioCall);
    {
        LinkWriter links(text);
        std::string const& api = ioCall.api;
        if (ioCall.actor.name.empty()) {
            links.Named("/system/login", api + "/system/login");
        } else {
            links.Named("/system/logout", api + "/system/logout");
            links.Named("/users/user#current", api + "/users/current");
            links.Named("/productions", api + "/p");
            links.Named("/productions/templates", api + "/templates");
            links.Named("/productions/production#byIdAndCommitId", api + "/p/{productionId}/at/{commitId}");
            links.Named("/productions/production#differenceByCommit", api + kDifferenceByCommitTemplate);
            links.Named("/medialocators", api + "/l");
            links.Named("/medialocator#byMediaLocatorId", api + "/l/{mediaLocatorId}");
        }
    }
    text += '}';
    return JsonResponse(200, std::move(text));
}

Response SignOut(Call& ioCall) {
    ioCall.transaction.RemoveToken(ioCall.tokenHash);
    return EmptyResponse(204);
}

Response UserDocument(Call& ioCall, std::string const& inName) {
    auto const user = ioCall.transaction.FindUser(inName);
    if (!user || (inName != ioCall.actor.name && !ioCall.actor.isAdmin))
        throw Failure(404, "not-found", "The user does not exist, or you may not see him.");
    Json document = Json::object();
    document["zo:userId"] = user->name;
    document["properties"] = {
        {"firstname", user->firstName}, {"lastname", user->lastName}, {"email", user->email}};
    document["links"] =
        Json::array({{{"rel", "self"}, {"href", ioCall.api + "/users/" + PercentEncode(user->name)}}});
    Json logins = Json::array();
    for (auto const& token : ioCall.transaction.ListTokens(user->name, ioCall.now))
        logins.push_back({{"ip", token.address}, {"hostname", ""}, {"useragent", token.userAgent}});
    document["logins"] = std::move(logins);
    return JsonResponse(200, JsonText(document));
}

std::string CookieFor(std::string const& inToken, Request const& inRequest, Micros inLifetime) {
    std::string cookie = "login-token=" + inToken + "; Path=/; HttpOnly; SameSite=Strict; Max-Age=" +
                         std::to_string(inLifetime / kSecond);
    return inRequest.isSecure ? cookie + "; Secure" : cookie;
}

std::string PrintableUserAgent(Request const& inRequest) {
    std::string text(inRequest.Header("User-Agent").substr(0, kMaxUserAgent));
    for (char& c : text)
        if (static_cast<unsigned char>(c) < 0x20 || static_cast<unsigned char>(c) > 0x7E)
            c = '?';
    return text;
}

}  // namespace

Response SignInByForm(Request const& inRequest, Storage& inStorage, HubSettings const& inSettings,
                      Micros inNow) {
    Form const form(inRequest);
    std::string const name(form.Get("j_username").bytes);
    std::string_view const password = form.Get("j_password").bytes;
    if (password.size() > kMaxPassword)
        throw Failure(400, "password-too-long", "A password has at most 1024 bytes.");
    auto const user = inStorage.BeginRead()->FindUser(name);
    if (!user)
        SpendPasswordTime(password);
    if (!user || !PasswordMatches(password, user->passwordHash))
        throw Failure(401, "sign-in-refused", "The user name or the password is wrong.");

    std::string const token = RandomHex(32);
    auto const transaction = inStorage.BeginWrite();
    transaction->RemoveTokensExpiredBefore(inNow);
    transaction->AddToken({Sha256Hex(token), user->name, inRequest.peerAddress, PrintableUserAgent(inRequest),
                           inNow, inNow + inSettings.tokenLifetime});
    transaction->Commit();
    Response response = JsonResponse(200, "{\"zo:userId\":" + JsonString(user->name) + "}");
    response.headers.emplace_back("Set-Cookie", CookieFor(token, inRequest, inSettings.tokenLifetime));
    return response;
}

void AddSystemRoutes(std::vector<Route>& ioRoutes) {
    std::string const api = std::string(kApiPath) + "/";
    ioRoutes.push_back({"GET", "health", SignIn::Optional, Health});
    ioRoutes.push_back({"GET", kDiscoveryPath, SignIn::Optional, Discovery});
    ioRoutes.push_back({"GET", api + "links", SignIn::Optional, ServiceLinks});
    ioRoutes.push_back({"POST", api + "system/logout", SignIn::Needed, SignOut});
    ioRoutes.push_back({"GET", api + "users/current", SignIn::Needed,
                        [](Call& ioCall) { return UserDocument(ioCall, ioCall.actor.name); }});
    ioRoutes.push_back({"GET", api + "users/{}", SignIn::Needed,
                        [](Call& ioCall) { return UserDocument(ioCall, ioCall.parameters[0]); }});
}

}  // namespace zohub
