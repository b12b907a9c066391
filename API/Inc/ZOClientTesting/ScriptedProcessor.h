// A request processor without a network: records each request exactly and answers by script, so that a host
// can test its use of the client without a hub.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ostnet/http/RequestProcessor.h"

namespace ZOClientTesting {

using ostcore::function;
using ostcore::shared_ptr;
using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;

/// A request as it would have gone out.
struct RecordedRequest {
    Guid requestID;
    /// "GET", "HEAD", "PUT", "POST" or "DELETE".
    std::string verb;
    std::string url;
    /// Name and value of each header, in the order in which they were passed.
    std::vector<std::pair<std::string, std::string>> headers;
    /// Whether the form variant of the verb was called; then form holds the fields and body is empty.
    bool isForm = false;
    std::vector<std::pair<std::string, std::string>> form;
    std::string body;
    bool hasObserver = false;
    bool decompressPayload = true;

    /// "GET http://host/path".
    std::string Line() const { return verb + " " + url; }
    /// The first value under a name (case does not count), empty when there is none.
    std::string Header(std::string_view inName) const;
    std::size_t CountHeader(std::string_view inName) const;
    /// The URL without scheme and authority; empty when there is no path.
    std::string Path() const;
    /// The first value of a form field, empty when there is none.
    std::string Field(std::string_view inName) const;
};

/// What a request is answered with.
struct ScriptedAnswer {
    enum class Kind {
        /// The completion gets a response.
        kRespond,
        /// The completion gets a null response.
        kRespondWithNull,
        /// The start call returns false and the completion never runs.
        kFailStart,
        /// Nothing comes until the request is cancelled or released (Release, ReleaseHeld).
        kHold
    };

    Kind kind = Kind::kRespond;
    std::int32_t status = 200;
    std::int32_t curlError = 0;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
    /// False leaves the payload null; an empty body is otherwise an empty payload.
    bool hasBody = false;

    static ScriptedAnswer Status(std::int32_t inStatus);
    static ScriptedAnswer Body(std::string inBody, const std::string& inContentType,
                               std::int32_t inStatus = 200);
    static ScriptedAnswer JSON(std::string inBody, std::int32_t inStatus = 200);
    /// Status 0 and a transport error code (7, the default, is a refused connection in libcurl's numbers).
    static ScriptedAnswer NoResponse(std::int32_t inCurlError = 7);
    static ScriptedAnswer NullResponse();
    static ScriptedAnswer FailStart();
    /// Held back; the status and all else count when it is released without another answer.
    static ScriptedAnswer Hold();

    /// Adds a header and returns the answer, for chaining.
    ScriptedAnswer&& With(const std::string& inName, const std::string& inValue) &&;
};

/// Stands in for the network. Install it with ostnet::http::SetGlobalRequestProcessor or ScopedProcessor.
///
/// Each request is answered by the oldest expectation when there is one, else by the handler, else with
/// status 404. A request that is not what the oldest expectation expects, or for which there is neither
/// expectation nor handler, is noted as a mismatch.
///
/// Completions run on the processor's own workers, each exactly once, never on the caller's stack; with 0
/// workers they wait until the test calls Deliver, and run on its thread. A cancel ends a request that has
/// not been completed with status -1. PostFunction runs on the same workers; delays are in the time of the
/// global scheduler (install a VirtualScheduler to control it).
///
/// Threads: any. The handler is called on the thread that starts the request, with no lock held.
class ScriptedProcessor final : public ostnet::http::RequestProcessor {
public:
    using Handler = function<ScriptedAnswer(const RecordedRequest& inRequest)>;

    static shared_ptr<ScriptedProcessor> Create(std::size_t inWorkers = 1);
    /// As Shutdown.
    ~ScriptedProcessor() override;
    ScriptedProcessor(const ScriptedProcessor&) = delete;
    ScriptedProcessor& operator=(const ScriptedProcessor&) = delete;

    // --- The script.

    /// Expects a request next, after those expected before. An empty URL matches any.
    void Expect(const std::string& inVerb, const std::string& inURL, ScriptedAnswer inAnswer);
    /// Answers what no expectation waits for.
    void SetHandler(Handler inHandler);
    /// The delayed twin of an answer: completes the held request. False when it is not held.
    bool Release(const Guid& inRequestID, const ScriptedAnswer& inAnswer);
    /// Completes all held requests in order of their start; returns how many.
    std::size_t ReleaseHeld(const ScriptedAnswer& inAnswer);

