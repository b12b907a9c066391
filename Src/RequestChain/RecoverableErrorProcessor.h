// The layer next to the network, where failures that pass by themselves are dealt with.
#pragma once

#include <atomic>

#include "ostnet/http/RequestProcessor.h"

namespace ZOCL {

/// Passes every request on to the network as it is. Retries: none are made by this version; the switch below
/// is what the login sequence and the end of a session turn.
class RecoverableErrorProcessor : public ostnet::http::ForwardingProcessor {
public:
    explicit RecoverableErrorProcessor(ostnet::shared_ptr<ostnet::http::RequestProcessor> inNext);

    /// Off from the start; a login that was accepted turns it on.
    void SetRetriesEnabled(bool inEnabled) noexcept { mRetriesEnabled = inEnabled; }
    bool AreRetriesEnabled() const noexcept { return mRetriesEnabled; }

private:
    std::atomic<bool> mRetriesEnabled{false};
};

}  // namespace ZOCL
