// Sends pending items of one or two kinds to a bulk link, form by form.
#pragma once

#include <vector>

#include "Model/BulkItems.h"
#include "ostcore/threads/Mutex.h"
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

/// Each form is one request of an operation. A few forms are under way at a time, and the next one is built
/// when one of them was answered, so that what memory holds twice is bounded however much there is to send.
/// The first form that carries the last items of the first kind also carries items of the second, as far as
/// they fit.
///
/// Every item is ended exactly once before the operation ends: with the result of its request, or, when the
/// operation has failed before its form was built, with that failure. Items that no form takes are a request
/// that could not be started.
///
/// Concurrency: answers come on several workers. The mutex guards the pending items while a form is built,
/// and nothing else is called under it but what writes items; requests start and items end outside.
class BulkSender : public enable_shared_from_this<BulkSender> {
public:
    enum class Verb { kPost, kPut };

    /// A kind without items may be null.
    BulkSender(shared_ptr<CompoundAsyncOperation> inOperation, InterfaceRef<IZOCDataServer> inServer,
               const ImmutableString& inURL, Verb inVerb, shared_ptr<BulkPending> inFirst,
               shared_ptr<BulkPending> inSecond);

    /// Call once, while something else keeps the operation from ending.
    void Start();

private:
    using Batches = std::vector<shared_ptr<BulkBatch>>;
    struct Request {
        Batches batches;
        /// Null when the form stayed empty, or when the items are of the kind that no form takes.
        shared_ptr<RecycledMemory const> body;
        ostnet::Headers headers;
        bool isRefused = false;
    };

    static bool HasItems(const shared_ptr<BulkPending>& inPending) {
        return inPending && !inPending->IsEmpty();
    }
    /// Starts the next request; false when nothing is left.
    bool SendNext();
    bool MakeNext(Request& outRequest);
    bool TakeRefused(Request& outRequest) ZO_REQUIRES(mMutex);
    void FillForm(BulkForm& ioForm, Batches& outBatches) ZO_REQUIRES(mMutex);
    void Initiate(const shared_ptr<const Request>& inRequest);
    int OnAnswered(const Batches& inBatches, int inResult, const shared_ptr<ostnet::Response>& inResponse);
    void EndRest(int inResult);

    const shared_ptr<CompoundAsyncOperation> mOperation;
    const InterfaceRef<IZOCDataServer> mServer;
    const ImmutableString mURL;
    const Verb mVerb;
    ostcore::threads::Mutex mMutex;
    const shared_ptr<BulkPending> mFirst ZO_PT_GUARDED_BY(mMutex);
    const shared_ptr<BulkPending> mSecond ZO_PT_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
