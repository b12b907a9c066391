// Gets all sessions of a production, each loaded.
#include <set>

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

/// One walk over the pages of a list: each page starts the loads of its sessions and that of the next page.
class SessionWalk : public enable_shared_from_this<SessionWalk> {
public:
    /// The loads are requests of the operation.
    void LoadPage(const shared_ptr<CompoundAsyncOperation>& inOperation,
                  const InterfaceRef<IZOCProductionList>& inPage) {
        const auto resource = RFL::QueryInterface<IZOCServerResource>(inPage);
        // A list that leads back to a page that was seen ends there.
        if (!resource || !mSeenPages.insert(resource->GetHTTPURL()).second) {
            return;
        }
        ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Progress,
                              JoinText("Load editing session list with URL ", resource->GetHTTPURL()));
        const auto self = shared_from_this();
        inOperation->Initiate(
            [resource](const Guid& inID, const RequestCompletion& inDone) {
                return resource->Load(inID, inDone, true);
            },
            [self, inOperation, inPage, resource](int inResult) {
                const int result = inResult >= 0 && !resource->IsLoaded() ? kResultFailure : inResult;
                ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Progress,
                                      JoinText("Editing session list loaded, inResult == ", result));
                if (result >= 0) {
                    self->StartSessions(inOperation, inPage);
                    self->LoadPage(inOperation, inPage->GetNextPage());
                }
                return result;
            });
    }
    /// When the operation has ended.
    Sessions GetLoaded() const {
        Sessions loaded;
        for (const auto& session : mSessions) {
            if (AsResource(session)->IsLoaded()) {
                loaded.push_back(session);
            }
        }
        return loaded;
    }

private:
    void StartSessions(const shared_ptr<CompoundAsyncOperation>& inOperation,
                       const InterfaceRef<IZOCProductionList>& inPage) {
        for (const auto& entry : inPage->GetAllItems()) {
            const auto session = inPage->GetProduction(entry);
            const auto resource = AsResource(session);
            if (!resource) {
                continue;
            }
            mSessions.push_back(session);
            inOperation->Initiate(
                [resource](const Guid& inID, const RequestCompletion& inDone) {
                    return resource->Load(inID, inDone, true);
                },
                [resource](int inResult) { return OnSessionLoaded(resource, inResult); });
        }
    }

    // One page is read at a time, and nobody asks for the result before the last has been.
    std::set<ImmutableString> mSeenPages;
    Sessions mSessions;
};

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
    const auto walk = boost::make_shared<SessionWalk>();
    const auto operation = CompoundAsyncOperation::Create(
        [walk, inCompletion](int inResult) {
            if (inCompletion) {
                inCompletion(inResult, walk->GetLoaded());
            }
        },
        resource->GetServer(), false);
    walk->LoadPage(operation, list);
    return true;
}

}  // namespace ZOCL
