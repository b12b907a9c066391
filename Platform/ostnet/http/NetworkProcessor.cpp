#include "ostnet/http/NetworkProcessor.h"

#include <unordered_map>

#include "ostcore/debug/Trace.h"
#include "ostnet/http/detail/DelayedFunctions.h"
#include "ostnet/http/detail/NetworkThread.h"
#include "ostnet/http/detail/WorkerPool.h"
#include "zourl/http/URL.h"

namespace ostnet {
namespace http {
namespace {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

constexpr unsigned kWorkerCount = 2;
constexpr std::size_t kMaximumRequestHead = 256u << 10;
constexpr std::chrono::milliseconds kPatienceAtProcessEnd(2000);

const ostcore::debug::TraceChannel& NetChannel() {
    static const auto* const sChannel = new ostcore::debug::TraceChannel("ostnet");
    return *sChannel;
}

/// Says which request it is and nothing that it carries: no header, no query.
void TraceRequest(int inLevel, std::string_view inWhat, const Request& inRequest, int inStatus, int inError) {
    if (!NetChannel().IsEnabled(inLevel)) {
        return;
    }
    const std::string_view url = inRequest.url;
    ostcore::debug::StructuredText text(inWhat);
    text.Add("request", inRequest.id.ToString()).Add("verb", GetVerbName(inRequest.verb));
    text.Add("uri", url.substr(0, url.find_first_of("?#")));
    text.Add("httpStatusCode", inStatus);
    if (inError != 0) {
        text.Add("CURL Error Code", inError)
            .Add("reason", curl_easy_strerror(static_cast<CURLcode>(inError)));
    }
    Trace(NetChannel(), inLevel, text);
}

/// The URL stays out: one that is not sound can hold anything anywhere.
void TraceRefusal(const Request& inRequest, std::string_view inReason) {
    if (NetChannel().IsEnabled(ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::StructuredText text("A request was refused before anything was sent");
        text.Add("request", inRequest.id.ToString())
            .Add("verb", GetVerbName(inRequest.verb))
            .Add("reason", inReason);
        Trace(NetChannel(), ostcore::debug::kTraceLevel_Error, text);
    }
}

}  // namespace

/// What the processor is, apart from its handle: the register of requests, and the threads.
///
/// The register is the heart of the once-only promise. An exchange stands in it from its start; whoever takes
/// it out, under the lock, owns its completion and must call it. The worker with the answer, a cancel and the
/// shutdown compete for that, and the losers find nothing.
class NetworkProcessor::Core : public std::enable_shared_from_this<Core> {
public:
    explicit Core(SettingsSource inSettings)
        : mSettings(std::move(inSettings)),
          mWorkers(kWorkerCount, [this](Job& ioJob) { Run(ioJob); }),
          mDelayed(std::make_shared<DelayedFunctions>([this](function<void()> inWork) { PostWork(inWork); })),
          mNetwork({[this](NetworkThread::Exchanges& ioEnded) { PostEnded(ioEnded); },
                    [this](const std::shared_ptr<Exchange>& inExchange) {
                        mWorkers.Post({Job::Kind::kProgress, inExchange, {}});
                    },
                    [this] { return mWorkers.MayStall(); }, [this] { mWorkers.WakeOne(); }},
                   mSettings()->limits.maximumConnections) {}

    bool Start(Request inRequest, const Headers& inHeaders, const CompletionFunction& inCompletion);
    void Cancel(const Guid& inRequestID);
    void CancelAll();
    bool Post(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds);
    bool Waiting(const Guid& inRequestID);
    Statistics GetStatistics() const;
    void Shutdown();
    void Abandon();

private:
    using Register = std::unordered_map<Guid, std::shared_ptr<Exchange>>;

    void PostEnded(NetworkThread::Exchanges& ioEnded);
    void PostWork(const function<void()>& inWork) { mWorkers.Post({Job::Kind::kFunction, nullptr, inWork}); }
    void Run(Job& ioJob);
    void CompleteAnswered(const std::shared_ptr<Exchange>& inExchange);
    void CompleteCancelled(Exchange& ioExchange);
    void EndCancelled(const std::shared_ptr<Exchange>& inExchange);
    bool TakeOut(const std::shared_ptr<Exchange>& inExchange);
    bool IsRegistered(const Exchange& inExchange) const;

    const SettingsSource mSettings;

    mutable Mutex mMutex;
    Register mRegister ZO_GUARDED_BY(mMutex);
    bool mIsShut ZO_GUARDED_BY(mMutex) = false;
    bool mIsAbandoned ZO_GUARDED_BY(mMutex) = false;

    std::atomic<std::uint64_t> mStarted{0}, mCompleted{0}, mCancelled{0};
    std::atomic<std::uint64_t> mConnectionsOpened{0}, mBytesReceived{0}, mBytesSent{0};

