// What the library's small operations share: counting, a station, a result and the message of the end.
#pragma once

#include <atomic>

#include "RFL/BatchOperation.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

/// A batch operation of the lower floors; it answers IBatchOperation alone. Started work holds a reference.
class BatchOperationBase : public RFL::IBatchOperation {
public:
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
        const bool isKnown =
            inID == RFL::IBatchOperation::kInterfaceID || inID == RFL::RFLUnknown::kInterfaceID;
        *outInterface = isKnown ? static_cast<RFL::IBatchOperation*>(this) : nullptr;
        return isKnown ? RFL::kResultSuccess : RFL::kResultInterfaceNotSupported;
    }
    ImmutableString GetStationID() override { return mStation; }

    /// kResultFailure until the operation has ended. Any thread.
    int GetResult() const noexcept { return mResult; }

protected:
    BatchOperationBase() = default;
    ~BatchOperationBase() override = default;

    /// Keeps the result and tells of the end; once for each start that returned true. Any thread.
    void Finish(int inResult) {
        mResult = inResult;
        RFL::StationUtils::PostMessageToUIThread(mStation, RFL::OperationCompleteMessage(), false);
    }

private:
    const ImmutableString mStation = RFL::StationRegistry::RegisterUniqueStation();
    std::atomic<int> mResult{kResultFailure};
    RFL::RefCount mReferences;
};

}  // namespace ZOCL
