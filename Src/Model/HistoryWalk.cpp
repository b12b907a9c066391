// One walk over a history: it lives in the completion of the page that is loading.
#include "Model/HistoryWalk.h"

#include <set>

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

namespace {

class HistoryWalk : public enable_shared_from_this<HistoryWalk> {
public:
    HistoryWalk(const HistoryVisitor& inVisitor, const HistoryWalkCompletion& inCompletion)
        : mVisitor(inVisitor), mCompletion(inCompletion) {}

    bool LoadPage(const InterfaceRef<IZOCProductionHistory>& inPage) {
        const auto resource = RFL::QueryInterface<IZOCServerResource>(inPage);
        if (!resource) {
            return false;
        }
        mSeenPages.insert(resource->GetHTTPURL());
        const auto self = shared_from_this();
        const auto onLoaded = [self, inPage](const Guid&, int inResult,
                                             const InterfaceRef<IZOCServerResource>& inResource,
                                             const shared_ptr<ostnet::Response>&) {
            const bool isLoaded = inResource && inResource->IsLoaded();
            self->OnPageLoaded(inPage, inResult >= 0 && !isLoaded ? kResultFailure : inResult);
        };
        return resource->Load(Guid::CreateUnique(), onLoaded, true);
    }

private:
    void OnPageLoaded(const InterfaceRef<IZOCProductionHistory>& inPage, int inResult) {
        if (inResult < 0) {
            End(inResult, nullptr);
            return;
        }
        mSeenPages.insert(RFL::QueryInterface<IZOCServerResource>(inPage)->GetHTTPURL());
        const int count = inPage->GetHistoryVersionCount();
        for (int index = 0; index < count; ++index) {
            const InterfaceRef<IZOCHistoryVersion> version = inPage->GetHistoryVersion(index);
            int result = kResultSuccess;
            if (mVisitor && mVisitor(version, result)) {
                End(result, version);
                return;
            }
        }
        GoOnBehind(inPage);
    }

    void GoOnBehind(const InterfaceRef<IZOCProductionHistory>& inPage) {
        const InterfaceRef<IZOCProductionHistory> next = inPage->GetNextPage();
        const auto resource = RFL::QueryInterface<IZOCServerResource>(next);
        if (!resource || mSeenPages.count(resource->GetHTTPURL()) > 0) {
            End(kResultHTTPNotFound, nullptr);
        } else if (!LoadPage(next)) {
            End(kResultNotStarted, nullptr);
        }
    }

    void End(int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
        if (mCompletion) {
            mCompletion(inResult, inVersion);
        }
    }

    // One page loads at a time, so nobody else touches these.
    const HistoryVisitor mVisitor;
    const HistoryWalkCompletion mCompletion;
    std::set<ImmutableString> mSeenPages;
};

}  // namespace

bool WalkHistory(const InterfaceRef<IZOCProductionHistory>& inFirstPage, const HistoryVisitor& inVisitor,
                 const HistoryWalkCompletion& inCompletion) {
    return boost::make_shared<HistoryWalk>(inVisitor, inCompletion)->LoadPage(inFirstPage);
}

}  // namespace ZOCL
