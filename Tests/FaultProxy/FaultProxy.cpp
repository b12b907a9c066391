// The proxy's listening socket, its connections, and what is done to each request.
//
// All of it runs on one thread, so nothing is shared but what the public calls post to that thread.
#include "FaultProxy.h"

#include <fcntl.h>

#include <algorithm>
#include <boost/asio/co_spawn.hpp>
#include <boost/asio/connect.hpp>
#include <boost/asio/detached.hpp>
#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/use_awaitable.hpp>
#include <boost/asio/write.hpp>
#include <boost/system/system_error.hpp>
#include <future>
#include <set>
#include <thread>

#include "HttpFraming.h"

namespace faultproxy {

namespace asio = boost::asio;
using asio::ip::tcp;
using boost::system::error_code;

namespace {

constexpr std::size_t kMaximumLog = 10000;
constexpr std::size_t kTricklePieces = 32;
constexpr std::string_view kContinue = "HTTP/1.1 100 Continue\r\n\r\n";
constexpr std::string_view kGarbage = "\x16\x03\x01 this is no HTTP \xff\xfe\r\n<html>500</html>\r\n\r\n";

/// A child that inherits a socket would keep it open when it is closed here.
template <class AnySocket>
void KeepFromChildren(AnySocket& ioSocket) {
    fcntl(ioSocket.native_handle(), F_SETFD, FD_CLOEXEC);
}

/// One connection of a client and the one to the hub that belongs to it.
struct Link {
    explicit Link(tcp::socket inClient, std::size_t inNumber)
        : number(inNumber),
          client(std::move(inClient)),
          hub(client.get_executor()),
          timer(client.get_executor()),
          fromClient(client),
          fromHub(hub) {}

    const std::size_t number;
    tcp::socket client;
    tcp::socket hub;
    asio::steady_timer timer;
    MessageReader fromClient;
    MessageReader fromHub;
    std::string previousAnswer;

    static void Reset(tcp::socket& ioSocket) {
        error_code ignored;
        ioSocket.set_option(asio::socket_base::linger(true, 0), ignored);
        ioSocket.close(ignored);
    }
    void ResetBoth() {
        Reset(client);
        Reset(hub);
        timer.cancel();
    }
    void CloseBoth() {
        error_code ignored;
        client.shutdown(tcp::socket::shutdown_send, ignored);
        client.close(ignored);
        hub.close(ignored);
    }
};

/// A request that has come in, and where its log entry is.
struct Request {
    std::string head;
    std::string body;
    BodyFraming framing;
    RequestLine line;
    Fault fault;
    std::size_t number = 0;
    std::size_t era = 0;
};

struct Answer {
    std::string head;
    std::string body;

    std::string Bytes() const { return head + body; }
};

/// How many of so many bytes come before the cut.
std::size_t PlaceIn(std::size_t inSize, std::uint32_t inShare) {
    return inSize * inShare / 1000;
}

asio::awaitable<void> Write(tcp::socket& ioSocket, std::string_view inBytes) {
    co_await asio::async_write(ioSocket, asio::buffer(inBytes.data(), inBytes.size()), asio::use_awaitable);
}

asio::awaitable<void> Pause(Link& ioLink, std::uint32_t inMilliseconds) {
    ioLink.timer.expires_after(std::chrono::milliseconds(inMilliseconds));
    co_await ioLink.timer.async_wait(asio::use_awaitable);
}

}  // namespace

std::string LogEntry::Describe() const {
    return "#" + std::to_string(number) + " [" + std::to_string(connection) + "] " + request.method + " " +
           request.path + ": " + fault.Describe() + ", hub " +
           (hubStatus == 0 ? std::string("not heard") : std::to_string(hubStatus)) + ", " +
           (end.empty() ? "under way" : end);
}

class FaultProxy::Implementation {
public:
    Implementation(std::uint16_t inHubPort, Schedule inSchedule, std::uint16_t inOwnPort)
        : mHubPort(inHubPort),
          mSchedule(std::move(inSchedule)),
          mWork(asio::make_work_guard(mIO)),
          mPlaceholder(mIO),
          mAcceptor(mIO),
          mRestoreTimer(mIO) {
        // Bound and never listening, it keeps the port from others while new connections are refused.
        mPlaceholder.open(tcp::v4());
        KeepFromChildren(mPlaceholder);
        mPlaceholder.set_option(asio::socket_base::reuse_address(true));
        mPlaceholder.bind({asio::ip::address_v4::loopback(), inOwnPort});
        mPort = mPlaceholder.local_endpoint().port();
        Listen();
        mThread = std::thread([this] { mIO.run(); });
    }

