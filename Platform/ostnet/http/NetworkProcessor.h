// The base processor: the bottom of every chain, which does the network's work.
#pragma once

#include "ostnet/http/RequestProcessor.h"
#include "ostnet/NetworkSettings.h"

namespace ostnet {
namespace http {

/// The bottom of the chain. It sends what it is given and hands over what comes back:
///
/// - It never follows a redirect, keeps no cookie, repeats nothing but a GET or HEAD whose kept connection
///   had closed, and offers gzip alone. The body is inflated when the options say so; Content-Encoding and
///   Content-Length are then left out of the headers.
/// - A start returns false, and nothing is sent, after the shutdown, for an ID that is in use, an empty
///   completion, a URL that is not plain http or https (zourl::http::Create), and a header that could break
///   out of its line. The headers of the message frame (Content-Length, Transfer-Encoding, Connection) are
///   left out and written by the processor.
/// - An exchange that fails in any way, a body cut short included, ends with status 0, no payload, and the
///   engine's error in curlError. Too large a body or inflated body is CURLE_FILESIZE_EXCEEDED, a damaged or
///   unknown encoding CURLE_BAD_CONTENT_ENCODING, a head that is too large or leaves the length of the body
///   in doubt CURLE_WEIRD_SERVER_REPLY, a passed deadline CURLE_OPERATION_TIMEDOUT.
/// - A cancel ends a request with status -1 at once, in whatever state it is, unless its completion has
/// begun.
/// - At the shutdown, functions that wait for their delay run at once, so that what they carry still ends.
/// - An observer's last report can overlap the completion.
///
/// Threads: any may call. Completions, functions and observers run on two workers; a worker that says through
/// WaitingForRequest that it is about to block is replaced for that time.
class ZOPLATFORM_EXPORT NetworkProcessor : public RequestProcessor {
public:
    /// Asked at each start for the settings of that request.
    using SettingsSource = function<shared_ptr<NetworkSettings const>()>;

    explicit NetworkProcessor(SettingsSource inSettings);
    /// With settings of its own.
    explicit NetworkProcessor(const NetworkSettings& inSettings);
    /// Shuts down.
    ~NetworkProcessor() override;
    NetworkProcessor(const NetworkProcessor&) = delete;
    NetworkProcessor& operator=(const NetworkProcessor&) = delete;

    /// Ends all requests with status -1, runs what is left to run and joins the threads. When a completion or
    /// posted function calls it, that worker is let go instead of joined.
    void Shutdown();
    /// For the end of the process: stops the threads, and calls no more completions.
    void Abandon();

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
    void CancelAllRequests() override;
    bool GetStatistics(Statistics& outStatistics) override;

private:
    class Core;
    const std::shared_ptr<Core> mCore;
};

}  // namespace http

/// Makes the network usable again after ostnet::Shutdown, for a library that is started anew in one process.
/// Processors that were handed out before stay shut.
ZOPLATFORM_EXPORT void Startup();

}  // namespace ostnet
