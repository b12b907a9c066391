#include "ostnet/http/detail/NetworkThread.h"

#include <openssl/err.h>
#include <openssl/ssl.h>
#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>

#include "ostcore/debug/Trace.h"
#include "ostnet/http/detail/ThreadStart.h"

namespace ostnet {
namespace http {
namespace {

using ostcore::threads::MutexLock;

constexpr std::size_t kMostIdleHandles = 64;
constexpr std::size_t kEventsAtOnce = 128;
constexpr int kPatienceWithWorkers = 1;
constexpr std::size_t kEndedAtOnce = 16;
constexpr std::size_t kManyTransfers = 8;
constexpr std::chrono::microseconds kLingerFor(200);
/// Below the size from which the allocator tidies up at each release: the engine takes one per transfer.
constexpr long kReceiveBufferSize = 32 << 10;
constexpr std::chrono::milliseconds kSlowestSweep(1000);
constexpr std::chrono::milliseconds kFastestSweep(20);

std::uint32_t EventsOf(int inWhat) noexcept {
    return ((inWhat & CURL_POLL_IN) != 0 ? EPOLLIN : 0u) | ((inWhat & CURL_POLL_OUT) != 0 ? EPOLLOUT : 0u);
}

int ActionsOf(std::uint32_t inEvents) noexcept {
    return ((inEvents & EPOLLIN) != 0 ? CURL_CSELECT_IN : 0) |
           ((inEvents & EPOLLOUT) != 0 ? CURL_CSELECT_OUT : 0) |
           ((inEvents & (EPOLLERR | EPOLLHUP)) != 0 ? CURL_CSELECT_ERR : 0);
}

const char* OrNone(const std::string& inText) noexcept {
    return inText.empty() ? nullptr : inText.c_str();
}

/// Takes nothing from the verdict. What a failed check has left in the error queue goes, so that the engine
/// finds the verdict there first: else a certificate whose signature does not fit, as of an impostor under a
/// trusted name, looks like a broken connection.
int OnVerified(int inIsGood, X509_STORE_CTX*) {
    if (inIsGood != 1) {
        ERR_clear_error();
    }
    return inIsGood;
}

CURLcode OnTLSContext(CURL*, void* ioContext, void*) {
    SSL_CTX_set_verify(static_cast<SSL_CTX*>(ioContext), SSL_VERIFY_PEER, &OnVerified);
    return CURLE_OK;
}

void PrepareTrust(CURL* ioHandle, const NetworkSettings& inSettings) {
    curl_easy_setopt(ioHandle, CURLOPT_SSL_VERIFYPEER, 1L);
    curl_easy_setopt(ioHandle, CURLOPT_SSL_VERIFYHOST, 2L);
    curl_easy_setopt(ioHandle, CURLOPT_SSL_CTX_FUNCTION, &OnTLSContext);
    curl_easy_setopt(ioHandle, CURLOPT_SSLVERSION, static_cast<long>(CURL_SSLVERSION_TLSv1_2));
    const auto& file = inSettings.certificateAuthorityFile;
    const auto& directory = inSettings.certificateAuthorityDirectory;
    if (!file.empty() || !directory.empty()) {
        // Both are set, so that the system's authorities are not trusted beside the chosen ones.
        for (const CURLoption option : {CURLOPT_CAINFO, CURLOPT_PROXY_CAINFO}) {
            curl_easy_setopt(ioHandle, option, OrNone(file));
        }
        for (const CURLoption option : {CURLOPT_CAPATH, CURLOPT_PROXY_CAPATH}) {
            curl_easy_setopt(ioHandle, option, OrNone(directory));
        }
    }
}

bool HasProxyVariable() {
    constexpr const char* kNames[] = {"http_proxy", "https_proxy", "HTTPS_PROXY", "all_proxy", "ALL_PROXY"};
    return std::any_of(std::begin(kNames), std::end(kNames), [](const char* inName) {
        const char* const value = std::getenv(inName);
        return value && *value;
    });
}

/// Sets all options that do not change from request to request.
void Prepare(CURL* ioHandle, const NetworkSettings& inSettings) {
    curl_easy_setopt(ioHandle, CURLOPT_NOSIGNAL, 1L);
    // A cancel must not wait for a name look-up that is under way.
    curl_easy_setopt(ioHandle, CURLOPT_QUICK_EXIT, 1L);
    curl_easy_setopt(ioHandle, CURLOPT_PROTOCOLS_STR, "http,https");
    curl_easy_setopt(ioHandle, CURLOPT_FOLLOWLOCATION, 0L);
    curl_easy_setopt(ioHandle, CURLOPT_PATH_AS_IS, 1L);
    curl_easy_setopt(ioHandle, CURLOPT_HTTP09_ALLOWED, 0L);
    curl_easy_setopt(ioHandle, CURLOPT_SUPPRESS_CONNECT_HEADERS, 1L);
    curl_easy_setopt(ioHandle, CURLOPT_TCP_KEEPALIVE, 1L);
    curl_easy_setopt(ioHandle, CURLOPT_BUFFERSIZE, kReceiveBufferSize);
    curl_easy_setopt(ioHandle, CURLOPT_USERAGENT, OrNone(inSettings.userAgent));
    curl_easy_setopt(ioHandle, CURLOPT_CONNECTTIMEOUT_MS,
                     static_cast<long>(inSettings.limits.connectTimeout));
    if (!inSettings.proxy.empty()) {
        curl_easy_setopt(ioHandle, CURLOPT_PROXY, inSettings.proxy.c_str());
        curl_easy_setopt(ioHandle, CURLOPT_NOPROXY, inSettings.noProxy.c_str());
    } else if (!HasProxyVariable()) {
        curl_easy_setopt(ioHandle, CURLOPT_PROXY, "");  // spares the engine its look for each request
    }
    PrepareTrust(ioHandle, inSettings);
}

}  // namespace

NetworkThread::NetworkThread(Workers inWorkers, std::uint32_t inMostTransfers)
    : mWorkers(std::move(inWorkers)),
      mMostTransfers(std::max(inMostTransfers, 1u)),
      mSweepEvery(kSlowestSweep) {
    if (OpenEngine()) {
        mThread = StartThread([this] { Run(); });
        return;
    }
    ostcore::debug::Trace(
        "ostnet", ostcore::debug::kTraceLevel_Fatal,
        "The network cannot start: no descriptor for its event queue. Raise the limit of open files.");
    MutexLock lock(mMutex);
    mIsStopped = true;
}

NetworkThread::~NetworkThread() {
    Stop();
    CloseAll();
}

bool NetworkThread::OpenEngine() {
    static const CURLcode sGlobalInit = curl_global_init(CURL_GLOBAL_DEFAULT);
    mEpoll = epoll_create1(EPOLL_CLOEXEC);
    mWakeUp = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    mMulti = curl_multi_init();
    if (sGlobalInit != CURLE_OK || mEpoll < 0 || mWakeUp < 0 || !mMulti) {
        return false;
    }
    curl_multi_setopt(mMulti, CURLMOPT_SOCKETFUNCTION, &NetworkThread::OnSocketChange);
    curl_multi_setopt(mMulti, CURLMOPT_SOCKETDATA, this);
    curl_multi_setopt(mMulti, CURLMOPT_TIMERFUNCTION, &NetworkThread::OnTimerChange);
    curl_multi_setopt(mMulti, CURLMOPT_TIMERDATA, this);
    curl_multi_setopt(mMulti, CURLMOPT_PIPELINING, static_cast<long>(CURLPIPE_MULTIPLEX));
    curl_multi_setopt(mMulti, CURLMOPT_MAXCONNECTS, static_cast<long>(mMostTransfers));
    epoll_event event{};
    event.events = EPOLLIN;
    event.data.fd = mWakeUp;
    return epoll_ctl(mEpoll, EPOLL_CTL_ADD, mWakeUp, &event) == 0;
}

bool NetworkThread::Begin(std::shared_ptr<Exchange> inExchange) {
    return Give(std::move(inExchange), &Orders::begin);
}

void NetworkThread::Drop(std::shared_ptr<Exchange> inExchange) {
    inExchange->MarkDropped();
    Give(std::move(inExchange), &Orders::drop);
}

bool NetworkThread::Give(std::shared_ptr<Exchange> inExchange, Exchanges Orders::*inList) {
    MutexLock lock(mMutex);
    if (mIsStopped) {
        return false;
    }
    (mOrders.*inList).push_back(std::move(inExchange));
    if (std::exchange(mIsAsleep, false)) {
        lock.Unlock();
        Wake();
    }
    return true;
}

void NetworkThread::Wake() noexcept {
    const std::uint64_t one = 1;
    [[maybe_unused]] const auto written = write(mWakeUp, &one, sizeof one);  // full: it is awake already
}

void NetworkThread::Stop() {
    {
        MutexLock lock(mMutex);
        mIsStopped = true;
        mOrders.stop = true;
        mIsAsleep = false;
    }
    Wake();
    if (mThread.joinable()) {
        mThread.join();
    }
}

void NetworkThread::Run() {
    for (;;) {
        WaitForEvents();
        if (!TakeOrders()) {
            break;
        }
        RunEngineTimer();
        CollectEnded();
        CheckDeadlines();
        BeginWaiting();
    }
    mWaiting.clear();
    while (!mTransfers.empty()) {
        EndTransfer(mTransfers.begin()->first, CURLE_ABORTED_BY_CALLBACK);
    }
    mEndedExchanges.clear();
}

/// Orders that came before the thread could say that it sleeps keep it awake.
bool NetworkThread::MayFallAsleep() {
    MutexLock lock(mMutex);
    mIsAsleep = mOrders.IsEmpty();
    return mIsAsleep;
}

int NetworkThread::MillisecondsToNextTimer(Clock::time_point inNow) const {
    if (mTransfers.empty() && !mHasEngineTimer) {
        return -1;
    }
    Clock::time_point next = mTransfers.empty() ? mEngineTimer : mNextSweep;
    if (mHasEngineTimer) {
        next = std::min(next, mEngineTimer);
    }
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(next - inNow).count();
    return left <= 0 ? 0 : static_cast<int>(std::min<long long>(left, 60000));
}

void NetworkThread::HandOverEnded() {
    if (!mEndedExchanges.empty()) {
        mWorkers.takeEnded(mEndedExchanges);
        mEndedExchanges.clear();
    }
}

/// With many transfers under way, what has ended waits a moment for others that end: one wake-up of a worker,
/// and one of this thread for what the worker then starts, serve them all. Orders wait for that moment, too.
bool NetworkThread::MayLinger(Clock::time_point inNow) {
    if (mEndedExchanges.empty() || mTransfers.size() < kManyTransfers ||
        mEndedExchanges.size() >= kEndedAtOnce) {
        mIsLingering = false;
        return false;
    }
    if (!std::exchange(mIsLingering, true)) {
        mLingerUntil = inNow + kLingerFor;
    }
    mIsLingering = inNow < mLingerUntil;
    return mIsLingering;
}

void NetworkThread::WaitForEvents() {
    std::array<epoll_event, kEventsAtOnce> events;
    const auto now = Clock::now();
    int count = 0;
    bool mustLookAfterWorkers = false;
    if (MayLinger(now)) {
        const timespec rest{0, std::chrono::nanoseconds(mLingerUntil - now).count()};
        count = epoll_pwait2(mEpoll, events.data(), static_cast<int>(events.size()), &rest, nullptr);
        if (count < 0) {
            HandOverEnded();  // a kernel without this call does not linger
        }
    } else {
        HandOverEnded();
        int wait = MayFallAsleep() ? MillisecondsToNextTimer(now) : 0;
        mustLookAfterWorkers = wait != 0 && mWorkers.mayStall();
        if (mustLookAfterWorkers) {
            wait = kPatienceWithWorkers;
        }
        count = epoll_wait(mEpoll, events.data(), static_cast<int>(events.size()), wait);
        MutexLock lock(mMutex);
        mIsAsleep = false;
    }
    if (mustLookAfterWorkers && count == 0) {
        mWorkers.wakeOne();
    }
    for (int i = 0; i < count; ++i) {
        const epoll_event& event = events[static_cast<std::size_t>(i)];
        if (event.data.fd == mWakeUp) {
            std::uint64_t wakes = 0;
            [[maybe_unused]] const auto size = read(mWakeUp, &wakes, sizeof wakes);
            continue;
        }
        if (const Socket& socket = SocketOf(event.data.fd); socket.wanted == 0) {
            // One that was closed since the events were fetched may be somebody else's descriptor by now.
            if (socket.watched != 0) {
                Watch(event.data.fd, 0);
            }
            continue;
        }
        int running = 0;
        curl_multi_socket_action(mMulti, event.data.fd, ActionsOf(event.events), &running);
    }
}

/// False when the thread is to end.
bool NetworkThread::TakeOrders() {
    Orders orders;
    {
        MutexLock lock(mMutex);
        std::swap(orders.begin, mOrders.begin);
        std::swap(orders.drop, mOrders.drop);
        orders.stop = mOrders.stop;
    }
    if (orders.stop) {
        return false;
    }
    std::move(orders.begin.begin(), orders.begin.end(), std::back_inserter(mWaiting));
    for (const auto& exchange : orders.drop) {
        DropExchange(exchange);
    }
    BeginWaiting();
    return true;
}

void NetworkThread::RunEngineTimer() {
    if (mHasEngineTimer && mEngineTimer <= Clock::now()) {
        mHasEngineTimer = false;
        int running = 0;
        curl_multi_socket_action(mMulti, CURL_SOCKET_TIMEOUT, 0, &running);
    }
}

void NetworkThread::CollectEnded() {
    int left = 0;
    while (const CURLMsg* message = curl_multi_info_read(mMulti, &left)) {
        if (message->msg == CURLMSG_DONE) {
            EndTransfer(message->easy_handle, message->data.result);
        }
    }
}

void NetworkThread::CheckDeadlines() {
    if (mTransfers.empty()) {
        return;
    }
    const auto now = Clock::now();
    if (now < mNextSweep) {
        return;
    }
    mNextSweep = now + mSweepEvery;
    std::vector<std::pair<CURL*, CURLcode>> late;
    for (const auto& [handle, transfer] : mTransfers) {
        if (const CURLcode verdict = transfer.exchange->CheckDeadlines(now); verdict != CURLE_OK) {
            late.emplace_back(handle, verdict);
        }
    }
    for (const auto& [handle, verdict] : late) {
        EndTransfer(handle, verdict);
    }
}

void NetworkThread::BeginWaiting() {
    while (!mWaiting.empty() && mTransfers.size() < mMostTransfers) {
        auto exchange = std::move(mWaiting.front());
        mWaiting.pop_front();
        BeginTransfer(std::move(exchange));
    }
}

void NetworkThread::BeginTransfer(std::shared_ptr<Exchange> inExchange) {
    if (inExchange->IsDropped()) {
        return;  // by a cancel whose order came before that to begin
    }
    const auto now = Clock::now();
    const auto& settings = inExchange->GetRequest().settings;
    const auto shortest = std::chrono::milliseconds(
        std::min({settings->limits.lowSpeedTime, settings->limits.responseTimeout}) / 4);
    const auto sweep = std::clamp(shortest, kFastestSweep, kSlowestSweep);
    if (mTransfers.empty() || sweep < mSweepEvery) {
        mSweepEvery = sweep;
        mNextSweep = now + mSweepEvery;
    }
    const IdleHandle idle = TakeHandle(inExchange->GetRequest());
    if (!idle.handle) {
        inExchange->Fail(CURLE_OUT_OF_MEMORY);
        mEndedExchanges.push_back(std::move(inExchange));
        return;
    }
    inExchange->Attach(idle.handle, now);
    Transfer& transfer = mTransfers[idle.handle];
    const bool isObserved = inExchange->GetRequest().options.observer != nullptr;
    transfer = {this, std::move(inExchange), idle.preparedFor, isObserved};
    if (isObserved) {
        curl_easy_setopt(idle.handle, CURLOPT_NOPROGRESS, 0L);
        curl_easy_setopt(idle.handle, CURLOPT_XFERINFODATA, &transfer);
    }
    if (curl_multi_add_handle(mMulti, idle.handle) != CURLM_OK) {
        EndTransfer(idle.handle, CURLE_FAILED_INIT);
    }
}

void NetworkThread::DropExchange(const std::shared_ptr<Exchange>& inExchange) {
    if (CURL* handle = inExchange->Handle()) {
        const std::size_t before = mEndedExchanges.size();
        EndTransfer(handle, CURLE_ABORTED_BY_CALLBACK);
        mEndedExchanges.resize(before);
        return;
    }
    if (const auto found = std::find(mWaiting.begin(), mWaiting.end(), inExchange); found != mWaiting.end()) {
        mWaiting.erase(found);
    }
}

void NetworkThread::EndTransfer(CURL* inHandle, CURLcode inResult) {
    const auto found = mTransfers.find(inHandle);
    if (found == mTransfers.end()) {
        return;
    }
    Transfer transfer = std::move(found->second);
    curl_multi_remove_handle(mMulti, inHandle);
    mTransfers.erase(found);
    if (transfer.isObserved) {
        curl_easy_setopt(inHandle, CURLOPT_NOPROGRESS, 1L);
    }
    const bool isForTLS = transfer.exchange->GetRequest().isSecure;
    KeepHandle({transfer.exchange->Detach(inResult), std::move(transfer.preparedFor), isForTLS});
    mEndedExchanges.push_back(std::move(transfer.exchange));
}

NetworkThread::IdleHandle NetworkThread::TakeHandle(const Request& inRequest) {
    const auto& settings = inRequest.settings;
    IdleHandle idle{nullptr, nullptr};
    if (!mIdleHandles.empty()) {
        idle = std::move(mIdleHandles.back());
        mIdleHandles.pop_back();
    } else {
        idle.handle = curl_easy_init();
    }
    if (idle.handle && (idle.preparedFor != settings || idle.isForTLS != inRequest.isSecure)) {
        curl_easy_reset(idle.handle);
        Prepare(idle.handle, *settings);
        Exchange::PrepareHandle(idle.handle, inRequest.isSecure);
        curl_easy_setopt(idle.handle, CURLOPT_NOPROGRESS, 1L);
        curl_easy_setopt(idle.handle, CURLOPT_XFERINFOFUNCTION, &NetworkThread::OnTransferProgress);
        curl_easy_setopt(idle.handle, CURLOPT_OPENSOCKETFUNCTION, &NetworkThread::OnOpenSocket);
        curl_easy_setopt(idle.handle, CURLOPT_OPENSOCKETDATA, this);
        curl_easy_setopt(idle.handle, CURLOPT_CLOSESOCKETFUNCTION, &NetworkThread::OnCloseSocket);
        curl_easy_setopt(idle.handle, CURLOPT_CLOSESOCKETDATA, this);
        idle.preparedFor = settings;
    }
    return idle;
}

void NetworkThread::KeepHandle(IdleHandle inHandle) {
    if (mIdleHandles.size() >= kMostIdleHandles) {
        curl_easy_cleanup(inHandle.handle);
        return;
    }
    mIdleHandles.push_back(std::move(inHandle));
}

void NetworkThread::CloseAll() {
    for (const IdleHandle& idle : std::exchange(mIdleHandles, {})) {
        curl_easy_cleanup(idle.handle);
    }
    if (mMulti) {
        curl_multi_cleanup(std::exchange(mMulti, nullptr));
    }
    for (int* descriptor : {&mEpoll, &mWakeUp}) {
        if (*descriptor >= 0) {
            close(std::exchange(*descriptor, -1));
        }
    }
}

/// A kept connection stays in the event queue between two transfers, since it is most often wanted again at
/// once. It leaves the queue when it has news that nobody wants, and when the engine closes it.
int NetworkThread::OnSocketChange(CURL*, curl_socket_t inSocket, int inWhat, void* inThis, void*) {
    auto& self = *static_cast<NetworkThread*>(inThis);
    Socket& socket = self.SocketOf(inSocket);
    socket.wanted = inWhat == CURL_POLL_REMOVE ? 0u : EventsOf(inWhat);
    if (socket.wanted == 0 ? !socket.isConnection : socket.wanted != socket.watched) {
        self.Watch(inSocket, socket.wanted);
    }
    return 0;
}

/// Has the event queue look for these events; for none, it forgets the socket.
void NetworkThread::Watch(int inSocket, std::uint32_t inEvents) {
    Socket& socket = SocketOf(inSocket);
    epoll_event event{};
    event.data.fd = inSocket;
    event.events = inEvents;
    if (inEvents == 0) {
        epoll_ctl(mEpoll, EPOLL_CTL_DEL, inSocket, &event);
    } else if (epoll_ctl(mEpoll, socket.watched != 0 ? EPOLL_CTL_MOD : EPOLL_CTL_ADD, inSocket, &event) !=
               0) {
        epoll_ctl(mEpoll, socket.watched != 0 ? EPOLL_CTL_ADD : EPOLL_CTL_MOD, inSocket, &event);
    }
    socket.watched = inEvents;
}

NetworkThread::Socket& NetworkThread::SocketOf(int inSocket) {
    const auto index = static_cast<std::size_t>(inSocket);
    if (index >= mSockets.size()) {
        mSockets.resize(index + 1);
    }
    return mSockets[index];
}

curl_socket_t NetworkThread::OnOpenSocket(void* inThis, curlsocktype, curl_sockaddr* inAddress) {
    const int opened = socket(inAddress->family, inAddress->socktype | SOCK_CLOEXEC, inAddress->protocol);
    if (opened >= 0) {
        static_cast<NetworkThread*>(inThis)->SocketOf(opened) = {true, 0, 0};
    }
    return opened;
}

int NetworkThread::OnCloseSocket(void* inThis, curl_socket_t inSocket) {
    static_cast<NetworkThread*>(inThis)->SocketOf(inSocket) = {};
    return close(inSocket);
}

int NetworkThread::OnTimerChange(CURLM*, long inMilliseconds, void* inThis) {
    auto& self = *static_cast<NetworkThread*>(inThis);
    self.mHasEngineTimer = inMilliseconds >= 0;
    self.mEngineTimer = Clock::now() + std::chrono::milliseconds(std::max(inMilliseconds, 0L));
    return 0;
}

int NetworkThread::OnTransferProgress(void* inTransfer, curl_off_t inReceiveTotal, curl_off_t inReceived,
                                      curl_off_t inSendTotal, curl_off_t inSent) {
    const auto& transfer = *static_cast<Transfer*>(inTransfer);
    const auto number = [](curl_off_t inValue) {
        return static_cast<std::uint64_t>(std::max<curl_off_t>(inValue, 0));
    };
    if (transfer.exchange->NoteProgress(number(inSent), number(inSendTotal), number(inReceived),
                                        number(inReceiveTotal))) {
        transfer.owner->mWorkers.takeProgress(transfer.exchange);
    }
    return 0;
}

}  // namespace http
}  // namespace ostnet
