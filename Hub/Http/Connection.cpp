// One connection of a client.
#include "Http/Connection.h"

#include <boost/asio/dispatch.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/write.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/core/tcp_stream.hpp>
#include <boost/beast/http/error.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/ssl/ssl_stream.hpp>
#include <type_traits>
#include <utility>

#include "Base/Error.h"
#include "Base/Text.h"
#include "Http/FaultySender.h"
#include "Http/RequestReader.h"

namespace zohub {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = beast::http;

namespace {

using SteadyClock = std::chrono::steady_clock;
using PlainStream = beast::tcp_stream;
using TlsStream = beast::ssl_stream<beast::tcp_stream>;

constexpr std::size_t kWriteStep = 256 * 1024;
// A body up to here leaves in one piece with its head.
constexpr std::size_t kJoinUpTo = 8 * 1024;
constexpr std::size_t kPackFrom = 1024;
constexpr std::size_t kMaxSignInsWaiting = 64;
constexpr std::size_t kMaxDrained = 4 << 20;
constexpr std::chrono::seconds kLinger{2};

// An answer as it goes out.
struct Outgoing {
    std::string head;
    std::shared_ptr<std::string const> body;  // null for none
    bool keepAlive = false;
};

bool IsWorthPacking(Response const& inResponse) {
    if (!inResponse.body || inResponse.body->Size() < kPackFrom)
        return false;
    std::string_view const type = inResponse.contentType;
    return type.substr(0, 16) == "application/json" || type.substr(0, 5) == "text/" ||
           type.find("xml") != std::string_view::npos;
}

Outgoing MakeOutgoing(Response const& inResponse, bool inIsHead, bool inAcceptsGzip, bool inKeepAlive) {
    Outgoing out;
    out.keepAlive = inKeepAlive && !inResponse.closeAfter;
    std::size_t length = 0;
    bool const isPacked = inAcceptsGzip && IsWorthPacking(inResponse);
    if (inResponse.body && inResponse.status != 204 && inResponse.status != 304) {
        out.body = isPacked ? inResponse.body->Packed()
                            : std::shared_ptr<std::string const>(inResponse.body, &inResponse.body->Plain());
        length = out.body->size();
    }
    out.head = WriteResponseHead(inResponse, length, isPacked, out.keepAlive);
    if (inIsHead)
        out.body.reset();
    return out;
}

template <class Stream>
class Connection : public std::enable_shared_from_this<Connection<Stream>> {
public:
    Connection(ServerCore& inCore, Stream&& inStream, std::string inPeer,
               std::shared_ptr<asio::ssl::context> inTls)
        : mCore(inCore), mTls(std::move(inTls)), mStream(std::move(inStream)), mPeer(std::move(inPeer)) {}

    ~Connection() {
        ReleaseBodyBytes();
        if (mIsRegistered)
            mCore.Unregister(this);
    }

    void Start() {
        auto const weak = this->weak_from_this();
        ServerCore::Handle handle;
        handle.endWhenIdle = [weak] { Ask(weak, &Connection::CloseIfIdle); };
        handle.endNow = [weak] { Ask(weak, &Connection::Close); };
        mIsRegistered = mCore.Register(this, std::move(handle));
        asio::dispatch(mStream.get_executor(), [self = Self()] { self->Begin(); });
    }

private:
    static constexpr bool kIsSecure = std::is_same_v<Stream, TlsStream>;

    static void Ask(std::weak_ptr<Connection> const& inWeak, void (Connection::*inWhat)()) {
        if (auto const self = inWeak.lock())
            asio::post(self->mStream.get_executor(), [self, inWhat] { ((*self).*inWhat)(); });
    }

    std::shared_ptr<Connection> Self() { return this->shared_from_this(); }
    beast::tcp_stream& Lowest() { return beast::get_lowest_layer(mStream); }

    void Begin() {
        beast::error_code ignored;
        Lowest().socket().set_option(asio::ip::tcp::no_delay(true), ignored);
        if constexpr (kIsSecure) {
            Lowest().expires_after(mCore.limits.header);
            mStream.async_handshake(asio::ssl::stream_base::server,
                                    [self = Self()](beast::error_code inError) {
                                        if (inError)
                                            return self->Close();
                                        self->Greet();
                                    });
        } else {
            Greet();
        }
    }

