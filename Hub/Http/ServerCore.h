// What all connections of a server share: limits, threads, counters.
#pragma once

#include <atomic>
#include <boost/asio/io_context.hpp>
#include <boost/asio/thread_pool.hpp>
#include <condition_variable>
#include <mutex>
#include <unordered_map>
#include <vector>

#include "Http/Server.h"

namespace zohub {

struct ServerCore {
    ServerCore(ServerLimits const& inLimits, RequestHandler inHandler, LaneFunction inLaneOf,
               FaultFunction inFaultOf)
        : limits(inLimits),
          handler(std::move(inHandler)),
          laneOf(std::move(inLaneOf)),
          faultOf(std::move(inFaultOf)),
          io(static_cast<int>(inLimits.ioThreads)),
          readers(inLimits.readThreads),
          writers(inLimits.writeThreads),
          signIns(1) {}

    ServerLimits const limits;
    RequestHandler const handler;
    LaneFunction const laneOf;
    FaultFunction const faultOf;  // may be empty
    std::atomic<std::size_t> signInsWaiting{0};
    std::atomic<std::uint64_t> bodyBytes{0};
    std::atomic<bool> isStopping{false};

    /// Connections by address of their object; each can be asked to end when it is idle, or at once.
    struct Handle {
        std::function<void()> endWhenIdle;
        std::function<void()> endNow;
    };
    std::mutex mutex;
    std::condition_variable allEnded;
    std::unordered_map<void const*, Handle> connections;  // under mutex

    // Last, so destroyed first: what still waits in them holds connections, which look at the fields above.
    boost::asio::io_context io;
    boost::asio::thread_pool readers;
    boost::asio::thread_pool writers;
    boost::asio::thread_pool signIns;

    bool Register(void const* inConnection, Handle inHandle) {
        std::lock_guard const lock(mutex);
        if (connections.size() >= limits.maxConnections)
            return false;
        connections.emplace(inConnection, std::move(inHandle));
        return true;
    }

    void Unregister(void const* inConnection) {
        std::lock_guard const lock(mutex);
        connections.erase(inConnection);
        if (connections.empty())
            allEnded.notify_all();
    }

    boost::asio::thread_pool& PoolOf(Lane inLane) {
        return inLane == Lane::Read ? readers : inLane == Lane::Write ? writers : signIns;
    }

    /// Asks every connection, outside of the lock.
    void ForEachConnection(std::function<void()> Handle::*inQuestion) {
        std::vector<Handle> handles;
        {
            std::lock_guard const lock(mutex);
            for (auto const& [address, handle] : connections)
                handles.push_back(handle);
        }
        for (auto const& handle : handles)
            (handle.*inQuestion)();
    }

    bool WaitUntilAllEnded(std::chrono::milliseconds inLimit) {
        std::unique_lock lock(mutex);
        return allEnded.wait_for(lock, inLimit, [this] { return connections.empty(); });
    }
};

}  // namespace zohub
