// Reading and writing the payload of an enclosure.
#include "Model/Enclosure.h"

#include "ostcore/utility/StringConversion.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

const ImmutableString& EnclosurePart() {
    static const ImmutableString name(":enclosure");
    return name;
}

ostnet::http::Form MakePayloadForm(const shared_ptr<RecycledMemory const>& inPayload) {
    return {{EnclosurePart(), inPayload ? std::string(inPayload->view()) : std::string()}};
}

/// A payload of no bytes is held like any other; no payload at all would be asked for again.
shared_ptr<RecycledMemory const> HeldForm(const shared_ptr<RecycledMemory const>& inPayload) {
    return inPayload ? inPayload : RecycledMemory::Create(0);
}

bool PutTypedForm(const InterfaceRef<ServerResource>& inTarget,
                  const shared_ptr<RecycledMemory const>& inPayload, const ImmutableString& inContentType,
                  const Guid& inRequestID, const RequestCompletion& inCompletion) {
    ostnet::http::FormBuilder form;
    const std::string_view bytes = inPayload ? inPayload->view() : std::string_view();
    if (!ostnet::http::AppendFormPart(form, EnclosurePart(), inContentType, bytes)) {
        return false;
    }
    ostnet::Headers headers;
    ostnet::http::SetFormContentTypeHeader(form, headers);
    return inTarget->Put(ostnet::http::CompleteForm(form), headers, inRequestID, inCompletion);
}

int ResultOfPayloadRequest(int inResult, const shared_ptr<ostnet::Response>& inResponse) {
    if (inResult < 0 || (inResponse && inResponse->IsSuccess())) {
        return inResult;
    }
    return GetResultFromResponse(inResponse, kResultNoResponseObject);
}

}  // namespace

int Enclosure::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == kInterfaceID) {
        *outInterface = this;
        return kResultSuccess;
    }
    return Implements::QueryInterfaceNoAddRef(inID, outInterface);
}

UString Enclosure::GetEnclosurePayloadAsText() {
    return ostcore::utility::ToUTF16(GetEnclosurePayloadAsUTF8());
}

std::string Enclosure::GetEnclosurePayloadAsUTF8() {
    const auto payload = GetEnclosurePayload();
    return payload ? std::string(payload->view()) : std::string();
}

Enclosure::PayloadSource Enclosure::FindPayload(const char* inLabel) {
    PayloadSource source;
    dto::Enclosure body;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
        source.held = mPayload;
        source.link = LinkHrefLocked(kRelation_Enclosures_Enclosure);
        body = mBody;
    }
    source.contentID = body.ContentID();
    return source;
}

void Enclosure::KeepPayload(const shared_ptr<RecycledMemory const>& inPayload, const char* inLabel) {
    shared_ptr<RecycledMemory const> replaced = inPayload;
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    mPayload.swap(replaced);
}

void Enclosure::DropPayload(const shared_ptr<RecycledMemory const>& inPayload, const char* inLabel) {
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    if (mPayload == inPayload) {
        mPayload.reset();
    }
}

bool Enclosure::LoadEnclosureData(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const PayloadSource source = FindPayload("Enclosure::LoadEnclosureData");
    if (source.held) {
        if (inCompletion) {
            inCompletion(inRequestID, kResultSuccess, GetSelf(), nullptr);
        }
        return true;
    }
    if (source.link.empty()) {
        return false;
    }
    const InterfaceRef<Enclosure> self(this);
    const RequestCompletion onPayload = [self, inCompletion](
                                            const Guid& inID, int inResult,
                                            const InterfaceRef<IZOCServerResource>& inResource,
                                            const shared_ptr<ostnet::Response>& inResponse) {
        const int result = ResultOfPayloadRequest(inResult, inResponse);
        if (result >= 0 && inResponse) {
            self->KeepPayload(HeldForm(inResponse->payload), "Enclosure::OnGetEnclosurePayloadCompleted");
        }
        if (inCompletion) {
            inCompletion(inID, result, inResource, inResponse);
        }
    };
    return GetServer()->GETByContentID(source.contentID, inRequestID,
                                       MakeCompletionFunction(onPayload, false, true), source.link);
}

