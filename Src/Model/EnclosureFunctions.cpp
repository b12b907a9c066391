// Creating and loading enclosures, and the names that they go by.
#include "Model/Enclosure.h"
#include "Model/ResourceCreation.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/RequestProcessor.h"
#include "ResourceCaches.h"
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

namespace {

ImmutableString MakeName(const ImmutableString& inBase, const char* inSuffix) {
    return ImmutableString(inBase.str() + inSuffix);
}

/// Whoever loads a list needs it held afterwards; a success whose body was not accepted is none.
int ResultOfListLoad(int inResult, const InterfaceRef<IZOCServerResource>& inList) {
    return inResult >= 0 && !inList->IsLoaded() ? kResultFailure : inResult;
}

void StartAllPayloads(const shared_ptr<CompoundAsyncOperation>& inOperation,
                      const InterfaceRef<IZOCEnclosures>& inEnclosures) {
    for (const ImmutableString& name : inEnclosures->GetEnclosureNames()) {
        const InterfaceRef<IZOCEnclosure> enclosure = inEnclosures->GetEnclosure(name);
        inOperation->Initiate(
            [enclosure](const Guid& inRequestID, const RequestCompletion& inCompletion) {
                return enclosure && enclosure->LoadEnclosureData(inRequestID, inCompletion);
            },
            nullptr);
    }
}

/// Keeps the payload of a new enclosure under the identifier that the server gave it, so that it need not be
/// fetched when it is asked for.
RequestCompletion KeepingPayload(const InterfaceRef<IZOCDataServer>& inServer,
                                 const shared_ptr<RecycledMemory const>& inPayload,
                                 const RequestCompletion& inCompletion) {
    return [inServer, inPayload, inCompletion](const Guid& inRequestID, int inResult,
                                               const InterfaceRef<IZOCServerResource>& inResource,
                                               const shared_ptr<ostnet::Response>& inResponse) {
        const auto enclosure = RFL::QueryInterface<IZOCEnclosure>(inResource);
        const auto caches = RFL::QueryInterface<ResourceCaches>(inServer);
        if (inResult >= 0 && enclosure && caches) {
            caches->CacheContent(enclosure->GetEnclosureContentID(), inPayload);
        }
        if (inCompletion) {
            inCompletion(inRequestID, inResult, inResource, inResponse);
        }
    };
}

bool LoadFoundEnclosure(const InterfaceRef<IZOCEnclosures>& inEnclosures, const ImmutableString& inName,
                        const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const InterfaceRef<IZOCEnclosure> enclosure = inEnclosures->GetEnclosure(inName);
    if (enclosure) {
        return enclosure->LoadEnclosureData(inRequestID, inCompletion);
    }
    if (inCompletion) {
        inCompletion(inRequestID, kResultSuccess, nullptr, nullptr);
    }
    return true;
}

}  // namespace

bool CreateEnclosure(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                     const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inName,
                     const shared_ptr<RecycledMemory const>& inPayload,
                     const RequestCompletion& inCompletion) {
    return CreateEnclosureOfType(inRequestID, inFactoryURL, inServer, inName, inPayload,
                                 ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, inCompletion);
}

bool CreateEnclosureOfType(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                           const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inName,
                           const shared_ptr<RecycledMemory const>& inPayload,
                           const ImmutableString& inContentType, const RequestCompletion& inCompletion) {
    static const ImmutableString namePart(":name");
    static const ImmutableString enclosurePart(":enclosure");
    ostnet::http::FormBuilder form;
    const std::string_view payload = inPayload ? inPayload->view() : std::string_view();
    if (inFactoryURL.empty() ||
        !ostnet::http::AppendFormPart(form, namePart, ostnet::kHEADER_CONTENT_TYPE_TEXT_PLAIN, inName) ||
        !ostnet::http::AppendFormPart(form, enclosurePart, inContentType, payload)) {
        return false;
    }
    ostnet::Headers headers;
    ostnet::http::SetFormContentTypeHeader(form, headers);
    const auto factory = ServerResource::MakePlain(inFactoryURL, inServer, ResourceWritability::kReadOnly);
    return factory->Post(
        ostnet::http::CompleteForm(form), headers, inRequestID,
        MakeCreationCompletion<Enclosure>(inFactoryURL, factory->GetServer(),
                                          KeepingPayload(factory->GetServer(), inPayload, inCompletion)));
}

bool LoadAllEnclosures(const InterfaceRef<IZOCEnclosures>& inEnclosures, const Guid& inRequestID,
                       const RequestCompletion& inCompletion) {
    const auto list = RFL::QueryInterface<ServerResource>(inEnclosures);
    if (!list) {
        return false;
    }
    const auto operation = CompoundAsyncOperation::Create(
        [inRequestID, inCompletion, list](int inResult) {
            if (inCompletion) {
                inCompletion(inRequestID, inResult, list, nullptr);
            }
        },
        list->GetServer(), false);
    // A list that is loaded already completes this step at once, so that the chain has one in any case.
    operation->Initiate(
        [list](const Guid& inID, const RequestCompletion& inDone) { return list->Load(inID, inDone, true); },
        [operation, inEnclosures](int inResult, const InterfaceRef<IZOCServerResource>& inList,
                                  const shared_ptr<ostnet::Response>&) {
            const int result = inResult < 0 ? inResult : ResultOfListLoad(inResult, inList);
            if (result >= 0) {
                StartAllPayloads(operation, inEnclosures);
            }
            return result;
        });
    return true;
}

bool LoadSpecificEnclosure(const InterfaceRef<IZOCEnclosures>& inEnclosures, const ImmutableString& inName,
                           const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const auto list = RFL::QueryInterface<IZOCServerResource>(inEnclosures);
    if (!list) {
        return false;
    }
    if (list->IsLoaded()) {
        return LoadFoundEnclosure(inEnclosures, inName, inRequestID, inCompletion);
    }
    const auto onLoaded = [inEnclosures, inName, inCompletion, list](
                              const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>& inResponse) {
        const int result = ResultOfListLoad(inResult, list);
        if (result >= 0 && LoadFoundEnclosure(inEnclosures, inName, inID, inCompletion)) {
            return;
        }
        if (inCompletion) {
            inCompletion(inID, result < 0 ? result : kResultNotStarted, nullptr, inResponse);
        }
    };
    return list->Load(inRequestID, onLoaded, true);
}

ImmutableString GetXMPEnclosureName(const ImmutableString& inBase) {
    return MakeName(inBase, "_xmp");
}

ImmutableString GetPreSyncHeadCommitIdEnclosureName(const ImmutableString& inBase) {
    return MakeName(inBase, "_preSyncHeadCommitId");
}

ImmutableString GetPostSyncBaseCommitIdEnclosureName(const ImmutableString& inBase) {
    return MakeName(inBase, "_postSyncBaseCommitId");
}

ImmutableString GetProductionUserDataEnclosureName(const ImmutableString& inBase) {
    return MakeName(inBase, "_productionstate.json");
}

}  // namespace ZOCL
