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

}  // namespace ZOCL
