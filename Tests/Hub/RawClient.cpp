// The tests' own HTTP client.
#include "RawClient.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <stdexcept>

namespace zohub::test {

namespace {

constexpr std::chrono::milliseconds kPatience{30000};
constexpr char kBoundary[] = "----zohub-test-boundary";

std::string Lower(std::string inText) {
    std::transform(inText.begin(), inText.end(), inText.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    return inText;
}

Answer ParseHead(std::string const& inHead) {
    Answer answer;
    answer.head = inHead;
    answer.status = std::stoi(inHead.substr(9, 3));
    std::size_t at = inHead.find("\r\n");
    while (at != std::string::npos && at + 2 < inHead.size()) {
        std::size_t const end = std::min(inHead.find("\r\n", at + 2), inHead.size());
        std::string const line = inHead.substr(at + 2, end - at - 2);
        std::size_t const colon = line.find(": ");
        if (colon != std::string::npos)
            answer.headers.emplace(Lower(line.substr(0, colon)), line.substr(colon + 2));
        at = end == inHead.size() ? std::string::npos : end;
    }
    return answer;
}

std::string PathOf(std::string const& inTarget) {
    std::size_t const scheme = inTarget.find("://");
    return scheme == std::string::npos ? inTarget : inTarget.substr(inTarget.find('/', scheme + 3));
}

}  // namespace

std::string Answer::Header(std::string const& inLowerName) const {
    auto const found = headers.find(inLowerName);
    return found == headers.end() ? std::string() : found->second;
}

RawConnection::RawConnection(std::uint16_t inPort) : mSocket(socket(AF_INET, SOCK_STREAM, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(inPort);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    if (connect(mSocket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) {
        close(mSocket);
        throw std::runtime_error("cannot connect to the hub");
    }
}

RawConnection::~RawConnection() {
    close(mSocket);
}

bool RawConnection::TrySend(std::string_view inBytes) {
    while (!inBytes.empty()) {
        ssize_t const count = send(mSocket, inBytes.data(), inBytes.size(), MSG_NOSIGNAL);
        if (count <= 0)
            return false;
        inBytes.remove_prefix(static_cast<std::size_t>(count));
    }
    return true;
}

void RawConnection::Send(std::string_view inBytes) {
    if (!TrySend(inBytes))
        throw std::runtime_error("the hub closed the connection");
}

bool RawConnection::Fill(std::chrono::milliseconds inLimit) {
    pollfd waiting{mSocket, POLLIN, 0};
    if (poll(&waiting, 1, static_cast<int>(inLimit.count())) <= 0)
        throw std::runtime_error("the hub is silent");
    char bytes[65536];
    ssize_t const count = recv(mSocket, bytes, sizeof bytes, 0);
    if (count <= 0)
        return false;
    mBuffer.append(bytes, static_cast<std::size_t>(count));
    return true;
}

Answer RawConnection::Receive(bool inIsHeadRequest) {
    std::size_t headEnd = 0;
    while ((headEnd = mBuffer.find("\r\n\r\n")) == std::string::npos)
        if (!Fill(kPatience))
            throw std::runtime_error("the connection ended before an answer");
    Answer answer = ParseHead(mBuffer.substr(0, headEnd));
    mBuffer.erase(0, headEnd + 4);
    std::string const length = answer.Header("content-length");
    if (inIsHeadRequest || length.empty())
        return answer;
    std::size_t const size = std::stoul(length);
    while (mBuffer.size() < size)
        if (!Fill(kPatience))
            throw std::runtime_error("the connection ended inside an answer");
    answer.body = mBuffer.substr(0, size);
    mBuffer.erase(0, size);
    return answer;
}

bool RawConnection::IsClosedWithin(std::chrono::milliseconds inLimit) {
    auto const end = std::chrono::steady_clock::now() + inLimit;
    try {
        while (true) {
            auto const left =
                std::chrono::duration_cast<std::chrono::milliseconds>(end - std::chrono::steady_clock::now());
            if (left.count() <= 0)
                return false;
            if (!Fill(left))
                return true;
        }
    } catch (std::runtime_error const&) {
        return false;
    }
}

Form& Form::Add(std::string const& inName, std::string const& inBytes, std::string const& inType) {
    mParts +=
        std::string("--") + kBoundary + "\r\nContent-Disposition: form-data; name=\"" + inName + "\"\r\n";
    if (!inType.empty())
        mParts += "Content-Type: " + inType + "\r\n";
    mParts += "\r\n" + inBytes + "\r\n";
    return *this;
}

std::string Form::Body() const {
    return mParts + "--" + kBoundary + "--\r\n";
}

std::string Form::Type() {
    return std::string("multipart/form-data; boundary=") + kBoundary;
}

Answer Client::Request(std::string const& inMethod, std::string const& inTarget, std::string const& inBody,
                       Headers const& inHeaders) const {
    std::string text = inMethod + " " + PathOf(inTarget) +
                       " HTTP/1.1\r\nHost: 127.0.0.1:" + std::to_string(mPort) + "\r\nConnection: close\r\n";
    if (!mToken.empty())
        text += "Cookie: " + mToken + "\r\n";
    for (auto const& [name, value] : inHeaders)
        text += name + ": " + value + "\r\n";
    if (!inBody.empty() || inMethod == "POST" || inMethod == "PUT")
        text += "Content-Length: " + std::to_string(inBody.size()) + "\r\n";
    RawConnection connection(mPort);
    connection.TrySend(text + "\r\n" + inBody);
    return connection.Receive(inMethod == "HEAD");
}

Answer Client::Get(std::string const& inTarget, Headers const& inHeaders) const {
    return Request("GET", inTarget, {}, inHeaders);
}

Answer Client::PostJson(std::string const& inTarget, std::string const& inBody, Headers inHeaders) const {
    inHeaders["Content-Type"] = "application/json;charset=utf-8";
    return Request("POST", inTarget, inBody, inHeaders);
}

Answer Client::PutJson(std::string const& inTarget, std::string const& inBody, Headers inHeaders) const {
    inHeaders["Content-Type"] = "application/json;charset=utf-8";
    return Request("PUT", inTarget, inBody, inHeaders);
}

Answer Client::SendForm(std::string const& inMethod, std::string const& inTarget, Form const& inForm,
                        Headers inHeaders) const {
    inHeaders["Content-Type"] = Form::Type();
    return Request(inMethod, inTarget, inForm.Body(), inHeaders);
}

Answer Client::SignIn(std::string const& inUser, std::string const& inPassword) {
    mToken.clear();
    Answer answer = SendForm("POST", "/zo/1/system/login",
                             Form().Add("j_username", inUser).Add("j_password", inPassword));
    std::string const cookie = answer.Header("set-cookie");
    if (!cookie.empty())
        mToken = cookie.substr(0, cookie.find(';') + 1);
    return answer;
}

}  // namespace zohub::test
