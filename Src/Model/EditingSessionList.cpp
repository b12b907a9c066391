// Gets all sessions of a production, each loaded.
#include "ostcore/debug/Trace.h"
#include "Resources/JoinText.h"
#include "Resources/ServerResource.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

namespace {

using Sessions = std::vector<InterfaceRef<IZOCProduction>>;

ostcore::debug::TraceChannel& Channel() {
    static ostcore::debug::TraceChannel channel("ZOCL.GetEditingSessionList");
    return channel;
}

InterfaceRef<IZOCServerResource> AsResource(const InterfaceRef<IZOCProduction>& inProduction) {
    return RFL::QueryInterface<IZOCServerResource>(inProduction);
}

Sessions KeepLoaded(const Sessions& inSessions) {
    Sessions loaded;
    for (const auto& session : inSessions) {
        if (AsResource(session)->IsLoaded()) {
            loaded.push_back(session);
        }
    }
    return loaded;
}

/// One that was discarded since the list was made is no failure; it is left out.
int OnSessionLoaded(const InterfaceRef<IZOCServerResource>& inSession, int inResult) {
    const int result = inResult >= 0 && !inSession->IsLoaded() ? kResultFailure : inResult;
    if (result < 0) {
        ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Error,
                              JoinText("Failed to load the editing session at ", inSession->GetHTTPURL(),
                                       ", inResult == ", result));
    }
    return result == kResultHTTPNotFound ? kResultSuccess : result;
}

void StartSessions(const shared_ptr<CompoundAsyncOperation>& inOperation,
                   const InterfaceRef<IZOCProductionList>& inList, Sessions& outSessions) {
    for (const auto& entry : inList->GetAllItems()) {
        if (const auto session = inList->GetProduction(entry)) {
            outSessions.push_back(session);
        }
    }
    for (const auto& session : outSessions) {
        const auto resource = AsResource(session);
        inOperation->Initiate(
            [resource](const Guid& inID, const RequestCompletion& inDone) {
                return resource->Load(inID, inDone, true);
            },
            [resource](int inResult) { return OnSessionLoaded(resource, inResult); });
    }
}

}  // namespace

bool GetEditingSessionList(const InterfaceRef<IZOCProduction>& inProduction,
                           const function<void(int, const Sessions&)>& inCompletion) {
    const auto list = inProduction ? inProduction->GetEditingSessions() : nullptr;
    const auto resource = RFL::QueryInterface<ServerResource>(list);
    if (!resource) {
        ostcore::debug::Trace(
            Channel(), ostcore::debug::kTraceLevel_Error,
            "The production offers no editing sessions; load it before they are asked for.");
        return false;
    }
    const auto sessions = boost::make_shared<Sessions>();
    const auto operation = CompoundAsyncOperation::Create(
        [sessions, inCompletion](int inResult) {
            if (inCompletion) {
                inCompletion(inResult, KeepLoaded(*sessions));
            }
        },
        resource->GetServer(), false);
    ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Progress,
                          JoinText("Load editing session list with URL ", resource->GetHTTPURL()));
    operation->Initiate(
        [resource](const Guid& inID, const RequestCompletion& inDone) {
            return resource->Load(inID, inDone, true);
        },
        [operation, list, resource, sessions](int inResult) {
            const int result = inResult >= 0 && !resource->IsLoaded() ? kResultFailure : inResult;
            if (result >= 0) {
                StartSessions(operation, list, *sessions);
            }
            ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Progress,
                                  JoinText("Editing session list loaded, inResult == ", inResult));
            return result;
        });
    return true;
}

}  // namespace ZOCL