    ~Implementation() {
        Do([this] {
            mIsCut = true;
            Refuse();
            ResetAll();
            mWork.reset();
        });
        mThread.join();
    }

    /// Runs it on the proxy's thread and waits.
    template <class Function>
    void Do(Function inFunction) const {
        std::promise<void> done;
        asio::post(mIO, [&] {
            inFunction();
            done.set_value();
        });
        done.get_future().wait();
    }

    std::uint16_t Port() const { return mPort; }

    // --- On the proxy's thread.

    void Follow(Schedule inSchedule) {
        mSchedule = std::move(inSchedule);
        mNext = 0;
        ++mEra;
        mLog.clear();
    }
    void BeGood() {
        mSchedule = nullptr;
        mRestoreTimer.cancel();
        if (!mIsCut) {
            Listen();
        }
    }
    void SetHubPort(std::uint16_t inPort) { mHubPort = inPort; }
    void Cut() {
        mIsCut = true;
        Refuse();
        ResetAll();
    }
    void Restore() {
        mIsCut = false;
        Listen();
    }
    const std::vector<LogEntry>& Log() const { return mLog; }
    std::size_t RequestCount() const { return mNext; }

private:
    void Listen() {
        if (mAcceptor.is_open()) {
            return;
        }
        mAcceptor.open(tcp::v4());
        KeepFromChildren(mAcceptor);
        mAcceptor.set_option(asio::socket_base::reuse_address(true));
        mAcceptor.bind({asio::ip::address_v4::loopback(), mPort});
        mAcceptor.listen();
        asio::co_spawn(mIO, Accept(), asio::detached);
    }
    void Refuse() {
        mRestoreTimer.cancel();
        error_code ignored;
        mAcceptor.close(ignored);
    }
    void RefuseFor(std::uint32_t inMilliseconds) {
        Refuse();
        mRestoreTimer.expires_after(std::chrono::milliseconds(inMilliseconds));
        mRestoreTimer.async_wait([this](error_code inError) {
            if (!inError && !mIsCut) {
                Listen();
            }
        });
    }
    void ResetAll() {
        for (const auto& link : mLinks) {
            link->ResetBoth();
        }
    }

    asio::awaitable<void> Accept() {
        try {
            for (;;) {
                tcp::socket client = co_await mAcceptor.async_accept(asio::use_awaitable);
                KeepFromChildren(client);
                client.set_option(tcp::no_delay(true));
                const auto link = std::make_shared<Link>(std::move(client), mConnections++);
                mLinks.insert(link);
                asio::co_spawn(mIO, Serve(link), asio::detached);
            }
        } catch (const boost::system::system_error&) {
            // Closed, until it listens again.
        }
    }

    asio::awaitable<void> Serve(std::shared_ptr<Link> inLink) {
        try {
            bool goesOn = true;
            while (goesOn) {
                goesOn = co_await ServeOne(*inLink);
            }
        } catch (const boost::system::system_error&) {
            // One of the two sides has gone.
        }
        inLink->CloseBoth();
        mLinks.erase(inLink);
    }

