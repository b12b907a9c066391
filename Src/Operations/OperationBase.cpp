// What every long operation has.
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/ZOOperationBase.h"

namespace ZOCL {

ZOOperationBase::ZOOperationBase() : mStationID(RFL::StationRegistry::RegisterUniqueStation()) {}
ZOOperationBase::~ZOOperationBase() = default;

std::uint32_t ZOOperationBase::AddRef() noexcept {
    return mReferences.Add();
}

std::uint32_t ZOOperationBase::Release() noexcept {
    const std::uint32_t left = mReferences.Drop();
    if (left == 0) {
        delete this;
    }
    return left;
}

int ZOOperationBase::QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int ZOOperationBase::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == RFL::IBatchOperation::kInterfaceID) {
        *outInterface = static_cast<RFL::IBatchOperation*>(this);
    } else if (inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<RFL::RFLUnknown*>(this);
    } else if (inID == ZOOperationBase::kInterfaceID) {
        *outInterface = this;
    } else {
        *outInterface = nullptr;
        return kResultInterfaceNotSupported;
    }
    return kResultSuccess;
}

ImmutableString ZOOperationBase::GetStationID() {
    return mStationID;
}

UString ZOOperationBase::GetDescription() {
    return u"ZOOperationBase";
}

bool ZOOperationBase::Start() {
    return false;
}

void ZOOperationBase::Abort() {
    int running = 0;
    mCanceled.compare_exchange_strong(running, 1, std::memory_order_acq_rel);
}

InterfaceRef<ZOOperationBase> ZOOperationBase::AddRefSelf() {
    return InterfaceRef<ZOOperationBase>(this);
}

int ZOOperationBase::GetResult() const {
    return IsCanceled() ? kResultCancelled : GetStoredResult();
}

bool ZOOperationBase::IsCanceled() const {
    return mCanceled.load(std::memory_order_acquire) == 1;
}

void ZOOperationBase::FinishOperation(int inResult) {
    SetStoredResult(inResult);
    RFL::StationUtils::PostMessageToUIThread(mStationID, RFL::OperationCompleteMessage(), false);
}

ZOLoadServerResourceOperation::ZOLoadServerResourceOperation(
    const InterfaceRef<IZOCServerResource>& inResource, const Guid& inRequestID)
    : mResource(inResource), mRequestID(inRequestID) {}
ZOLoadServerResourceOperation::~ZOLoadServerResourceOperation() = default;

UString ZOLoadServerResourceOperation::GetDescription() {
    return u"ZOLoadServerResourceOperation";
}

bool ZOLoadServerResourceOperation::Start() {
    if (IsCanceled() || !mResource) {
        return false;
    }
    const InterfaceRef<ZOLoadServerResourceOperation> self(this);
    const auto onLoaded = [self](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                                 const shared_ptr<ostnet::Response>&) { self->FinishOperation(inResult); };
    return mResource->Load(mRequestID, onLoaded, true);
}

}  // namespace ZOCL
