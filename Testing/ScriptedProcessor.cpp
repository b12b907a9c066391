// The scripted processor: one table of requests that are not completed, one queue of what is due, and the
// workers that empty it.
#include "ZOClientTesting/ScriptedProcessor.h"

#include <chrono>
#include <deque>
#include <map>
#include <thread>

#include "ostcore/threads/Mutex.h"
#include "ostcore/threads/Scheduler.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOClientTesting {

using ostcore::threads::ConditionVariable;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;
using ostnet::Response;
using ostnet::http::CompletionFunction;

namespace {

using Deadline = std::chrono::steady_clock::time_point;

Deadline DeadlineIn(std::uint32_t inMilliseconds) {
    return std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
}

shared_ptr<Response> MakeResponse(const ScriptedAnswer& inAnswer, bool inIsHead) {
    if (inAnswer.kind == ScriptedAnswer::Kind::kRespondWithNull) {
        return nullptr;
    }
    auto response = boost::make_shared<Response>(inAnswer.status);
    response->curlError = inAnswer.curlError;
    for (const auto& header : inAnswer.headers) {
        response->headers.emplace(ImmutableString(header.first), ImmutableString(header.second));
    }
    if (inAnswer.hasBody && !inIsHead) {
        response->payload = RecycledMemory::CreateFromBytes(inAnswer.body);
    }
    return response;
}

}  // namespace

std::string RecordedRequest::Header(std::string_view inName) const {
    for (const auto& header : headers) {
        if (ostcore::utility::EqualsIgnoreCaseASCII(header.first, inName)) {
            return header.second;
        }
    }
    return {};
}

std::size_t RecordedRequest::CountHeader(std::string_view inName) const {
    std::size_t count = 0;
    for (const auto& header : headers) {
        count += ostcore::utility::EqualsIgnoreCaseASCII(header.first, inName) ? 1 : 0;
    }
    return count;
}

std::string RecordedRequest::Path() const {
    const std::size_t scheme = url.find("://");
    const std::size_t path = url.find('/', scheme == std::string::npos ? 0 : scheme + 3);
    return path == std::string::npos ? std::string() : url.substr(path);
}

std::string RecordedRequest::Field(std::string_view inName) const {
    for (const auto& field : form) {
        if (field.first == inName) {
            return field.second;
        }
    }
    return {};
}

ScriptedAnswer ScriptedAnswer::Status(std::int32_t inStatus) {
    ScriptedAnswer answer;
    answer.status = inStatus;
    return answer;
}

ScriptedAnswer ScriptedAnswer::Body(std::string inBody, const std::string& inContentType,
                                    std::int32_t inStatus) {
    ScriptedAnswer answer;
    answer.status = inStatus;
    answer.body = std::move(inBody);
    answer.hasBody = true;
    answer.headers.emplace_back("Content-Type", inContentType);
    return answer;
}

ScriptedAnswer ScriptedAnswer::JSON(std::string inBody, std::int32_t inStatus) {
    return Body(std::move(inBody), "application/json;charset=utf-8", inStatus);
}

ScriptedAnswer ScriptedAnswer::NoResponse(std::int32_t inCurlError) {
    ScriptedAnswer answer;
    answer.status = Response::kStatusNoResponse;
    answer.curlError = inCurlError;
    return answer;
}

ScriptedAnswer ScriptedAnswer::NullResponse() {
    ScriptedAnswer answer;
    answer.kind = Kind::kRespondWithNull;
    return answer;
}

ScriptedAnswer ScriptedAnswer::FailStart() {
    ScriptedAnswer answer;
    answer.kind = Kind::kFailStart;
    return answer;
}

ScriptedAnswer ScriptedAnswer::Hold() {
    ScriptedAnswer answer;
    answer.kind = Kind::kHold;
    return answer;
}

ScriptedAnswer&& ScriptedAnswer::With(const std::string& inName, const std::string& inValue) && {
    headers.emplace_back(inName, inValue);
    return std::move(*this);
}

/// All state, shared with the workers so that the processor may go in one of its own completions.
///
/// A request enters the table before its answer is known, so a cancel that comes while the handler still
/// thinks is not lost. Whoever takes the entry out of the table runs the completion: hence exactly once.
class ScriptedProcessor::Core : public boost::enable_shared_from_this<ScriptedProcessor::Core> {
public:
    explicit Core(std::size_t inWorkers) : mWorkerCount(inWorkers) {}