    // In this order: the network thread, which posts to the workers, ends first.
    WorkerPool mWorkers;
    const std::shared_ptr<DelayedFunctions> mDelayed;
    NetworkThread mNetwork;
};

bool NetworkProcessor::Core::Start(Request inRequest, const Headers& inHeaders,
                                   const CompletionFunction& inCompletion) {
    const auto url = zourl::http::Create(inRequest.url);
    if (!url || !inCompletion || !AreSendable(inHeaders, kMaximumRequestHead)) {
        TraceRefusal(inRequest, url ? "a header, or its completion, is not sound"
                                    : "its URL is not plain http or https");
        return false;
    }
    inRequest.isSecure = url->IsSecure();
    inRequest.settings = mSettings();
    const Guid id = inRequest.id;
    const auto exchange = std::make_shared<Exchange>(std::move(inRequest), inHeaders, inCompletion);
    {
        MutexLock lock(mMutex);
        if (mIsShut || !mRegister.emplace(id, exchange).second) {
            return false;
        }
    }
    mStarted.fetch_add(1, std::memory_order_relaxed);
    // False only when a shutdown has begun since; that ends the request.
    if (!mNetwork.Begin(exchange)) {
        Cancel(id);
    }
    return true;
}

bool NetworkProcessor::Core::TakeOut(const std::shared_ptr<Exchange>& inExchange) {
    MutexLock lock(mMutex);
    const auto found = mRegister.find(inExchange->GetRequest().id);
    if (found == mRegister.end() || found->second != inExchange) {
        return false;
    }
    mRegister.erase(found);
    return true;
}

bool NetworkProcessor::Core::IsRegistered(const Exchange& inExchange) const {
    MutexLock lock(mMutex);
    const auto found = mRegister.find(inExchange.GetRequest().id);
    return found != mRegister.end() && found->second.get() == &inExchange;
}

void NetworkProcessor::Core::Cancel(const Guid& inRequestID) {
    Register::node_type node;
    {
        MutexLock lock(mMutex);
        if (mIsAbandoned) {
            return;
        }
        node = mRegister.extract(inRequestID);
    }
    if (!node.empty()) {
        EndCancelled(node.mapped());
    }
}

/// For whoever has taken the exchange out of the register. A cancel that meets the end of the workers
/// completes its request itself: none but it knows of the request any more.
void NetworkProcessor::Core::EndCancelled(const std::shared_ptr<Exchange>& inExchange) {
    mNetwork.Drop(inExchange);
    if (!mWorkers.Post({Job::Kind::kCancelled, inExchange, {}})) {
        CompleteCancelled(*inExchange);
    }
}

void NetworkProcessor::Core::CancelAll() {
    Register taken;
    {
        MutexLock lock(mMutex);
        if (mIsAbandoned) {
            return;
        }
        taken.swap(mRegister);
    }
    for (const auto& [id, exchange] : taken) {
        EndCancelled(exchange);
    }
}

bool NetworkProcessor::Core::Post(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) {
    {
        MutexLock lock(mMutex);
        if (mIsShut) {
            return false;
        }
    }
    if (inDelayMilliseconds == 0) {
        return mWorkers.Post({Job::Kind::kFunction, nullptr, inFunction});
    }
    return mDelayed->Add(inFunction, inDelayMilliseconds);
}

// A layer above may hold the request back, or send it under an ID of its own; so a worker that says that it
// is about to block is replaced in any case.
bool NetworkProcessor::Core::Waiting(const Guid& inRequestID) {
    const bool goesOn = mWorkers.AboutToBlock();
    MutexLock lock(mMutex);
    return goesOn && mRegister.count(inRequestID) > 0;
}

void NetworkProcessor::Core::PostEnded(NetworkThread::Exchanges& ioEnded) {
    std::vector<Job> jobs;
    jobs.reserve(ioEnded.size());
    for (auto& exchange : ioEnded) {
        jobs.push_back({Job::Kind::kAnswered, std::move(exchange), {}});
    }
    mWorkers.PostAll(jobs);
}

void NetworkProcessor::Core::Run(Job& ioJob) {
    switch (ioJob.kind) {
        case Job::Kind::kFunction:
            ioJob.work();
            break;
        case Job::Kind::kAnswered:
            CompleteAnswered(ioJob.exchange);
            break;
        case Job::Kind::kCancelled:
            CompleteCancelled(*ioJob.exchange);
            break;
        case Job::Kind::kProgress:
            if (IsRegistered(*ioJob.exchange)) {
                ioJob.exchange->ReportProgress();
            }
            break;
    }
}

void NetworkProcessor::Core::CompleteAnswered(const std::shared_ptr<Exchange>& inExchange) {
    mConnectionsOpened.fetch_add(inExchange->ConnectionsOpened(), std::memory_order_relaxed);
    mBytesReceived.fetch_add(inExchange->BytesReceived(), std::memory_order_relaxed);
    mBytesSent.fetch_add(inExchange->BytesSent(), std::memory_order_relaxed);
    shared_ptr<Response> response;
    try {
        response = inExchange->BuildResponse();
    } catch (const std::bad_alloc&) {
        response = make_shared<Response>();
        response->curlError = CURLE_OUT_OF_MEMORY;
    }
    if (!TakeOut(inExchange)) {
        return;  // cancelled meanwhile
    }
    const Request& request = inExchange->GetRequest();
    const bool hasFailed = response->curlError != 0;
    TraceRequest(hasFailed ? ostcore::debug::kTraceLevel_Error : ostcore::debug::kTraceLevel_LifetimeDetail,
                 hasFailed ? "A request got no answer" : "A request was answered", request, response->status,
                 response->curlError);
    mCompleted.fetch_add(1, std::memory_order_relaxed);
    const CompletionFunction completion = inExchange->TakeCompletion();
    completion(request.id, response);
}

void NetworkProcessor::Core::CompleteCancelled(Exchange& ioExchange) {
    mCompleted.fetch_add(1, std::memory_order_relaxed);
    mCancelled.fetch_add(1, std::memory_order_relaxed);
    TraceRequest(ostcore::debug::kTraceLevel_LifetimeDetail, "A request was cancelled",
                 ioExchange.GetRequest(), Response::kStatusCancelled, 0);
    const CompletionFunction completion = ioExchange.TakeCompletion();
    completion(ioExchange.GetRequest().id, make_shared<Response>(Response::kStatusCancelled));
}

RequestProcessor::Statistics NetworkProcessor::Core::GetStatistics() const {
    Statistics statistics;
    statistics.started = mStarted;
    statistics.completed = mCompleted;
    statistics.cancelled = mCancelled;
    statistics.connectionsOpened = mConnectionsOpened;
    statistics.bytesReceived = mBytesReceived;
    statistics.bytesSent = mBytesSent;
    return statistics;
}

void NetworkProcessor::Core::Shutdown() {
    {
        MutexLock lock(mMutex);
        mIsShut = true;
    }
    CancelAll();
    for (const auto& work : mDelayed->TakeAll()) {
        PostWork(work);
    }
    mNetwork.Stop();
    mWorkers.Stop();
}

void NetworkProcessor::Core::Abandon() {
    {
        MutexLock lock(mMutex);
        mIsShut = true;
        mIsAbandoned = true;
    }
    mNetwork.Stop();
    mWorkers.Abandon(kPatienceAtProcessEnd);
}

NetworkProcessor::NetworkProcessor(SettingsSource inSettings)
    : mCore(std::make_shared<Core>(std::move(inSettings))) {}

NetworkProcessor::NetworkProcessor(const NetworkSettings& inSettings)
    : NetworkProcessor(SettingsSource([settings = shared_ptr<NetworkSettings const>(
                                           make_shared<NetworkSettings>(inSettings))] { return settings; })) {
}

NetworkProcessor::~NetworkProcessor() {
    Shutdown();
}

void NetworkProcessor::Shutdown() {
    mCore->Shutdown();
}

void NetworkProcessor::Abandon() {
    mCore->Abandon();
}

void NetworkProcessor::TryToCancelRequest(const Guid& inRequestID) {
    mCore->Cancel(inRequestID);
}

bool NetworkProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders, const RequestOptions& inOptions) {
    return mCore->Start({inRequestID, Verb::kGet, inURL, false, {}, inOptions, {}}, inHeaders, inCompletion);
}

bool NetworkProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders,
                            const RequestOptions& inOptions) {
    return mCore->Start({inRequestID, Verb::kHead, inURL, false, {}, inOptions, {}}, inHeaders, inCompletion);
}

bool NetworkProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders,
                           const shared_ptr<RecycledMemory const>& inPayload,
                           const RequestOptions& inOptions) {
    return mCore->Start({inRequestID, Verb::kPut, inURL, false, inPayload, inOptions, {}}, inHeaders,
                        inCompletion);
}

