// Listening sockets, threads, start and stop.
#include "Http/Server.h"

#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ip/v6_only.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/strand.hpp>
#include <iostream>
#include <stdexcept>
#include <thread>

#include "Http/Connection.h"

namespace zohub {

namespace asio = boost::asio;
using asio::ip::tcp;

namespace {

constexpr std::chrono::milliseconds kAcceptPause{50};

// One listening socket. Lives until the io context is destroyed.
class Listener : public std::enable_shared_from_this<Listener> {
public:
    Listener(ServerCore& inCore, std::shared_ptr<asio::ssl::context> inTls)
        : mCore(inCore),
          mTls(std::move(inTls)),
          mAcceptor(asio::make_strand(inCore.io)),
          mPause(mAcceptor.get_executor()) {}

    std::uint16_t Open(std::string const& inAddress, std::uint16_t inPort) {
        try {
            tcp::endpoint const endpoint(asio::ip::make_address(inAddress), inPort);
            mAcceptor.open(endpoint.protocol());
            mAcceptor.set_option(asio::socket_base::reuse_address(true));
            mAcceptor.bind(endpoint);
            mAcceptor.listen(asio::socket_base::max_listen_connections);
            return mAcceptor.local_endpoint().port();
        } catch (boost::system::system_error const& error) {
            throw std::runtime_error("cannot listen on " + inAddress + " port " + std::to_string(inPort) +
                                     ": " + error.code().message() +
                                     "; choose another port or stop what uses it");
        }
    }

    void Accept() {
        mAcceptor.async_accept(
            asio::make_strand(mCore.io),
            [self = shared_from_this()](boost::system::error_code inError, tcp::socket inSocket) {
                self->OnAccepted(inError, std::move(inSocket));
            });
    }

    void Close() {
        asio::post(mAcceptor.get_executor(), [self = shared_from_this()] {
            boost::system::error_code ignored;
            self->mAcceptor.close(ignored);
            self->mPause.cancel();
        });
    }

private:
    void OnAccepted(boost::system::error_code inError, tcp::socket inSocket) {
        if (!mAcceptor.is_open() || mCore.isStopping)
            return;
        if (!inError) {
            StartConnection(mCore, std::move(inSocket), mTls);
            return Accept();
        }
        // Out of descriptors, most likely: taking a breath lets connections end meanwhile.
        mPause.expires_after(kAcceptPause);
        mPause.async_wait([self = shared_from_this()](boost::system::error_code inWaitError) {
            if (!inWaitError)
                self->Accept();
        });
    }

    ServerCore& mCore;
    std::shared_ptr<asio::ssl::context> const mTls;
    tcp::acceptor mAcceptor;
    asio::steady_timer mPause;
};

}  // namespace

class Server::Implementation {
public:
    Implementation(ServerLimits const& inLimits, RequestHandler inHandler, LaneFunction inLaneOf,
                   FaultFunction inFaultOf)
        : mCore(inLimits, std::move(inHandler), std::move(inLaneOf), std::move(inFaultOf)),
          mWork(mCore.io.get_executor()) {}

    std::uint16_t Listen(std::string const& inAddress, std::uint16_t inPort,
                         std::shared_ptr<asio::ssl::context> inTls) {
        auto const listener = std::make_shared<Listener>(mCore, std::move(inTls));
        std::uint16_t const port = listener->Open(inAddress, inPort);
        mListeners.push_back(listener);
        return port;
    }

    void Start() {
        for (auto const& listener : mListeners)
            listener->Accept();
        for (std::size_t i = 0; i < mCore.limits.ioThreads; ++i)
            mThreads.emplace_back([this] { RunIo(); });
    }

    void Stop() {
        if (mCore.isStopping.exchange(true))
            return;
        for (auto const& listener : mListeners)
            listener->Close();
        if (!mThreads.empty()) {
            mCore.ForEachConnection(&ServerCore::Handle::endWhenIdle);
            if (!mCore.WaitUntilAllEnded(mCore.limits.drain)) {
                mCore.ForEachConnection(&ServerCore::Handle::endNow);
                mCore.WaitUntilAllEnded(std::chrono::seconds(1));
            }
        }
        mCore.readers.join();
        mCore.writers.join();
        mCore.signIns.join();
        mWork.reset();
        mCore.io.stop();
        for (auto& thread : mThreads)
            thread.join();
        mThreads.clear();
        mListeners.clear();
    }

private:
    // What a handler throws (memory is short, say) costs its connection, not the server.
    void RunIo() {
        while (true) {
            try {
                mCore.io.run();
                return;
            } catch (std::exception const& error) {
                std::cerr << std::string("zohub: a connection was dropped: ") + error.what() + "\n";
            }
        }
    }

    ServerCore mCore;
    asio::executor_work_guard<asio::io_context::executor_type> mWork;
    std::vector<std::shared_ptr<Listener>> mListeners;
    std::vector<std::thread> mThreads;
};

Server::Server(ServerLimits const& inLimits, RequestHandler inHandler, LaneFunction inLaneOf,
               FaultFunction inFaultOf)
    : mImplementation(std::make_shared<Implementation>(inLimits, std::move(inHandler), std::move(inLaneOf),
                                                       std::move(inFaultOf))) {}

Server::~Server() {
    Stop();
}

std::uint16_t Server::ListenPlain(std::string const& inAddress, std::uint16_t inPort) {
    return mImplementation->Listen(inAddress, inPort, nullptr);
}

std::uint16_t Server::ListenTls(std::string const& inAddress, std::uint16_t inPort,
                                std::shared_ptr<asio::ssl::context> inContext) {
    return mImplementation->Listen(inAddress, inPort, std::move(inContext));
}

void Server::Start() {
    mImplementation->Start();
}

void Server::Stop() {
    mImplementation->Stop();
}

}  // namespace zohub
