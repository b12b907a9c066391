// Where a message of HTTP/1.1 begins and ends on a socket. Bytes stay as they came.
#pragma once

#include <boost/asio/awaitable.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/steady_timer.hpp>
#include <cstdint>
#include <string>
#include <string_view>

#include "Fault.h"

namespace faultproxy {

/// How a head says that its body ends.
struct BodyFraming {
    enum class Kind { kNone, kLength, kChunks, kUntilClose };
    Kind kind = Kind::kNone;
    std::uint64_t length = 0;
};

RequestLine ReadRequestLine(std::string_view inHead);
int StatusOf(std::string_view inHead);
BodyFraming FramingOfRequest(std::string_view inHead);
BodyFraming FramingOfAnswer(std::string_view inHead, std::string_view inMethod);
bool AsksToClose(std::string_view inHead);
bool ExpectsContinue(std::string_view inHead);
std::string WithoutExpectation(const std::string& inHead);
/// An answer as a hub in trouble gives it.
std::string OwnAnswer(int inStatus, std::string_view inMethod);

/// Reads messages off one socket. Throws boost::system::system_error when the other side ends early.
class MessageReader {
public:
    explicit MessageReader(boost::asio::ip::tcp::socket& inSocket) : mSocket(inSocket) {}

    /// With its empty line.
    boost::asio::awaitable<std::string> ReadHead();
    boost::asio::awaitable<std::string> ReadBody(BodyFraming inFraming);
    /// So many bytes.
    boost::asio::awaitable<std::string> Read(std::size_t inCount);

private:
    boost::asio::awaitable<void> Fill();
    boost::asio::awaitable<std::string> ReadThrough(std::string_view inMark);
    boost::asio::awaitable<std::string> ReadChunks();
    boost::asio::awaitable<std::string> ReadUntilClose();
    std::string Take(std::size_t inCount);

    boost::asio::ip::tcp::socket& mSocket;
    std::string mBuffer;
};

}  // namespace faultproxy
