// A server for tests that sends exactly the bytes that a test tells it to, keeps what it was sent, and can
// stall, cut and reset. Knows nothing of HTTP but where a request ends.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace zotest {
namespace net {

class Stream;

/// One request as it came, byte for byte.
struct ReceivedRequest {
    std::string head;  // with its blank line
    std::string body;  // as sent; a chunked one with its chunk lines
    std::string method;
    std::string target;

    std::string Raw() const { return head + body; }
    /// The value of the first header of this name, in any case; none when it is absent.
    std::optional<std::string> Header(std::string_view inName) const;
    std::size_t CountHeaders(std::string_view inName) const;
};

/// The server's end of one connection. Used by its handler, on the connection's own thread.
class Connection {
public:
    /// The number of this connection, from 0.
    std::size_t Index() const noexcept { return mIndex; }
    /// Waits for the next request; none when the client has closed or the server stops.
    std::optional<ReceivedRequest> ReadRequest();
    /// The head alone, leaving the body in the socket.
    std::optional<ReceivedRequest> ReadHead();
    /// False when the client is gone.
    bool Write(std::string_view inBytes);
    /// Blocks until the client closes or the server stops: a server that has fallen silent.
    void WaitForClose();
    /// Ends the connection with a reset, unsent bytes and all.
    void Reset();

private:
    friend class RawServer;
    Connection(std::unique_ptr<Stream> inStream, int inSocket, std::size_t inIndex,
               class RawServer& inServer);
    bool Fill();

    std::unique_ptr<Stream> mStream;
    int mSocket;
    const std::size_t mIndex;
    class RawServer& mServer;
    std::string mBuffer;

public:
    ~Connection();
};

/// PEM texts with which a server proves who it is.
struct ServerIdentity {
    std::string certificate;
    std::string key;
};

/// Listens on a free port of 127.0.0.1 and runs the handler for each connection on a thread of its own. When
/// the handler returns, the connection is closed in good order. The destructor ends all connections and
/// joins.
class RawServer {
public:
    using Handler = std::function<void(Connection&)>;

    explicit RawServer(Handler inHandler);
    /// Speaks TLS.
    RawServer(Handler inHandler, const ServerIdentity& inIdentity);
    ~RawServer();
    RawServer(const RawServer&) = delete;
    RawServer& operator=(const RawServer&) = delete;

    std::uint16_t Port() const noexcept;
    /// "http://127.0.0.1:port" or with https, and the path.
    std::string URL(std::string_view inPath) const;
    /// How many connections have been accepted.
    std::size_t ConnectionCount() const;
    /// All requests that handlers have read, in the order of their arrival.
    std::vector<ReceivedRequest> Requests() const;
    /// Blocks until so many requests have been read; false after 30 seconds.
    bool WaitForRequests(std::size_t inCount) const;
    bool WaitForConnections(std::size_t inCount) const;
    /// TLS: the protocols that the last client offered by ALPN.
    std::vector<std::string> OfferedProtocols() const;

    /// A handler that answers each request of each connection with what the function makes of it, and closes
    /// when that is empty.
    static Handler Answering(std::function<std::string(const ReceivedRequest&)> inAnswer);
    /// "HTTP/1.1 status", the extra header lines (each with its CR LF), the length and the body.
    static std::string Answer(int inStatus, std::string_view inBody, std::string_view inExtraHeaders = {});

private:
    friend class Connection;
    void Close(Connection& ioConnection);
    void Keep(const ReceivedRequest& inRequest);
    struct State;
    const std::unique_ptr<State> mState;
};

}  // namespace net
}  // namespace zotest
