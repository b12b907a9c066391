// What a production says of itself, and what hangs on it.
#include "Model/Production.h"

#include "CollaborationFactory.h"
#include "Model/Asset.h"
#include "Model/AssetList.h"
#include "Model/HistoryWalk.h"
#include "Model/ResourceCreation.h"
#include "Model/ServerResourceWithEnclosures.h"
#include "Model/TransactionList.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "ResourceFactory.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;
using ostcore::threads::ScopedLock;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;

namespace {

ostcore::debug::TraceChannel& Channel() {
    static ostcore::debug::TraceChannel channel("ZOCL.Production");
    return channel;
}

/// Unreserved characters (RFC 3986, section 2.3) stand for themselves in a query.
std::string EscapeForQuery(std::string_view inText) {
    constexpr char digits[] = "0123456789ABCDEF";
    constexpr std::string_view unreserved = "-._~";
    std::string result;
    for (const char c : inText) {
        const auto byte = static_cast<unsigned char>(c);
        if ((c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
            unreserved.find(c) != std::string_view::npos) {
            result += c;
        } else {
            result += '%';
            result += digits[byte >> 4];
            result += digits[byte & 15];
        }
    }
    return result;
}

}  // namespace

ostcore::serialization::JSONValue MakeProductionCreationBody(const UString& inName,
                                                             const UString& inDescription,
                                                             bool inIsTemporary) {
    auto body = ostcore::serialization::JSONValue::EmptyObject();
    ostcore::serialization::AddToObject(body, "name", inName);
    ostcore::serialization::AddToObject(body, "description", inDescription);
    ostcore::serialization::AddToObject(body, "isTemporary", inIsTemporary);
    return body;
}

Production::Production() = default;
Production::~Production() = default;

int Production::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == kInterfaceID) {
        *outInterface = this;
        return kResultSuccess;
    }
    return Implements::QueryInterfaceNoAddRef(inID, outInterface);
}

/// A body that comes anew must not take away what the host has set and not stored yet.
void Production::ApplyPropertyChanges() {
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::ApplyPropertyChanges");
    if (!mLoaded || mPropertyChanges.empty()) {
        return;
    }
    dto::ProductionBaseProperties properties = mBody.Properties();
    for (const auto& change : mPropertyChanges) {
        properties.Set(change.first, change.second);
    }
    mBody.SetProperties(properties);
}

void Production::PostLoadDTO() {
    ApplyPropertyChanges();
    const ImmutableString enclosuresLink = GetLinkHref(kRelation_Enclosures);
    const ImmutableString assetsLink = GetAssetsLink();
    if (enclosuresLink.empty() || assetsLink.empty()) {
        ReportMissingLists();
        return;
    }
    const InterfaceRef<IZOCDataServer> server = GetServer();
    InterfaceRef<Enclosures> enclosures = MakeAtURL<Enclosures>(enclosuresLink, server, GetWritability());
    InterfaceRef<AssetList> assets = MakeAtURL<AssetList>(assetsLink, server, GetWritability());
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::PostLoadDTO");
        std::swap(mEnclosures, enclosures);
        std::swap(mAssets, assets);
    }
    if (assets) {
        assets->InvalidateContent();
    }
}

void Production::ReportMissingLists() {
    if (!Channel().IsEnabled(kTraceLevel_Error)) {
        return;
    }
    shared_ptr<ostnet::Response> response;
    ImmutableString url;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::PostLoadDTO");
        response = mResponse;
        url = mURL;
    }
    ostcore::debug::StructuredText text("Failed to load enclosures and assets link lists for production");
    text.Add("uri", url);
    text.Add("httpStatusCode", std::int64_t(response ? response->status : 0));
    text.Add("httpLibCode", std::int64_t(response ? response->curlError : 0));
    text.Add("payload", response ? response->GetShortenedPayloadAsUTF8String() : "NULL http response");
    text.Add("httpHeaders", response ? response->GetHeadersAsUTF8String() : std::string());
    text.Add("expression", "(enclosuresLink == ostnet::URL() || assetsLink == ostnet::URL())");
    ostcore::debug::Trace(Channel(), kTraceLevel_Error, text);
}

ImmutableString Production::GetAssetsLink() {
    const ImmutableString full = GetLinkHref(kRelation_Assets_Full);
    if (full.empty() || ostcore::debug::DebugDatabase::GetBool("ZOClient.DisableFullAssetList", false)) {
        return GetLinkHref(kRelation_Assets);
    }
    return full;
}

