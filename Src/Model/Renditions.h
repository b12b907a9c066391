// Renditions of an asset, and the list of them.
#pragma once

#include "dto/Rendition.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCRendition.h"

namespace ZOCL {

class Rendition final : public Implements<JSONServerResource<dto::Rendition>, Readable<IZOCRendition>> {
public:
    ImmutableString GetFlavor() override;
    ImmutableString GetRenditionID() override;
    ImmutableString GetContentID() override;
    InterfaceRef<IZOCServerResource> GetPayloadResource(bool inForEdit) override;
};

class Renditions final : public Implements<JSONServerResource<dto::ContainedRenditions>,
                                           Readable<IZOCRenditions>, Writable<IZOCWritableRenditions>> {
public:
    shared_ptr<ostnet::Response> GetRenditionPayload(const ImmutableString& inFlavor) override;
    InterfaceRef<IZOCRendition> FindRendition(const std::string& inFlavor) override;
    InterfaceRef<IZOCRendition> FindRendition(const ImmutableString& inFlavor) override;
    std::vector<ImmutableString> GetRenditionIDs() override;
    std::vector<ImmutableString> GetFlavors() override;
    ImmutableString GetRenditionFactoryURL() override;

private:
    InterfaceRef<Rendition> Find(std::string_view inFlavor);
};

}  // namespace ZOCL
