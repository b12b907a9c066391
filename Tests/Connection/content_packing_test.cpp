// Payloads by the thousand are packed behind the requests: one worker at a time, a few a turn.
#include <deque>

#include <gtest/gtest.h>

#include "Connection/ContentCache.h"
#include "Connection/ContentPacking.h"
#include "ostnet/http/Compression.h"

namespace ZOCL {
namespace {

/// Workers that run when the test says so; below them there is nothing, so that no request ever starts.
class HeldWorkers : public ostnet::http::ForwardingProcessor {
public:
    HeldWorkers() : ForwardingProcessor(nullptr) {}
    bool PostFunction(const function<void()>& inFunction, std::uint32_t) override {
        if (refuses) {
            return false;
        }
        posted.push_back(inFunction);
        return true;
    }
    bool RunOne() {
        if (posted.empty()) {
            return false;
        }
        const auto function = posted.front();
        posted.pop_front();
        function();
        return true;
    }
    std::deque<function<void()>> posted;
    bool refuses = false;
};

class ContentPackingTest : public testing::Test {
protected:
    ContentPackingTest() { ReplaceContentCache(cache); }
    ~ContentPackingTest() override { ReleaseContentCache(); }

    static ImmutableString IDOf(int inNumber) {
        return ImmutableString("content-" + std::to_string(inNumber));
    }
    void Add(int inFirst, int inEnd) {
        for (int number = inFirst; number < inEnd; ++number) {
            packing->Add(IDOf(number), RecycledMemory::CreateFromBytes("payload " + std::to_string(number)));
        }
    }
    int Held(int inCount) const {
        int held = 0;
        for (int number = 0; number < inCount; ++number) {
            held += cache->Contains(IDOf(number), ContentName()) ? 1 : 0;
        }
        return held;
    }

    const shared_ptr<QM::DataCache> cache = QM::CreateDataCacheInMemory(1 << 20);
    const shared_ptr<HeldWorkers> workers = make_shared<HeldWorkers>();
    shared_ptr<ContentPacking> packing = make_shared<ContentPacking>(workers);
};

TEST_F(ContentPackingTest, OneWorkerAtATimePacksAFewATurnUntilAllIsStored) {
    Add(0, 100);
    int turns = 0;
    while (!workers->posted.empty()) {
        ASSERT_EQ(workers->posted.size(), 1u) << "others have to wait behind it";
        const int before = Held(100);
        workers->RunOne();
        ++turns;
        EXPECT_LT(Held(100) - before, 50) << "a turn leaves no room for others";
    }
    EXPECT_EQ(Held(100), 100);
    EXPECT_GT(turns, 2);
    QM::Payload packed;
    cache->Read(
        IDOf(7), ContentName(), [](int, const QM::Payload&) {}, packed);
    ASSERT_TRUE(packed);
    EXPECT_EQ(ostnet::http::DecompressPayload(packed)->view(), "payload 7");

    Add(100, 101);
    while (workers->RunOne()) {
    }
    EXPECT_EQ(Held(101), 101) << "what comes after an idle time finds a turn";
}

TEST_F(ContentPackingTest, GoesOnAfterWorkersThatRefused) {
    workers->refuses = true;
    Add(0, 3);
    workers->refuses = false;
    Add(3, 40);
    // In the middle of the work, too.
    workers->RunOne();
    workers->refuses = true;
    while (workers->RunOne()) {
    }
    workers->refuses = false;
    Add(40, 42);
    while (workers->RunOne()) {
    }
    EXPECT_FALSE(cache->Contains(IDOf(0), ContentName()));
    EXPECT_TRUE(cache->Contains(IDOf(3), ContentName()));
    EXPECT_TRUE(cache->Contains(IDOf(41), ContentName()));
}

TEST_F(ContentPackingTest, LivesUntilItsTurnIsOver) {
    Add(0, 5);
    packing.reset();
    workers->RunOne();
    EXPECT_EQ(Held(5), 5);
}

}  // namespace
}  // namespace ZOCL
