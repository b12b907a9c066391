// The data server as the factory of resources, and the caches of those that live on.
#include "Connection/DataServer.h"
#include "Connection/SynchronousRequest.h"
#include "Links.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"
#include "Relations.h"
#include "ResourceFactory.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

const ImmutableString& NewestCommit() {
    static const ImmutableString& head = *new ImmutableString("HEAD");
    return head;
}

std::string WithText(const char* inMessage, const ImmutableString& inText) {
    return inMessage + inText.str();
}

template <class T>
ImmutableString URLOf(const InterfaceRef<T>& inObject) {
    const auto resource = RFL::QueryInterface<IZOCServerResource>(inObject);
    return resource ? resource->GetHTTPURL() : ImmutableString();
}

/// Null before Initialize and after Shutdown: then no getter has anything to give.
ResourceFactory* Factory() {
    return GetCompositionRoot().resources;
}

}  // namespace

InterfaceRef<IZOCProductionList> DataServer::MakeProductionList(const ImmutableString& inRelation) {
    const ImmutableString url = GetLink(inRelation);
    ResourceFactory* const factory = Factory();
    return factory && !url.IsNull() ? factory->MakeProductionList(url, Self()) : nullptr;
}

InterfaceRef<IZOCProductionList> DataServer::GetProductionList(bool inRefresh) {
    const InterfaceRef<IZOCProductionList> list = MakeProductionList(kRelation_Productions);
    if (list && inRefresh) {
        list->Load(true);
    }
    return list;
}

InterfaceRef<IZOCProductionList> DataServer::GetProductionTemplateList(bool inRefresh) {
    const InterfaceRef<IZOCProductionList> list = MakeProductionList(kRelation_Productions_Templates);
    if (list && inRefresh) {
        list->Load(true);
    }
    return list;
}

InterfaceRef<IZOCEnclosures> DataServer::GetEnclosures() {
    const ImmutableString url = GetLink(kRelation_Enclosures);
    ResourceFactory* const factory = Factory();
    return factory && !url.IsNull() ? factory->MakeEnclosures(url, Self()) : nullptr;
}

InterfaceRef<IZOCServerResource> DataServer::GetMediaLocators() {
    const ImmutableString url = GetLink(kRelation_MediaLocators);
    ResourceFactory* const factory = Factory();
    return factory && !url.IsNull() ? factory->MakeResource(url, Self(), ResourceWritability::kWritable)
                                    : nullptr;
}

InterfaceRef<IZOCUser> DataServer::GetLoggedInUser() {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "GetServerLoggedInUser");
        if (mLoggedInUser) {
            return mLoggedInUser;
        }
    }
    const ImmutableString url = GetLink(kRelation_Users_User_Current);
    ResourceFactory* const factory = Factory();
    InterfaceRef<IZOCUser> user = factory && !url.IsNull() ? factory->MakeUser(url, Self()) : nullptr;
    ScopedLock lock(IZOCDataServer::GetLock(), "GetServerLoggedInUser - 2");
    if (mLoggedInUser || mUseHasEnded) {
        return mLoggedInUser ? mLoggedInUser : user;
    }
    mLoggedInUser = user;
    return user;
}

UString DataServer::GetLoggedInUserName() {
    const InterfaceRef<IZOCUser> user = GetLoggedInUser();
    const auto resource = RFL::QueryInterface<IZOCServerResource>(user);
    if (resource && (resource->IsLoaded() || resource->Load(false))) {
        const UString first = user->GetFirstName();
        const UString last = user->GetLastName();
        const UString name = first + (first.empty() || last.empty() ? u"" : u" ") + last;
        if (!name.empty()) {
            return name;
        }
    }
    return ostcore::utility::ToUTF16(GetCredentials().username.view());
}

