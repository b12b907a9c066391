// One HTTP exchange: what was asked, and the engine's handle while it runs.
#pragma once

#include <curl/curl.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "ostnet/http/detail/HeaderRules.h"
#include "ostnet/http/RequestProcessor.h"
#include "ostnet/NetworkSettings.h"

namespace ostnet {
namespace http {

enum class Verb { kGet, kHead, kPut, kPost, kDelete };
const char* GetVerbName(Verb inVerb) noexcept;

/// The header lines of a request in the engine's own list form, in one block of memory.
class HeaderLines {
public:
    HeaderLines(const Headers& inHeaders, Verb inVerb);
    HeaderLines(const HeaderLines&) = delete;
    HeaderLines& operator=(const HeaderLines&) = delete;
    curl_slist* First() noexcept { return mNodes.data(); }

private:
    void Add(std::string_view inName, std::string_view inSeparator, std::string_view inValue);
    void Link();

    std::string mText;
    std::vector<std::size_t> mOffsets;
    std::vector<curl_slist> mNodes;
};

/// What was asked; constant once the exchange has started.
struct Request {
    Guid id;
    Verb verb = Verb::kGet;
    ImmutableString url;
    bool isSecure = false;
    shared_ptr<RecycledMemory const> payload;
    RequestOptions options;
    shared_ptr<NetworkSettings const> settings;
};

/// An exchange from its start to its completion.
///
/// Three sides touch it, and never the same part at the same time. The request is constant. The transfer
/// (engine handle, head, body, verdict) belongs to the network thread until that hands the exchange over to
/// the workers, once. The completion belongs to whoever has taken the exchange out of the processor's
/// register: a worker with the answer, a cancel, or the shutdown; taking it out is the only claim, so it is
/// called once. A cancel leaves the transfer to the network thread, which drops it in its own time.
class Exchange {
public:
    using Clock = std::chrono::steady_clock;

    Exchange(Request inRequest, const Headers& inHeaders, CompletionFunction inCompletion);

    const Request& GetRequest() const noexcept { return mRequest; }

    /// Notes, on any thread, that nobody wants the transfer any more; one that has not begun never will.
    void MarkDropped() noexcept { mIsDropped = true; }
    bool IsDropped() const noexcept { return mIsDropped; }

    /// For the owner of the completion: hands it over, and leaves none.
    CompletionFunction TakeCompletion() noexcept { return std::exchange(mCompletion, CompletionFunction()); }

    /// Sets what is the same for all exchanges of one kind, once for a handle that serves many.
    static void PrepareHandle(CURL* ioHandle, bool inIsSecure);

    // On the network thread, in this order.
    void Attach(CURL* inHandle, Clock::time_point inNow);
    /// Not CURLE_OK when a deadline has passed.
    CURLcode CheckDeadlines(Clock::time_point inNow);
    /// Ends the transfer with the engine's verdict and gives the handle back.
    CURL* Detach(CURLcode inResult);
    /// Ends an exchange that got no handle.
    void Fail(CURLcode inReason) noexcept { mResult = inReason; }
    CURL* Handle() const noexcept { return mHandle; }

    /// Notes how far the transfer is; true when the observer is to be told, false while it is still being
    /// told.
    bool NoteProgress(std::uint64_t inSent, std::uint64_t inSendTotal, std::uint64_t inReceived,
                      std::uint64_t inReceiveTotal) noexcept;
    /// On a worker: tells the observer what was noted last.
    void ReportProgress();

    // After the hand-over.
    shared_ptr<Response> BuildResponse();
    std::uint64_t BytesReceived() const noexcept { return mBytesReceived; }
    std::uint64_t BytesSent() const noexcept { return mBytesSent; }
    std::uint64_t ConnectionsOpened() const noexcept { return mConnectionsOpened; }

    /// The engine's calls, all on the network thread.
    std::size_t OnHeadLine(std::string_view inLine);
    std::size_t OnBody(std::string_view inBytes);
    int OnAboutToSend();

private:
    bool JudgeField(std::string_view inLine);
    bool JudgeHead();
    bool Refuse(CURLcode inReason) noexcept;
    void MakeRoom(std::size_t inMore);
    void DropSpareRoom();

    const Request mRequest;
    HeaderLines mHeaderLines;
    CompletionFunction mCompletion;
    std::atomic<bool> mIsDropped{false};

    CURL* mHandle = nullptr;
    CURLcode mRefusal = CURLE_OK;
    CURLcode mResult = CURLE_OK;
    int mTimesSent = 0;
    std::int32_t mStatus = 0;

    std::string mHead;
    std::uint32_t mHeadBytes = 0;
    std::uint32_t mHeadLines = 0;
    bool mInHead = false;
    bool mHeadDone = false;
    bool mIsChunked = false;
    std::optional<std::uint64_t> mStatedLength;

    // Made with the exchange, on the caller's thread: they are let go on a worker, not on the network thread.
    shared_ptr<RecycledMemory> mBody;
    std::size_t mRoom = 0;

    Clock::time_point mSpanStart;
    std::uint64_t mSpanBytes = 0;
    bool mWasAlive = false;

    struct Progress {
        std::atomic<bool> isPosted{false};
        std::atomic<std::uint64_t> sent{0}, sendTotal{0}, received{0}, receiveTotal{0};
    } mProgress;

    std::uint64_t mBytesReceived = 0;
    std::uint64_t mBytesSent = 0;
    std::uint64_t mConnectionsOpened = 0;
};

}  // namespace http
}  // namespace ostnet
