#include "BenchmarkServer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/epoll.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <stdexcept>
#include <string>
#include <string_view>
#include <unordered_map>

namespace bench {
namespace {

void Watch(int inEpoll, int inSocket) {
    epoll_event event{};
    event.events = EPOLLIN;
    event.data.fd = inSocket;
    epoll_ctl(inEpoll, EPOLL_CTL_ADD, inSocket, &event);
}

std::string MakeAnswer(std::size_t inBodySize, const std::string& inCacheControl) {
    return "HTTP/1.1 200 OK\r\nContent-Type: application/json\r\nETag: \"5d8c72a5edda8d6a\"\r\n"
           "Cache-Control: " +
           inCacheControl + "\r\nServer: bench\r\nContent-Length: " + std::to_string(inBodySize) +
           "\r\n\r\n" + std::string(inBodySize, 'b');
}

/// Answers the whole requests in the buffer. False when the client is gone.
bool AnswerAll(int inSocket, std::string& ioBuffer, const std::string& inAnswer) {
    for (auto end = ioBuffer.find("\r\n\r\n"); end != std::string::npos; end = ioBuffer.find("\r\n\r\n")) {
        ioBuffer.erase(0, end + 4);
        std::string_view rest = inAnswer;
        while (!rest.empty()) {
            const ssize_t sent = send(inSocket, rest.data(), rest.size(), MSG_NOSIGNAL);
            if (sent <= 0) {
                return false;
            }
            rest.remove_prefix(static_cast<std::size_t>(sent));
        }
    }
    return true;
}

[[noreturn]] void Serve(int inListener, const std::string& inAnswer) {
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    const int epoll = epoll_create1(EPOLL_CLOEXEC);
    Watch(epoll, inListener);
    std::unordered_map<int, std::string> buffers;
    std::array<epoll_event, 128> events;
    std::array<char, 16384> bytes;
    for (;;) {
        const int count = epoll_wait(epoll, events.data(), static_cast<int>(events.size()), -1);
        for (int i = 0; i < count; ++i) {
            const int socket = events[static_cast<std::size_t>(i)].data.fd;
            if (socket == inListener) {
                const int client = accept(inListener, nullptr, nullptr);
                const int yes = 1;
                setsockopt(client, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
                Watch(epoll, client);
                continue;
            }
            const ssize_t size = recv(socket, bytes.data(), bytes.size(), 0);
            std::string& buffer = buffers[socket];
            if (size > 0) {
                buffer.append(bytes.data(), static_cast<std::size_t>(size));
            }
            if (size <= 0 || !AnswerAll(socket, buffer, inAnswer)) {
                close(socket);
                buffers.erase(socket);
            }
        }
    }
}

}  // namespace

BenchmarkServer::BenchmarkServer(std::size_t inBodySize, const char* inCacheControl) {
    const int listener = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    void* const place = &address;
    auto* const generic = static_cast<sockaddr*>(place);
    if (listener < 0 || bind(listener, generic, size) != 0 || listen(listener, 1024) != 0 ||
        getsockname(listener, generic, &size) != 0) {
        throw std::runtime_error("The benchmark's server cannot listen on 127.0.0.1.");
    }
    mPort = ntohs(address.sin_port);
    mProcess = fork();
    if (mProcess == 0) {
        Serve(listener, MakeAnswer(inBodySize, inCacheControl));
    }
    close(listener);
    if (mProcess < 0) {
        throw std::runtime_error("The benchmark's server process cannot be started.");
    }
}

BenchmarkServer::~BenchmarkServer() {
    kill(mProcess, SIGKILL);
    waitpid(mProcess, nullptr, 0);
}

}  // namespace bench