    // --- What happened.

    std::vector<RecordedRequest> Requests() const;
    /// "VERB URL" of each request in order.
    std::vector<std::string> Lines() const;
    std::size_t RequestCount() const;
    /// Forgets the requests recorded so far; expectations and held requests stay.
    void ClearRequests();
    /// One text for each mismatch, and one for each expectation that was not met.
    std::vector<std::string> Mismatches() const;
    /// The number of started requests whose completion has not begun.
    std::size_t PendingCount() const;

    // --- Waiting and driving.

    /// Waits until so many requests were recorded, at most so long. True: they were.
    bool WaitForRequests(std::size_t inCount, std::uint32_t inMilliseconds = 20000) const;
    /// Waits until no answer is due and no function runs; held requests do not count.
    bool WaitUntilIdle(std::uint32_t inMilliseconds = 20000) const;
    /// Runs the oldest completion or function that is due, on this thread; false when there is none.
    bool Deliver();
    /// Runs until none is due, also what becomes due meanwhile; returns how many ran.
    std::size_t DeliverAll();
    /// Ends all requests with status -1 and waits for their completions, unless called from one of them.
    /// Later starts return false. What was posted with a delay does not run any more.
    void Shutdown();

    // --- RequestProcessor.

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool GET(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
             const ImmutableString& inURL, ostnet::Headers inHeaders,
             const ostnet::http::RequestOptions& inOptions) override;
    bool HEAD(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
              const ImmutableString& inURL, ostnet::Headers inHeaders,
              const ostnet::http::RequestOptions& inOptions) override;
    bool PUT(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
             const ImmutableString& inURL, ostnet::Headers inHeaders,
             const shared_ptr<RecycledMemory const>& inPayload,
             const ostnet::http::RequestOptions& inOptions) override;
    bool PUT(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
             const ImmutableString& inURL, ostnet::Headers inHeaders, const ostnet::http::Form& inForm,
             const ostnet::http::RequestOptions& inOptions) override;
    bool POST(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
              const ImmutableString& inURL, ostnet::Headers inHeaders,
              const shared_ptr<RecycledMemory const>& inPayload,
              const ostnet::http::RequestOptions& inOptions) override;
    bool POST(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
              const ImmutableString& inURL, ostnet::Headers inHeaders, const ostnet::http::Form& inForm,
              const ostnet::http::RequestOptions& inOptions) override;
    bool DELETE(const Guid& inRequestID, const ostnet::http::CompletionFunction& inCompletion,
                const ImmutableString& inURL, ostnet::Headers inHeaders,
                const ostnet::http::RequestOptions& inOptions) override;
    bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) override;
    /// True with workers, which go on while the caller blocks.
    bool WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) override;
    bool GetStatistics(Statistics& outStatistics) override;

private:
    class Core;
    explicit ScriptedProcessor(shared_ptr<Core> inCore);
    bool Start(RecordedRequest&& inRequest, const ostnet::http::CompletionFunction& inCompletion,
               const ImmutableString& inURL, const ostnet::Headers& inHeaders,
               const ostnet::http::RequestOptions& inOptions);

    shared_ptr<Core> mCore;
};

/// Makes a scripted processor the global one for a scope; then shuts it down and puts the former back.
class ScopedProcessor {
public:
    explicit ScopedProcessor(std::size_t inWorkers = 1);
    ~ScopedProcessor();
    ScopedProcessor(const ScopedProcessor&) = delete;
    ScopedProcessor& operator=(const ScopedProcessor&) = delete;

    ScriptedProcessor* operator->() const noexcept { return mProcessor.get(); }
    ScriptedProcessor& operator*() const noexcept { return *mProcessor; }
    const shared_ptr<ScriptedProcessor>& get() const noexcept { return mProcessor; }

private:
    shared_ptr<ScriptedProcessor> mProcessor;
    shared_ptr<ostnet::http::RequestProcessor> mFormer;
};

}  // namespace ZOClientTesting