bool Enclosure::EnclosureDataIsLoaded() {
    ScopedLock lock(IZOCDataServer::GetLock(), "Enclosure::EnclosureDataIsLoaded");
    return mPayload != nullptr;
}

shared_ptr<RecycledMemory const> Enclosure::GetEnclosurePayload() {
    const PayloadSource source = FindPayload("Enclosure::GetEnclosurePayload (1)");
    if (source.held || source.link.empty()) {
        return source.held;
    }
    const auto response =
        GetServer()->BlockingGETByContentID(source.contentID, source.link, ostnet::http::kWaitForever);
    if (!response || !response->IsSuccess()) {
        return nullptr;
    }
    const auto payload = HeldForm(response->payload);
    ScopedLock lock(IZOCDataServer::GetLock(), "Enclosure::GetEnclosurePayload (2)");
    if (!mPayload) {
        mPayload = payload;
    }
    return mPayload;
}

ImmutableString Enclosure::GetEnclosureContentID() {
    return GetBody("Enclosure::GetEnclosureContentID").ContentID();
}

ImmutableString Enclosure::GetEnclosureName() {
    return GetBody("Enclosure::GetEnclosureName").Name();
}

ImmutableString Enclosure::GetEnclosureID() {
    return GetBody("Enclosure::GetEnclosureID").Identifier();
}

std::string Enclosure::GetTraceName() {
    return GetEnclosureName().str();
}

bool Enclosure::PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload,
                                    const Guid& inRequestID, const RequestCompletion& inCompletion) {
    return PutPayloadOfType(inPayload, ImmutableString(), inRequestID, inCompletion);
}

bool Enclosure::PutPayloadOfType(const shared_ptr<RecycledMemory const>& inPayload,
                                 const ImmutableString& inContentType, const Guid& inRequestID,
                                 const RequestCompletion& inCompletion) {
    const ImmutableString target = GetLinkHref(kRelation_Edit);
    if (target.empty()) {
        return false;
    }
    const auto payload = HeldForm(inPayload);
    KeepPayload(payload, "Enclosure::PutEnclosurePayload");
    const InterfaceRef<Enclosure> self(this);
    const RequestCompletion onPut =
        [self, payload, inCompletion](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                                      const shared_ptr<ostnet::Response>& inResponse) {
            const int result = ResultOfPayloadRequest(inResult, inResponse);
            if (result < 0) {
                self->DropPayload(payload, "Enclosure::OnPutEnclosurePayloadCompleted");
            }
            if (inCompletion) {
                inCompletion(inID, result, self, inResponse);
            }
        };
    const auto resource = ServerResource::MakePlain(target, GetServer(), ResourceWritability::kReadOnly);
    const bool started = inContentType.empty()
                             ? resource->PutMultiPart(MakePayloadForm(inPayload), inRequestID, onPut)
                             : PutTypedForm(resource, inPayload, inContentType, inRequestID, onPut);
    if (!started) {
        DropPayload(payload, "Enclosure::PutEnclosurePayload");
    }
    return started;
}

bool Enclosure::PutEnclosurePayload(const shared_ptr<RecycledMemory const>& inPayload) {
    const ImmutableString target = GetLinkHref(kRelation_Edit);
    if (target.empty()) {
        return false;
    }
    const auto resource = ServerResource::MakePlain(target, GetServer(), ResourceWritability::kReadOnly);
    const auto response = resource->PutMultiPart(MakePayloadForm(inPayload));
    if (!response || !response->IsSuccess()) {
        return false;
    }
    KeepPayload(HeldForm(inPayload), "Enclosure::PutEnclosurePayload (Synchronous)");
    return true;
}

}  // namespace ZOCL