bool NetworkProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                           const RequestOptions& inOptions) {
    const auto payload = ConvertFormToPayload(inForm, inHeaders);
    return payload && PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), payload, inOptions);
}

bool NetworkProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders,
                            const shared_ptr<RecycledMemory const>& inPayload,
                            const RequestOptions& inOptions) {
    return mCore->Start({inRequestID, Verb::kPost, inURL, false, inPayload, inOptions, {}}, inHeaders,
                        inCompletion);
}

bool NetworkProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                            const RequestOptions& inOptions) {
    const auto payload = ConvertFormToPayload(inForm, inHeaders);
    return payload && POST(inRequestID, inCompletion, inURL, std::move(inHeaders), payload, inOptions);
}

bool NetworkProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, Headers inHeaders,
                              const RequestOptions& inOptions) {
    return mCore->Start({inRequestID, Verb::kDelete, inURL, false, {}, inOptions, {}}, inHeaders,
                        inCompletion);
}

bool NetworkProcessor::PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) {
    return mCore->Post(inFunction, inDelayMilliseconds);
}

bool NetworkProcessor::WaitingForRequest(const Guid& inRequestID, std::uint32_t) {
    return mCore->Waiting(inRequestID);
}

void NetworkProcessor::CancelAllRequests() {
    mCore->CancelAll();
}

bool NetworkProcessor::GetStatistics(Statistics& outStatistics) {
    outStatistics = mCore->GetStatistics();
    return true;
}

}  // namespace http
}  // namespace ostnet