bool Production::HasLink(const ImmutableString& inRelation) {
    return !GetLinkHref(inRelation).empty();
}

UString Production::GetName() {
    const auto properties = GetBody("Production::GetName").Properties();
    return ToUTF16(properties.Name());
}

void Production::SetProperty(std::string_view inKey, const UString& inValue, const char* inLabel) {
    const std::string value = ToUTF8(inValue);
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    dto::ProductionBaseProperties properties = mBody.Properties();
    if (properties.Text(inKey) != value) {
        properties.Set(inKey, value);
        mBody.SetProperties(properties);
        mPropertyChanges[std::string(inKey)] = value;
    }
}

void Production::SetName(const UString& inName) {
    SetProperty("name", inName, "Production::SetName");
}

ImmutableString Production::GetIdentifier() {
    return GetBody("Production::GetIdentifier").Identifier();
}

UString Production::GetDescription() {
    const auto properties = GetBody("Production::GetDescription").Properties();
    return ToUTF16(properties.Description());
}

void Production::SetDescription(const UString& inDescription) {
    SetProperty("description", inDescription, "Production::SetDescription");
}

InterfaceRef<IZOCAssetList> Production::GetAssets() {
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::GetAssets");
    return mAssets;
}

InterfaceRef<IZOCAssetList> Production::GetAssetsWithParent(const ImmutableString& inParentID) {
    const ImmutableString link = GetAssetsLink();
    if (link.empty()) {
        return nullptr;
    }
    const char* separator = link.view().find('?') == std::string_view::npos ? "?" : "&";
    const ImmutableString url(JoinText(link, separator, "parentId=", EscapeForQuery(inParentID)));
    return MakeAtURL<AssetList>(url, GetServer(), GetWritability());
}

void Production::ReportMissingAsset(const ImmutableString& inIdentifier) {
    ostcore::debug::StructuredText text("Failed to find asset for identifier");
    text.Add("assetID", inIdentifier);
    ostcore::debug::Trace(Channel(), kTraceLevel_Error, text);
}

bool Production::GetAssetByIdentifier(const Guid& inRequestID, const ImmutableString& inIdentifier,
                                      const RequestCompletion& inCompletion) {
    const InterfaceRef<IZOCAssetList> assets = GetAssets();
    const auto list = RFL::QueryInterface<IZOCServerResource>(assets);
    if (!list) {
        return false;
    }
    const InterfaceRef<Production> self(this);
    const auto onLoaded = [=](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>& inResponse) {
        int result = inResult >= 0 && !list->IsLoaded() ? kResultFailure : inResult;
        InterfaceRef<IZOCAsset> asset;
        if (result >= 0) {
            asset = assets->GetAssetByIdentifier(inIdentifier);
            result = asset ? result : kResultHTTPNotFound;
        }
        if (!asset) {
            self->ReportMissingAsset(inIdentifier);
        }
        if (inCompletion) {
            inCompletion(inID, result, RFL::QueryInterface<IZOCServerResource>(asset), inResponse);
        }
    };
    return list->Load(inRequestID, onLoaded, true);
}

InterfaceRef<IZOCAsset> Production::GetAssetByIdentifier(const ImmutableString& inIdentifier) {
    const InterfaceRef<IZOCAssetList> assets = GetAssets();
    const auto list = RFL::QueryInterface<IZOCServerResource>(assets);
    InterfaceRef<IZOCAsset> asset;
    if (list && list->Load(true)) {
        asset = assets->GetAssetByIdentifier(inIdentifier);
    }
    if (!asset) {
        ReportMissingAsset(inIdentifier);
    }
    return asset;
}

ImmutableString Production::GetAssetURL(const ImmutableString& inAssetID, const ImmutableString& inCommit) {
    const ImmutableString href = GetLinkHref(kRelation_Assets_Asset_ById);
    if (href.empty()) {
        return href;
    }
    static const ImmutableString head("HEAD");
    return ExpandTemplate(href,
                          {{"{assetId}", inAssetID}, {"{commitId}", inCommit.empty() ? head : inCommit}});
}

bool Production::LoadHistoryWith(const HistoryVisitor& inVisitor, const HistoryWalkCompletion& inCompletion) {
    return WalkHistory(GetProductionHistory(), inVisitor, inCompletion);
}

bool Production::GetMostRecentRevision(const HistoryWalkCompletion& inCompletion) {
    const auto isNewest = [](const InterfaceRef<IZOCHistoryVersion>&, int&) { return true; };
    return LoadHistoryWith(isNewest, inCompletion);
}

