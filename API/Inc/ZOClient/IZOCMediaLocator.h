// Where an asset's media lies: a part for all clients, on the server, and a part for this machine alone.
#pragma once

#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/MediaLocatorProperties.h"

namespace ZOCL {

/// A location whose href contains "zomedia://localhost-" never leaves this machine: it is kept in the
/// registry under the locator's identifier.
class ZOCL_EXPORT IZOCMediaLocator : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634d65646961ull, 0x4c6f6361746f7201ull};

    /// Forgets the machine's own location and the cached locator.
    static void ClearLocalMediaLinkFromCache(const ImmutableString& inID);
    /// The two identifiers' texts with "-" between them.
    static ImmutableString CreateMediaLocatorID(const Guid& inFirst, const Guid& inSecond);

    virtual ostnet::http::Form GetForm() = 0;
    /// Writes to the server and blocks; true when the server has the locator. Not on the main thread.
    virtual bool Store() = 0;
    /// The server's href, else this machine's own, else the null string.
    virtual ImmutableString GetMediaHRef() = 0;
    virtual void SetMediaHRef(const ImmutableString& inHRef) = 0;
    virtual void SetDocumentIDAndContentState(const Guid& inDocumentID, const Guid& inContentStateID) = 0;
    virtual ImmutableString GetDisplayName() = 0;
    virtual void SetDisplayName(const ImmutableString& inName) = 0;
    virtual optional<MediaLocatorStillSequenceParams> GetStillSequenceParams() = 0;
    virtual void SetStillSequenceParams(const optional<MediaLocatorStillSequenceParams>& inParams) = 0;
    virtual ImmutableString GetID() = 0;
    /// A stored locator that shares document and content state with this one; null on failure. Blocks.
    virtual InterfaceRef<IZOCMediaLocator> Duplicate() = 0;
    virtual bool Store(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
};

}  // namespace ZOCL
