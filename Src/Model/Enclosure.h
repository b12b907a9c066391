// One enclosure: its metadata as a resource, its payload loaded on demand and kept.
#pragma once

#include "dto/Enclosure.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCEnclosure.h"

namespace ZOCL {

class Enclosure final : public Implements<JSONServerResource<dto::Enclosure>, Readable<IZOCEnclosure>,
                                          Writable<IZOCWritableEnclosure>> {
public:
    /// Answers with the object itself, for code of this floor.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63456e636c6full, 0x7375726500000003ull};

    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    UString GetEnclosurePayloadAsText() override;
    std::string GetEnclosurePayloadAsUTF8() override;
    bool LoadEnclosureData(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    bool EnclosureDataIsLoaded() override;
    shared_ptr<RecycledMemory const> GetEnclosurePayload() override;
    ImmutableString GetEnclosureContentID() override;
    ImmutableString GetEnclosureName() override;
    ImmutableString GetEnclosureID() override;

    bool PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload, const Guid& inRequestID,
                             const RequestCompletion& inCompletion) override;
    bool PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload) override;
    /// The asynchronous put with a content type for the payload; a null one is left out.
    bool PutPayloadOfType(const shared_ptr<RecycledMemory const>& inPayload,
                          const ImmutableString& inContentType, const Guid& inRequestID,
                          const RequestCompletion& inCompletion);

protected:
    std::string GetTraceName() override;

private:
    struct PayloadSource {
        shared_ptr<RecycledMemory const> held;
        ImmutableString link;
        ImmutableString contentID;
    };
    PayloadSource FindPayload(const char* inLabel);
    void KeepPayload(const shared_ptr<RecycledMemory const>& inPayload, const char* inLabel);
    void DropPayload(const shared_ptr<RecycledMemory const>& inPayload, const char* inLabel);

    shared_ptr<RecycledMemory const> mPayload ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

/// CreateEnclosure with a content type for the payload.
bool CreateEnclosureOfType(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                           const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inName,
                           const shared_ptr<RecycledMemory const>& inPayload,
                           const ImmutableString& inContentType, const RequestCompletion& inCompletion);

}  // namespace ZOCL
