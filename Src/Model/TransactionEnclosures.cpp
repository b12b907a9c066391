// Writes an enclosure of a transaction: over the one of its name, or as a new one.
#include "Model/EnclosureWrite.h"
#include "Model/Production.h"
#include "Model/TransactionList.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

bool StartEnclosureWrite(const EnclosureWrite& inWrite, const Guid& inRequestID,
                         const RequestCompletion& inCompletion) {
    const auto present = RFL::QueryInterface<Enclosure>(inWrite.list->GetEnclosure(inWrite.name));
    if (present) {
        return present->PutPayloadOfType(inWrite.payload, inWrite.contentType, inRequestID, inCompletion);
    }
    const auto onCreated = [inWrite, inCompletion](const Guid& inID, int inResult,
                                                   const InterfaceRef<IZOCServerResource>& inResource,
                                                   const shared_ptr<ostnet::Response>& inResponse) {
        const auto enclosure = RFL::QueryInterface<IZOCEnclosure>(inResource);
        if (inResult >= 0 && enclosure) {
            inWrite.list->AddEnclosure(inWrite.name, enclosure);
        }
        if (inCompletion) {
            inCompletion(inID, inResult, inResource, inResponse);
        }
    };
    return CreateEnclosureOfType(inRequestID, inWrite.list->GetEnclosureFactoryURL(), inWrite.server,
                                 inWrite.name, inWrite.payload, inWrite.contentType, onCreated);
}

bool Production::WriteEnclosure(const ImmutableString& inPath, const std::string& inText,
                                const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const ImmutableString& inContentType) {
    EnclosureWrite write;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::WriteEnclosure");
        write.list = mLoaded ? mEnclosures : nullptr;
        write.server = mServer;
    }
    if (!write.list || inPath.empty()) {
        return false;
    }
    write.name = inPath;
    write.payload = RecycledMemory::CreateFromBytes(inText);
    write.contentType =
        inContentType.empty() ? ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8 : inContentType;
    if (write.list->IsLoaded()) {
        return StartEnclosureWrite(write, inRequestID, inCompletion);
    }
    const auto onLoaded = [write, inCompletion](const Guid& inID, int inResult,
                                                const InterfaceRef<IZOCServerResource>&,
                                                const shared_ptr<ostnet::Response>& inResponse) {
        const int result = inResult >= 0 && !write.list->IsLoaded() ? kResultFailure : inResult;
        if (result >= 0 && StartEnclosureWrite(write, inID, inCompletion)) {
            return;
        }
        if (inCompletion) {
            inCompletion(inID, result < 0 ? result : kResultNotStarted, nullptr, inResponse);
        }
    };
    return write.list->Load(inRequestID, onLoaded, true);
}

}  // namespace ZOCL
