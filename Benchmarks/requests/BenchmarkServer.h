// A small HTTP server in a process of its own, so that its work does not count as the client's.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <cstdint>

namespace bench {

/// Answers every GET on every connection with a body of one size, a tag, and a word on how long that may be
/// kept. Made before any thread of the client.
class BenchmarkServer {
public:
    explicit BenchmarkServer(std::size_t inBodySize, const char* inCacheControl = "no-cache");
    ~BenchmarkServer();
    BenchmarkServer(const BenchmarkServer&) = delete;
    BenchmarkServer& operator=(const BenchmarkServer&) = delete;
    std::uint16_t Port() const noexcept { return mPort; }

private:
    pid_t mProcess = -1;
    std::uint16_t mPort = 0;
};

}  // namespace bench
