#include "ostnet/http/detail/Exchange.h"

#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"

namespace ostnet {
namespace http {
namespace {

using ostcore::utility::EqualsIgnoreCaseASCII;

/// A stated length is believed up to here; a longer body gets its room when this much has really come.
constexpr std::size_t kBelievedLength = 16u << 20;
constexpr std::size_t kFirstRoom = 16u << 10;
constexpr std::size_t kUsualHeadSize = 512;

constexpr std::string_view kAcceptEncoding = "Accept-Encoding";

/// Fields of the message frame: the processor writes them itself.
bool IsFramingHeader(std::string_view inName) {
    return EqualsIgnoreCaseASCII(inName, "Content-Length") ||
           EqualsIgnoreCaseASCII(inName, "Transfer-Encoding") || EqualsIgnoreCaseASCII(inName, "Connection");
}

bool HasBody(Verb inVerb) noexcept {
    return inVerb == Verb::kPut || inVerb == Verb::kPost;
}
bool IsSafe(Verb inVerb) noexcept {
    return inVerb == Verb::kGet || inVerb == Verb::kHead;
}

std::size_t OnHeadLineFromEngine(char* inBytes, std::size_t inUnit, std::size_t inCount, void* inExchange) {
    return static_cast<Exchange*>(inExchange)->OnHeadLine({inBytes, inUnit * inCount});
}
std::size_t OnBodyFromEngine(char* inBytes, std::size_t inUnit, std::size_t inCount, void* inExchange) {
    return static_cast<Exchange*>(inExchange)->OnBody({inBytes, inUnit * inCount});
}
int OnAboutToSendFromEngine(void* inExchange, char*, char*, int, int) {
    return static_cast<Exchange*>(inExchange)->OnAboutToSend();
}

void SetVerb(CURL* ioHandle, Verb inVerb, const RecycledMemory* inPayload) {
    if (HasBody(inVerb)) {
        const std::string_view bytes = inPayload ? inPayload->view() : std::string_view("");
        curl_easy_setopt(ioHandle, CURLOPT_POSTFIELDS, bytes.data());
        curl_easy_setopt(ioHandle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(bytes.size()));
        curl_easy_setopt(ioHandle, CURLOPT_POST, 1L);
    } else if (inVerb == Verb::kHead) {
        curl_easy_setopt(ioHandle, CURLOPT_NOBODY, 1L);
    }
    if (inVerb == Verb::kPut || inVerb == Verb::kDelete) {
        curl_easy_setopt(ioHandle, CURLOPT_CUSTOMREQUEST, GetVerbName(inVerb));
    }
}

/// Back to the state of a fresh handle, a plain GET, without the cost of setting all options anew.
void ResetVerb(CURL* ioHandle, Verb inVerb) {
    if (inVerb == Verb::kGet) {
        return;
    }
    curl_easy_setopt(ioHandle, CURLOPT_POSTFIELDS, nullptr);
    curl_easy_setopt(ioHandle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(-1));
    curl_easy_setopt(ioHandle, CURLOPT_CUSTOMREQUEST, nullptr);
    curl_easy_setopt(ioHandle, CURLOPT_HTTPGET, 1L);
}

std::uint64_t GetOffset(CURL* inHandle, CURLINFO inInfo) {
    curl_off_t value = 0;
    curl_easy_getinfo(inHandle, inInfo, &value);
    return value > 0 ? static_cast<std::uint64_t>(value) : 0;
}

long GetLong(CURL* inHandle, CURLINFO inInfo) {
    long value = 0;
    curl_easy_getinfo(inHandle, inInfo, &value);
    return value;
}

}  // namespace

const char* GetVerbName(Verb inVerb) noexcept {
    switch (inVerb) {
        case Verb::kGet:
            return "GET";
        case Verb::kHead:
            return "HEAD";
        case Verb::kPut:
            return "PUT";
        case Verb::kPost:
            return "POST";
        case Verb::kDelete:
            return "DELETE";
    }
    return "";
}

HeaderLines::HeaderLines(const Headers& inHeaders, Verb inVerb) {
    mText.reserve(512);
    mOffsets.reserve(inHeaders.size() + 3);
    for (const auto& [name, value] : inHeaders) {
        if (!IsFramingHeader(name)) {
            // The engine takes "Name:" for an order to leave a header out, "Name;" for an empty value.
            Add(name, value.empty() ? ";" : ": ", value);
        }
    }
    const auto has = [&inHeaders](std::string_view inName) {
        return std::any_of(inHeaders.begin(), inHeaders.end(), [inName](const auto& inField) {
            return EqualsIgnoreCaseASCII(inField.first, inName);
        });
    };
    if (!has(kAcceptEncoding)) {
        Add(kAcceptEncoding, ": ", "gzip");
    }
    if (HasBody(inVerb)) {
        // Neither of the engine's own additions: no form type, and no wait for "100 Continue".
        if (inHeaders.count(kHEADER_CONTENT_TYPE) == 0) {
            Add(kHEADER_CONTENT_TYPE, ":", "");
        }
        if (inHeaders.count(kHEADER_EXPECT) == 0) {
            Add(kHEADER_EXPECT, ":", "");
        }
    }
    Link();
}

void HeaderLines::Add(std::string_view inName, std::string_view inSeparator, std::string_view inValue) {
    mOffsets.push_back(mText.size());
    mText.append(inName).append(inSeparator).append(inValue).push_back('\0');
}

void HeaderLines::Link() {
    mNodes.resize(mOffsets.size());
    for (std::size_t i = 0; i < mNodes.size(); ++i) {
        mNodes[i].data = mText.data() + mOffsets[i];
        mNodes[i].next = i + 1 < mNodes.size() ? &mNodes[i + 1] : nullptr;
    }
}

Exchange::Exchange(Request inRequest, const Headers& inHeaders, CompletionFunction inCompletion)
    : mRequest(std::move(inRequest)),
      mHeaderLines(inHeaders, mRequest.verb),
      mCompletion(std::move(inCompletion)),
      mBody(RecycledMemory::Create(0)) {
    mHead.reserve(kUsualHeadSize);
}

void Exchange::PrepareHandle(CURL* ioHandle, bool inIsSecure) {
    // HTTP/2 is agreed on within TLS only; there a request waits for a connection that it may share.
    curl_easy_setopt(ioHandle, CURLOPT_HTTP_VERSION,
                     static_cast<long>(inIsSecure ? CURL_HTTP_VERSION_2TLS : CURL_HTTP_VERSION_1_1));
    curl_easy_setopt(ioHandle, CURLOPT_PIPEWAIT, inIsSecure ? 1L : 0L);
    curl_easy_setopt(ioHandle, CURLOPT_HEADERFUNCTION, &OnHeadLineFromEngine);
    curl_easy_setopt(ioHandle, CURLOPT_WRITEFUNCTION, &OnBodyFromEngine);
    curl_easy_setopt(ioHandle, CURLOPT_PREREQFUNCTION, &OnAboutToSendFromEngine);
}

void Exchange::Attach(CURL* inHandle, Clock::time_point inNow) {
    mHandle = inHandle;
    mSpanStart = inNow;
    curl_easy_setopt(inHandle, CURLOPT_URL, mRequest.url.c_str());
    curl_easy_setopt(inHandle, CURLOPT_HTTPHEADER, mHeaderLines.First());
    curl_easy_setopt(inHandle, CURLOPT_PRIVATE, this);
    curl_easy_setopt(inHandle, CURLOPT_HEADERDATA, this);
    curl_easy_setopt(inHandle, CURLOPT_WRITEDATA, this);
    curl_easy_setopt(inHandle, CURLOPT_PREREQDATA, this);
    SetVerb(inHandle, mRequest.verb, mRequest.payload.get());
}

CURL* Exchange::Detach(CURLcode inResult) {
    mResult = mRefusal != CURLE_OK ? mRefusal : inResult;
    if (mResult == CURLE_OK && !mHeadDone) {
        mResult = CURLE_GOT_NOTHING;  // closed within the head, which the engine takes for its end
    }
    mStatus = static_cast<std::int32_t>(GetLong(mHandle, CURLINFO_RESPONSE_CODE));
    mBytesSent = GetOffset(mHandle, CURLINFO_SIZE_UPLOAD_T);
    mConnectionsOpened = static_cast<std::uint64_t>(GetLong(mHandle, CURLINFO_NUM_CONNECTS));
    ResetVerb(mHandle, mRequest.verb);
    curl_easy_setopt(mHandle, CURLOPT_HTTPHEADER, nullptr);
    DropSpareRoom();
    return std::exchange(mHandle, nullptr);
}

bool Exchange::Refuse(CURLcode inReason) noexcept {
    mRefusal = inReason;
    return false;
}

// The engine repeats a request by itself when a kept connection closes before an answer. Only what is safe to
// repeat may go out twice: the server may have done the first one.
int Exchange::OnAboutToSend() {
    if (++mTimesSent > 1 && !IsSafe(mRequest.verb)) {
        Refuse(CURLE_GOT_NOTHING);
        return CURL_PREREQFUNC_ABORT;
    }
    return CURL_PREREQFUNC_OK;
}

std::size_t Exchange::OnHeadLine(std::string_view inLine) {
    const auto& limits = mRequest.settings->limits;
    mHeadBytes += static_cast<std::uint32_t>(inLine.size());
    if (mHeadBytes > limits.maximumHeadSize || ++mHeadLines > limits.maximumHeadLines) {
        Refuse(CURLE_WEIRD_SERVER_REPLY);
        return 0;
    }
    if (mHeadDone) {
        return inLine.size();  // a trailer: nothing here reads them
    }
    if (!mInHead) {
        mInHead = true;
        mHead.clear();
        mStatedLength.reset();
        mIsChunked = false;
        return inLine.size();  // the status line
    }
    const bool isEnd = inLine == "\r\n" || inLine == "\n";
    if (!isEnd) {
        mHead.append(inLine);
        return JudgeField(inLine) ? inLine.size() : 0;
    }
    mInHead = false;
    mWasAlive = true;
    const long status = GetLong(mHandle, CURLINFO_RESPONSE_CODE);
    if (status >= 100 && status < 200) {
        return inLine.size();  // an interim answer; another head follows
    }
    mHeadDone = true;
    return JudgeHead() ? inLine.size() : 0;
}

/// Refuses what would leave the end of the body in doubt (RFC 9112, section 6.3), as the next answer on the
/// connection would then be read from within this one.
bool Exchange::JudgeField(std::string_view inLine) {
    const auto colon = inLine.find(':');
    if (colon == std::string_view::npos) {
        return true;
    }
    const std::string_view name = inLine.substr(0, colon);
    if (EqualsIgnoreCaseASCII(name, "Transfer-Encoding")) {
        mIsChunked = true;
        return true;
    }
    if (!EqualsIgnoreCaseASCII(name, "Content-Length")) {
        return true;
    }
    const auto length = ParseContentLength(TrimBlanks(inLine.substr(colon + 1)));
    if (!length || (mStatedLength && *mStatedLength != *length)) {
        return Refuse(CURLE_WEIRD_SERVER_REPLY);
    }
    mStatedLength = length;
    return true;
}

bool Exchange::JudgeHead() {
    if (mIsChunked && mStatedLength) {
        return Refuse(CURLE_WEIRD_SERVER_REPLY);
    }
    const bool bodyFollows = mRequest.verb != Verb::kHead;
    if (bodyFollows && mStatedLength.value_or(0) > mRequest.settings->limits.maximumBodySize) {
        return Refuse(CURLE_FILESIZE_EXCEEDED);
    }
    return true;
}

std::size_t Exchange::OnBody(std::string_view inBytes) {
    mBytesReceived += inBytes.size();
    if (mBytesReceived > mRequest.settings->limits.maximumBodySize) {
        Refuse(CURLE_FILESIZE_EXCEEDED);
        return 0;
    }
    try {
        MakeRoom(inBytes.size());
        mBody->Append(inBytes.data(), inBytes.size());
    } catch (const std::bad_alloc&) {
        Refuse(CURLE_OUT_OF_MEMORY);
        return 0;
    }
    return inBytes.size();
}

/// A body of unknown length gets all that it may fill at once when it has become long: the system lends pages
/// as they are written, and a long body is never copied, so that it is never held twice.
void Exchange::MakeRoom(std::size_t inMore) {
    const std::size_t needed = mBody->size() + inMore;
    if (needed <= mRoom) {
        return;
    }
    const std::uint64_t most = mStatedLength.value_or(mRequest.settings->limits.maximumBodySize);
    if (needed > kBelievedLength) {
        mRoom = std::max(needed, static_cast<std::size_t>(most));
    } else if (mRoom == 0 && mStatedLength) {
        mRoom = std::max(needed, static_cast<std::size_t>(std::min<std::uint64_t>(most, kBelievedLength)));
    } else {
        mRoom = std::min(std::max({needed, mRoom * 2, kFirstRoom}), kBelievedLength);
    }
    mBody->Reserve(mRoom);
}

void Exchange::DropSpareRoom() {
    if (mRoom == 0 || mResult != CURLE_OK) {
        mBody.reset();
        return;
    }
    if (mRoom > kBelievedLength && mBody->size() < mRoom / 2) {
        mBody = RecycledMemory::CreateFromBytes(mBody->view());
    }
}

CURLcode Exchange::CheckDeadlines(Clock::time_point inNow) {
    if (mTimesSent == 0) {
        return CURLE_OK;  // waits for a connection; the engine keeps the deadline of that
    }
    const auto& limits = mRequest.settings->limits;
    const std::uint64_t sent = GetOffset(mHandle, CURLINFO_SIZE_UPLOAD_T);
    const std::uint64_t moved = sent + mBytesReceived;
    const bool isSending = mRequest.payload && sent < mRequest.payload->size();
    const bool isWaiting = !isSending && !mHeadDone;
    const auto span = inNow - mSpanStart;
    const bool hasMoved = moved - mSpanBytes >= limits.lowSpeedBytes;
    const auto allowed = std::chrono::milliseconds(isWaiting ? limits.responseTimeout : limits.lowSpeedTime);
    if (mWasAlive || (isWaiting && moved != mSpanBytes) || (!isWaiting && span >= allowed && hasMoved)) {
        mWasAlive = false;
        mSpanStart = inNow;
        mSpanBytes = moved;
        return CURLE_OK;
    }
    return span >= allowed ? CURLE_OPERATION_TIMEDOUT : CURLE_OK;
}

bool Exchange::NoteProgress(std::uint64_t inSent, std::uint64_t inSendTotal, std::uint64_t inReceived,
                            std::uint64_t inReceiveTotal) noexcept {
    const bool isNews = mProgress.received.exchange(inReceived) != inReceived;
    if (mProgress.sent.exchange(inSent) == inSent && !isNews) {
        return false;
    }
    mProgress.sendTotal = inSendTotal;
    mProgress.receiveTotal = inReceiveTotal;
    return !mProgress.isPosted.exchange(true);
}

void Exchange::ReportProgress() {
    mProgress.isPosted = false;
    mRequest.options.observer->OnProgress(mProgress.sent, mProgress.sendTotal, mProgress.received,
                                          mProgress.receiveTotal);
}

shared_ptr<Response> Exchange::BuildResponse() {
    const auto response = make_shared<Response>();
    response->curlError = mResult;
    if (mResult != CURLE_OK) {
        return response;
    }
    Headers headers = ParseHead(mHead);
    shared_ptr<RecycledMemory const> payload = std::exchange(mBody, nullptr);
    if (payload && mRequest.options.decompressPayload && !IsPlainEncoded(headers)) {
        const auto outcome = IsGzipEncoded(headers)
                                 ? InflateGzip(payload, mRequest.settings->limits.inflate, payload)
                                 : InflateOutcome::kDamaged;
        if (outcome != InflateOutcome::kInflated) {
            response->curlError =
                outcome == InflateOutcome::kTooLarge ? CURLE_FILESIZE_EXCEEDED : CURLE_BAD_CONTENT_ENCODING;
            return response;
        }
        // They speak of the packed body, which is gone.
        headers.erase(kHEADER_CONTENT_ENCODING);
        headers.erase(ImmutableString("Content-Length"));
    }
    response->status = mStatus;
    response->headers = std::move(headers);
    response->payload = std::move(payload);
    return response;
}

}  // namespace http
}  // namespace ostnet