bool DataServer::CreateProduction(const Guid& inRequestID, const UString& inName,
                                  const UString& inDescription, bool inIsTemporary,
                                  const RequestCompletion& inCompletion) {
    const ImmutableString url = GetLink(kRelation_Productions);
    ResourceFactory* const factory = Factory();
    return factory && !url.IsNull() &&
           factory->PostNewProduction(inRequestID, url, Self(), inName, inDescription, inIsTemporary,
                                      inCompletion);
}

InterfaceRef<IZOCProduction> DataServer::CreateProduction(const UString& inName, const UString& inDescription,
                                                          bool inIsTemporary) {
    struct Outcome {
        ostcore::threads::Gate gate;
        InterfaceRef<IZOCProduction> production;
    };
    const auto outcome = boost::make_shared<Outcome>();
    const Guid requestID = Guid::CreateUnique();
    const auto onCreated = [outcome](const Guid&, int inResult,
                                     const InterfaceRef<IZOCServerResource>& inResource,
                                     const shared_ptr<ostnet::Response>&) {
        if (inResult >= 0) {
            outcome->production = RFL::QueryInterface<IZOCProduction>(inResource);
        }
        outcome->gate.Open();
    };
    if (!CreateProduction(requestID, inName, inDescription, inIsTemporary, onCreated)) {
        return nullptr;
    }
    WaitForRequest(outcome->gate, requestID, ostnet::http::kWaitForever, *mChain.upload,
                   [this] { ShowWarningsIfNeeded(); });
    return outcome->production;
}