    void Greet() {
        if (mIsRegistered)
            return WaitForRequest();
        mUnread = true;
        Refuse(Failure(503, "too-many-connections", "The server has too many connections; try again later."));
    }

    // Waits, for a long time if need be, for the first byte; from then on the head has its own short
    // deadline.
    void WaitForRequest() {
        if (mCore.isStopping)
            return CloseGently();
        if (mBuffer.size() != 0)
            return ReadHead();
        mIsIdle = true;
        Lowest().expires_after(mCore.limits.idle);
        mStream.async_read_some(mBuffer.prepare(4096),
                                [self = Self()](beast::error_code inError, std::size_t inCount) {
                                    self->mIsIdle = false;
                                    if (inError)
                                        return self->CloseGently();
                                    self->mBuffer.commit(inCount);
                                    self->ReadHead();
                                });
    }

    void ReadHead() {
        mParser.emplace();
        mParser->header_limit(mCore.limits.maxHeader);
        mParser->body_limit(boost::none);
        mStarted = SteadyClock::now();
        mUnread = true;
        Lowest().expires_after(mCore.limits.header);
        http::async_read_header(mStream, mBuffer, *mParser,
                                [self = Self()](beast::error_code inError, std::size_t) {
                                    if (inError)
                                        return self->OnReadFailed(inError);
                                    self->OnHead();
                                });
    }

    void OnHead() {
        auto const& head = mParser->get();
        try {
            std::optional<std::uint64_t> length;
            if (mParser->content_length())
                length = *mParser->content_length();
            CheckHead(head.base(), length, mCore.limits);
            mParser->body_limit(BodyLimitFor(head.base(), mCore.limits));
        } catch (Failure const& failure) {
            return Refuse(failure);
        }
        auto const expect = head[http::field::expect];
        bool const wantsContinue = EqualIgnoringCase({expect.data(), expect.size()}, "100-continue");
        if (wantsContinue && !mParser->is_done())
            return WriteContinue();
        ReadBody();
    }

    void WriteContinue() {
        static constexpr std::string_view kContinue = "HTTP/1.1 100 Continue\r\n\r\n";
        asio::async_write(mStream, asio::buffer(kContinue.data(), kContinue.size()),
                          [self = Self()](beast::error_code inError, std::size_t) {
                              if (inError)
                                  return self->Close();
                              self->ReadBody();
                          });
    }

    void ReadBody() {
        if (mParser->is_done()) {
            mUnread = false;
            return Handle();
        }
        std::size_t const received = mParser->get().body().size();
        if (!ReserveBodyBytes(received))
            return Refuse(Failure(503, "too-much-in-flight",
                                  "The server is receiving as much as it can; try again in a moment."));
        Lowest().expires_at(Deadline(received));
        http::async_read_some(mStream, mBuffer, *mParser,
                              [self = Self()](beast::error_code inError, std::size_t) {
                                  if (inError)
                                      return self->OnReadFailed(inError);
                                  self->ReadBody();
                              });
    }

    // So much has moved since mStarted: by when must the next piece have come?
    SteadyClock::time_point Deadline(std::size_t inMoved) const {
        auto const earned = std::chrono::milliseconds(inMoved * 1000 / mCore.limits.minimumRate);
        return mStarted + mCore.limits.bodyGrace + earned;
    }

    bool ReserveBodyBytes(std::size_t inReceived) {
        if (inReceived > mReserved) {
            mCore.bodyBytes += inReceived - mReserved;
            mReserved = inReceived;
        }
        return mCore.bodyBytes <= mCore.limits.maxBodiesInFlight;
    }

    void ReleaseBodyBytes() {
        mCore.bodyBytes -= mReserved;
        mReserved = 0;
    }

    void OnReadFailed(beast::error_code inError) {
        if (inError == http::error::header_limit || inError == http::error::buffer_overflow)
            return Refuse(Failure(431, "headers-too-large", "The head of the request is too large."));
        if (inError == http::error::body_limit)
            return Refuse(Failure(413, "body-too-large", "The body is larger than this server accepts."));
        bool const isOurs = inError.category() == http::make_error_code(http::error::bad_method).category();
        bool const isCut = inError == http::error::end_of_stream || inError == http::error::partial_message;
        if (isOurs && !isCut)
            return Refuse(Failure(400, "request-malformed", "The request is not valid HTTP."));
        Close();
    }

