// Making resource objects: at a URL, from a part of another body, and from the answer to a creating POST.
#pragma once

#include "JSONServerResource.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {

/// At a URL, unloaded; null for a null URL. Sends nothing.
template <class T>
InterfaceRef<T> MakeAtURL(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                          ResourceWritability inWritability) {
    if (inURL.empty()) {
        return InterfaceRef<T>();
    }
    InterfaceRef<T> made(new T);
    made->InternalInit(inURL, inServer, nullptr, inWritability, true);
    return made;
}

/// Loaded from a body that came inside of another one. Sends nothing.
template <class T, class Body>
InterfaceRef<T> MakeFromBody(const Body& inBody, const ImmutableString& inURL,
                             const InterfaceRef<IZOCDataServer>& inServer,
                             ResourceWritability inWritability) {
    InterfaceRef<T> made(new T);
    made->InternalDTOInit(inURL, inServer, nullptr, inBody, true, inWritability);
    return made;
}

/// A completion for a creating POST: makes the new, writable object from the answer and hands it on as the
/// resource. An answer that says success but holds no such object is a failure.
template <class T>
RequestCompletion MakeCreationCompletion(const ImmutableString& inFactoryURL,
                                         const InterfaceRef<IZOCDataServer>& inServer,
                                         const RequestCompletion& inCompletion,
                                         ResourceWritability inWritability = ResourceWritability::kWritable) {
    return [=](const Guid& inRequestID, int inResult, const InterfaceRef<IZOCServerResource>&,
               const shared_ptr<ostnet::Response>& inResponse) {
        InterfaceRef<T> made;
        int result = inResult;
        if (result >= 0) {
            made = InterfaceRef<T>(new T);
            if (!made->InternalInit(inFactoryURL, inServer, inResponse, inWritability, true)) {
                result = kResultFailure;
            }
        }
        if (inCompletion) {
            inCompletion(inRequestID, result, made, inResponse);
        }
    };
}

/// Posts JSON to a factory; the completion gets the new object.
template <class T>
bool PostJSONForNew(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                    const InterfaceRef<IZOCDataServer>& inServer,
                    const ostcore::serialization::JSONValue& inBody, const RequestCompletion& inCompletion,
                    ResourceWritability inWritability = ResourceWritability::kWritable) {
    if (inFactoryURL.empty()) {
        return false;
    }
    const auto factory = ServerResource::MakePlain(inFactoryURL, inServer, ResourceWritability::kReadOnly);
    return factory->Post(
        RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(inBody)),
        MakeContentTypeHeaders(ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8), inRequestID,
        MakeCreationCompletion<T>(inFactoryURL, factory->GetServer(), inCompletion, inWritability));
}

}  // namespace ZOCL
