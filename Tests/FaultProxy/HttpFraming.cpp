// Heads, lengths and chunks.
#include "HttpFraming.h"

#include <algorithm>
#include <array>
#include <boost/asio/buffer.hpp>
#include <boost/asio/error.hpp>
#include <boost/asio/use_awaitable.hpp>
#include <boost/system/system_error.hpp>
#include <cctype>
#include <charconv>

namespace faultproxy {

namespace asio = boost::asio;

namespace {

constexpr std::size_t kMaximumHead = 1 << 20;
constexpr std::string_view kEmptyLine = "\r\n\r\n";

std::string Lower(std::string_view inText) {
    std::string text(inText);
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return text;
}

/// Where the line of this header begins; npos when there is none.
std::size_t FindHeader(const std::string& inLowerHead, std::string_view inLowerName) {
    const std::size_t found = inLowerHead.find("\r\n" + std::string(inLowerName) + ":");
    return found == std::string::npos ? found : found + 2;
}

std::string HeaderOf(std::string_view inHead, std::string_view inLowerName) {
    const std::string head = Lower(inHead);
    const std::size_t line = FindHeader(head, inLowerName);
    if (line == std::string::npos) {
        return {};
    }
    const std::size_t begin = head.find_first_not_of(" \t", line + inLowerName.size() + 1);
    return head.substr(begin, head.find("\r\n", line) - begin);
}

template <class Number>
Number ReadNumber(std::string_view inText, int inBase) {
    Number number = 0;
    const auto end = std::from_chars(inText.data(), inText.data() + inText.size(), number, inBase);
    if (end.ec != std::errc()) {
        throw boost::system::system_error(asio::error::make_error_code(asio::error::invalid_argument));
    }
    return number;
}

BodyFraming FramingOf(std::string_view inHead, BodyFraming::Kind inOtherwise) {
    if (HeaderOf(inHead, "transfer-encoding").find("chunked") != std::string::npos) {
        return {BodyFraming::Kind::kChunks, 0};
    }
    const std::string length = HeaderOf(inHead, "content-length");
    if (length.empty()) {
        return {inOtherwise, 0};
    }
    return {BodyFraming::Kind::kLength, ReadNumber<std::uint64_t>(length, 10)};
}

}  // namespace

RequestLine ReadRequestLine(std::string_view inHead) {
    const std::size_t methodEnd = inHead.find(' ');
    const std::size_t targetEnd = inHead.find_first_of(" ?\r", methodEnd + 1);
    if (methodEnd == std::string_view::npos || targetEnd == std::string_view::npos) {
        return {};
    }
    return {std::string(inHead.substr(0, methodEnd)),
            std::string(inHead.substr(methodEnd + 1, targetEnd - methodEnd - 1))};
}

int StatusOf(std::string_view inHead) {
    const std::size_t space = inHead.find(' ');
    return space == std::string_view::npos ? 0 : ReadNumber<int>(inHead.substr(space + 1, 3), 10);
}

BodyFraming FramingOfRequest(std::string_view inHead) {
    return FramingOf(inHead, BodyFraming::Kind::kNone);
}

BodyFraming FramingOfAnswer(std::string_view inHead, std::string_view inMethod) {
    const int status = StatusOf(inHead);
    if (inMethod == "HEAD" || status < 200 || status == 204 || status == 304) {
        return {};
    }
    return FramingOf(inHead, BodyFraming::Kind::kUntilClose);
}

bool AsksToClose(std::string_view inHead) {
    return HeaderOf(inHead, "connection").find("close") != std::string::npos;
}

bool ExpectsContinue(std::string_view inHead) {
    return HeaderOf(inHead, "expect") == "100-continue";
}

std::string WithoutExpectation(const std::string& inHead) {
    const std::size_t line = FindHeader(Lower(inHead), "expect");
    std::string head = inHead;
    if (line != std::string::npos) {
        head.erase(line, head.find("\r\n", line) + 2 - line);
    }
    return head;
}

std::string OwnAnswer(int inStatus, std::string_view inMethod) {
    const std::string body = R"({"error":{"code":"injected","message":"A fault on the way to the hub."}})";
    std::string answer = "HTTP/1.1 " + std::to_string(inStatus) +
                         " Injected\r\nContent-Type: application/json;charset=utf-8\r\nContent-Length: " +
                         std::to_string(body.size()) + "\r\n\r\n";
    return inMethod == "HEAD" ? answer : answer + body;
}

asio::awaitable<void> MessageReader::Fill() {
    std::array<char, 16384> bytes;
    const std::size_t count = co_await mSocket.async_read_some(asio::buffer(bytes), asio::use_awaitable);
    mBuffer.append(bytes.data(), count);
}

std::string MessageReader::Take(std::size_t inCount) {
    std::string taken = mBuffer.substr(0, inCount);
    mBuffer.erase(0, inCount);
    return taken;
}

asio::awaitable<std::string> MessageReader::ReadThrough(std::string_view inMark) {
    std::size_t found = mBuffer.find(inMark);
    while (found == std::string::npos) {
        if (mBuffer.size() > kMaximumHead) {
            throw boost::system::system_error(asio::error::make_error_code(asio::error::message_size));
        }
        co_await Fill();
        found = mBuffer.find(inMark);
    }
    co_return Take(found + inMark.size());
}

asio::awaitable<std::string> MessageReader::ReadHead() {
    std::string head = co_await ReadThrough(kEmptyLine);
    co_return head;
}

asio::awaitable<std::string> MessageReader::Read(std::size_t inCount) {
    while (mBuffer.size() < inCount) {
        co_await Fill();
    }
    co_return Take(inCount);
}

asio::awaitable<std::string> MessageReader::ReadChunks() {
    std::string body;
    for (;;) {
        const std::string line = co_await ReadThrough("\r\n");
        body += line;
        const auto size = ReadNumber<std::size_t>(line, 16);
        if (size == 0) {
            break;
        }
        const std::string chunk = co_await Read(size + 2);
        body += chunk;
    }
    std::string trailer;
    while (trailer != "\r\n") {
        trailer = co_await ReadThrough("\r\n");
        body += trailer;
    }
    co_return body;
}

asio::awaitable<std::string> MessageReader::ReadUntilClose() {
    try {
        for (;;) {
            co_await Fill();
        }
    } catch (const boost::system::system_error& error) {
        if (error.code() != asio::error::eof) {
            throw;
        }
    }
    co_return Take(mBuffer.size());
}

asio::awaitable<std::string> MessageReader::ReadBody(BodyFraming inFraming) {
    std::string body;
    switch (inFraming.kind) {
        case BodyFraming::Kind::kNone:
            break;
        case BodyFraming::Kind::kLength:
            body = co_await Read(inFraming.length);
            break;
        case BodyFraming::Kind::kChunks:
            body = co_await ReadChunks();
            break;
        case BodyFraming::Kind::kUntilClose:
            body = co_await ReadUntilClose();
            break;
    }
    co_return body;
}

}  // namespace faultproxy
