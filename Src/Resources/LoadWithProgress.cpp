// A load under a progress window.
#include <atomic>

#include "Frame/ProgressWindow.h"
#include "ostcore/config/ZString.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/Progress.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

namespace {

constexpr std::int32_t kStatusNotModified = 304;
const char kWaitingTitle[] = "$$$/ZOCL/LoadServerResourceWithProgress/WaitingForServer=Waiting";
const char kWaitingText[] =
    "$$$/ZOCL/LoadServerResourceWithProgress/WaitingForServerData=Waiting for data from the Meridane "
    "Collaboration Hub.";

/// One load or refresh. Its completion holds it, so that it outlives the window.
class LoadOperation final : public RFL::IBatchOperation {
public:
    explicit LoadOperation(const InterfaceRef<IZOCServerResource>& inResource) : mResource(inResource) {}

    std::uint32_t AddRef() noexcept override { return mReferences.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mReferences.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const int result = QueryInterfaceNoAddRef(inID, outInterface);
        if (result >= 0) {
            AddRef();
        }
        return result;
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const bool isKnown = inID == RFL::IBatchOperation::kInterfaceID || inID == kInterfaceID;
        *outInterface = isKnown ? static_cast<RFL::IBatchOperation*>(this) : nullptr;
        return isKnown ? RFL::kResultSuccess : RFL::kResultInterfaceNotSupported;
    }

    ImmutableString GetStationID() override { return mStation; }
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

    int GetResult() const noexcept { return mResult; }

private:
    void OnLoaded(int inResult, const shared_ptr<ostnet::Response>& inResponse) {
        const bool isUnchanged = inResult < 0 && inResponse && inResponse->status == kStatusNotModified;
        mResult = isUnchanged ? kResultSuccess : inResult;
        RFL::StationUtils::PostMessageToUIThread(mStation, RFL::OperationCompleteMessage(), false);
    }

    const InterfaceRef<IZOCServerResource> mResource;
    const Guid mRequestID = Guid::CreateUnique();
    const ImmutableString mStation = RFL::StationRegistry::RegisterUniqueStation();
    std::atomic<int> mResult{kResultFailure};
    RFL::RefCount mReferences;
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
