// Sharing: one push, and a look at the history when the session was changed meanwhile.
#include "Collaboration/ZOPublishOperation.h"

#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "Resources/JoinText.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

void TraceNotStarted(const InterfaceRef<IZOCEditingSession>& inSession,
                     const shared_ptr<ostnet::Response>& inResponse) {
    const auto production = RFL::QueryInterface<IZOCProduction>(inSession);
    ostcore::debug::StructuredText text(
        JoinText("ZOPublishOperation failed to start push on editing session: \"",
                 ostcore::utility::ToUTF8(production ? production->GetName() : UString()), "\""));
    text.Add("payload", inResponse ? inResponse->GetShortenedPayloadAsUTF8String() : "NULL http response");
    ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error, text);
}

}  // namespace

ZOPublishOperation::ZOPublishOperation(const InterfaceRef<IZOCEditingSession>& inSession,
                                       const UString& inCommitMessage, const ImmutableString& inCommitId)
    : WorkflowOperation("publish operation"),
      mSession(inSession),
      mCommitMessage(inCommitMessage),
      mCommitId(inCommitId) {}

shared_ptr<ostnet::Response> ZOPublishOperation::GetResponse() const {
    MutexLock lock(mMutex);
    return mResponse;
}

void ZOPublishOperation::Run() {
    if (!mSession || IsCanceled()) {
        return Finish(kResultFailure);
    }
    const InterfaceRef<ZOPublishOperation> self(this);
    const RequestCompletion onPushed = [self](const Guid&, int inResult,
                                              const InterfaceRef<IZOCServerResource>&,
                                              const shared_ptr<ostnet::Response>& inResponse) {
        self->OnPushCompleted(inResult, inResponse);
    };
    if (!mSession->Push(Guid::CreateUnique(), onPushed, mCommitMessage, kResolveStrategy_None,
                        ostcore::utility::ToUTF16(mCommitId.view()))) {
        TraceNotStarted(mSession, GetResponse());
        Finish(kResultFailure);
    }
}

void ZOPublishOperation::OnPushCompleted(int inResult, const shared_ptr<ostnet::Response>& inResponse) {
    {
        MutexLock lock(mMutex);
        mResponse = inResponse;
    }
    if (inResult == kResultHTTPPreconditionFailed) {
        return FinishAfterForeignCommit(RFL::QueryInterface<IZOCProduction>(mSession), mCommitId);
    }
    Finish(inResult);
}

}  // namespace ZOCL
