// Derived representations of an asset, such as thumbnails and proxies, told apart by flavour.
#pragma once

#include <string>
#include <vector>

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

class ZOCL_EXPORT IZOCRendition : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6352656e6469ull, 0x74696f6e00000001ull};

    static const ImmutableString kFlavorJPEG;
    static const ImmutableString kFlavorPNG;
    static const ImmutableString kFlavorMP4;

    /// The flavour, which is the media type of the payload.
    virtual ImmutableString GetFlavor() = 0;
    virtual ImmutableString GetRenditionID() = 0;
    virtual ImmutableString GetContentID() = 0;
    /// A plain read-only resource at the payload, or at the target of an upload. Null without the link.
    virtual InterfaceRef<IZOCServerResource> GetPayloadResource(bool inForEdit) = 0;
};

class ZOCL_EXPORT IZOCRenditions : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6352656e6469ull, 0x74696f6e73000001ull};

    /// Blocks; null when there is no such rendition or it has no payload link.
    virtual shared_ptr<ostnet::Response> GetRenditionPayload(const ImmutableString& inFlavor) = 0;
    virtual InterfaceRef<IZOCRendition> FindRendition(const std::string& inFlavor) = 0;
    /// The first rendition of a flavour, null when there is none. Makes no request.
    virtual InterfaceRef<IZOCRendition> FindRendition(const ImmutableString& inFlavor) = 0;
    virtual std::vector<ImmutableString> GetRenditionIDs() = 0;
    /// The flavours, in list order.
    virtual std::vector<ImmutableString> GetFlavors() = 0;
};

class ZOCL_EXPORT IZOCWritableRenditions : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6352656e6469ull, 0x74696f6e73000002ull};

    /// Posts a new rendition; the completion's resource answers IZOCRendition.
    static bool CreateRendition(const InterfaceRef<IZOCDataServer>& inServer,
                                const ImmutableString& inFactoryURL, const ImmutableString& inContentType,
                                const shared_ptr<RecycledMemory const>& inBody, const Guid& inRequestID,
                                const RequestCompletion& inCompletion);

    virtual ImmutableString GetRenditionFactoryURL() = 0;
};

}  // namespace ZOCL
