// What a media locator says, on the server and on this machine.
#include "Model/MediaLocator.h"

#include "Model/DataServerCaches.h"
#include "Model/LocalMediaLinks.h"
#include "Model/MediaLocatorPropertiesJSON.h"
#include "Model/ResourceCreation.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

InterfaceRef<MediaLocator> MediaLocator::Make(const ImmutableString& inURL, const ImmutableString& inID,
                                              const InterfaceRef<IZOCDataServer>& inServer) {
    auto locator = MakeAtURL<MediaLocator>(inURL, inServer, ResourceWritability::kWritable);
    if (locator) {
        ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::Make");
        locator->mID = inID;
    }
    return locator;
}

void IZOCMediaLocator::ClearLocalMediaLinkFromCache(const ImmutableString& inID) {
    ForgetLocalMediaLink(inID);
    if (const auto server = IZOCDataServer::GetLoggedInServerRef()) {
        ForgetCachedMediaLocator(server, inID);
    }
}

ImmutableString IZOCMediaLocator::CreateMediaLocatorID(const Guid& inFirst, const Guid& inSecond) {
    return ImmutableString(inFirst.ToString() + "-" + inSecond.ToString());
}

void MediaLocator::PostLoadDTO() {
    bool loaded = false;
    const dto::MediaLocator body = GetBody("MediaLocator::PostLoadDTO", loaded);
    if (!loaded) {
        return;
    }
    const ImmutableString id = body.Identifier();
    const auto stored = body.Properties();
    const MediaLocatorProperties properties = ReadMediaLocatorProperties(stored);
    ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::PostLoadDTO");
    if (!id.empty()) {
        mID = id;
    }
    // An answer without a body (a 204) says nothing about them.
    if (!stored.IsNull()) {
        mProperties = properties;
    }
}

MediaLocatorProperties MediaLocator::GetProperties(const char* inLabel) {
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    return mProperties;
}

ostnet::http::Form MediaLocator::GetForm() {
    static const ImmutableString idPart(":id");
    static const ImmutableString locatorPart(":medialocator");
    return {{idPart, GetID().str()}, {locatorPart, GetProperties("MediaLocator::GetForm").AsUTF8String()}};
}

ImmutableString MediaLocator::GetMediaHRef() {
    const ImmutableString href = GetProperties("MediaLocator::GetMediaHRef").href;
    // The registry is a file: it is read with no lock held.
    return href.empty() ? ReadLocalMediaLink(GetID()) : href;
}

void MediaLocator::SetMediaHRef(const ImmutableString& inHRef) {
    if (IsLocalMediaLink(inHRef)) {
        WriteLocalMediaLink(GetID(), inHRef);
        return;
    }
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::SetMediaHRef");
        mProperties.href = inHRef;
    }
    ForgetLocalMediaLink(GetID());
}

void MediaLocator::SetDocumentIDAndContentState(const Guid& inDocumentID, const Guid& inContentStateID) {
    ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::SetDocumentIDAndContentState");
    mProperties.documentID = inDocumentID;
    mProperties.contentStateID = inContentStateID;
}

ImmutableString MediaLocator::GetDisplayName() {
    return GetProperties("MediaLocator::GetDisplayName").displayName;
}

void MediaLocator::SetDisplayName(const ImmutableString& inName) {
    ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::SetDisplayName");
    mProperties.displayName = inName;
}

optional<MediaLocatorStillSequenceParams> MediaLocator::GetStillSequenceParams() {
    return GetProperties("ZOCL::MediaLocator::GetStillSequenceParams").stillSequenceParams;
}

void MediaLocator::SetStillSequenceParams(const optional<MediaLocatorStillSequenceParams>& inParams) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::MediaLocator::SetStillSequenceParams");
    mProperties.stillSequenceParams = inParams;
}

ImmutableString MediaLocator::GetID() {
    ScopedLock lock(IZOCDataServer::GetLock(), "MediaLocator::GetID");
    return mID;
}

InterfaceRef<IZOCMediaLocator> MediaLocator::Duplicate() {
    const MediaLocatorProperties properties = GetProperties("MediaLocator::Duplicate");
    const ImmutableString id = CreateMediaLocatorID(Guid::CreateUnique(), properties.contentStateID);
    const InterfaceRef<IZOCMediaLocator> copy = GetServer()->GetMediaLocator(id);
    if (!copy) {
        return nullptr;
    }
    copy->SetDocumentIDAndContentState(properties.documentID, properties.contentStateID);
    copy->SetMediaHRef(properties.href);
    return copy->Store() ? copy : nullptr;
}

}  // namespace ZOCL
