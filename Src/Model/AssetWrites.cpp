// Changing and creating assets.
#include "Model/Asset.h"
#include "Model/AssetProperties.h"
#include "Model/ResourceCreation.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

dto::Asset MakeAssetBody(const AssetBaseProperties& inProperties) {
    dto::Asset body;
    body.SetProperties(MakeAssetProperties(inProperties));
    return body;
}

void OnAssetCreated(const ImmutableString& inFactoryURL, const InterfaceRef<IZOCDataServer>& inServer,
                    const RequestCompletion& inCompletion, const Guid& inRequestID, int inResult,
                    const shared_ptr<ostnet::Response>& inResponse) {
    if (inResult < 0) {
        ZO_ASSERT_ONCE(ResultSucceededOrCanceled(inResult), "ResultSucceededOrCanceled(inResult)",
                       JoinText("Create_OnAssetCreated(): failed to create asset, RFL result == ", inResult));
        if (inCompletion) {
            inCompletion(inRequestID, inResult, nullptr, inResponse);
        }
        return;
    }
    const RequestCompletion checked = [inCompletion](const Guid& inID, int inFinalResult,
                                                     const InterfaceRef<IZOCServerResource>& inAsset,
                                                     const shared_ptr<ostnet::Response>& inAnswer) {
        ZO_ASSERT_ONCE(inFinalResult >= 0, "initialized",
                       "Create_OnAssetCreated(): failed to create asset from server response");
        if (inCompletion) {
            inCompletion(inID, inFinalResult, inAsset, inAnswer);
        }
    };
    MakeCreationCompletion<Asset>(inFactoryURL, inServer, checked)(inRequestID, inResult, nullptr,
                                                                   inResponse);
}

}  // namespace

InterfaceRef<IZOCAsset> IZOCWritableAsset::Create(const ImmutableString& inURL,
                                                  const InterfaceRef<IZOCDataServer>& inServer,
                                                  ResourceWritability inWritability) {
    return MakeAtURL<Asset>(inURL, inServer, inWritability);
}

bool IZOCWritableAsset::Create(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                               const InterfaceRef<IZOCDataServer>& inServer,
                               const AssetBaseProperties& inProperties,
                               const RequestCompletion& inCompletion) {
    bool postStarted = false;
    if (!inFactoryURL.empty()) {
        const auto factory =
            ServerResource::MakePlain(inFactoryURL, inServer, ResourceWritability::kReadOnly);
        const InterfaceRef<IZOCDataServer> server = factory->GetServer();
        postStarted = factory->Post(
            RecycledMemory::CreateFromBytes(
                ostcore::serialization::GetJSONUTF8String(MakeAssetBody(inProperties).Body())),
            MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8), inRequestID,
            [=](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                const shared_ptr<ostnet::Response>& inResponse) {
                OnAssetCreated(inFactoryURL, server, inCompletion, inID, inResult, inResponse);
            });
    }
    ZO_ASSERT_ONCE(postStarted, "postStarted",
                   "IZOCWritableAsset::Create(): failed to start POST to asset factory");
    return postStarted;
}

bool Asset::SetAssetBaseProperties(const AssetBaseProperties& inProperties) {
    ScopedLock lock(IZOCDataServer::GetLock(), "Asset::SetAssetBaseProperties");
    dto::AssetProperties properties = mBody.Properties();
    if (!UpdateAssetProperties(properties, inProperties)) {
        return false;
    }
    mBody.SetProperties(properties);
    return true;
}

bool Asset::SetAssetBasePropertiesAndUpdate(const AssetBaseProperties& inProperties, const Guid& inRequestID,
                                            const RequestCompletion& inCompletion) {
    if (SetAssetBaseProperties(inProperties)) {
        return UpdatePropertiesOnServer(inRequestID, inCompletion);
    }
    if (inCompletion) {
        inCompletion(inRequestID, kResultSuccess, GetSelf(), nullptr);
    }
    return true;
}

void Asset::SetSubClip(const SubClip& inSubClip) {
    ScopedLock lock(IZOCDataServer::GetLock(), "Asset::SetSubClip");
    dto::AssetProperties properties = mBody.Properties();
    WriteSubClip(properties, inSubClip);
    mBody.SetProperties(properties);
}

bool Asset::SetMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) {
    if (!inLocator) {
        return false;
    }
    const ImmutableString id = inLocator->GetID();
    ScopedLock lock(IZOCDataServer::GetLock(), "Asset::SetMediaLocator");
    dto::AssetProperties properties = mBody.Properties();
    properties.Set("mediaLocator", id);
    mBody.SetProperties(properties);
    return true;
}

bool Asset::SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator, const Guid& inRequestID,
                                     const RequestCompletion& inCompletion) {
    return SetMediaLocator(inLocator) && UpdatePropertiesOnServer(inRequestID, inCompletion);
}

bool Asset::SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator) {
    return SetMediaLocator(inLocator) && UpdatePropertiesOnServer();
}

bool Asset::PreparePropertiesWrite(PropertiesWrite& outWrite) {
    ImmutableString link;
    InterfaceRef<IZOCDataServer> server;
    dto::AssetProperties properties;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Asset::UpdatePropertiesOnServer");
        link = LinkHrefLocked(kRelation_Edit);
        server = mServer;
        properties = mBody.Properties();
        outWrite.eTag = mETag;
    }
    if (link.empty()) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              JoinText("Asset::UpdatePropertiesOnServer(): no edit link on asset at ",
                                       GetHTTPURL(), "; load it anew with the right to write."));
        return false;
    }
    outWrite.target = ServerResource::MakePlain(link, server, ResourceWritability::kWritable);
    outWrite.body =
        RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(properties.Body()));
    return true;
}

bool Asset::UpdatePropertiesOnServer() {
    PropertiesWrite write;
    if (!PreparePropertiesWrite(write)) {
        return false;
    }
    const auto response =
        write.target->PutIfMatch(write.body, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, write.eTag);
    if (!response || !response->IsSuccess()) {
        return false;
    }
    SetETag(GetETagFromResponse(response));
    return true;
}

bool Asset::UpdatePropertiesOnServer(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    PropertiesWrite write;
    if (!PreparePropertiesWrite(write)) {
        return false;
    }
    const InterfaceRef<Asset> self(this);
    const auto onPut = [self, inCompletion](const Guid& inID, int inResult,
                                            const InterfaceRef<IZOCServerResource>&,
                                            const shared_ptr<ostnet::Response>& inResponse) {
        if (inResult >= 0) {
            self->SetETag(GetETagFromResponse(inResponse));
        }
        if (inCompletion) {
            inCompletion(inID, inResult, self, inResponse);
        }
    };
    return write.target->Put(write.body, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, inRequestID,
                             onPut, true);
}

ImmutableString Asset::GetEnclosureFactoryURL() {
    return GetLinkHref(kRelation_Enclosures_Enclosure_Create);
}

ImmutableString Asset::GetRenditionFactoryURL() {
    return GetLinkHref(kRelation_Renditions_Rendition_Create);
}

}  // namespace ZOCL