InterfaceRef<IZOCMediaLocator> DataServer::GetMediaLocator(const ImmutableString& inID) {
    if (const InterfaceRef<IZOCMediaLocator> cached = GetCachedMediaLocator(inID)) {
        return cached;
    }
    const ImmutableString link = GetLink(kRelation_MediaLocator_ByMediaLocatorId);
    ResourceFactory* const factory = Factory();
    InterfaceRef<IZOCMediaLocator> mediaLocator;
    if (factory && !link.IsNull()) {
        mediaLocator =
            factory->MakeMediaLocator(ExpandTemplate(link, {{"{mediaLocatorId}", inID}}), inID, Self());
    }
    ZO_ASSERT_ONCE(mediaLocator, "mediaLocator", WithText("Could not create MediaLocator with ID=", inID));
    if (!mediaLocator) {
        return nullptr;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::GetMediaLocator");
    if (mUseHasEnded) {
        return mediaLocator;
    }
    // Another thread may have been quicker; both get the same object.
    return mMediaLocatorCache.emplace(inID, mediaLocator).first->second;
}

bool DataServer::CreateAsset(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                             const AssetBaseProperties& inProperties, const RequestCompletion& inCompletion) {
    return !inFactoryURL.IsNull() &&
           IZOCWritableAsset::Create(inRequestID, inFactoryURL, Self(), inProperties, inCompletion);
}

InterfaceRef<IZOCAsset> DataServer::GetAssetFromURL(const ImmutableString& inURL,
                                                    ResourceWritability inWritability) {
    ResourceFactory* const factory = Factory();
    const InterfaceRef<IZOCAsset> assetRef =
        factory ? factory->MakeAsset(inURL, Self(), inWritability) : nullptr;
    ZO_ASSERT_ONCE(assetRef, "assetRef", WithText("Could not create AssetRef for URL ", inURL));
    return assetRef;
}

InterfaceRef<IZOCProduction> DataServer::FindOrMakeProduction(const ImmutableString& inURL) {
    if (const InterfaceRef<IZOCProduction> cached = GetCachedProduction(inURL)) {
        return cached;
    }
    ResourceFactory* const factory = Factory();
    const InterfaceRef<IZOCProduction> production =
        factory ? factory->MakeProduction(inURL, Self(), ResourceWritability::kWritable) : nullptr;
    ZO_ASSERT_ONCE(production, "production", WithText("Could not create ProductionRef for URL ", inURL));
    if (!production) {
        return nullptr;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::GetProductionFromURL");
    if (mUseHasEnded) {
        return production;
    }
    return mProductionCache.emplace(inURL, production).first->second;
}

InterfaceRef<IZOCProduction> DataServer::GetProductionFromURL(const ImmutableString& inURL) {
    const InterfaceRef<IZOCProduction> production = FindOrMakeProduction(inURL);
    const auto resource = RFL::QueryInterface<IZOCServerResource>(production);
    if (resource && resource->Load(true)) {
        OnProductionLoadedForCache(inURL, production);
    }
    return production;
}

InterfaceRef<IZOCProduction> DataServer::GetWritableProductionFromURL(const ImmutableString& inURL) {
    return GetProductionFromURL(inURL);
}

bool DataServer::LoadProductionFromURL(const ImmutableString& inURL, const Guid& inRequestID,
                                       const RequestCompletion& inCompletion) {
    const InterfaceRef<IZOCProduction> production = FindOrMakeProduction(inURL);
    const auto resource = RFL::QueryInterface<IZOCServerResource>(production);
    if (!resource) {
        return false;
    }
    const InterfaceRef<DataServer> self(this);
    const auto onLoaded = [self, inURL, production, inCompletion](
                              const Guid& inID, int inResult,
                              const InterfaceRef<IZOCServerResource>& inResource,
                              const shared_ptr<ostnet::Response>& inResponse) {
        if (LoadResultSucceeded(inResult) && inResource && inResource->IsLoaded()) {
            self->OnProductionLoadedForCache(inURL, production);
        }
        inCompletion(inID, inResult, inResource, inResponse);
    };
    return resource->Load(inRequestID, onLoaded, true);
}

void DataServer::OnProductionLoadedForCache(const ImmutableString& inURL,
                                            const InterfaceRef<IZOCProduction>& inProduction) {
    // The body may have named another URL as the canonical one; both lead to the same object from now on.
    const ImmutableString canonical = URLOf(inProduction);
    ZO_ASSERT_ONCE(!canonical.IsNull(), "production",
                   WithText("Could not cache ProductionRef for URL ", inURL));
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::OnProductionLoadedForCache");
    if (!mUseHasEnded && !canonical.IsNull()) {
        mProductionCache.emplace(canonical, inProduction);
    }
}

InterfaceRef<IZOCProduction> DataServer::GetProductionByIdAndCommitId(const ImmutableString& inProductionID,
                                                                      const ImmutableString& inCommitID) {
    const ImmutableString link = GetLink(kRelation_Productions_Production_ByIdAndCommitId);
    ResourceFactory* const factory = Factory();
    if (!factory || link.IsNull()) {
        return nullptr;
    }
    const ImmutableString commit = inCommitID.IsNull() ? NewestCommit() : inCommitID;
    return factory->MakeProduction(
        ExpandTemplate(link, {{"{productionId}", inProductionID}, {"{commitId}", commit}}), Self(),
        ResourceWritability::kReadOnly);
}

InterfaceRef<IZOCProduction> DataServer::GetProductionByIdAndCommitId(const ProductionRevision& inRevision) {
    return GetProductionByIdAndCommitId(inRevision.productionID, inRevision.commitID);
}

shared_ptr<RecycledMemory const> DataServer::GetPayloadFromURL(const ImmutableString& inURL) {
    const ResponseRef response = BlockingGET(inURL, ostnet::Headers(), ostnet::http::kWaitForever);
    return response && response->IsSuccess() ? response->payload : nullptr;
}

namespace {

/// Turns the end of a plain POST into that of a resource's request.
ostnet::http::CompletionFunction AsRequestCompletion(const InterfaceRef<IZOCDataServer>& inServer,
                                                     const ImmutableString& inURL,
                                                     const RequestCompletion& inCompletion) {
    return [inServer, inURL, inCompletion](const Guid& inID, const shared_ptr<ostnet::Response>& inResponse) {
        ResourceFactory* const factory = Factory();
        const auto resource =
            factory ? factory->MakeResource(inURL, inServer, ResourceWritability::kReadOnly) : nullptr;
        inCompletion(inID, GetResultFromResponse(inResponse, kResultNoResponseObject), resource, inResponse);
    };
}

}  // namespace

bool DataServer::PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                           const ImmutableString& inContentType, const Guid& inRequestID,
                           const RequestCompletion& inCompletion) {
    ostnet::Headers headers;
    headers.emplace(ostnet::kHEADER_CONTENT_TYPE, inContentType);
    return PostToURL(inURL, inBody, headers, inRequestID, inCompletion);
}

bool DataServer::PostToURL(const ImmutableString& inURL, const shared_ptr<RecycledMemory const>& inBody,
                           const ostnet::Headers& inHeaders, const Guid& inRequestID,
                           const RequestCompletion& inCompletion) {
    return POST(inRequestID, AsRequestCompletion(Self(), inURL, inCompletion), inURL, inHeaders, inBody);
}

bool DataServer::PostToURL(const ImmutableString& inURL, const ostnet::http::Form& inForm,
                           const Guid& inRequestID, const RequestCompletion& inCompletion) {
    return POST(inRequestID, AsRequestCompletion(Self(), inURL, inCompletion), inURL, ostnet::Headers(),
                inForm);
}

void DataServer::CacheProduction(const InterfaceRef<IZOCProduction>& inProduction) {
    const ImmutableString url = URLOf(inProduction);
    ZO_ASSERT_ONCE(!url.IsNull(), "production", "Could not cache ProductionRef for URL ");
    InterfaceRef<IZOCProduction> former = inProduction;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::CacheProduction");
    if (!url.IsNull() && !mUseHasEnded) {
        std::swap(former, mProductionCache[url]);
    }
    lock.Unlock();
}

InterfaceRef<IZOCProduction> DataServer::GetCachedProduction(const ImmutableString& inURL) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::GetCachedProduction");
    const auto found = mProductionCache.find(inURL);
    return found == mProductionCache.end() ? nullptr : found->second;
}

