// Stations and typed messages: how parts of a process tell each other of events, on the main thread.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <typeinfo>
#include <utility>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/ImmutableString.h"

namespace RFL {

using ostcore::utility::ImmutableString;

/// Tells the types of messages apart, across shared libraries as well.
using MessageID = std::uint64_t;

/// The number of a message type, made from its name alone (FNV-1a, 64 bits).
ZOPLATFORM_EXPORT MessageID HashMessageTypeNameToMessageID(std::string_view inTypeName) noexcept;

/// The root of all messages. A message does not change once it is posted.
class ZOPLATFORM_EXPORT Message {
public:
    virtual ~Message();
    virtual MessageID GetMessageID() const noexcept = 0;
};

/// What a concrete message derives from: `struct MyMessage : MessageImpl<MyMessage> { ... };`
/// Types are told apart by their qualified names, so the types that are posted to one station must differ in
/// them; two of one name in different unnamed namespaces are one type.
template <class T>
class MessageImpl : public Message {
public:
    /// Computed at first use and kept.
    static MessageID TypeID() noexcept {
        static const MessageID id = HashMessageTypeNameToMessageID(typeid(T).name());
        return id;
    }
    MessageID GetMessageID() const noexcept override { return TypeID(); }
};

class ZOPLATFORM_EXPORT StationRegistry {
public:
    /// A station that nobody else in this process has. A station is a name and needs no release.
    /// Threads: any.
    static ImmutableString RegisterUniqueStation();
};

class ZOPLATFORM_EXPORT StationUtils {
public:
    /// Delivers a message to the listeners of a station, on the main thread, in the order in which they
    /// began to listen.
    ///
    /// Not synchronous: the message is queued and the call returns at once; messages are delivered in the
    /// order in which they were posted. Synchronous: on the main thread it is delivered before the call
    /// returns, ahead of what is queued; on any other thread it is queued and the call waits until it has
    /// been delivered, so the caller must hold no lock that a listener could want, and the main thread must
    /// be running its queue.
    ///
    /// Returns false when the message will not be delivered: it is null, or the main thread's queue was
    /// dropped while the call waited. A handler that throws is traced and does not keep the message from the
    /// others. Threads: any.
    static bool PostMessageToUIThread(const ImmutableString& inStation, shared_ptr<Message const> inMessage,
                                      bool inSynchronous);

    /// The same for a message given by value.
    template <class T>
    static auto PostMessageToUIThread(const ImmutableString& inStation, const T& inMessage,
                                      bool inSynchronous) -> decltype(T::TypeID(), true) {
        return PostMessageToUIThread(inStation, shared_ptr<Message const>(boost::make_shared<T>(inMessage)),
                                     inSynchronous);
    }
};

/// Listens at one station and hands each message to the handlers of its type.
///
/// Handlers may be added and removed at any time, also by a handler during a delivery: one that is added
/// then sees the next message, one that is removed is not called again. The listener may be destroyed by its
/// own handler.
///
/// Threads: any. Handlers run on the main thread, with no lock held. When a handler is removed or the
/// listener is destroyed on the main thread, the handler is not called afterwards; on another thread, one
/// call that has begun may still be under way when the operation returns.
class ZOPLATFORM_EXPORT Listener {
public:
    using HandlerID = std::uint64_t;

    explicit Listener(const ImmutableString& inStation);
    ~Listener();
    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    /// Calls inHandler for every message of type T from now on.
    template <class T>
    HandlerID AddHandler(function<void(const T&)> inHandler) {
        return AddRawHandler(T::TypeID(), [handler = std::move(inHandler)](const Message& inMessage) {
            handler(static_cast<const T&>(inMessage));
        });
    }
    /// An unknown ID has no effect.
    void RemoveHandler(HandlerID inHandler);
    const ImmutableString& GetStation() const noexcept;

private:
    HandlerID AddRawHandler(MessageID inType, function<void(const Message&)> inHandler);

    friend class MessageDelivery;
    struct State;
    shared_ptr<State> mState;
};

/// Runs a function on the main thread, in order with the messages. Threads: any.
ZOPLATFORM_EXPORT void AsyncCallFromMainThread(function<void()> inFunction);

}  // namespace RFL
