#include "ostnet/http/UploadDeflatingProcessor.h"

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/Compression.h"

namespace ostnet {
namespace http {

using ostcore::threads::ScopedLock;

namespace {

constexpr char kMinimumSizeKey[] = "ostnet.UploadCompressionMinimumSize";
constexpr std::uint32_t kMinimumSizeDefault = 65536;

void Pack(shared_ptr<RecycledMemory const>& ioPayload, Headers& ioHeaders) {
    try {
        ioPayload = CompressPayloadAndUpdateHeaders(ioPayload, ioHeaders);
    } catch (const std::bad_alloc&) {
        ostcore::debug::Trace("ostnet", ostcore::debug::kTraceLevel_Error,
                              "There is no memory to pack the body of an upload; it is sent as it is");
    }
}

}  // namespace

UploadDeflatingProcessor::UploadDeflatingProcessor(shared_ptr<RequestProcessor> inNext)
    : ForwardingProcessor(std::move(inNext)),
      mMinimumSize(ostcore::debug::DebugDatabase::GetUInt32(kMinimumSizeKey, kMinimumSizeDefault)) {}

bool UploadDeflatingProcessor::IsToBePacked(const Payload& inPayload, const Headers& inHeaders) const {
    return inPayload && inPayload->size() > mMinimumSize && inHeaders.count(kHEADER_CONTENT_ENCODING) == 0;
}

bool UploadDeflatingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                   const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                   const RequestOptions& inOptions) {
    if (!IsToBePacked(inPayload, inHeaders)) {
        return Next()->PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
    }
    const auto send = [next = Next(), inRequestID, inCompletion, inURL, inOptions](const Payload& inPacked,
                                                                                   Headers inPackedHeaders) {
        return next->PUT(inRequestID, inCompletion, inURL, std::move(inPackedHeaders), inPacked, inOptions);
    };
    return MakeRequest(inRequestID, send, inCompletion, inPayload, std::move(inHeaders));
}

bool UploadDeflatingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                    const RequestOptions& inOptions) {
    if (!IsToBePacked(inPayload, inHeaders)) {
        return Next()->POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
    }
    const auto send = [next = Next(), inRequestID, inCompletion, inURL, inOptions](const Payload& inPacked,
                                                                                   Headers inPackedHeaders) {
        return next->POST(inRequestID, inCompletion, inURL, std::move(inPackedHeaders), inPacked, inOptions);
    };
    return MakeRequest(inRequestID, send, inCompletion, inPayload, std::move(inHeaders));
}

bool UploadDeflatingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                   const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                   const RequestOptions& inOptions) {
    const Payload payload = ConvertFormToPayload(inForm, inHeaders);
    return payload && PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), payload, inOptions);
}

bool UploadDeflatingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                    const RequestOptions& inOptions) {
    const Payload payload = ConvertFormToPayload(inForm, inHeaders);
    return payload && POST(inRequestID, inCompletion, inURL, std::move(inHeaders), payload, inOptions);
}

bool UploadDeflatingProcessor::MakeRequest(const Guid& inRequestID, SendFunction inMakeRequest,
                                           const CompletionFunction& inCompletion, const Payload& inPayload,
                                           Headers inHeaders) {
    if (!inCompletion) {
        return false;
    }
    {
        ScopedLock lock(mMutex, "UploadDeflatingProcessor::MakeRequest");
        PendingCompression pending;
        pending.makeRequest = std::move(inMakeRequest);
        pending.completion = inCompletion;
        if (!mPending.emplace(inRequestID, std::move(pending)).second) {
            return false;
        }
    }
    // One body for all copies of the function, so that the bytes go when they have been packed.
    const auto body = boost::make_shared<Body>(Body{inPayload, std::move(inHeaders)});
    const auto packAndSend = [self = shared_from_this(), inRequestID, body] {
        self->PackAndSend(inRequestID, *body);
    };
    if (PostFunction(packAndSend, 0)) {
        return true;
    }
    // A cancel that came first has completed the request.
    return !FindAndRemoveRequest(inRequestID);
}

void UploadDeflatingProcessor::PackAndSend(const Guid& inRequestID, Body& ioBody) {
    if (!CompressionRequestIsStillValid(inRequestID)) {
        return;
    }
    Pack(ioBody.payload, ioBody.headers);
    const optional<SendFunction> makeRequest = BeginStart(inRequestID);
    if (!makeRequest) {
        return;
    }
    const bool isStarted = (*makeRequest)(std::exchange(ioBody.payload, nullptr), std::move(ioBody.headers));
    const optional<PendingCompression> pending = FindAndRemoveRequest(inRequestID);
    if (!isStarted) {
        EndCancelled(inRequestID, pending->completion);
    } else if (pending->isCancelled) {
        Next()->TryToCancelRequest(inRequestID);
    }
}

bool UploadDeflatingProcessor::CompressionRequestIsStillValid(const Guid& inRequestID) {
    ScopedLock lock(mMutex, "UploadDeflatingProcessor::CompressionRequestIsStillValid");
    return mPending.count(inRequestID) > 0;
}

/// From here on a cancel leaves its mark only. None: the request was cancelled while it was packed.
optional<UploadDeflatingProcessor::SendFunction> UploadDeflatingProcessor::BeginStart(
    const Guid& inRequestID) {
    ScopedLock lock(mMutex, "UploadDeflatingProcessor::BeginStart");
    const auto found = mPending.find(inRequestID);
    if (found == mPending.end()) {
        return {};
    }
    found->second.isBeingStarted = true;
    return std::exchange(found->second.makeRequest, {});
}

optional<UploadDeflatingProcessor::PendingCompression> UploadDeflatingProcessor::FindAndRemoveRequest(
    const Guid& inRequestID) {
    ScopedLock lock(mMutex, "UploadDeflatingProcessor::FindAndRemoveRequest");
    const auto found = mPending.find(inRequestID);
    if (found == mPending.end()) {
        return {};
    }
    optional<PendingCompression> pending = std::move(found->second);
    mPending.erase(found);
    return pending;
}

void UploadDeflatingProcessor::TryToCancelRequest(const Guid& inRequestID) {
    CompletionFunction completion;
    {
        ScopedLock lock(mMutex, "UploadDeflatingProcessor::TryToCancelRequest");
        const auto found = mPending.find(inRequestID);
        if (found != mPending.end() && found->second.isBeingStarted) {
            found->second.isCancelled = true;
            return;
        }
        if (found != mPending.end()) {
            completion.swap(found->second.completion);
            mPending.erase(found);
        }
    }
    if (completion) {
        EndCancelled(inRequestID, completion);
    } else {
        Next()->TryToCancelRequest(inRequestID);
    }
}

void UploadDeflatingProcessor::EndCancelled(const Guid& inRequestID, const CompletionFunction& inCompletion) {
    const auto end = [inRequestID, inCompletion] {
        inCompletion(inRequestID, boost::make_shared<Response>(Response::kStatusCancelled));
    };
    if (!PostFunction(end, 0)) {
        end();
    }
}

}  // namespace http
}  // namespace ostnet