    // Answers without a route and ends the connection, since what follows on it cannot be trusted.
    void Refuse(Failure const& inFailure) {
        Response response = ErrorResponse(inFailure.Status(), inFailure.Code(), inFailure.what());
        response.closeAfter = true;
        if (inFailure.Status() == 503)
            response.headers.emplace_back("Retry-After", "1");
        mStarted = SteadyClock::now();
        Send(MakeOutgoing(response, false, false, false));
    }

    void Handle() {
        Request request;
        bool const keepAlive = mParser->get().keep_alive();
        try {
            Lowest().expires_never();
            auto message = mParser->release();
            mParser.reset();
            request = MakeRequest(std::move(message), kIsSecure, mPeer, mCore.limits);
        } catch (Failure const& failure) {
            return Refuse(failure);
        }
        if (!mCore.faultOf)
            return Dispatch(std::move(request), keepAlive);
        mPlan = mCore.faultOf(request);
        if (mPlan.isRefused)
            return Reset();
        if (mPlan.delay.count() == 0)
            return Dispatch(std::move(request), keepAlive);
        mFaultTimer.expires_after(mPlan.delay);
        mFaultTimer.async_wait(
            [self = Self(), request = std::move(request), keepAlive](beast::error_code inError) mutable {
                if (!inError)
                    self->Dispatch(std::move(request), keepAlive);
            });
    }

    void Dispatch(Request inRequest, bool inKeepAlive) {
        Lane const lane = mCore.laneOf(inRequest);
        if (lane == Lane::SignIn && ++mCore.signInsWaiting > kMaxSignInsWaiting) {
            --mCore.signInsWaiting;
            return Refuse(
                Failure(503, "too-many-logins", "Too many sign-ins at once; try again in a moment."));
        }
        asio::post(mCore.PoolOf(lane),
                   [self = Self(), request = std::move(inRequest), inKeepAlive, lane]() mutable {
                       Outgoing out = self->Work(std::move(request), inKeepAlive);
                       if (lane == Lane::SignIn)
                           --self->mCore.signInsWaiting;
                       // The executor is copied out: once posted, the connection may end on another thread.
                       auto const executor = self->mStream.get_executor();
                       asio::post(executor, [self = std::move(self), out = std::move(out)]() mutable {
                           self->ReleaseBodyBytes();
                           self->mStarted = SteadyClock::now();
                           self->Send(std::move(out));
                       });
                   });
    }

    // On a worker. Packing can run out of memory; the client shall hear of it all the same.
    Outgoing Work(Request inRequest, bool inKeepAlive) const {
        bool const isHead = inRequest.method == "HEAD";
        try {
            Response const response = Answer(inRequest);
            return MakeOutgoing(response, isHead, AcceptsGzip(inRequest), inKeepAlive && !mCore.isStopping);
        } catch (std::exception const&) {
            return MakeOutgoing(ErrorResponse(500, "internal-error", "The hub could not make its answer."),
                                isHead, false, false);
        }
    }

    Response Answer(Request const& inRequest) const {
        if (mPlan.beforeWork)
            mPlan.beforeWork(inRequest);
        Response const response = mPlan.insteadOfWork ? *mPlan.insteadOfWork : mCore.handler(inRequest);
        return mPlan.insteadOfAnswer ? *mPlan.insteadOfAnswer : response;
    }

    void Send(Outgoing inOutgoing) {
        mOutgoing = std::move(inOutgoing);
        mWritten = 0;
        if (mPlan.ending != FaultPlan::Ending::Whole)
            return SendFaulty();
        Lowest().expires_at(Deadline(0));
        std::size_t const size = mOutgoing.body ? mOutgoing.body->size() : 0;
        std::size_t const joined = size <= kJoinUpTo ? size : 0;
        if (joined > 0)
            mOutgoing.head.append(*mOutgoing.body);
        // One buffer a write: the secure stream reports a sequence as written when its first part is.
        asio::async_write(mStream, asio::buffer(mOutgoing.head),
                          [self = Self(), joined](beast::error_code inError, std::size_t) {
                              self->OnWritten(inError, joined);
                          });
    }

