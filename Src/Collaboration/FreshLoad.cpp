// The one way in which the workflows load a resource that is shared with others.
#include "Collaboration/FreshLoad.h"

namespace ZOCL {

bool LoadFresh(const InterfaceRef<IZOCServerResource>& inResource, const Guid& inRequestID,
               const RequestCompletion& inCompletion) {
    if (!inResource) {
        return false;
    }
    const RequestCompletion onLoaded = [resource = inResource, inCompletion](
                                           const Guid& inID, int inResult,
                                           const InterfaceRef<IZOCServerResource>& inLoaded,
                                           const shared_ptr<ostnet::Response>& inResponse) {
        int result = inResult == kResultHTTPNotModified ? kResultSuccess : inResult;
        if (result >= 0 && !resource->IsLoaded()) {
            result = kResultFailure;
        }
        inCompletion(inID, result, inLoaded, inResponse);
    };
    return inResource->IsLoaded() ? inResource->Refresh(inRequestID, onLoaded)
                                  : inResource->Load(inRequestID, onLoaded, true);
}

}  // namespace ZOCL
