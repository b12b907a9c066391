// The hub's own certificates: a small authority made at the first start, and a server certificate from it.
#pragma once

#include <boost/asio/ssl/context.hpp>
#include <memory>
#include <string>

namespace zohub {

/// Where the certificates lie: <data>/tls/ca.pem (give this one to clients as SSL_CERT_FILE), server.pem and
/// the keys, which only this user can read.
std::string CaFilePath(std::string const& inDataDirectory);

/// Makes what is missing or about to expire, and loads it. Throws std::runtime_error.
std::shared_ptr<boost::asio::ssl::context> PrepareTls(std::string const& inDataDirectory);

}  // namespace zohub
