// Batching of bulk items, and the requests that carry them.
#include "Model/BulkSender.h"

#include "ostcore/debug/Trace.h"
#include "Resources/JoinText.h"
#include "Resources/ServerResource.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

/// One on the wire, and one that is built and waits for it.
constexpr int kFormsUnderWay = 2;

void CompleteAll(const std::vector<shared_ptr<BulkBatch>>& inBatches, int inResult,
                 const BulkAnswer& inAnswer) {
    for (const auto& batch : inBatches) {
        batch->Complete(inResult, inAnswer);
    }
}

bool FitsAll(const std::vector<shared_ptr<BulkBatch>>& inBatches, const BulkAnswer& inAnswer) {
    for (const auto& batch : inBatches) {
        if (!batch->Fits(inAnswer)) {
            return false;
        }
    }
    return true;
}

bool ReadsAnswer(const std::vector<shared_ptr<BulkBatch>>& inBatches) {
    for (const auto& batch : inBatches) {
        if (batch->ReadsAnswer()) {
            return true;
        }
    }
    return false;
}

}  // namespace

BulkSender::BulkSender(shared_ptr<CompoundAsyncOperation> inOperation, InterfaceRef<IZOCDataServer> inServer,
                       const ImmutableString& inURL, Verb inVerb, shared_ptr<BulkPending> inFirst,
                       shared_ptr<BulkPending> inSecond)
    : mOperation(std::move(inOperation)),
      mServer(std::move(inServer)),
      mURL(inURL),
      mVerb(inVerb),
      mFirst(std::move(inFirst)),
      mSecond(std::move(inSecond)) {}

void BulkSender::Start() {
    for (int started = 0; started < kFormsUnderWay && SendNext(); ++started) {
    }
}

bool BulkSender::SendNext() {
    for (;;) {
        const int result = mOperation->GetResult();
        if (result < 0) {
            EndRest(result);
            return false;
        }
        const auto request = make_shared<Request>();
        if (!MakeNext(*request)) {
            return false;
        }
        if (request->body || request->isRefused) {
            Initiate(request);
            return true;
        }
        // All of it is about what the server does not have.
        CompleteAll(request->batches, kResultHTTPNotFound, BulkAnswer());
    }
}

bool BulkSender::MakeNext(Request& outRequest) {
    MutexLock lock(mMutex);
    if (!HasItems(mFirst) && !HasItems(mSecond)) {
        return TakeRefused(outRequest);
    }
    BulkForm form;
    FillForm(form, outRequest.batches);
    if (!form.IsEmpty()) {
        outRequest.body = form.Complete(outRequest.headers);
    }
    return true;
}

void BulkSender::FillForm(BulkForm& ioForm, Batches& outBatches) {
    if (HasItems(mFirst)) {
        outBatches.push_back(mFirst->MoveInto(ioForm));
        if (HasItems(mFirst)) {
            return;
        }
    }
    if (HasItems(mSecond) && !ioForm.IsFull()) {
        outBatches.push_back(mSecond->MoveInto(ioForm));
    }
}

bool BulkSender::TakeRefused(Request& outRequest) {
    for (const auto& pending : {mFirst, mSecond}) {
        if (const auto refused = pending ? pending->TakeRefused() : nullptr) {
            outRequest.batches.push_back(refused);
        }
    }
    outRequest.isRefused = !outRequest.batches.empty();
    return outRequest.isRefused;
}

void BulkSender::Initiate(const shared_ptr<const Request>& inRequest) {
    const auto self = shared_from_this();
    const auto work = [self, inRequest](const Guid& inRequestID, const RequestCompletion& inCompletion) {
        if (!inRequest->body) {
            return false;
        }
        const auto target =
            ServerResource::MakePlain(self->mURL, self->mServer, ResourceWritability::kReadOnly);
        return self->mVerb == Verb::kPost
                   ? target->Post(inRequest->body, inRequest->headers, inRequestID, inCompletion)
                   : target->Put(inRequest->body, inRequest->headers, inRequestID, inCompletion);
    };
    const auto onAnswered = [self, batches = inRequest->batches](
                                int inResult, const shared_ptr<ostnet::Response>& inResponse) {
        const int result = self->OnAnswered(batches, inResult, inResponse);
        if (result < 0) {
            self->EndRest(result);
        } else {
            self->SendNext();
        }
        return result;
    };
    mOperation->Initiate(work, onAnswered);
}

int BulkSender::OnAnswered(const Batches& inBatches, int inResult,
                           const shared_ptr<ostnet::Response>& inResponse) {
    int result = inResult;
    BulkAnswer answer;
    if (result >= 0 && ReadsAnswer(inBatches)) {
        if (!ReadBulkAnswer(inResponse, answer)) {
            result = kResultFailure;
        } else if (!FitsAll(inBatches, answer)) {
            static ostcore::debug::TraceChannel channel("ZOCL.Production");
            ostcore::debug::StructuredText text("The answer to a bulk request speaks of more than was sent");
            text.Add("uri", mURL);
            ostcore::debug::Trace(channel, ostcore::debug::kTraceLevel_Error, text);
            result = kResultFailure;
        }
    }
    CompleteAll(inBatches, result, answer);
    return result;
}

/// Called with the failure before the operation is told of it, so that nothing is built for a request that
/// will not start.
void BulkSender::EndRest(int inResult) {
    Batches rest;
    {
        MutexLock lock(mMutex);
        Request refused;
        TakeRefused(refused);
        rest = refused.batches;
        for (const auto& pending : {mFirst, mSecond}) {
            if (HasItems(pending)) {
                rest.push_back(pending->TakeRest());
            }
        }
    }
    CompleteAll(rest, inResult, BulkAnswer());
}

}  // namespace ZOCL
