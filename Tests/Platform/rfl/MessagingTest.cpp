// Messages: order, threads, and listeners that change while a message is delivered.
#include <gtest/gtest.h>

#include <condition_variable>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "ostcore/threads/MainThread.h"
#include "RFL/Messaging.h"

using namespace RFL;
namespace threads = ostcore::threads;

namespace {

struct NumberMessage : MessageImpl<NumberMessage> {
    explicit NumberMessage(int inNumber) : number(inNumber) {}
    int number;
};
struct OtherMessage : MessageImpl<OtherMessage> {};

class Messaging : public testing::Test {
protected:
    void SetUp() override {
        threads::ResetMainThread();
        ASSERT_TRUE(threads::SetMainThread());
    }
    void TearDown() override { threads::ResetMainThread(); }

    static void PumpAll() {
        while (threads::PumpMainThread() > 0) {
        }
    }
    void Post(int inNumber, bool inSynchronous = false) {
        EXPECT_TRUE(StationUtils::PostMessageToUIThread(mStation, NumberMessage(inNumber), inSynchronous));
    }
    function<void(const NumberMessage&)> Recorder() {
        return [this](const NumberMessage& inMessage) { mSeen.push_back(inMessage.number); };
    }

    const ImmutableString mStation = StationRegistry::RegisterUniqueStation();
    std::vector<int> mSeen;
};

using Numbers = std::vector<int>;

}  // namespace

TEST_F(Messaging, TypesAndStationsAreToldApart) {
    EXPECT_EQ(HashMessageTypeNameToMessageID(""), 0xCBF29CE484222325ull);
    EXPECT_EQ(HashMessageTypeNameToMessageID("a"), 0xAF63DC4C8601EC8Cull);
    EXPECT_NE(NumberMessage::TypeID(), OtherMessage::TypeID());
    EXPECT_NE(mStation, StationRegistry::RegisterUniqueStation());
    Listener here(mStation);
    Listener elsewhere(StationRegistry::RegisterUniqueStation());
    here.AddHandler<NumberMessage>(Recorder());
    elsewhere.AddHandler<NumberMessage>([](const NumberMessage&) { FAIL() << "wrong station"; });
    here.AddHandler<OtherMessage>([](const OtherMessage&) { FAIL() << "wrong type"; });
    Post(1);
    PumpAll();
    EXPECT_EQ(mSeen, Numbers{1});
    EXPECT_FALSE(StationUtils::PostMessageToUIThread(mStation, shared_ptr<Message const>(), false));
}

TEST_F(Messaging, QueuedMessagesKeepTheirOrderAndSynchronousOnesGoAhead) {
    Listener listener(mStation);
    listener.AddHandler<NumberMessage>(Recorder());
    Post(1);
    Post(2);
    AsyncCallFromMainThread([this] { mSeen.push_back(100); });
    Post(3);
    EXPECT_TRUE(mSeen.empty());
    Post(4, true);
    EXPECT_EQ(mSeen, Numbers{4});
    PumpAll();
    EXPECT_EQ(mSeen, (Numbers{4, 1, 2, 100, 3}));
}

TEST_F(Messaging, ASynchronousPostOfAnotherThreadReturnsAfterTheDelivery) {
    Listener listener(mStation);
    const std::thread::id mainThread = std::this_thread::get_id();
    listener.AddHandler<NumberMessage>([&](const NumberMessage& inMessage) {
        EXPECT_EQ(std::this_thread::get_id(), mainThread);
        mSeen.push_back(inMessage.number);
    });
    std::atomic<bool> isDone{false};
    Numbers seenByPoster;
    std::thread poster([&] {
        Post(1);
        Post(2, true);
        seenByPoster = mSeen;
        threads::AsyncCallFromMainThread([&] { isDone = true; });
    });
    while (!isDone) {
        threads::WaitAndPumpMainThread(0xFFFFFFFFu);
    }
    poster.join();
    EXPECT_EQ(seenByPoster, (Numbers{1, 2}));
}

