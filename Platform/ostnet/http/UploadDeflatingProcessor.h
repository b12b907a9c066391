// Packs large bodies on their way up, on a worker instead of the caller's thread.
#pragma once

#include <map>

#include "ostcore/threads/RecursiveMutex.h"
#include "ostnet/http/RequestProcessor.h"

namespace ostnet {
namespace http {

/// The layer that uploads enter when the server takes packed bodies. A PUT or POST whose body is larger than
/// "ostnet.UploadCompressionMinimumSize" (65536 bytes unless the debug database says otherwise; read at
/// construction) is started by a posted function that packs the body and calls the next layer. All else goes
/// on at once, so a large body can overtake and be overtaken. A form becomes its payload first. A body that
/// bears a Content-Encoding already goes on as it is; so does one for which there is no memory to pack it.
///
/// Memory: while it is packed, a body costs its own size and libdeflate's bound for it, which is hardly more
/// than that size; from then on what it was packed to. No more bodies are packed at once than there are
/// workers.
///
/// The race: a cancel can come while the body is packed, and while the packed request is being started and is
/// not yet known below. A request stands in mPending all that time, with where it is: while it is packed, a
/// cancel takes it out and completes it; while it is started, a cancel leaves a mark, and is repeated below
/// when the start has returned.
///
/// Threads: any. The mutex is held neither over the next layer nor over a completion.
class ZOPLATFORM_EXPORT UploadDeflatingProcessor : public ForwardingProcessor,
                                                   public enable_shared_from_this<UploadDeflatingProcessor> {
public:
    explicit UploadDeflatingProcessor(shared_ptr<RequestProcessor> inNext);

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
             const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
              const RequestOptions&) override;

private:
    using Payload = shared_ptr<RecycledMemory const>;
    using SendFunction = function<bool(const Payload& inPayload, Headers inHeaders)>;
    struct PendingCompression {
        SendFunction makeRequest;
        CompletionFunction completion;
        bool isBeingStarted = false;
        bool isCancelled = false;
    };
    struct Body {
        Payload payload;
        Headers headers;
    };

    bool IsToBePacked(const Payload& inPayload, const Headers& inHeaders) const;
    bool MakeRequest(const Guid& inRequestID, SendFunction inMakeRequest,
                     const CompletionFunction& inCompletion, const Payload& inPayload, Headers inHeaders);
    void PackAndSend(const Guid& inRequestID, Body& ioBody);
    bool CompressionRequestIsStillValid(const Guid& inRequestID);
    optional<SendFunction> BeginStart(const Guid& inRequestID);
    optional<PendingCompression> FindAndRemoveRequest(const Guid& inRequestID);
    void EndCancelled(const Guid& inRequestID, const CompletionFunction& inCompletion);

    mutable ostcore::threads::RecursiveMutex mMutex;
    std::map<Guid, PendingCompression> mPending ZO_GUARDED_BY(mMutex);
    const std::uint32_t mMinimumSize;
};

}  // namespace http
}  // namespace ostnet