    /// Whether the connection may carry another request.
    asio::awaitable<bool> ServeOne(Link& ioLink) {
        Request request;
        request.head = co_await ioLink.fromClient.ReadHead();
        Enter(ioLink, request);
        try {
            const bool isThrough = co_await Receive(ioLink, request);
            if (!isThrough) {
                co_return Ended(request, "cut before the work");
            }
            if (request.fault.kind == FaultKind::kStatusWithoutWork) {
                co_await Write(ioLink.client, OwnAnswer(request.fault.status, request.line.method));
                Note(request, "answered here");
                co_return true;
            }
            if (request.fault.kind == FaultKind::kGarbageWithoutWork) {
                co_await Write(ioLink.client, kGarbage);
                co_return Ended(request, "garbage");
            }
            const Answer answer = co_await AskHub(ioLink, request);
            const bool goesOn = co_await Deliver(ioLink, request, answer);
            ioLink.previousAnswer = answer.Bytes();
            co_return goesOn && !AsksToClose(answer.head) && !AsksToClose(request.head);
        } catch (const boost::system::system_error& error) {
            Note(request, "broke off: " + error.code().message());
            throw;
        }
    }

    void Enter(const Link& inLink, Request& outRequest) {
        outRequest.line = ReadRequestLine(outRequest.head);
        outRequest.framing = FramingOfRequest(outRequest.head);
        outRequest.number = mNext++;
        outRequest.era = mEra;
        if (mSchedule) {
            outRequest.fault = mSchedule(outRequest.number, outRequest.line);
        }
        if (mLog.size() < kMaximumLog) {
            mLog.push_back({outRequest.number, inLink.number, outRequest.line, outRequest.fault, 0, {}});
        }
    }
    LogEntry* EntryOf(const Request& inRequest) {
        const bool isThere = inRequest.era == mEra && inRequest.number < mLog.size();
        return isThere ? &mLog[inRequest.number] : nullptr;
    }
    void Note(const Request& inRequest, const std::string& inEnd) {
        if (LogEntry* entry = EntryOf(inRequest)) {
            entry->end = inEnd;
        }
    }
    bool Ended(const Request& inRequest, const char* inHow) {
        Note(inRequest, inHow);
        return false;
    }

    /// Takes the request in; false when it was cut off here.
    asio::awaitable<bool> Receive(Link& ioLink, Request& ioRequest) {
        const Fault& fault = ioRequest.fault;
        switch (fault.kind) {
            case FaultKind::kRefuse:
                RefuseFor(fault.milliseconds);
                ioLink.ResetBoth();
                co_return false;
            case FaultKind::kOutage:
                RefuseFor(fault.milliseconds);
                ResetAll();
                co_return false;
            case FaultKind::kResetBeforeRequest:
                ioLink.ResetBoth();
                co_return false;
            case FaultKind::kResetInRequestHead:
                co_await SendPart(ioLink, ioRequest.head, PlaceIn(ioRequest.head.size(), fault.share));
                co_return false;
            case FaultKind::kResetInRequestBody:
                co_await CutInBody(ioLink, ioRequest);
                co_return false;
            default:
                break;
        }
        if (ExpectsContinue(ioRequest.head)) {
            ioRequest.head = WithoutExpectation(ioRequest.head);
            co_await Write(ioLink.client, kContinue);
        }
        ioRequest.body = co_await ioLink.fromClient.ReadBody(ioRequest.framing);
        if (fault.kind == FaultKind::kDelayRequest) {
            co_await Pause(ioLink, fault.milliseconds);
        }
        co_return true;
    }

    /// The hub gets the beginning, then both sides are reset.
    asio::awaitable<void> SendPart(Link& ioLink, const std::string& inBytes, std::size_t inCount) {
        co_await ConnectToHub(ioLink);
        co_await Write(ioLink.hub, std::string_view(inBytes).substr(0, inCount));
        ioLink.ResetBoth();
    }

