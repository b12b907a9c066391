// The one thread that moves bytes: all transfers run on it, side by side.
#pragma once

#include <curl/curl.h>

#include <chrono>
#include <deque>
#include <functional>
#include <memory>
#include <thread>
#include <unordered_map>
#include <vector>

#include "ostcore/threads/Mutex.h"
#include "ostnet/http/detail/Exchange.h"

namespace ostnet {
namespace http {

/// Runs transfers on the engine's event interface over epoll.
///
/// Orders (begin, drop) come in from any thread through a list; only when the thread sleeps does an order
/// wake it, so that a busy thread takes many orders for one look at the list. Ended transfers leave in
/// batches, on the network thread. Only so many transfers run at a time; the others wait here in their order,
/// since the engine's own queue costs a look at all of it for each transfer that ends. A dropped exchange is
/// not handed over.
class NetworkThread {
public:
    using Exchanges = std::vector<std::shared_ptr<Exchange>>;
    /// The side of the workers, called on the network thread; none of it may block.
    struct Workers {
        /// Takes the exchanges whose transfer has ended.
        std::function<void(Exchanges& ioEnded)> takeEnded;
        /// Takes an exchange whose observer has something to hear.
        std::function<void(const std::shared_ptr<Exchange>&)> takeProgress;
        /// True while jobs wait for a busy worker and another one sleeps. The network thread then looks again
        /// in a moment, and wakes one if the jobs still wait: that is cheaper than a wake-up for each batch.
        std::function<bool()> mayStall;
        std::function<void()> wakeOne;
    };

    NetworkThread(Workers inWorkers, std::uint32_t inMostTransfers);
    ~NetworkThread();
    NetworkThread(const NetworkThread&) = delete;
    NetworkThread& operator=(const NetworkThread&) = delete;

    /// False after Stop.
    bool Begin(std::shared_ptr<Exchange> inExchange);
    void Drop(std::shared_ptr<Exchange> inExchange);
    /// Drops all transfers, closes all connections, joins the thread. May be called again.
    void Stop();

private:
    using Clock = Exchange::Clock;
    struct Orders {
        Exchanges begin;
        Exchanges drop;
        bool stop = false;
        bool IsEmpty() const noexcept { return begin.empty() && drop.empty() && !stop; }
    };
    struct Transfer {
        NetworkThread* owner = nullptr;
        std::shared_ptr<Exchange> exchange;
        shared_ptr<NetworkSettings const> preparedFor;
        bool isObserved = false;
    };
    struct Socket {
        bool isConnection = false;
        std::uint32_t wanted = 0;   // by the engine
        std::uint32_t watched = 0;  // by the event queue
    };
    struct IdleHandle {
        CURL* handle;
        shared_ptr<NetworkSettings const> preparedFor;
        bool isForTLS = false;
    };

    void Run();
    bool OpenEngine();
    bool MayFallAsleep();
    void WaitForEvents();
    bool MayLinger(Clock::time_point inNow);
    void HandOverEnded();
    bool TakeOrders();
    void RunEngineTimer();
    void CollectEnded();
    void CheckDeadlines();
    int MillisecondsToNextTimer(Clock::time_point inNow) const;

    void BeginWaiting();
    void BeginTransfer(std::shared_ptr<Exchange> inExchange);
    void DropExchange(const std::shared_ptr<Exchange>& inExchange);
    void EndTransfer(CURL* inHandle, CURLcode inResult);
    IdleHandle TakeHandle(const Request& inRequest);
    void KeepHandle(IdleHandle inHandle);
    bool Give(std::shared_ptr<Exchange> inExchange, Exchanges Orders::*inList);
    void Wake() noexcept;
    void CloseAll();

    void Watch(int inSocket, std::uint32_t inEvents);
    Socket& SocketOf(int inSocket);

    static curl_socket_t OnOpenSocket(void* inThis, curlsocktype inPurpose, curl_sockaddr* inAddress);
    static int OnCloseSocket(void* inThis, curl_socket_t inSocket);
    static int OnSocketChange(CURL* inHandle, curl_socket_t inSocket, int inWhat, void* inThis, void* inSeen);
    static int OnTimerChange(CURLM* inMulti, long inMilliseconds, void* inThis);
    static int OnTransferProgress(void* inTransfer, curl_off_t inReceiveTotal, curl_off_t inReceived,
                                  curl_off_t inSendTotal, curl_off_t inSent);

    const Workers mWorkers;

    ostcore::threads::Mutex mMutex;
    Orders mOrders ZO_GUARDED_BY(mMutex);
    bool mIsAsleep ZO_GUARDED_BY(mMutex) = false;
    bool mIsStopped ZO_GUARDED_BY(mMutex) = false;

    // On the network thread only, once it has started.
    const std::size_t mMostTransfers;
    CURLM* mMulti = nullptr;
    int mEpoll = -1;
    int mWakeUp = -1;
    std::unordered_map<CURL*, Transfer> mTransfers;
    std::deque<std::shared_ptr<Exchange>> mWaiting;
    std::vector<Socket> mSockets;
    std::vector<IdleHandle> mIdleHandles;
    Exchanges mEndedExchanges;
    bool mIsLingering = false;
    Clock::time_point mLingerUntil;
    bool mHasEngineTimer = false;
    Clock::time_point mEngineTimer;
    Clock::time_point mNextSweep;
    Clock::duration mSweepEvery;

    std::thread mThread;
};

}  // namespace http
}  // namespace ostnet