InterfaceRef<IZOCProductionHistory> Production::GetProductionHistory() {
    CollaborationFactory* const factory = GetCompositionRoot().collaboration;
    const ImmutableString link = GetLinkHref(kRelation_Productions_Production_History);
    return factory && !link.empty() ? factory->MakeProductionHistory(link, GetServer()) : nullptr;
}

ImmutableString Production::GetSessionsLink() {
    return GetLinkHref(kRelation_Sessions);
}

ImmutableString Production::GetMostRecentRevision() {
    const ImmutableString link = GetLinkHref(kRelation_LatestVersion);
    const auto latest = MakeAtURL<Production>(link, GetServer(), ResourceWritability::kReadOnly);
    const bool isLoaded = latest && latest->Load(true);
    ZO_ASSERT_ONCE(isLoaded, "isLoaded", JoinText("Failed to load production ", link));
    return isLoaded ? latest->GetLoadedRevision() : ImmutableString();
}

ImmutableString Production::GetLoadedRevision() {
    bool loaded = false;
    const dto::Production body = GetBody("Production::GetLoadedRevision", loaded);
    return loaded ? body.CommitID() : ImmutableString();
}

InterfaceRef<IZOCEnclosures> Production::GetEnclosures() {
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::GetEnclosures");
    return mEnclosures;
}

bool Production::Copy(const Guid& inRequestID, const RequestCompletion& inCompletion, const UString& inName,
                      const UString& inDescription, bool inIsTemporary) {
    ImmutableString relation = kRelation_Productions_Production_Copy;
    if (IsEditingSession()) {
        relation = kRelation_Sessions_Session_Copy;
    } else if (IsTemplate()) {
        relation = kRelation_Productions_Production_Create_Production;
    }
    return PostJSONForNew<Production>(inRequestID, GetLinkHref(relation), GetServer(),
                                      MakeProductionCreationBody(inName, inDescription, inIsTemporary),
                                      inCompletion);
}

ptime Production::GetCreationTime() {
    return GetBody("Production::GetCreationTime").Created();
}

ptime Production::GetModificationTime() {
    return GetBody("Production::GetModificationTime").Modified();
}

ImmutableString Production::GetOwner() {
    return GetBody("Production::GetOwner").Owner();
}

std::vector<ImmutableString> Production::GetTags() {
    return GetBody("Production::GetTags").Properties().Tags();
}

InterfaceRef<IZOCProduction> Production::GetLatestVersion() {
    return MakeAtURL<Production>(GetLinkHref(kRelation_LatestVersion), GetServer(), GetWritability());
}

bool Production::IsEditingSession() {
    return HasLink(kRelation_Sessions_Session_Push);
}

bool Production::IsTransaction() {
    return HasLink(kRelation_Transactions_Transaction_Commit);
}

bool Production::IsTemplate() {
    return HasLink(kRelation_Productions_Production_Create_Production);
}

bool Production::UpdateProductionBaseProperties(const Guid& inRequestID,
                                                const RequestCompletion& inCompletion) {
    ImmutableString link;
    InterfaceRef<IZOCDataServer> server;
    dto::ProductionBaseProperties properties;
    ostnet::Headers headers = MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8);
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::UpdateProductionBaseProperties");
        link = LinkHrefLocked(kRelation_Edit);
        server = mServer;
        properties = mBody.Properties();
        if (!mETag.IsNull()) {
            headers.emplace(ostnet::kHEADER_IF_MATCH, mETag);
        }
    }
    if (link.empty()) {
        return false;
    }
    const InterfaceRef<Production> self(this);
    const auto onPut = [self, inCompletion](const Guid& inID, int inResult,
                                            const InterfaceRef<IZOCServerResource>&,
                                            const shared_ptr<ostnet::Response>& inResponse) {
        const ImmutableString tag = GetETagFromResponse(inResponse);
        if (inResult >= 0 && !tag.IsNull()) {
            self->SetETag(tag);
        }
        if (inCompletion) {
            inCompletion(inID, inResult, self, inResponse);
        }
    };
    const auto target = ServerResource::MakePlain(link, server, ResourceWritability::kWritable);
    return target->Put(
        RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(properties.Body())),
        headers, inRequestID, onPut);
}

std::string Production::GetTraceName() {
    return ToUTF8(GetName());
}

}  // namespace ZOCL
