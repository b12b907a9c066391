// A load under a progress window.
#include "Frame/BatchOperationBase.h"
#include "Frame/ProgressWindow.h"
#include "ostcore/config/ZString.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/Progress.h"

namespace ZOCL {

namespace {

constexpr std::int32_t kStatusNotModified = 304;
const char kWaitingTitle[] = "$$$/ZOCL/LoadServerResourceWithProgress/WaitingForServer=Waiting";
const char kWaitingText[] =
    "$$$/ZOCL/LoadServerResourceWithProgress/WaitingForServerData=Waiting for data from the Meridane "
    "Collaboration Hub.";

/// One load or refresh. Its completion holds it, so that it outlives the window.
class LoadOperation final : public BatchOperationBase {
public:
    explicit LoadOperation(const InterfaceRef<IZOCServerResource>& inResource) : mResource(inResource) {}

    UString GetDescription() override { return u"LoadServerResourceWithProgress"; }
    bool Start() override {
        const RequestCompletion completion =
            [self = InterfaceRef<LoadOperation>(this)](
                const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                const shared_ptr<ostnet::Response>& inResponse) { self->OnLoaded(inResult, inResponse); };
        return mResource->IsLoaded() ? mResource->Refresh(mRequestID, completion)
                                     : mResource->Load(mRequestID, completion, true);
    }
    void Abort() override { mResource->TryToCancelRequest(mRequestID); }

private:
    void OnLoaded(int inResult, const shared_ptr<ostnet::Response>& inResponse) {
        const bool isUnchanged = inResult < 0 && inResponse && inResponse->status == kStatusNotModified;
        Finish(isUnchanged ? kResultSuccess : inResult);
    }

    const InterfaceRef<IZOCServerResource> mResource;
    const Guid mRequestID = Guid::CreateUnique();
};

}  // namespace

int LoadServerResourceWithProgress(const InterfaceRef<IZOCServerResource>& inResource,
                                   bool inRefreshIfLoaded) {
    if (!inResource) {
        return kResultFailure;
    }
    if (inResource->IsLoaded() && !inRefreshIfLoaded) {
        return kResultSuccess;
    }
    const InterfaceRef<LoadOperation> operation(new LoadOperation(inResource));
    ProgressWindowSettings settings;
    settings.title = ostcore::ZString(kWaitingTitle).AsUTF8();
    settings.caption = ostcore::ZString(kWaitingText).AsUTF8();
    const ProgressEnd end = RunProgressWindow(operation, settings);
    return end == ProgressEnd::kNotStarted ? kResultNotStarted : operation->GetResult();
}

}  // namespace ZOCL
