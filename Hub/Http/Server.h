// The network side of the hub: listens, reads bounded requests, hands them to workers, writes the answers.
#pragma once

#include <boost/asio/ssl/context.hpp>
#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "Http/FaultPlan.h"
#include "Http/Message.h"

namespace zohub {

struct ServerLimits {
    std::chrono::milliseconds idle{120000};      ///< between two requests of one connection
    std::chrono::milliseconds header{20000};     ///< for the whole head of a request, and for a TLS handshake
    std::chrono::milliseconds bodyGrace{30000};  ///< a body or answer may take this long ...
    std::uint64_t minimumRate = 16 * 1024;       ///< ... plus its size divided by this, in bytes per second
    std::chrono::milliseconds drain{10000};      ///< how long a stop waits for requests in flight
    std::uint32_t maxHeader = 32 * 1024;
    std::uint64_t maxBody = 256ull << 20;
    std::uint64_t maxAnonymousBody = 64 * 1024;  ///< without a token cookie
    std::uint64_t maxBodiesInFlight = 1ull << 30;
    std::size_t maxConnections = 4096;
    std::size_t ioThreads = 2;
    std::size_t readThreads = 4;
    std::size_t writeThreads = 2;
};

/// Runs a request to its end and never throws. Called on worker threads, several at a time.
using RequestHandler = std::function<Response(Request const&)>;
/// Which threads run a request. Writes wait for each other in the database, and sign-ins are slow on purpose;
/// neither may keep readers waiting.
enum class Lane { Read, Write, SignIn };
using LaneFunction = std::function<Lane(Request const&)>;

class Server {
public:
    /// The fault function is for those who want to see their client in trouble; without one all is well.
    Server(ServerLimits const& inLimits, RequestHandler inHandler, LaneFunction inLaneOf,
           FaultFunction inFaultOf = nullptr);
    /// Stops.
    ~Server();
    Server(Server const&) = delete;
    Server& operator=(Server const&) = delete;

    /// Bind and listen; port 0 picks a free one. Give the port in use. Throw std::runtime_error.
    std::uint16_t ListenPlain(std::string const& inAddress, std::uint16_t inPort);
    std::uint16_t ListenTls(std::string const& inAddress, std::uint16_t inPort,
                            std::shared_ptr<boost::asio::ssl::context> inContext);

    /// Starts the threads and returns.
    void Start();
    /// Accepts no more, lets requests in flight end within the drain time, closes the rest. May be called
    /// twice.
    void Stop();

private:
    class Implementation;
    std::shared_ptr<Implementation> mImplementation;
};

}  // namespace zohub
