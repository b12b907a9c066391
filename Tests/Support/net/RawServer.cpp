#include "net/RawServer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <chrono>
#include <condition_variable>
#include <csignal>
#include <list>
#include <mutex>
#include <set>
#include <stdexcept>
#include <thread>
#include <utility>

#include "net/Stream.h"

namespace zotest {
namespace net {
namespace {

constexpr std::chrono::seconds kPatience(30);
/// What a stated length may reserve before its bytes are there.
constexpr std::size_t kLargestReservation = std::size_t(64) << 20;

std::string Lower(std::string_view inText) {
    std::string text(inText);
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char inByte) { return static_cast<char>(std::tolower(inByte)); });
    return text;
}

std::vector<std::string> HeaderValues(std::string_view inHead, std::string_view inName) {
    std::vector<std::string> values;
    const std::string prefix = "\r\n" + Lower(inName) + ":";
    const std::string head = Lower(inHead);
    for (auto at = head.find(prefix); at != std::string::npos; at = head.find(prefix, at + 1)) {
        auto begin = at + prefix.size();
        const auto end = head.find("\r\n", begin);
        while (begin < end && head[begin] == ' ') {
            ++begin;
        }
        values.emplace_back(inHead.substr(begin, end - begin));
    }
    return values;
}

int Listen(std::uint16_t& outPort) {
    const int listener = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    void* const place = &address;
    auto* const generic = static_cast<sockaddr*>(place);
    if (listener < 0 || bind(listener, generic, size) != 0 || listen(listener, 1024) != 0 ||
        getsockname(listener, generic, &size) != 0) {
        throw std::runtime_error("The test server cannot listen on 127.0.0.1.");
    }
    outPort = ntohs(address.sin_port);
    return listener;
}

}  // namespace

std::optional<std::string> ReceivedRequest::Header(std::string_view inName) const {
    const auto values = HeaderValues(head, inName);
    return values.empty() ? std::nullopt : std::optional<std::string>(values.front());
}

std::size_t ReceivedRequest::CountHeaders(std::string_view inName) const {
    return HeaderValues(head, inName).size();
}

struct RawServer::State {
    Handler handler;
    std::unique_ptr<TLSContext> tls;
    std::uint16_t port = 0;
    int listener = -1;
    int stopEvent = -1;
    std::thread acceptor;

    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    bool stopping = false;
    std::size_t accepted = 0;
    std::vector<ReceivedRequest> requests;
    std::list<std::thread> threads;
    std::vector<std::thread::id> ended;
    std::set<int> sockets;

    void AcceptLoop(RawServer& inServer);
    void Serve(int inSocket, std::size_t inIndex, RawServer& inServer);
    void Reap();
    template <typename Condition>
    bool WaitFor(Condition inCondition) const {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, kPatience, inCondition);
    }
};

Connection::Connection(std::unique_ptr<Stream> inStream, int inSocket, std::size_t inIndex,
                       RawServer& inServer)
    : mStream(std::move(inStream)), mSocket(inSocket), mIndex(inIndex), mServer(inServer) {}

Connection::~Connection() = default;

bool Connection::Fill() {
    char bytes[16384];
    const long size = mStream->Read(bytes, sizeof bytes);
    if (size <= 0) {
        return false;
    }
    mBuffer.append(bytes, static_cast<std::size_t>(size));
    return true;
}

std::optional<ReceivedRequest> Connection::ReadHead() {
    auto end = mBuffer.find("\r\n\r\n");
    while (end == std::string::npos) {
        if (!Fill()) {
            return std::nullopt;
        }
        end = mBuffer.find("\r\n\r\n");
    }
    ReceivedRequest request;
    request.head = mBuffer.substr(0, end + 4);
    mBuffer.erase(0, end + 4);
    const auto firstBlank = request.head.find(' ');
    request.method = request.head.substr(0, firstBlank);
    request.target =
        request.head.substr(firstBlank + 1, request.head.find(' ', firstBlank + 1) - firstBlank - 1);
    return request;
}

std::optional<ReceivedRequest> Connection::ReadRequest() {
    auto request = ReadHead();
    if (!request) {
        return std::nullopt;
    }
    const auto length = request->Header("Content-Length");
    const std::size_t size = length ? std::stoul(*length) : 0;
    mBuffer.reserve(std::min(size, kLargestReservation));
    while (mBuffer.size() < size) {
        if (!Fill()) {
            return std::nullopt;
        }
    }
    // A large body is most often all that there is.
    std::string rest = mBuffer.substr(size);
    mBuffer.resize(size);
    request->body = std::move(mBuffer);
    mBuffer = std::move(rest);
    mServer.Keep(*request);
    return request;
}

bool Connection::Write(std::string_view inBytes) {
    return mStream->Write(inBytes);
}

void Connection::WaitForClose() {
    char bytes[4096];
    while (mStream->Read(bytes, sizeof bytes) > 0) {
    }
}

void Connection::Reset() {
    mStream->Reset();
    mServer.Close(*this);
}

RawServer::RawServer(Handler inHandler) : mState(std::make_unique<State>()) {
    // Writing to a client that is gone fails; it does not end the test.
    std::signal(SIGPIPE, SIG_IGN);
    mState->handler = std::move(inHandler);
    mState->listener = Listen(mState->port);
    mState->stopEvent = eventfd(0, EFD_CLOEXEC);
    mState->acceptor = std::thread([this] { mState->AcceptLoop(*this); });
}

