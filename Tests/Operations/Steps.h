// Requests of compound operations under the control of a test.
#pragma once

#include "ClientTest.h"
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

/// A request that started, until the test ends it.
class Step {
public:
    CompoundAsyncOperation::WorkFunction Work() {
        const auto state = mState;
        return [state](const Guid& inID, const RequestCompletion& inCompletion) {
            ++state->starts;
            state->id = inID;
            state->completion = inCompletion;
            return true;
        };
    }
    /// Notes the results that pass through, and gives back the same.
    CompoundAsyncOperation::IntermediateCompletion Intermediate() {
        const auto state = mState;
        return [state](int inResult, const InterfaceRef<IZOCServerResource>&,
                       const shared_ptr<ostnet::Response>&) {
            state->seen.push_back(inResult);
            return inResult;
        };
    }
    CompoundAsyncOperation::TryToCancelFunction CountCancels() {
        const auto state = mState;
        return [state](const Guid&) { ++state->cancels; };
    }
    void End(int inResult) {
        RequestCompletion completion;
        completion.swap(mState->completion);
        ASSERT_TRUE(completion) << "the step has not started";
        completion(mState->id, inResult, nullptr, nullptr);
    }
    int Starts() const { return mState->starts; }
    int Cancels() const { return mState->cancels; }
    const std::vector<int>& Seen() const { return mState->seen; }
    Guid ID() const { return mState->id; }

private:
    struct State {
        int starts = 0;
        int cancels = 0;
        std::vector<int> seen;
        Guid id;
        RequestCompletion completion;
    };
    shared_ptr<State> mState = make_shared<State>();
};

/// The final function: on record, to be waited for.
class Finish {
public:
    CompoundAsyncOperation::FinalCompletion Function() {
        const auto state = mState;
        return [state](int inResult) {
            std::lock_guard<std::mutex> lock(state->mutex);
            state->results.push_back(inResult);
            state->changed.notify_all();
        };
    }
    std::vector<int> Results() const {
        std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->results;
    }
    bool WaitForCalls(std::size_t inCount) {
        std::unique_lock<std::mutex> lock(mState->mutex);
        return mState->changed.wait_for(lock, std::chrono::seconds(60),
                                        [&] { return mState->results.size() >= inCount; });
    }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
        std::vector<int> results;
    };
    shared_ptr<State> mState = make_shared<State>();
};

}  // namespace ZOCL