    void StartWorkers() {
        for (std::size_t i = 0; i < mWorkerCount; ++i) {
            mWorkers.emplace_back([self = shared_from_this()] { self->Work(); });
        }
    }

    bool Start(RecordedRequest&& inRequest, const CompletionFunction& inCompletion) {
        std::uint64_t sequence = 0;
        ScriptedAnswer answer;
        Handler handler;
        {
            MutexLock lock(mMutex);
            if (mStopped) {
                return false;
            }
            sequence = ++mLastSequence;
            Pending& pending = mPending[sequence];
            pending.requestID = inRequest.requestID;
            pending.completion = inCompletion;
            pending.isHead = inRequest.verb == "HEAD";
            mRequests.push_back(inRequest);
            if (!TakeExpectation(inRequest, answer)) {
                handler = mHandler;
            }
            mChanged.NotifyAll();
        }
        if (handler) {
            answer = handler(inRequest);
        }
        return Decide(sequence, std::move(answer));
    }

    void Expect(const std::string& inVerb, const std::string& inURL, ScriptedAnswer inAnswer) {
        MutexLock lock(mMutex);
        mExpectations.push_back({inVerb, inURL, std::move(inAnswer)});
    }

    void SetHandler(Handler inHandler) {
        MutexLock lock(mMutex);
        mHandler.swap(inHandler);
    }

    void Cancel(const Guid& inRequestID) {
        MutexLock lock(mMutex);
        for (auto& entry : mPending) {
            if (entry.second.requestID == inRequestID) {
                CancelEntry(entry.first, entry.second);
            }
        }
    }

    std::size_t Release(const Guid* inRequestID, const ScriptedAnswer& inAnswer) {
        MutexLock lock(mMutex);
        std::size_t count = 0;
        for (auto& entry : mPending) {
            Pending& pending = entry.second;
            if (pending.isHeld && (!inRequestID || pending.requestID == *inRequestID)) {
                pending.isHeld = false;
                pending.answer = inAnswer;
                MakeDue(entry.first);
                ++count;
            }
        }
        return count;
    }

    bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelay) {
        if (inDelay == 0) {
            return PostNow(inFunction);
        }
        {
            MutexLock lock(mMutex);
            if (mStopped) {
                return false;
            }
        }
        boost::weak_ptr<Core> weak = shared_from_this();
        const auto timer = ostcore::threads::GetGlobalScheduler()->Schedule(
            std::chrono::milliseconds(inDelay), [weak, inFunction] {
                if (auto self = weak.lock()) {
                    self->PostNow(inFunction);
                }
            });
        return timer != ostcore::threads::Scheduler::kNoTimer;
    }

    /// Runs one thing that is due, on this thread.
    bool RunOne() {
        Due due;
        {
            MutexLock lock(mMutex);
            if (mDue.empty()) {
                return false;
            }
            TakeDue(due);
        }
        Run(due);
        return true;
    }

    void Stop() {
        {
            MutexLock lock(mMutex);
            mStopped = true;
            for (auto& entry : mPending) {
                CancelEntry(entry.first, entry.second);
            }
            mChanged.NotifyAll();
        }
        if (mWorkerCount == 0) {
            while (RunOne()) {
            }
            return;
        }
        JoinWorkers();
    }

    bool WaitForRequests(std::size_t inCount, std::uint32_t inMilliseconds) {
        const Deadline deadline = DeadlineIn(inMilliseconds);
        MutexLock lock(mMutex);
        while (mRequests.size() < inCount) {
            if (!mChanged.WaitUntil(lock, deadline) && mRequests.size() < inCount) {
                return false;
            }
        }
        return true;
    }

    bool WaitUntilIdle(std::uint32_t inMilliseconds) {
        const Deadline deadline = DeadlineIn(inMilliseconds);
        MutexLock lock(mMutex);
        while (!mDue.empty() || mRunning > 0) {
            if (!mChanged.WaitUntil(lock, deadline) && (!mDue.empty() || mRunning > 0)) {
                return false;
            }
        }
        return true;
    }

    std::vector<RecordedRequest> Requests() {
        MutexLock lock(mMutex);
        return mRequests;
    }
    std::size_t RequestCount() {
        MutexLock lock(mMutex);
        return mRequests.size();
    }
    void ClearRequests() {
        MutexLock lock(mMutex);
        mRequests.clear();
    }
    std::size_t PendingCount() {
        MutexLock lock(mMutex);
        return mPending.size();
    }
    std::vector<std::string> Mismatches() {
        MutexLock lock(mMutex);
        std::vector<std::string> result = mMismatches;
        for (const Expectation& expectation : mExpectations) {
            result.push_back("never came: " + expectation.Line());
        }
        return result;
    }
    Statistics GetStatistics() {
        MutexLock lock(mMutex);
        return mStatistics;
    }
    std::size_t WorkerCount() const noexcept { return mWorkerCount; }

