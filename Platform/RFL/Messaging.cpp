// Delivery of messages: who listens is copied out under the lock, handlers run outside of it.
#include "RFL/Messaging.h"

#include <atomic>
#include <exception>
#include <unordered_map>
#include <vector>

#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/Guid.h"

namespace RFL {

using ostcore::threads::ConditionVariable;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

namespace {

struct Handler {
    Listener::HandlerID id;
    MessageID type;
    function<void(const Message&)> call;
    std::atomic<bool> isRemoved{false};
};

}  // namespace

struct Listener::State {
    explicit State(const ImmutableString& inStation) : station(inStation) {}

    const ImmutableString station;
    Mutex mutex;
    Listener::HandlerID lastID ZO_GUARDED_BY(mutex) = 0;
    std::vector<shared_ptr<Handler>> handlers ZO_GUARDED_BY(mutex);

    std::vector<shared_ptr<Handler>> HandlersOf(MessageID inType) {
        std::vector<shared_ptr<Handler>> found;
        const MutexLock lock(mutex);
        for (const shared_ptr<Handler>& handler : handlers) {
            if (handler->type == inType) {
                found.push_back(handler);
            }
        }
        return found;
    }
};

namespace {

void CallHandler(const Handler& inHandler, const Message& inMessage) {
    try {
        inHandler.call(inMessage);
    } catch (const std::exception& error) {
        ostcore::debug::Trace("RFL", ostcore::debug::kTraceLevel_Error,
                              std::string("A message handler has thrown: ") + error.what());
    } catch (...) {
        ostcore::debug::Trace("RFL", ostcore::debug::kTraceLevel_Error,
                              "A message handler has thrown something that is no std::exception");
    }
}

/// One delivery that another thread waits for. It ends when the message was delivered, or when the queue has
/// dropped it, which is when the last reference but the waiter's goes.
struct Delivery {
    Mutex mutex;
    ConditionVariable ended;
    bool hasEnded ZO_GUARDED_BY(mutex) = false;
    bool wasDelivered ZO_GUARDED_BY(mutex) = false;

    void End(bool inWasDelivered) {
        const MutexLock lock(mutex);
        wasDelivered = wasDelivered || inWasDelivered;
        hasEnded = true;
        ended.NotifyAll();
    }
    bool Wait() {
        MutexLock lock(mutex);
        while (!hasEnded) {
            ended.Wait(lock);
        }
        return wasDelivered;
    }
};

struct DeliveryGuard {
    explicit DeliveryGuard(shared_ptr<Delivery> inDelivery) : delivery(std::move(inDelivery)) {}
    ~DeliveryGuard() { delivery->End(false); }
    DeliveryGuard(const DeliveryGuard&) = delete;
    DeliveryGuard& operator=(const DeliveryGuard&) = delete;
    const shared_ptr<Delivery> delivery;
};

}  // namespace

/// Knows who listens where. Lives for ever, since listeners with static lifetime may end late.
class MessageDelivery {
public:
    static MessageDelivery& Get() {
        static MessageDelivery& delivery = *new MessageDelivery;
        return delivery;
    }
    void Add(const shared_ptr<Listener::State>& inListener) {
        const MutexLock lock(mMutex);
        mListeners[inListener->station].push_back(inListener);
    }
    void Remove(const shared_ptr<Listener::State>& inListener) {
        const MutexLock lock(mMutex);
        const auto found = mListeners.find(inListener->station);
        auto& listeners = found->second;
        listeners.erase(std::find(listeners.begin(), listeners.end(), inListener));
        if (listeners.empty()) {
            mListeners.erase(found);
        }
    }
    void Deliver(const ImmutableString& inStation, const Message& inMessage) {
        for (const auto& listener : At(inStation)) {
            for (const shared_ptr<Handler>& handler : listener->HandlersOf(inMessage.GetMessageID())) {
                if (!handler->isRemoved.load(std::memory_order_acquire)) {
                    CallHandler(*handler, inMessage);
                }
            }
        }
    }

private:
    std::vector<shared_ptr<Listener::State>> At(const ImmutableString& inStation) {
        const MutexLock lock(mMutex);
        const auto found = mListeners.find(inStation);
        return found == mListeners.end() ? std::vector<shared_ptr<Listener::State>>() : found->second;
    }

    Mutex mMutex;
    std::unordered_map<ImmutableString, std::vector<shared_ptr<Listener::State>>> mListeners
        ZO_GUARDED_BY(mMutex);
};

Message::~Message() = default;

MessageID HashMessageTypeNameToMessageID(std::string_view inTypeName) noexcept {
    std::uint64_t hash = 0xCBF29CE484222325ull;
    for (const char character : inTypeName) {
        hash = (hash ^ static_cast<unsigned char>(character)) * 0x100000001B3ull;
    }
    return hash;
}

ImmutableString StationRegistry::RegisterUniqueStation() {
    return ImmutableString("RFL.Station." + ostcore::utility::Guid::CreateUnique().ToString());
}

bool StationUtils::PostMessageToUIThread(const ImmutableString& inStation,
                                         shared_ptr<Message const> inMessage, bool inSynchronous) {
    if (!inMessage) {
        return false;
    }
    if (!inSynchronous) {
        AsyncCallFromMainThread([inStation, message = std::move(inMessage)] {
            MessageDelivery::Get().Deliver(inStation, *message);
        });
        return true;
    }
    if (ostcore::threads::IsMainThread()) {
        MessageDelivery::Get().Deliver(inStation, *inMessage);
        return true;
    }
    const auto delivery = boost::make_shared<Delivery>();
    AsyncCallFromMainThread(
        [guard = boost::make_shared<DeliveryGuard>(delivery), inStation, message = std::move(inMessage)] {
            MessageDelivery::Get().Deliver(inStation, *message);
            guard->delivery->End(true);
        });
    return delivery->Wait();
}

Listener::Listener(const ImmutableString& inStation) : mState(boost::make_shared<State>(inStation)) {
    MessageDelivery::Get().Add(mState);
}

Listener::~Listener() {
    MessageDelivery::Get().Remove(mState);
    std::vector<shared_ptr<Handler>> handlers;
    {
        const MutexLock lock(mState->mutex);
        handlers.swap(mState->handlers);
    }
    for (const shared_ptr<Handler>& handler : handlers) {
        handler->isRemoved.store(true, std::memory_order_release);
    }
}

Listener::HandlerID Listener::AddRawHandler(MessageID inType, function<void(const Message&)> inHandler) {
    const auto handler = boost::make_shared<Handler>();
    handler->type = inType;
    handler->call = std::move(inHandler);
    const MutexLock lock(mState->mutex);
    handler->id = ++mState->lastID;
    mState->handlers.push_back(handler);
    return handler->id;
}

void Listener::RemoveHandler(HandlerID inHandler) {
    shared_ptr<Handler> removed;
    {
        const MutexLock lock(mState->mutex);
        const auto found = std::find_if(
            mState->handlers.begin(), mState->handlers.end(),
            [&](const shared_ptr<Handler>& inCandidate) { return inCandidate->id == inHandler; });
        if (found == mState->handlers.end()) {
            return;
        }
        removed = *found;
        mState->handlers.erase(found);
    }
    removed->isRemoved.store(true, std::memory_order_release);
}

const ImmutableString& Listener::GetStation() const noexcept {
    return mState->station;
}

void AsyncCallFromMainThread(function<void()> inFunction) {
    ostcore::threads::AsyncCallFromMainThread(std::move(inFunction));
}

}  // namespace RFL