void DataServer::CacheMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) {
    const ImmutableString identifier = inLocator->GetID();
    if (inLocator->GetMediaHRef().IsNull()) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Lifetime,
                              WithText("DataServer::CacheMediaLocator: Skip to cache media locator with a "
                                       "non-existing media HREF for media locator ID=",
                                       identifier));
        return;
    }
    ZO_ASSERT_ONCE(!identifier.IsNull(), "mediaLocator", "Failed to cache MediaLocator with ID=");
    InterfaceRef<IZOCMediaLocator> former = inLocator;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::CacheMediaLocator");
    if (!identifier.IsNull() && !mUseHasEnded) {
        std::swap(former, mMediaLocatorCache[identifier]);
    }
    lock.Unlock();
}

InterfaceRef<IZOCMediaLocator> DataServer::GetCachedMediaLocator(const ImmutableString& inID) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::GetCachedMediaLocator");
    const auto found = mMediaLocatorCache.find(inID);
    return found == mMediaLocatorCache.end() ? nullptr : found->second;
}

void DataServer::ClearProductionFromCache(const ImmutableString& inURL) {
    InterfaceRef<IZOCProduction> former;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::ClearFromCache");
    const auto found = mProductionCache.find(inURL);
    if (found != mProductionCache.end()) {
        std::swap(former, found->second);
        mProductionCache.erase(found);
    }
    lock.Unlock();
}

void DataServer::ClearMediaLocatorFromCache(const ImmutableString& inID) {
    InterfaceRef<IZOCMediaLocator> former;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::ClearFromCache");
    const auto found = mMediaLocatorCache.find(inID);
    if (found != mMediaLocatorCache.end()) {
        std::swap(former, found->second);
        mMediaLocatorCache.erase(found);
    }
    lock.Unlock();
}

}  // namespace ZOCL
