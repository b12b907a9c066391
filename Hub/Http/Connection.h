// One connection of a client: reads requests one after the other under deadlines and writes the answers.
//
// Every operation of a connection runs on its own strand, except the handling of a request, which runs on a
// worker; while that happens nothing else touches the connection. A slow client holds a socket and its
// buffers, never a thread.
#pragma once

#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ssl/context.hpp>
#include <memory>

#include "Http/ServerCore.h"

namespace zohub {

/// Takes the accepted socket over. Without a TLS context the connection is plain.
void StartConnection(ServerCore& inCore, boost::asio::ip::tcp::socket inSocket,
                     std::shared_ptr<boost::asio::ssl::context> inTls);

}  // namespace zohub