private:
    struct Expectation {
        std::string verb;
        std::string url;
        ScriptedAnswer answer;
        std::string Line() const { return verb + " " + (url.empty() ? "(any)" : url); }
    };
    struct Pending {
        Guid requestID;
        CompletionFunction completion;
        ScriptedAnswer answer;
        bool isHead = false;
        bool isHeld = false;
        bool isDecided = false;
        bool isCancelled = false;
    };
    /// Either a request of the table or, with sequence 0, a function.
    struct Due {
        std::uint64_t sequence = 0;
        function<void()> call;
    };

    bool TakeExpectation(const RecordedRequest& inRequest, ScriptedAnswer& outAnswer) ZO_REQUIRES(mMutex) {
        if (!mExpectations.empty()) {
            const Expectation& next = mExpectations.front();
            if (next.verb == inRequest.verb && (next.url.empty() || next.url == inRequest.url)) {
                outAnswer = next.answer;
                mExpectations.pop_front();
                return true;
            }
            if (!mHandler) {
                mMismatches.push_back("expected " + next.Line() + ", got " + inRequest.Line());
            }
        } else if (!mHandler) {
            mMismatches.push_back("nothing expected, got " + inRequest.Line());
        }
        outAnswer = ScriptedAnswer::Status(404);
        return false;
    }

    bool Decide(std::uint64_t inSequence, ScriptedAnswer inAnswer) {
        CompletionFunction dropped;
        MutexLock lock(mMutex);
        const auto found = mPending.find(inSequence);
        if (found == mPending.end()) {
            return true;
        }
        Pending& pending = found->second;
        if (inAnswer.kind == ScriptedAnswer::Kind::kFailStart) {
            dropped.swap(pending.completion);
            mPending.erase(found);
            lock.Unlock();
            return false;
        }
        ++mStatistics.started;
        pending.isDecided = true;
        if (pending.isCancelled) {
            MakeDue(inSequence);
            return true;
        }
        pending.isHeld = inAnswer.kind == ScriptedAnswer::Kind::kHold;
        pending.answer = std::move(inAnswer);
        if (!pending.isHeld) {
            MakeDue(inSequence);
        }
        return true;
    }

    void CancelEntry(std::uint64_t inSequence, Pending& ioPending) ZO_REQUIRES(mMutex) {
        if (ioPending.isCancelled) {
            return;
        }
        ioPending.isCancelled = true;
        ioPending.answer = ScriptedAnswer::Status(Response::kStatusCancelled);
        ++mStatistics.cancelled;
        if (ioPending.isDecided && ioPending.isHeld) {
            ioPending.isHeld = false;
            MakeDue(inSequence);
        }
    }

    void MakeDue(std::uint64_t inSequence) ZO_REQUIRES(mMutex) {
        Due due;
        due.sequence = inSequence;
        mDue.push_back(std::move(due));
        mChanged.NotifyAll();
    }

    bool PostNow(const function<void()>& inFunction) {
        MutexLock lock(mMutex);
        if (mStopped) {
            return false;
        }
        Due due;
        due.call = inFunction;
        mDue.push_back(std::move(due));
        mChanged.NotifyAll();
        return true;
    }

    void TakeDue(Due& outDue) ZO_REQUIRES(mMutex) {
        outDue = std::move(mDue.front());
        mDue.pop_front();
        ++mRunning;
    }

    void Run(Due& ioDue) {
        if (ioDue.sequence != 0) {
            Complete(ioDue.sequence);
        } else {
            ioDue.call();
            ioDue.call.clear();
        }
        MutexLock lock(mMutex);
        --mRunning;
        mChanged.NotifyAll();
    }

    void Complete(std::uint64_t inSequence) {
        Pending pending;
        {
            MutexLock lock(mMutex);
            const auto found = mPending.find(inSequence);
            if (found == mPending.end()) {
                return;
            }
            pending = std::move(found->second);
            mPending.erase(found);
            ++mStatistics.completed;
            mChanged.NotifyAll();
        }
        pending.completion(pending.requestID, MakeResponse(pending.answer, pending.isHead));
    }

    void Work() {
        for (;;) {
            Due due;
            {
                MutexLock lock(mMutex);
                while (mDue.empty()) {
                    if (mStopped && mPending.empty()) {
                        return;
                    }
                    mChanged.Wait(lock);
                }
                TakeDue(due);
            }
            Run(due);
        }
    }

    void JoinWorkers() {
        std::vector<std::thread> workers;
        {
            MutexLock lock(mMutex);
            workers.swap(mWorkers);
        }
        for (std::thread& worker : workers) {
            if (worker.get_id() == std::this_thread::get_id()) {
                worker.detach();
            } else {
                worker.join();
            }
        }
    }

    const std::size_t mWorkerCount;
    mutable Mutex mMutex;
    mutable ConditionVariable mChanged;
    bool mStopped ZO_GUARDED_BY(mMutex) = false;
    std::uint64_t mLastSequence ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mRunning ZO_GUARDED_BY(mMutex) = 0;
    std::map<std::uint64_t, Pending> mPending ZO_GUARDED_BY(mMutex);
    std::deque<Due> mDue ZO_GUARDED_BY(mMutex);
    std::deque<Expectation> mExpectations ZO_GUARDED_BY(mMutex);
    Handler mHandler ZO_GUARDED_BY(mMutex);
    std::vector<RecordedRequest> mRequests ZO_GUARDED_BY(mMutex);
    std::vector<std::string> mMismatches ZO_GUARDED_BY(mMutex);
    Statistics mStatistics ZO_GUARDED_BY(mMutex);
    std::vector<std::thread> mWorkers;
};