RawServer::RawServer(Handler inHandler, const ServerIdentity& inIdentity)
    : mState(std::make_unique<State>()) {
    std::signal(SIGPIPE, SIG_IGN);
    mState->tls = std::make_unique<TLSContext>(inIdentity.certificate, inIdentity.key);
    mState->handler = std::move(inHandler);
    mState->listener = Listen(mState->port);
    mState->stopEvent = eventfd(0, EFD_CLOEXEC);
    mState->acceptor = std::thread([this] { mState->AcceptLoop(*this); });
}

RawServer::~RawServer() {
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(mState->stopEvent, &one, sizeof one);
    mState->acceptor.join();
    {
        std::lock_guard<std::mutex> lock(mState->mutex);
        mState->stopping = true;
        for (const int socket : mState->sockets) {
            shutdown(socket, SHUT_RDWR);
        }
    }
    for (std::thread& thread : mState->threads) {
        thread.join();
    }
    close(mState->listener);
    close(mState->stopEvent);
}

void RawServer::State::AcceptLoop(RawServer& inServer) {
    for (;;) {
        pollfd waits[2] = {{listener, POLLIN, 0}, {stopEvent, POLLIN, 0}};
        poll(waits, 2, -1);
        if (waits[1].revents != 0) {
            return;
        }
        const int client = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
        if (client < 0) {
            continue;
        }
        const int yes = 1;
        setsockopt(client, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
        Reap();
        std::lock_guard<std::mutex> lock(mutex);
        sockets.insert(client);
        threads.emplace_back([this, client, index = accepted, &inServer] { Serve(client, index, inServer); });
        ++accepted;
        changed.notify_all();
    }
}

void RawServer::State::Reap() {
    std::list<std::thread> done;
    {
        std::lock_guard<std::mutex> lock(mutex);
        for (const std::thread::id id : ended) {
            const auto found =
                std::find_if(threads.begin(), threads.end(),
                             [id](const std::thread& inThread) { return inThread.get_id() == id; });
            done.splice(done.end(), threads, found);
        }
        ended.clear();
    }
    for (std::thread& thread : done) {
        thread.join();
    }
}

void RawServer::State::Serve(int inSocket, std::size_t inIndex, RawServer& inServer) {
    if (auto stream = tls ? tls->Accept(inSocket) : MakePlainStream(inSocket)) {
        Connection connection(std::move(stream), inSocket, inIndex, inServer);
        handler(connection);
        inServer.Close(connection);
    } else {
        std::lock_guard<std::mutex> lock(mutex);
        sockets.erase(inSocket);
        close(inSocket);
    }
    std::lock_guard<std::mutex> lock(mutex);
    ended.push_back(std::this_thread::get_id());
}

std::uint16_t RawServer::Port() const noexcept {
    return mState->port;
}

std::string RawServer::URL(std::string_view inPath) const {
    return (mState->tls ? "https://127.0.0.1:" : "http://127.0.0.1:") + std::to_string(mState->port) +
           std::string(inPath);
}

std::size_t RawServer::ConnectionCount() const {
    std::lock_guard<std::mutex> lock(mState->mutex);
    return mState->accepted;
}

std::vector<ReceivedRequest> RawServer::Requests() const {
    std::lock_guard<std::mutex> lock(mState->mutex);
    return mState->requests;
}

bool RawServer::WaitForRequests(std::size_t inCount) const {
    return mState->WaitFor([this, inCount] { return mState->requests.size() >= inCount; });
}

bool RawServer::WaitForConnections(std::size_t inCount) const {
    return mState->WaitFor([this, inCount] { return mState->accepted >= inCount; });
}

std::vector<std::string> RawServer::OfferedProtocols() const {
    std::vector<std::string> protocols;
    const std::string offer = mState->tls ? mState->tls->LastOffer() : std::string();
    for (std::size_t at = 0; at < offer.size(); at += 1 + static_cast<unsigned char>(offer[at])) {
        protocols.push_back(offer.substr(at + 1, static_cast<unsigned char>(offer[at])));
    }
    return protocols;
}

/// Closes under the lock, with the socket taken off the list first: its number may belong to another
/// connection right afterwards. What the handler then still does fails.
void RawServer::Close(Connection& ioConnection) {
    std::lock_guard<std::mutex> lock(mState->mutex);
    if (ioConnection.mSocket >= 0) {
        mState->sockets.erase(std::exchange(ioConnection.mSocket, -1));
        ioConnection.mStream = MakePlainStream(-1);
    }
}

void RawServer::Keep(const ReceivedRequest& inRequest) {
    std::lock_guard<std::mutex> lock(mState->mutex);
    mState->requests.push_back(inRequest);
    mState->changed.notify_all();
}

RawServer::Handler RawServer::Answering(std::function<std::string(const ReceivedRequest&)> inAnswer) {
    return [answer = std::move(inAnswer)](Connection& ioConnection) {
        while (const auto request = ioConnection.ReadRequest()) {
            const std::string bytes = answer(*request);
            if (bytes.empty() || !ioConnection.Write(bytes)) {
                return;
            }
        }
    };
}

std::string RawServer::Answer(int inStatus, std::string_view inBody, std::string_view inExtraHeaders) {
    std::string answer = "HTTP/1.1 " + std::to_string(inStatus) + " Status\r\n";
    answer.append(inExtraHeaders);
    answer += "Content-Length: " + std::to_string(inBody.size()) + "\r\n\r\n";
    return answer.append(inBody);
}

}  // namespace net
}  // namespace zotest
