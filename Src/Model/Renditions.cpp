// Finding, reading and creating renditions.
#include "Model/Renditions.h"

#include "Model/ResourceCreation.h"
#include "Relations.h"

namespace ZOCL {

const ImmutableString IZOCRendition::kFlavorJPEG("image/jpeg");
const ImmutableString IZOCRendition::kFlavorPNG("image/png");
const ImmutableString IZOCRendition::kFlavorMP4("video/mp4");

ImmutableString Rendition::GetFlavor() {
    return GetBody("ZOCL::Rendition::GetFlavor").MimeType();
}

ImmutableString Rendition::GetRenditionID() {
    return GetBody("ZOCL::Rendition::GetRenditionID").Identifier();
}

ImmutableString Rendition::GetContentID() {
    return GetBody("ZOCL::Rendition::GetContentID").ContentID();
}

InterfaceRef<IZOCServerResource> Rendition::GetPayloadResource(bool inForEdit) {
    const ImmutableString link =
        GetLinkHref(inForEdit ? kRelation_EditMedia : kRelation_Renditions_Rendition);
    if (link.empty()) {
        return nullptr;
    }
    return ServerResource::MakePlain(link, GetServer(), ResourceWritability::kReadOnly);
}

bool IZOCWritableRenditions::CreateRendition(const InterfaceRef<IZOCDataServer>& inServer,
                                             const ImmutableString& inFactoryURL,
                                             const ImmutableString& inContentType,
                                             const shared_ptr<RecycledMemory const>& inBody,
                                             const Guid& inRequestID, const RequestCompletion& inCompletion) {
    if (inFactoryURL.empty()) {
        return false;
    }
    const auto factory = ServerResource::MakePlain(inFactoryURL, inServer, ResourceWritability::kReadOnly);
    return factory->Post(inBody, MakeContentTypeHeaders(inContentType), inRequestID,
                         MakeCreationCompletion<Rendition>(inFactoryURL, factory->GetServer(), inCompletion));
}

InterfaceRef<Rendition> Renditions::Find(std::string_view inFlavor) {
    const auto body = GetBody("Renditions::FindRendition");
    for (const dto::Rendition& contained : body.Renditions()) {
        if (contained.MimeType().view() == inFlavor) {
            return MakeFromBody<Rendition>(contained, ImmutableString(), GetServer(), GetWritability());
        }
    }
    return nullptr;
}

shared_ptr<ostnet::Response> Renditions::GetRenditionPayload(const ImmutableString& inFlavor) {
    const InterfaceRef<Rendition> rendition = Find(inFlavor);
    if (!rendition) {
        return nullptr;
    }
    const ImmutableString link = rendition->GetLinkHref(kRelation_Renditions_Rendition);
    if (link.empty()) {
        return nullptr;
    }
    return GetServer()->BlockingGETByContentID(rendition->GetContentID(), link, ostnet::http::kWaitForever);
}

InterfaceRef<IZOCRendition> Renditions::FindRendition(const std::string& inFlavor) {
    return FindRendition(ImmutableString(inFlavor));
}

InterfaceRef<IZOCRendition> Renditions::FindRendition(const ImmutableString& inFlavor) {
    return Find(inFlavor);
}

std::vector<ImmutableString> Renditions::GetRenditionIDs() {
    std::vector<ImmutableString> identifiers;
    const auto body = GetBody("ZOCL::Renditions::GetRenditionIDs");
    for (const dto::Rendition& contained : body.Renditions()) {
        identifiers.push_back(contained.Identifier());
    }
    return identifiers;
}

std::vector<ImmutableString> Renditions::GetFlavors() {
    std::vector<ImmutableString> flavors;
    const auto body = GetBody("ZOCL::Renditions::GetFlavors");
    for (const dto::Rendition& contained : body.Renditions()) {
        flavors.push_back(contained.MimeType());
    }
    return flavors;
}

ImmutableString Renditions::GetRenditionFactoryURL() {
    return GetLinkHref(kRelation_Create);
}

}  // namespace ZOCL
