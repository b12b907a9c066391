// Calls that are under way are known by their identifiers; who is not known is not told.
#include "Requests.h"

#include <map>

#include "ostcore/threads/Executor.h"
#include "ostcore/threads/MainThread.h"

namespace Desk {

using ostcore::threads::AsyncCallFromMainThread;
using ZOCL::Guid;
using ZOCL::InterfaceRef;
using ZOCL::IZOCDataServer;
using ZOCL::IZOCServerResource;

struct Requests::State {
    /// Main thread only. Who is not in here is not wanted any more.
    std::map<Guid, Done> underWay;
};

namespace {

/// Any thread.
template <class State>
void Deliver(const std::weak_ptr<State>& inState, const Guid& inID, const Outcome& inOutcome) {
    AsyncCallFromMainThread([inState, inID, inOutcome] {
        const auto state = inState.lock();
        const auto found = state ? state->underWay.find(inID) : decltype(state->underWay.find(inID))();
        if (state && found != state->underWay.end()) {
            const Requests::Done done = found->second;
            state->underWay.erase(found);
            done(inOutcome);
        }
    });
}

}  // namespace

Requests::Requests() : mState(std::make_shared<State>()) {}

Requests::~Requests() {
    Cancel();
}

void Requests::Run(const Start& inStart, const Done& inDone) {
    const Guid id = Guid::CreateUnique();
    mState->underWay.emplace(id, inDone);
    const std::weak_ptr<State> weak = mState;
    const auto onCompleted = [weak](const Guid& inID, int inResult,
                                    const InterfaceRef<IZOCServerResource>& inResource,
                                    const ZOCL::shared_ptr<ostnet::Response>& inResponse) {
        Deliver(weak, inID, {inResult, inResource, inResponse});
    };
    if (!inStart(id, onCompleted)) {
        Deliver(weak, id, {});
    }
}

void Requests::Refresh(const InterfaceRef<IZOCServerResource>& inResource, const Done& inDone) {
    Run(
        [inResource](const Guid& inID, const ZOCL::RequestCompletion& inCompletion) {
            return inResource && (inResource->IsLoaded() ? inResource->Refresh(inID, inCompletion)
                                                         : inResource->Load(inID, inCompletion, false));
        },
        inDone);
}

void Requests::Load(const InterfaceRef<IZOCServerResource>& inResource, const Done& inDone) {
    Run(
        [inResource](const Guid& inID, const ZOCL::RequestCompletion& inCompletion) {
            return inResource && inResource->Load(inID, inCompletion, false);
        },
        inDone);
}

void Requests::RunBlocking(const std::function<void()>& inWork, const std::function<void()>& inDone) {
    Run(
        [inWork](const Guid& inID, const ZOCL::RequestCompletion& inCompletion) {
            return ostcore::threads::GetIOBoundExecutor()->Post([inWork, inID, inCompletion] {
                inWork();
                inCompletion(inID, ZOCL::kResultSuccess, nullptr, nullptr);
            });
        },
        [inDone](const Outcome&) { inDone(); });
}

bool Requests::IsIdle() const {
    return mState->underWay.empty();
}

void Requests::Cancel() {
    const std::map<Guid, Done> unwanted = std::exchange(mState->underWay, {});
    const InterfaceRef<IZOCDataServer> server =
        unwanted.empty() ? nullptr : IZOCDataServer::GetLoggedInServerRef();
    for (const auto& [id, done] : unwanted) {
        if (server) {
            server->TryToCancelRequest(id);
        }
    }
}

}  // namespace Desk
