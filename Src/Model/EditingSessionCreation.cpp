// Finds the session in which a user works on a production, or makes one.
#include <set>

#include "Model/DataServerCaches.h"
#include "Model/Production.h"
#include "Model/ProductionList.h"
#include "Model/ResourceCreation.h"
#include "Model/TransactionList.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"

namespace ZOCL {

namespace {

/// What stands in a trace for the status of a response that never came.
constexpr std::int64_t kStatusOfNullResponse = -2;

void TraceFailure(const ostcore::debug::StructuredText& inText) {
    ostcore::debug::Trace(std::string_view("ZOCL.Production"), ostcore::debug::kTraceLevel_Error, inText);
}

void TraceBadResponse(const char* inMessage, const shared_ptr<ostnet::Response>& inResponse) {
    ostcore::debug::StructuredText text(inMessage);
    text.Add("httpStatusCode", inResponse ? std::int64_t(inResponse->status) : kStatusOfNullResponse);
    text.Add("httpLibCode", std::int64_t(inResponse ? inResponse->curlError : 0));
    text.Add("payload", inResponse ? inResponse->GetShortenedPayloadAsUTF8String() : "NULL http response");
    TraceFailure(text);
}

ImmutableString FindUserID(const InterfaceRef<IZOCDataServer>& inServer) {
    const InterfaceRef<IZOCUser> user = inServer->GetLoggedInUser();
    const auto resource = RFL::QueryInterface<IZOCServerResource>(user);
    return resource && resource->Load(true) ? user->GetUserID() : ImmutableString();
}

ImmutableString URLOf(const InterfaceRef<IZOCProductionList>& inList) {
    return RFL::QueryInterface<IZOCServerResource>(inList)->GetHTTPURL();
}

/// The URL of the user's session in a list; null when there is none or the list cannot be read.
ImmutableString FindSessionOfUser(InterfaceRef<IZOCProductionList> ioList,
                                  const InterfaceRef<IZOCDataServer>& inServer) {
    ImmutableString userID;
    // A list that leads back to a page that was seen ends there.
    std::set<ImmutableString> seen;
    while (seen.insert(URLOf(ioList)).second && ioList->Load(true)) {
        const auto entries = ioList->GetAllItems();
        if (!entries.empty() && userID.empty()) {
            userID = FindUserID(inServer);
        }
        for (const auto& entry : entries) {
            if (!userID.empty() && entry.owner == userID && !entry.url.empty()) {
                return entry.url;
            }
        }
        ioList = ioList->GetNextPage();
        if (!ioList) {
            break;
        }
    }
    return ImmutableString();
}

/// Loaded, and as the server has it now; null when it cannot be loaded.
InterfaceRef<Production> LoadFoundSession(const ImmutableString& inURL,
                                          const InterfaceRef<IZOCDataServer>& inServer) {
    const auto held = RFL::QueryInterface<Production>(FindCachedProduction(inServer, inURL));
    if (held && held->IsLoaded()) {
        bool changed = false;
        held->Refresh(changed, false);
    }
    const auto session = RFL::QueryInterface<Production>(inServer->GetWritableProductionFromURL(inURL));
    if (session && session->IsLoaded()) {
        return session;
    }
    ostcore::debug::StructuredText text("Failed to load the user's editing session");
    text.Add("uri", inURL);
    TraceFailure(text);
    return nullptr;
}

InterfaceRef<Production> FollowRedirect(const shared_ptr<ostnet::Response>& inResponse,
                                        const InterfaceRef<IZOCDataServer>& inServer, bool inIsTemporary) {
    const ImmutableString location = ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_LOCATION);
    if (location.empty()) {
        ostcore::debug::StructuredText text("Server redirect response did not contain a Location: header");
        text.Add("httpHeaders", inResponse->GetHeadersAsUTF8String());
        TraceFailure(text);
        return nullptr;
    }
    // A temporary session is nobody else's, so it stays out of what the server gives out again.
    const auto session = inIsTemporary
                             ? MakeAtURL<Production>(location, inServer, ResourceWritability::kWritable)
                             : RFL::QueryInterface<Production>(FindOrMakeProduction(inServer, location));
    if (session && session->Load(true)) {
        return session;
    }
    ostcore::debug::StructuredText text(
        "Failed to create production for editing session (redirected from url)");
    text.Add("uri", location);
    TraceFailure(text);
    return nullptr;
}

InterfaceRef<Production> MakeFromResponse(const shared_ptr<ostnet::Response>& inResponse,
                                          const ImmutableString& inFactoryURL,
                                          const InterfaceRef<IZOCDataServer>& inServer, bool inIsTemporary) {
    const InterfaceRef<Production> session(new Production);
    if (!session->InternalInit(inFactoryURL, inServer, inResponse, ResourceWritability::kWritable, true)) {
        TraceBadResponse("Failed to create production from response", inResponse);
        return nullptr;
    }
    if (!inIsTemporary) {
        CacheProduction(inServer, session);
    }
    return session;
}

InterfaceRef<Production> PostNewSession(const ImmutableString& inFactoryURL,
                                        const InterfaceRef<IZOCDataServer>& inServer, const UString& inName,
                                        const UString& inDescription, bool inIsTemporary) {
    const auto body = MakeProductionCreationBody(inName, inDescription, inIsTemporary);
    const auto response = inServer->BlockingPOST(
        inFactoryURL, MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8),
        RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(body)),
        ostnet::http::kWaitForever);
    constexpr const char* noResponse =
        "Failed to create editing session using factory URL; no response from server";
    ZO_ASSERT_ONCE(response, "response", noResponse);
    if (!response) {
        TraceBadResponse(noResponse, response);
        return nullptr;
    }
    if (response->status >= 300 && response->status <= 399) {
        return FollowRedirect(response, inServer, inIsTemporary);
    }
    if (response->IsSuccess()) {
        return MakeFromResponse(response, inFactoryURL, inServer, inIsTemporary);
    }
    TraceBadResponse("Failed to create editing session from factory", response);
    return nullptr;
}

}  // namespace

InterfaceRef<IZOCProductionList> Production::GetEditingSessions() {
    return MakeAtURL<ProductionList>(GetSessionsLink(), GetServer(), GetWritability());
}

bool Production::GetEditingSessionFactoryURL(ImmutableString& outURL) {
    outURL = GetSessionsLink();
    return !outURL.empty();
}

bool Production::CreateEditingSession(InterfaceRef<IZOCEditingSession>& outSession, const UString& inName,
                                      const UString& inDescription, bool inIsTemporary) {
    outSession.Reset();
    const InterfaceRef<IZOCDataServer> server = GetServer();
    ImmutableString factoryURL;
    if (!server || !GetEditingSessionFactoryURL(factoryURL)) {
        return false;
    }
    const ImmutableString found =
        inIsTemporary ? ImmutableString() : FindSessionOfUser(GetEditingSessions(), server);
    const InterfaceRef<Production> session =
        found.empty() ? PostNewSession(factoryURL, server, inName, inDescription, inIsTemporary)
                      : LoadFoundSession(found, server);
    if (!session || !session->Load(true)) {
        return false;
    }
    session->SetCreationContext(InterfaceRef<Production>(this), nullptr);
    outSession = session;
    return true;
}

}  // namespace ZOCL
