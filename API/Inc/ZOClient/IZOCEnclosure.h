// Named payloads attached to a production, an asset or a user.
#pragma once

#include <vector>

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

/// One enclosure: its metadata is the resource, its payload is loaded on demand and kept.
/// Threads: any; completions on workers, except where told.
class ZOCL_EXPORT IZOCEnclosure : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63456e636c6full, 0x7375726500000001ull};

    virtual UString GetEnclosurePayloadAsText() = 0;
    virtual std::string GetEnclosurePayloadAsUTF8() = 0;
    /// A payload that is held already completes at once on this thread with result 0 and no response.
    /// False when there is no payload link.
    virtual bool LoadEnclosureData(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    virtual bool EnclosureDataIsLoaded() = 0;
    /// Blocks when the payload is not held yet; null when it cannot be had.
    virtual shared_ptr<RecycledMemory const> GetEnclosurePayload() = 0;
    virtual ImmutableString GetEnclosureContentID() = 0;
    virtual ImmutableString GetEnclosureName() = 0;
    virtual ImmutableString GetEnclosureID() = 0;
};

class ZOCL_EXPORT IZOCWritableEnclosure : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63456e636c6full, 0x7375726500000002ull};

    /// The new payload can be read before the request has ended; a failure drops it again.
    virtual bool PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload,
                                     const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// Blocks.
    virtual bool PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload) = 0;
};

class ZOCL_EXPORT IZOCEnclosures : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63456e636c6full, 0x7375726573000001ull};

    /// By exact name; null when there is none. Two calls yield the same object.
    virtual InterfaceRef<IZOCEnclosure> GetEnclosure(const ImmutableString& inName) = 0;
    /// The completion's resource answers IZOCEnclosure.
    virtual bool GetEnclosureByContentID(const ImmutableString& inContentID, const Guid& inRequestID,
                                         const RequestCompletion& inCompletion) = 0;
    virtual std::vector<ImmutableString> GetEnclosureNames() = 0;
    virtual std::vector<ImmutableString> GetEnclosureIDs() = 0;
};

class ZOCL_EXPORT IZOCWritableEnclosures : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63456e636c6full, 0x7375726573000002ull};

    virtual ImmutableString GetEnclosureFactoryURL() = 0;
};

/// Posts a new enclosure; the completion's resource answers IZOCEnclosure.
ZOCL_EXPORT bool CreateEnclosure(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                                 const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inName,
                                 const shared_ptr<RecycledMemory const>& inPayload,
                                 const RequestCompletion& inCompletion);
/// Loads the list when needed, then every payload; completes once, with the first failure or 0.
ZOCL_EXPORT bool LoadAllEnclosures(const InterfaceRef<IZOCEnclosures>& inEnclosures, const Guid& inRequestID,
                                   const RequestCompletion& inCompletion);
/// One enclosure with its payload; one that isn't there completes with success and a null resource.
ZOCL_EXPORT bool LoadSpecificEnclosure(const InterfaceRef<IZOCEnclosures>& inEnclosures,
                                       const ImmutableString& inName, const Guid& inRequestID,
                                       const RequestCompletion& inCompletion);

using EnclosureCopyPredicate =
    function<bool(const ImmutableString& inName, const InterfaceRef<IZOCEnclosures>& inFrom,
                  const InterfaceRef<IZOCEnclosures>& inTo)>;
/// Copies the enclosures that the predicate accepts. Completes once, with the first failure or 0.
ZOCL_EXPORT bool CopyEnclosuresIf(const Guid& inRequestID, const InterfaceRef<IZOCEnclosures>& inFrom,
                                  const InterfaceRef<IZOCEnclosures>& inTo,
                                  const EnclosureCopyPredicate& inPredicate,
                                  const RequestCompletion& inCompletion);

/// Names made of a base (the production's name, or the asset's media locator) and a fixed suffix.
ZOCL_EXPORT ImmutableString GetXMPEnclosureName(const ImmutableString& inBase);
ZOCL_EXPORT ImmutableString GetPreSyncHeadCommitIdEnclosureName(const ImmutableString& inBase);
ZOCL_EXPORT ImmutableString GetPostSyncBaseCommitIdEnclosureName(const ImmutableString& inBase);
ZOCL_EXPORT ImmutableString GetProductionUserDataEnclosureName(const ImmutableString& inBase);

}  // namespace ZOCL