    asio::awaitable<void> CutInBody(Link& ioLink, const Request& inRequest) {
        // The head goes without its last line end where there is no body to cut.
        std::string bytes = inRequest.head.substr(0, inRequest.head.size() - 2);
        if (inRequest.framing.kind == BodyFraming::Kind::kLength && inRequest.framing.length > 0 &&
            !ExpectsContinue(inRequest.head)) {
            const std::size_t count = PlaceIn(inRequest.framing.length, inRequest.fault.share);
            bytes = inRequest.head;
            const std::string part = co_await ioLink.fromClient.Read(count);
            bytes += part;
        }
        co_await SendPart(ioLink, bytes, bytes.size());
    }

    asio::awaitable<void> ConnectToHub(Link& ioLink) {
        if (ioLink.hub.is_open()) {
            co_return;
        }
        const tcp::endpoint hub(asio::ip::address_v4::loopback(), mHubPort);
        co_await ioLink.hub.async_connect(hub, asio::use_awaitable);
        KeepFromChildren(ioLink.hub);
        ioLink.hub.set_option(tcp::no_delay(true));
    }

    asio::awaitable<Answer> AskHub(Link& ioLink, const Request& inRequest) {
        co_await ConnectToHub(ioLink);
        co_await Write(ioLink.hub, inRequest.head + inRequest.body);
        Answer answer;
        answer.head = co_await ioLink.fromHub.ReadHead();
        while (StatusOf(answer.head) < 200) {
            co_await Write(ioLink.client, answer.head);
            answer.head = co_await ioLink.fromHub.ReadHead();
        }
        answer.body = co_await ioLink.fromHub.ReadBody(FramingOfAnswer(answer.head, inRequest.line.method));
        if (LogEntry* entry = EntryOf(inRequest)) {
            entry->hubStatus = StatusOf(answer.head);
        }
        co_return answer;
    }

    asio::awaitable<bool> Deliver(Link& ioLink, const Request& inRequest, const Answer& inAnswer) {
        const Fault& fault = inRequest.fault;
        const std::string bytes = inAnswer.Bytes();
        // Without a body, its cut falls just before the end of the head.
        const std::size_t inBody = inAnswer.body.empty()
                                       ? inAnswer.head.size() - 1
                                       : inAnswer.head.size() + PlaceIn(inAnswer.body.size(), fault.share);
        switch (fault.kind) {
            case FaultKind::kResetBeforeAnswer:
                ioLink.ResetBoth();
                co_return Ended(inRequest, "reset before the answer");
            case FaultKind::kResetInAnswerHead:
                co_await Write(ioLink.client, bytes.substr(0, PlaceIn(inAnswer.head.size(), fault.share)));
                ioLink.ResetBoth();
                co_return Ended(inRequest, "reset in the head of the answer");
            case FaultKind::kResetInAnswerBody:
                co_await Write(ioLink.client, bytes.substr(0, inBody));
                ioLink.ResetBoth();
                co_return Ended(inRequest, "reset in the body of the answer");
            case FaultKind::kResetAfterAnswer:
                co_await Write(ioLink.client, bytes);
                ioLink.ResetBoth();
                co_return Ended(inRequest, "reset after the answer");
            case FaultKind::kTruncate:
                co_await Write(ioLink.client, bytes.substr(0, inBody));
                co_return Ended(inRequest, "truncated");
            case FaultKind::kStall:
                co_await Write(ioLink.client, bytes.substr(0, inBody));
                co_await Pause(ioLink, fault.milliseconds);
                co_return Ended(inRequest, "stalled and closed");
            case FaultKind::kStatusAfterWork:
                co_await Write(ioLink.client, OwnAnswer(fault.status, inRequest.line.method));
                Note(inRequest, "answer replaced");
                co_return true;
            case FaultKind::kGarbageAfterWork:
                co_await Write(ioLink.client, kGarbage);
                co_return Ended(inRequest, "garbage");
            case FaultKind::kDelayAnswer:
                co_await Pause(ioLink, fault.milliseconds);
                break;
            case FaultKind::kTrickle:
                co_await Trickle(ioLink, bytes, fault.milliseconds);
                Note(inRequest, "passed slowly");
                co_return true;
            case FaultKind::kDuplicate:
                co_await Write(ioLink.client, bytes + bytes);
                Note(inRequest, "passed twice");
                co_return true;
            case FaultKind::kSwap:
                co_await Write(ioLink.client, ioLink.previousAnswer.empty() ? bytes : ioLink.previousAnswer);
                Note(inRequest, ioLink.previousAnswer.empty() ? "passed" : "swapped");
                co_return true;
            case FaultKind::kCloseIdle:
                co_await Write(ioLink.client, bytes);
                co_return Ended(inRequest, "passed and closed");
            default:
                break;
        }
        co_await Write(ioLink.client, bytes);
        Note(inRequest, "passed");
        co_return true;
    }

