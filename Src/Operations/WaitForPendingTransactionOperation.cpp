// Watches the list of transactions until it is empty. The end is claimed once by whoever comes first: the
// list, the user, or the system.
#include "Operations/WaitForPendingTransactionOperation.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

constexpr std::uint32_t kPollMilliseconds = 500;

}  // namespace

WaitForPendingTransactionOperation::WaitForPendingTransactionOperation(const ImmutableString& inStationID)
    : mStationID(inStationID) {}
WaitForPendingTransactionOperation::~WaitForPendingTransactionOperation() = default;

bool WaitForPendingTransactionOperation::Init(const InterfaceRef<IZOCServerResource>& inResource,
                                              const std::vector<ImmutableString>& inIgnoredTypes) {
    const auto list = RFL::QueryInterface<IZOCTransactionList>(inResource);
    if (!list) {
        return false;
    }
    mResource = inResource;
    mList = list;
    mIgnoredTypes = inIgnoredTypes;
    mPendingItems = list->GetPendingItems(inIgnoredTypes);
    return true;
}

std::uint32_t WaitForPendingTransactionOperation::AddRef() noexcept {
    return mReferences.Add();
}

std::uint32_t WaitForPendingTransactionOperation::Release() noexcept {
    const std::uint32_t left = mReferences.Drop();
    if (left == 0) {
        delete this;
    }
    return left;
}

int WaitForPendingTransactionOperation::QueryInterface(const RFL::InterfaceID& inID,
                                                       void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int WaitForPendingTransactionOperation::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID,
                                                               void** outInterface) noexcept {
    if (inID == RFL::IBatchOperation::kInterfaceID) {
        *outInterface = static_cast<RFL::IBatchOperation*>(this);
    } else if (inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<RFL::RFLUnknown*>(static_cast<RFL::IBatchOperation*>(this));
    } else if (inID == IForceAbortEnabledOperation::kInterfaceID) {
        *outInterface = static_cast<IForceAbortEnabledOperation*>(this);
    } else {
        *outInterface = nullptr;
        return kResultInterfaceNotSupported;
    }
    return kResultSuccess;
}

ImmutableString WaitForPendingTransactionOperation::GetStationID() {
    return mStationID;
}

UString WaitForPendingTransactionOperation::GetDescription() {
    return u"WaitForPendingTransactionOperation";
}

bool WaitForPendingTransactionOperation::Start() {
    if (!mList || mHasEnded.load(std::memory_order_acquire) != 0) {
        return false;
    }
    mIsRunning.store(true, std::memory_order_release);
    if (mPendingItems.empty()) {
        End(kResultSuccess);
        return true;
    }
    mPendingCount.store(mPendingItems.size(), std::memory_order_release);
    const InterfaceRef<WaitForPendingTransactionOperation> self(this);
    const auto notifier = mResource->SubscribeToChanges(
        [self](const InterfaceRef<IZOCServerResource>&) { self->OnTransactionListChanged(); }, false,
        kPollMilliseconds);
    {
        MutexLock lock(mMutex);
        mNotifier = notifier;
    }
    const auto onReloaded = [self](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                                   const shared_ptr<ostnet::Response>&) { self->OnTransactionListChanged(); };
    if (notifier && mResource->Load(Guid::CreateUnique(), onReloaded, true)) {
        // Whoever ended the wait before the notifier was stored has not stopped it.
        if (mHasEnded.load(std::memory_order_acquire) != 0) {
            StopWatching();
        }
        return true;
    }
    const bool isOurs = ClaimEnd();
    StopWatching();
    return !isOurs;
}

void WaitForPendingTransactionOperation::OnTransactionListChanged() {
    if (mPendingCount.load(std::memory_order_acquire) < 1 || !mResource->IsLoaded()) {
        return;
    }
    const std::size_t count = mList->GetPendingItems(mIgnoredTypes).size();
    // What was read of a list that was unloaded meanwhile proves nothing.
    if (!mResource->IsLoaded()) {
        return;
    }
    mPendingCount.store(count, std::memory_order_release);
    if (count == 0) {
        End(kResultSuccess);
    }
}

void WaitForPendingTransactionOperation::StopWatching() {
    shared_ptr<ServerResourceChangeNotifier> notifier;
    {
        MutexLock lock(mMutex);
        notifier.swap(mNotifier);
    }
    if (notifier) {
        notifier->StopNotifications();
    }
}

void WaitForPendingTransactionOperation::End(int inResult) {
    if (!ClaimEnd()) {
        return;
    }
    mResult.store(inResult, std::memory_order_release);
    StopWatching();
    OnFinished();
}

void WaitForPendingTransactionOperation::OnFinished() {
    if (WasForceAborted() || !mIsRunning.load(std::memory_order_acquire)) {
        return;
    }
    RFL::StationUtils::PostMessageToUIThread(mStationID, RFL::OperationCompleteMessage(), false);
}

void WaitForPendingTransactionOperation::Abort() {
    End(kResultCancelled);
}

void WaitForPendingTransactionOperation::ForceAbort(int inResult) {
    ForceAbortEnabledOperation::ForceAbort(inResult);
    ClaimEnd();
    StopWatching();
}

}  // namespace ZOCL
