// The chain as a whole under a storm of failures.
#include "ChainSupport.h"
#include "RequestChain/RequestChain.h"

namespace ZOCL {
namespace {

using ostnet::Response;
using ZOClientTesting::ScopedProcessor;

TEST(RequestChain, AStormOfFailuresKeepsTheLoadBoundedAndLosesNothing) {
    constexpr int kRequests = 10000;
    const auto time = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler scope(time);
    const ScopedProcessor net(0);
    const RequestChain chain = BuildRequestChain({}, ImmutableString("login-token=t;"));
    chain.recoverableError->SetRetriesEnabled(true);
    std::size_t most = 0;
    net->SetHandler([&](const RecordedRequest&) {
        most = std::max(most, net->PendingCount());
        return ScriptedAnswer::Status(503);
    });
    int succeeded = 0;
    int completed = 0;
    for (int i = 0; i < kRequests; ++i) {
        ASSERT_TRUE(chain.common->GET(Guid::CreateUnique(),
                                      [&](const Guid&, const shared_ptr<Response>& inResponse) {
                                          ++completed;
                                          succeeded += inResponse && inResponse->status == 200 ? 1 : 0;
                                      },
                                      URLOf("/" + std::to_string(i)), {}, {}));
    }
    const auto pass = [&](int inMilliseconds) {
        for (int i = 0; i < inMilliseconds; i += 4) {
            net->DeliverAll();
            time->Advance(milliseconds(4));
        }
        net->DeliverAll();
    };
    pass(20000);
    EXPECT_LE(most, 50u);
    // Each of 50: seven retries within half a second, then one every 512 milliseconds.
    EXPECT_LE(net->RequestCount(), 50u * (8 + 20000 / 512 + 1));
    EXPECT_EQ(completed, 0) << "they wait for the network";
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
    pass(1000);
    EXPECT_EQ(completed, kRequests);
    EXPECT_EQ(succeeded, kRequests);
    EXPECT_EQ(chain.readThrottle->GetLoad().inFlight, 0);
}

}  // namespace
}  // namespace ZOCL