shared_ptr<ScriptedProcessor> ScriptedProcessor::Create(std::size_t inWorkers) {
    auto core = boost::make_shared<Core>(inWorkers);
    core->StartWorkers();
    return shared_ptr<ScriptedProcessor>(new ScriptedProcessor(core));
}

ScriptedProcessor::ScriptedProcessor(shared_ptr<Core> inCore) : mCore(std::move(inCore)) {}

ScriptedProcessor::~ScriptedProcessor() {
    mCore->Stop();
}

void ScriptedProcessor::Expect(const std::string& inVerb, const std::string& inURL, ScriptedAnswer inAnswer) {
    mCore->Expect(inVerb, inURL, std::move(inAnswer));
}

void ScriptedProcessor::SetHandler(Handler inHandler) {
    mCore->SetHandler(std::move(inHandler));
}

bool ScriptedProcessor::Release(const Guid& inRequestID, const ScriptedAnswer& inAnswer) {
    return mCore->Release(&inRequestID, inAnswer) > 0;
}

std::size_t ScriptedProcessor::ReleaseHeld(const ScriptedAnswer& inAnswer) {
    return mCore->Release(nullptr, inAnswer);
}

std::vector<RecordedRequest> ScriptedProcessor::Requests() const {
    return mCore->Requests();
}

std::vector<std::string> ScriptedProcessor::Lines() const {
    std::vector<std::string> lines;
    for (const RecordedRequest& request : mCore->Requests()) {
        lines.push_back(request.Line());
    }
    return lines;
}

std::size_t ScriptedProcessor::RequestCount() const {
    return mCore->RequestCount();
}

void ScriptedProcessor::ClearRequests() {
    mCore->ClearRequests();
}

std::vector<std::string> ScriptedProcessor::Mismatches() const {
    return mCore->Mismatches();
}