TEST_F(Messaging, AWaitingPosterIsLetGoWhenTheQueueIsDropped) {
    std::mutex mutex;
    std::condition_variable queued;
    bool isQueued = false;
    threads::SetMainThreadWakeFunction([&] {
        const std::lock_guard<std::mutex> lock(mutex);
        isQueued = true;
        queued.notify_all();
    });
    bool wasDelivered = true;
    std::thread poster(
        [&] { wasDelivered = StationUtils::PostMessageToUIThread(mStation, NumberMessage(1), true); });
    {
        std::unique_lock<std::mutex> lock(mutex);
        queued.wait(lock, [&] { return isQueued; });
    }
    threads::SetMainThreadWakeFunction({});
    threads::ResetMainThread();
    poster.join();
    EXPECT_FALSE(wasDelivered);
}

TEST_F(Messaging, HandlersMayBeAddedAndRemovedDuringADelivery) {
    Listener listener(mStation);
    Listener::HandlerID second = 0;
    listener.AddHandler<NumberMessage>([&](const NumberMessage& inMessage) {
        mSeen.push_back(inMessage.number);
        if (inMessage.number == 1) {
            listener.RemoveHandler(second);
            listener.AddHandler<NumberMessage>(
                [this](const NumberMessage& inLater) { mSeen.push_back(inLater.number * 10); });
        }
    });
    second = listener.AddHandler<NumberMessage>([](const NumberMessage&) { FAIL() << "was removed"; });
    Post(1, true);
    Post(2, true);
    EXPECT_EQ(mSeen, (Numbers{1, 2, 20}));
    listener.RemoveHandler(second);
    listener.RemoveHandler(12345);
}

TEST_F(Messaging, AListenerMayEndItselfAndOthersDuringADelivery) {
    auto victim = std::make_unique<Listener>(mStation);
    auto first = std::make_unique<Listener>(mStation);
    victim.reset();
    auto last = std::make_unique<Listener>(mStation);
    const auto guard = std::make_shared<int>(7);
    first->AddHandler<NumberMessage>([&, guard](const NumberMessage& inMessage) {
        last.reset();
        first.reset();
        // What the handler holds lives until it returns.
        mSeen.push_back(inMessage.number + *guard);
    });
    last->AddHandler<NumberMessage>([](const NumberMessage&) { FAIL() << "its listener has ended"; });
    Post(1, true);
    Post(2, true);
    EXPECT_EQ(mSeen, Numbers{8});
    EXPECT_EQ(guard.use_count(), 1);
}

TEST_F(Messaging, AHandlerThatThrowsKeepsNoMessageFromTheOthers) {
    Listener listener(mStation);
    listener.AddHandler<NumberMessage>(
        [](const NumberMessage&) { throw std::runtime_error("expected here"); });
    listener.AddHandler<NumberMessage>([](const NumberMessage&) { throw 7; });
    listener.AddHandler<NumberMessage>(Recorder());
    Post(1);
    Post(2);
    PumpAll();
    EXPECT_EQ(mSeen, (Numbers{1, 2}));
}

TEST_F(Messaging, ManyThreadsPostWhileListenersComeAndGo) {
    constexpr int kThreads = 3;
    constexpr int kMessages = 300;
    std::vector<Numbers> seen(kThreads);
    Listener listener(mStation);
    listener.AddHandler<NumberMessage>([&](const NumberMessage& inMessage) {
        seen[static_cast<std::size_t>(inMessage.number / 1000)].push_back(inMessage.number % 1000);
    });
    std::atomic<int> running{kThreads};
    std::vector<std::thread> posters;
    for (int poster = 0; poster < kThreads; ++poster) {
        posters.emplace_back([&, poster] {
            for (int message = 0; message < kMessages; ++message) {
                Listener passing(mStation);
                passing.AddHandler<NumberMessage>([](const NumberMessage&) {});
                Post(poster * 1000 + message, message % 50 == 49);
            }
            threads::AsyncCallFromMainThread([&] { --running; });
        });
    }
    while (running > 0) {
        threads::WaitAndPumpMainThread(0xFFFFFFFFu);
    }
    for (std::thread& poster : posters) {
        poster.join();
    }
    for (const Numbers& numbers : seen) {
        ASSERT_EQ(numbers.size(), static_cast<std::size_t>(kMessages));
        EXPECT_TRUE(std::is_sorted(numbers.begin(), numbers.end()));
    }
}