    void SendFaulty() {
        Lowest().expires_never();
        std::string const body = mOutgoing.body ? *mOutgoing.body : std::string();
        std::make_shared<FaultySender<Stream>>(mStream, mFaultTimer, mOutgoing.head, body,
                                               std::exchange(mPlan, FaultPlan()),
                                               [self = Self()](AfterFault inNext) {
                                                   if (inNext == AfterFault::GoOn)
                                                       return self->OnSent();
                                                   if (inNext == AfterFault::Reset)
                                                       return self->Reset();
                                                   self->CloseGently();
                                               })
            ->Step();
    }

    void OnWritten(beast::error_code inError, std::size_t inCount) {
        if (inError)
            return Close();
        mWritten += inCount;
        std::size_t const total = mOutgoing.body ? mOutgoing.body->size() : 0;
        if (mWritten >= total)
            return OnSent();
        std::size_t const step = std::min(kWriteStep, total - mWritten);
        Lowest().expires_at(Deadline(mWritten));
        asio::async_write(mStream, asio::buffer(mOutgoing.body->data() + mWritten, step),
                          [self = Self(), step](beast::error_code inNextError, std::size_t) {
                              self->OnWritten(inNextError, step);
                          });
    }

    void OnSent() {
        bool const goesOn = mOutgoing.keepAlive;
        mOutgoing = Outgoing();
        if (goesOn)
            return WaitForRequest();
        if (mUnread)
            return Linger();
        CloseGently();
    }

    // A client that is still sending would lose the answer if the socket were closed under it.
    void Linger() {
        beast::error_code ignored;
        Lowest().socket().shutdown(asio::ip::tcp::socket::shutdown_send, ignored);
        Lowest().expires_after(kLinger);
        mBuffer.clear();
        mDrained = 0;
        Drain();
    }

    void Drain() {
        Lowest().async_read_some(mBuffer.prepare(16 * 1024),
                                 [self = Self()](beast::error_code inError, std::size_t inCount) {
                                     self->mDrained += inCount;
                                     if (inError || self->mDrained > kMaxDrained)
                                         return self->Close();
                                     self->Drain();
                                 });
    }

    void CloseGently() {
        if constexpr (kIsSecure) {
            Lowest().expires_after(kLinger);
            mStream.async_shutdown([self = Self()](beast::error_code) { self->Close(); });
        } else {
            beast::error_code ignored;
            Lowest().socket().shutdown(asio::ip::tcp::socket::shutdown_both, ignored);
            Close();
        }
    }

    void CloseIfIdle() {
        if (mIsIdle)
            Close();
    }

    void Reset() {
        beast::error_code ignored;
        Lowest().socket().set_option(asio::socket_base::linger(true, 0), ignored);
        Close();
    }

    void Close() {
        mFaultTimer.cancel();
        Lowest().close();
    }

    ServerCore& mCore;
    std::shared_ptr<asio::ssl::context> const mTls;
    Stream mStream;
    std::string const mPeer;
    beast::flat_buffer mBuffer{128 * 1024};
    std::optional<BodyParser> mParser;
    SteadyClock::time_point mStarted;
    FaultPlan mPlan;  // for the request that is being handled
    asio::steady_timer mFaultTimer{mStream.get_executor()};
    Outgoing mOutgoing;
    std::size_t mWritten = 0;
    std::size_t mReserved = 0;
    std::size_t mDrained = 0;
    bool mUnread = false;
    bool mIsIdle = false;
    bool mIsRegistered = false;
};

}  // namespace

void StartConnection(ServerCore& inCore, asio::ip::tcp::socket inSocket,
                     std::shared_ptr<asio::ssl::context> inTls) {
    beast::error_code error;
    auto const endpoint = inSocket.remote_endpoint(error);
    std::string peer = error ? std::string() : endpoint.address().to_string();
    beast::tcp_stream stream(std::move(inSocket));
    if (!inTls) {
        std::make_shared<Connection<PlainStream>>(inCore, std::move(stream), std::move(peer), nullptr)
            ->Start();
        return;
    }
    TlsStream secure(std::move(stream), *inTls);
    std::make_shared<Connection<TlsStream>>(inCore, std::move(secure), std::move(peer), std::move(inTls))
        ->Start();
}

}  // namespace zohub
