// The contract that every layer of the request chain honours, down to the network itself.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "ostnet/Response.h"

namespace ostnet {
namespace http {

/// Watches one exchange on its way; every call comes on a worker of the base processor.
class RequestObserver {
public:
    virtual ~RequestObserver() = default;
    /// Bytes of the body sent and received so far, and the totals when they are known (else 0).
    virtual void OnProgress(std::uint64_t inSent, std::uint64_t inSendTotal, std::uint64_t inReceived,
                            std::uint64_t inReceiveTotal) = 0;
};

/// How a request is to be carried out.
struct RequestOptions {
    shared_ptr<RequestObserver> observer;
    /// Passed through unchanged; false in every request of the client library.
    bool reservedFlag = false;
    /// The base processor hands over the body inflated.
    bool decompressPayload = true;
};

/// Field name and value of a form, in order.
using Form = std::vector<std::pair<ImmutableString, std::string>>;

/// Called exactly once for a request whose start call returned true, and never otherwise. Runs on a worker
/// of the base processor with no lock held, never on the stack of the start call. The response can be null,
/// which is a failed exchange.
using CompletionFunction = function<void(const Guid& inRequestID, const shared_ptr<Response>& inResponse)>;

constexpr std::uint32_t kWaitForever = 0xFFFFFFFFu;

/// One layer of the chain. The order of the operations is fixed.
///
/// Each verb takes a request ID of the caller's choosing, which is the only handle for a cancel, an absolute
/// URL, and headers by value. It returns true when the request was started.
///
/// Threads: any thread may call any operation.
class ZOPLATFORM_EXPORT RequestProcessor {
public:
    /// A request that is held here ends with status -1; otherwise the next layer is asked. An unknown ID has
    /// no effect.
    ///
    /// After the start has returned, a cancel finds its request wherever that is: it ends with status -1, or
    /// with its answer when that is on its way up already, and a failed or refused request is not sent again.
    /// Only a sending that another thread has begun meanwhile can still reach the network, where it is
    /// cancelled at once. A cancel that comes while the start is under way may find nothing.
    virtual void TryToCancelRequest(const Guid& inRequestID) = 0;
    virtual bool GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                     const ImmutableString& inURL, Headers inHeaders, const RequestOptions& inOptions) = 0;
    virtual bool HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                      const ImmutableString& inURL, Headers inHeaders, const RequestOptions& inOptions) = 0;
    virtual bool PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                     const ImmutableString& inURL, Headers inHeaders,
                     const shared_ptr<RecycledMemory const>& inPayload, const RequestOptions& inOptions) = 0;
    virtual bool PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                     const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                     const RequestOptions& inOptions) = 0;
    virtual bool POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                      const ImmutableString& inURL, Headers inHeaders,
                      const shared_ptr<RecycledMemory const>& inPayload, const RequestOptions& inOptions) = 0;
    virtual bool POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                      const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                      const RequestOptions& inOptions) = 0;
    virtual bool DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                        const ImmutableString& inURL, Headers inHeaders, const RequestOptions& inOptions) = 0;
    virtual ~RequestProcessor();

    /// Runs a function on a worker after the delay; 0 means as soon as possible. False: it will not run.
    virtual bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) = 0;
    /// Told by a caller that is about to block on a request, with the time-out in milliseconds. True when the
    /// base processor goes on serving the request while this very thread blocks.
    virtual bool WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) = 0;
    virtual void CancelAllRequests();

    struct Statistics {
        std::uint64_t started = 0;
        std::uint64_t completed = 0;
        std::uint64_t cancelled = 0;
        std::uint64_t connectionsOpened = 0;
        std::uint64_t bytesReceived = 0;
        std::uint64_t bytesSent = 0;
    };
    virtual bool GetStatistics(Statistics& outStatistics) = 0;
};

/// Passes every operation to the next layer; a concrete layer overrides what it handles.
class ZOPLATFORM_EXPORT ForwardingProcessor : public RequestProcessor {
public:
    explicit ForwardingProcessor(shared_ptr<RequestProcessor> inNext);

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool GET(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const RequestOptions&) override;
    bool HEAD(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
             const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
              const RequestOptions&) override;
    bool DELETE(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
                const RequestOptions&) override;
    bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) override;
    bool WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) override;
    bool GetStatistics(Statistics& outStatistics) override;

protected:
    const shared_ptr<RequestProcessor>& Next() const noexcept { return mNext; }

private:
    const shared_ptr<RequestProcessor> mNext;
};

/// The process-wide processor that does the network's work; made at first use.
ZOPLATFORM_EXPORT shared_ptr<RequestProcessor> GetGlobalRequestProcessor();

/// Puts another processor in the place of the global one and returns the former; a null pointer restores
/// the network. For test hosts, before anything connects.
ZOPLATFORM_EXPORT shared_ptr<RequestProcessor> SetGlobalRequestProcessor(
    shared_ptr<RequestProcessor> inProcessor);

/// Turns a form into a multipart/form-data payload (RFC 7578), one part a field in order, and sets the
/// Content-Type in ioHeaders. A field name with CR, LF, NUL or a double quote is refused: null is returned.
ZOPLATFORM_EXPORT shared_ptr<RecycledMemory const> ConvertFormToPayload(const Form& inForm,
                                                                        Headers& ioHeaders);

/// Builds a multi-part body part by part: AppendFormPart for each, then CompleteForm once.
class ZOPLATFORM_EXPORT FormBuilder {
public:
    FormBuilder();
    const std::string& Boundary() const noexcept { return mBoundary; }
    const shared_ptr<RecycledMemory>& Body() const noexcept { return mBody; }

private:
    std::string mBoundary;
    shared_ptr<RecycledMemory> mBody;
};
/// False, with the form unchanged, for a name or content type that could break out of its header.
ZOPLATFORM_EXPORT bool AppendFormPart(FormBuilder& ioForm, const ImmutableString& inName,
                                      const ImmutableString& inContentType, std::string_view inBytes);
ZOPLATFORM_EXPORT void SetFormContentTypeHeader(const FormBuilder& inForm, Headers& ioHeaders);
/// Closes the body and returns it; the builder must not be used again.
ZOPLATFORM_EXPORT shared_ptr<RecycledMemory const> CompleteForm(FormBuilder& ioForm);

}  // namespace http

/// Ends the network: requests in flight end with status -1, workers are joined. Later requests do not start.
ZOPLATFORM_EXPORT void Shutdown();

}  // namespace ostnet
