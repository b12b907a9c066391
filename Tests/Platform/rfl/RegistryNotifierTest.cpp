// Change notification: within a process, between two, for stores that come later, and its end.
#include <chrono>

#include "ostcore/threads/MainThread.h"
#include "Process.h"
#include "RegistryFixture.h"
#include "RegistryWorker.h"
#include "RFL/RegistryChangeNotifier.h"

using namespace RFL;
using ostcore::UString;
namespace threads = ostcore::threads;

class RegistryNotifier : public RegistryFixture {
protected:
    void SetUp() override {
        RegistryFixture::SetUp();
        threads::ResetMainThread();
        ASSERT_TRUE(threads::SetMainThread());
    }
    void TearDown() override {
        threads::ResetMainThread();
        RegistryFixture::TearDown();
    }

    ostcore::shared_ptr<RegistryChangeNotifier> Watch(const UString& inPath, int& ioCalls) {
        return RegistryChangeNotifier::Create(RegistryRoot::User, inPath, [&ioCalls] { ++ioCalls; });
    }
    /// Runs the main thread until the condition holds; false after a time in which it should have.
    template <class Condition>
    static bool RunUntil(Condition&& inCondition) {
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (!inCondition()) {
            if (std::chrono::steady_clock::now() > deadline) {
                return false;
            }
            threads::WaitAndPumpMainThread(1000);
        }
        return true;
    }
    static bool Reads(const UString& inName, const UString& inText) {
        RegistryKey key;
        UString text;
        return RegistryKey::Open(RegistryRoot::User, kWorkerKey, RegistryAccess::Read, key) == 0 &&
               key.GetStringValue(inName, text) == 0 && text == inText;
    }
};

TEST_F(RegistryNotifier, TellsOfAnotherProcess) {
    MakeKey(kWorkerKey);
    bool isSeen = false;
    const auto notifier = RegistryChangeNotifier::Create(
        RegistryRoot::User, u"Software\\Tests", [&] { isSeen = isSeen || Reads(u"Name", u"from afar"); });
    ASSERT_TRUE(notifier);
    Process other({kRegistryWorkerFlag, "set", "Name", "from afar"});
    EXPECT_EQ(other.Wait(), 0);
    EXPECT_TRUE(RunUntil([&] { return isSeen; }));
}

TEST_F(RegistryNotifier, TellsOfAStoreThatComesLaterAndSeesTheLastOfManyChanges) {
    int calls = 0;
    bool isLastSeen = false;
    const auto notifier = RegistryChangeNotifier::Create(RegistryRoot::User, kWorkerKey, [&] {
        ++calls;
        isLastSeen = Reads(u"Name", u"300");
    });
    ASSERT_TRUE(notifier);
    RegistryKey key = MakeKey(kWorkerKey);
    for (int change = 1; change <= 300; ++change) {
        const std::string text = std::to_string(change);
        EXPECT_EQ(key.SetStringValue(u"Name", UString(text.begin(), text.end())), 0);
    }
    EXPECT_TRUE(RunUntil([&] { return isLastSeen; }));
    EXPECT_LE(calls, 300);
}

TEST_F(RegistryNotifier, LooksAtItsOwnKeyAndBelow) {
    RegistryKey parent = MakeKey(u"Software\\Tests");
    RegistryKey sibling = MakeKey(u"Software\\Tests\\Sibling");
    RegistryKey below = MakeKey(u"Software\\Tests\\Mine\\Deep");
    int mine = 0;
    int siblings = 0;
    const auto watchMine = Watch(u"Software\\Tests\\Mine", mine);
    const auto watchSibling = Watch(u"Software\\Tests\\Sibling", siblings);
    EXPECT_EQ(sibling.SetStringValue(u"v", u"x"), 0);
    EXPECT_TRUE(RunUntil([&] { return siblings == 1; }));
    EXPECT_EQ(mine, 0);
    EXPECT_EQ(below.SetStringValue(u"v", u"x"), 0);
    EXPECT_TRUE(RunUntil([&] { return mine == 1; }));
    EXPECT_EQ(parent.DeleteSubKey(u"Mine"), 0);
    EXPECT_TRUE(RunUntil([&] { return mine == 2; }));
    EXPECT_EQ(siblings, 1);
}

TEST_F(RegistryNotifier, IsSilentAfterItsEnd) {
    RegistryKey key = MakeKey(kWorkerKey);
    int stopped = 0;
    int running = 0;
    auto notifier = Watch(kWorkerKey, stopped);
    const auto other = Watch(kWorkerKey, running);
    EXPECT_EQ(key.SetStringValue(u"Name", u"1"), 0);
    // Whatever is queued by now is not told any more.
    notifier->Stop();
    notifier->Stop();
    EXPECT_TRUE(RunUntil([&] { return running > 0; }));
    EXPECT_EQ(stopped, 0);
    notifier.reset();

    ostcore::shared_ptr<RegistryChangeNotifier> ownEnd;
    int calls = 0;
    ownEnd = RegistryChangeNotifier::Create(RegistryRoot::User, kWorkerKey, [&] {
        ++calls;
        ownEnd.reset();
    });
    EXPECT_EQ(key.SetStringValue(u"Name", u"2"), 0);
    EXPECT_TRUE(RunUntil([&] { return calls > 0; }));
    EXPECT_FALSE(ownEnd);
    const int before = running;
    EXPECT_EQ(key.SetStringValue(u"Name", u"3"), 0);
    EXPECT_TRUE(RunUntil([&] { return running > before; }));
    EXPECT_EQ(calls, 1);
}
