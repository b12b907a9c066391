// A proxy between client and hub that lets through what a schedule lets through, and does to the rest what
// the schedule says.
//
// It listens on a free port of 127.0.0.1 and speaks plain HTTP/1.1; each connection of a client has one to
// the hub. What happens depends on the schedule and the number of the request alone, so the same requests in
// the same order meet the same faults. The addresses in the hub's documents lead through the proxy as well,
// since the hub takes them from the Host header.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Fault.h"

namespace faultproxy {

/// What was done with one request. Holds no header, query or body, so no secret.
struct LogEntry {
    std::size_t number = 0;
    std::size_t connection = 0;
    RequestLine request;
    Fault fault;
    /// Of the hub's answer; 0 when there was none.
    int hubStatus = 0;
    /// How it went on: "passed", or what ended the connection.
    std::string end;

    std::string Describe() const;
};

/// Threads: any. Calls return when they have taken effect.
class FaultProxy {
public:
    /// Port 0 for itself picks a free one. Throws boost::system::system_error.
    FaultProxy(std::uint16_t inHubPort, Schedule inSchedule, std::uint16_t inOwnPort = 0);
    /// Ends all connections.
    ~FaultProxy();
    FaultProxy(const FaultProxy&) = delete;
    FaultProxy& operator=(const FaultProxy&) = delete;

    std::uint16_t Port() const;
    /// "http://127.0.0.1:port"
    std::string URL() const;
    /// From now on this schedule; numbers and the log begin anew. Requests under way keep their fault.
    void Follow(Schedule inSchedule);
    /// From now on all is well. Numbers and log go on; an outage that a fault began ends.
    void BeGood();
    /// Connections from now on go to this port; those that stand stay.
    void SetHubPort(std::uint16_t inHubPort);

    /// A full outage: resets every connection and refuses new ones until Restore.
    void Cut();
    void Restore();

    /// Since the schedule began, at most the first 10,000 of them.
    std::vector<LogEntry> Log() const;
    /// One line per request that met a fault or did not pass; with inAll of every one.
    std::string LogText(bool inAll) const;
    std::size_t RequestCount() const;

private:
    class Implementation;
    const std::unique_ptr<Implementation> mImplementation;
};

}  // namespace faultproxy