    asio::awaitable<void> Trickle(Link& ioLink, const std::string& inBytes, std::uint32_t inMilliseconds) {
        const std::size_t step = inBytes.size() / kTricklePieces + 1;
        for (std::size_t at = 0; at < inBytes.size(); at += step) {
            co_await Write(ioLink.client, std::string_view(inBytes).substr(at, step));
            co_await Pause(ioLink, inMilliseconds / kTricklePieces);
        }
    }

    mutable asio::io_context mIO{1};
    std::uint16_t mHubPort;
    std::uint16_t mPort = 0;
    Schedule mSchedule;
    asio::executor_work_guard<asio::io_context::executor_type> mWork;
    tcp::socket mPlaceholder;
    tcp::acceptor mAcceptor;
    asio::steady_timer mRestoreTimer;
    std::set<std::shared_ptr<Link>> mLinks;
    bool mIsCut = false;
    std::size_t mConnections = 0;
    std::size_t mNext = 0;
    std::size_t mEra = 0;
    std::vector<LogEntry> mLog;
    std::thread mThread;
};

FaultProxy::FaultProxy(std::uint16_t inHubPort, Schedule inSchedule, std::uint16_t inOwnPort)
    : mImplementation(std::make_unique<Implementation>(inHubPort, std::move(inSchedule), inOwnPort)) {}

FaultProxy::~FaultProxy() = default;

std::uint16_t FaultProxy::Port() const {
    return mImplementation->Port();
}

std::string FaultProxy::URL() const {
    return "http://127.0.0.1:" + std::to_string(Port());
}

void FaultProxy::Follow(Schedule inSchedule) {
    mImplementation->Do([&] { mImplementation->Follow(std::move(inSchedule)); });
}

void FaultProxy::BeGood() {
    mImplementation->Do([&] { mImplementation->BeGood(); });
}

void FaultProxy::SetHubPort(std::uint16_t inHubPort) {
    mImplementation->Do([&] { mImplementation->SetHubPort(inHubPort); });
}

void FaultProxy::Cut() {
    mImplementation->Do([&] { mImplementation->Cut(); });
}

void FaultProxy::Restore() {
    mImplementation->Do([&] { mImplementation->Restore(); });
}

std::vector<LogEntry> FaultProxy::Log() const {
    std::vector<LogEntry> log;
    mImplementation->Do([&] { log = mImplementation->Log(); });
    return log;
}

std::string FaultProxy::LogText(bool inAll) const {
    std::string text;
    for (const LogEntry& entry : Log()) {
        if (inAll || entry.fault.kind != FaultKind::kNone || entry.end != "passed") {
            text += entry.Describe() + "\n";
        }
    }
    return text;
}

std::size_t FaultProxy::RequestCount() const {
    std::size_t count = 0;
    mImplementation->Do([&] { count = mImplementation->RequestCount(); });
    return count;
}

}  // namespace faultproxy