std::size_t ScriptedProcessor::PendingCount() const {
    return mCore->PendingCount();
}

bool ScriptedProcessor::WaitForRequests(std::size_t inCount, std::uint32_t inMilliseconds) const {
    return mCore->WaitForRequests(inCount, inMilliseconds);
}

bool ScriptedProcessor::WaitUntilIdle(std::uint32_t inMilliseconds) const {
    return mCore->WaitUntilIdle(inMilliseconds);
}

bool ScriptedProcessor::Deliver() {
    return mCore->RunOne();
}

std::size_t ScriptedProcessor::DeliverAll() {
    std::size_t count = 0;
    while (mCore->RunOne()) {
        ++count;
    }
    return count;
}

void ScriptedProcessor::Shutdown() {
    mCore->Stop();
}

bool ScriptedProcessor::Start(RecordedRequest&& inRequest, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, const ostnet::Headers& inHeaders,
                              const ostnet::http::RequestOptions& inOptions) {
    inRequest.url = inURL.str();
    for (const auto& header : inHeaders) {
        inRequest.headers.emplace_back(header.first.str(), header.second.str());
    }
    inRequest.hasObserver = static_cast<bool>(inOptions.observer);
    inRequest.decompressPayload = inOptions.decompressPayload;
    return mCore->Start(std::move(inRequest), inCompletion);
}

namespace {

RecordedRequest Begin(const Guid& inRequestID, const char* inVerb) {
    RecordedRequest request;
    request.requestID = inRequestID;
    request.verb = inVerb;
    return request;
}

RecordedRequest Begin(const Guid& inRequestID, const char* inVerb,
                      const shared_ptr<RecycledMemory const>& inPayload) {
    RecordedRequest request = Begin(inRequestID, inVerb);
    if (inPayload) {
        request.body = std::string(inPayload->view());
    }
    return request;
}

RecordedRequest Begin(const Guid& inRequestID, const char* inVerb, const ostnet::http::Form& inForm) {
    RecordedRequest request = Begin(inRequestID, inVerb);
    request.isForm = true;
    for (const auto& field : inForm) {
        request.form.emplace_back(field.first.str(), field.second);
    }
    return request;
}

}  // namespace

void ScriptedProcessor::TryToCancelRequest(const Guid& inRequestID) {
    mCore->Cancel(inRequestID);
}

bool ScriptedProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, ostnet::Headers inHeaders,
                            const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "GET"), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                             const ImmutableString& inURL, ostnet::Headers inHeaders,
                             const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "HEAD"), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, ostnet::Headers inHeaders,
                            const shared_ptr<RecycledMemory const>& inPayload,
                            const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "PUT", inPayload), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, ostnet::Headers inHeaders,
                            const ostnet::http::Form& inForm, const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "PUT", inForm), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                             const ImmutableString& inURL, ostnet::Headers inHeaders,
                             const shared_ptr<RecycledMemory const>& inPayload,
                             const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "POST", inPayload), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                             const ImmutableString& inURL, ostnet::Headers inHeaders,
                             const ostnet::http::Form& inForm,
                             const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "POST", inForm), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                               const ImmutableString& inURL, ostnet::Headers inHeaders,
                               const ostnet::http::RequestOptions& inOptions) {
    return Start(Begin(inRequestID, "DELETE"), inCompletion, inURL, inHeaders, inOptions);
}

bool ScriptedProcessor::PostFunction(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) {
    return mCore->PostFunction(inFunction, inDelayMilliseconds);
}

bool ScriptedProcessor::WaitingForRequest(const Guid&, std::uint32_t) {
    return mCore->WorkerCount() > 0;
}

bool ScriptedProcessor::GetStatistics(Statistics& outStatistics) {
    outStatistics = mCore->GetStatistics();
    return true;
}

ScopedProcessor::ScopedProcessor(std::size_t inWorkers)
    : mProcessor(ScriptedProcessor::Create(inWorkers)),
      mFormer(ostnet::http::SetGlobalRequestProcessor(mProcessor)) {}

ScopedProcessor::~ScopedProcessor() {
    mProcessor->Shutdown();
    ostnet::http::SetGlobalRequestProcessor(mFormer);
}

}  // namespace ZOClientTesting
