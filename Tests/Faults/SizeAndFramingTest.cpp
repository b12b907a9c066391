// Answers that are too large or packed too densely, and such whose length is in doubt.
#include <zlib.h>

#include <atomic>
#include <fstream>

#include "Client.h"
#include "ostcore/utility/StringConversion.h"

namespace faults {
namespace {

constexpr std::uint64_t kMiB = 1ull << 20;

/// So many zero bytes in gzip form, at about 1000 to 1.
std::string GzipBomb(std::uint64_t inSize) {
    z_stream stream{};
    EXPECT_EQ(deflateInit2(&stream, Z_BEST_COMPRESSION, Z_DEFLATED, 15 + 16, 9, Z_DEFAULT_STRATEGY), Z_OK);
    std::vector<unsigned char> zeros(kMiB), packed(kMiB);
    std::string bomb;
    for (std::uint64_t done = 0; done < inSize; done += kMiB) {
        stream.next_in = zeros.data();
        stream.avail_in = static_cast<uInt>(zeros.size());
        do {
            stream.next_out = packed.data();
            stream.avail_out = static_cast<uInt>(packed.size());
            deflate(&stream, done + kMiB >= inSize ? Z_FINISH : Z_NO_FLUSH);
            bomb.append(packed.begin(), packed.end() - stream.avail_out);
        } while (stream.avail_out == 0);
    }
    deflateEnd(&stream);
    return bomb;
}

std::uint64_t PeakMemory() {
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word == "VmHWM:") {
            std::uint64_t kibibytes = 0;
            status >> kibibytes;
            return kibibytes << 10;
        }
    }
    return 0;
}

#if defined(__SANITIZE_THREAD__) || defined(__SANITIZE_ADDRESS__)
constexpr bool kMemoryIsJudged = false;  // sanitizers keep what was freed
#else
constexpr bool kMemoryIsJudged = true;
#endif

class Flood : public FaultTest {
protected:
    /// Runs, and says by how much the peak of memory rose.
    template <typename Function>
    void ExpectPeakBelow(std::uint64_t inBytes, const char* inName, Function inFunction) {
        std::ofstream("/proc/self/clear_refs") << "5";
        const std::uint64_t before = PeakMemory();
        inFunction();
        const std::uint64_t rise = PeakMemory() - before;
        RecordProperty(inName, std::to_string(rise));
        if (kMemoryIsJudged) {
            EXPECT_GT(before, 0u);
            EXPECT_LT(rise, inBytes) << inName;
        }
    }
    void ExpectRefused(const Outcome& inOutcome, Step inStep) {
        EXPECT_EQ(inOutcome.result, ZOCL::kResultNoHTTPResponse) << NameOf(inStep);
        EXPECT_NE(inOutcome.CurlError(), 0) << NameOf(inStep);
        EXPECT_FALSE(inOutcome.response && inOutcome.response->payload) << NameOf(inStep);
        EXPECT_FALSE(inOutcome.server);
    }
};

TEST_F(Flood, AGzipBombStopsAtTheCapAtEveryStep) {
    constexpr std::uint64_t kCap = 32 * kMiB;
    ostnet::NetworkLimits limits;
    limits.inflate.maximumSize = kCap;
    limits.inflate.maximumRatio = 2000;
    std::string bomb = GzipBomb(64 * kMiB);
    ASSERT_GT(64 * kMiB / bomb.size(), 900u);
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    ostnet::SetNetworkLimits(limits);
    // One bomb says in its last bytes how large it is, the other one lies.
    for (const char* const name : {"peak_of_honest_bombs", "peak_of_lying_bombs"}) {
        const auto pack = [bomb](const HubAnswer& inGood) {
            return inGood.WithHeaders(inGood.headers + "Content-Encoding: gzip\r\n").WithBody(bomb);
        };
        ExpectPeakBelow(kCap + 16 * kMiB, name, [&] {
            for (const Step step : kLoadSteps) {
                const auto resource = ResourceOf(step, server, production, hub);
                hub.Change(step, pack);
                ExpectRefused(mClient.Load(resource), step);
                EXPECT_FALSE(resource->IsLoaded());
            }
            for (const Step step : kConnectSteps) {
                hub.BeGood();
                hub.Change(step, pack);
                ExpectRefused(mClient.Connect(hub.URL("")), step);
            }
            hub.BeGood();
        });
        bomb.replace(bomb.size() - 4, 4, std::string("\x10\0\0\0", 4));
    }
}

TEST_F(Flood, ABodyWithoutEndIsDroppedAtTheCapAtEveryStep) {
    ostnet::NetworkLimits limits;
    limits.maximumBodySize = kMiB;
    constexpr std::uint64_t kGiB = 1024 * kMiB;
    std::atomic<std::uint64_t> written{0};
    const auto pour = [&](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
        const std::string chunk = "10000\r\n" + std::string(0x10000, ' ') + "\r\n";
        ioConnection.Write("HTTP/1.1 200 OK\r\n" + inGood.headers + "Transfer-Encoding: chunked\r\n\r\n");
        for (std::uint64_t sent = 0; sent < kGiB && ioConnection.Write(chunk); sent += chunk.size()) {
            written += chunk.size();
        }
        return false;
    };
    const auto boast = [](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
        ioConnection.Write("HTTP/1.1 200 OK\r\n" + inGood.headers + "Content-Length: 1073741824\r\n\r\n{");
        ioConnection.WaitForClose();
        return false;
    };
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    ostnet::SetNetworkLimits(limits);
    std::size_t tries = 0;
    for (const BadHub::Interference& flood : {BadHub::Interference(pour), BadHub::Interference(boast)}) {
        ExpectPeakBelow(17 * kMiB, tries == 0 ? "peak_of_floods" : "peak_of_boasts", [&] {
            for (const Step step : kLoadSteps) {
                const auto resource = ResourceOf(step, server, production, hub);
                hub.Interfere(step, flood);
                ExpectRefused(mClient.Load(resource), step);
                ++tries;
            }
            for (const Step step : kConnectSteps) {
                hub.BeGood();
                hub.Interfere(step, flood);
                ExpectRefused(mClient.Connect(hub.URL("")), step);
                ++tries;
            }
            hub.BeGood();
        });
    }
    // The socket's buffers take some more than the client reads.
    EXPECT_LT(written, tries * 24 * kMiB) << "the connection is dropped, not read to its end";
}

/// Answers whose length is in doubt. Each carries, where a careless reader would take it for the next
/// answer, a list that nobody asked for.
std::string InDoubt(std::size_t inKind, const HubAnswer& inGood, const HubAnswer& inEvil) {
    const std::string head = "HTTP/1.1 200 OK\r\n" + inGood.headers;
    const std::string size = std::to_string(inGood.body.size());
    const std::string evil = inEvil.Bytes();
    switch (inKind) {
        case 0:  // too short: the rest and another answer are left over
            return head + "Content-Length: " + std::to_string(inGood.body.size() / 2) + "\r\n\r\n" +
                   inGood.body + evil;
        case 1:  // too long: the next answer would be taken for its end
            return head + "Content-Length: " + std::to_string(inGood.body.size() + evil.size()) + "\r\n\r\n" +
                   inGood.body + evil;
        case 2:
            return head + "Content-Length: " + size + "\r\nContent-Length: 3\r\n\r\n" + inGood.body + evil;
        case 3:
            return head + "Content-Length: " + size + "\r\nTransfer-Encoding: chunked\r\n\r\n" + inGood.body +
                   evil;
        case 4:
            return head + "Transfer-Encoding: chunked\r\n\r\nffffffffffffffffff\r\n" + inGood.body + evil;
        case 5:
            return head + "Transfer-Encoding: chunked\r\n\r\n-5\r\n" + inGood.body + "\r\n0\r\n\r\n" + evil;
        case 6:  // sound, with another answer behind it
            return inGood.Bytes() + evil;
        default:
            return inGood.Bytes();
    }
}

TEST_F(Flood, NoAnswerCrossesWhenManyListsAreLoadedAtOnce) {
    constexpr std::size_t kLists = 20, kRounds = 24;
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    const auto nameOf = [](const std::string& inList) { return "Clip of list " + inList; };
    hub.Interfere(Step::kAssets, [&](Connection& ioConnection, const ReceivedRequest& inRequest,
                                     const HubAnswer& inGood) {
        const std::string list = inRequest.target.substr(inRequest.target.find('=') + 1);
        const auto document = [&](const std::string& inName) {
            return inGood.WithBody(R"({"assets":[{"zo:assetId":"a","properties":{"name":)" + Quote(inName) +
                                   R"(,"description":"","cdzo:assetType":"bin"},"links":[]}],"links":[]})");
        };
        // Every other one is sound, so that connections are kept and used again.
        const std::size_t number = std::stoul(list);
        const std::size_t kind = number % 2 == 0 ? 7 : (number / 2) % 7;
        return ioConnection.Write(InDoubt(kind, document(nameOf(list)), document("evil"))) && kind >= 6;
    });
    std::size_t bound = 0;
    for (std::size_t round = 0; round < kRounds; ++round) {
        std::vector<std::pair<std::size_t, InterfaceRef<IZOCAssetList>>> calls;
        for (std::size_t list = 0; list < kLists; ++list) {
            const std::string number = std::to_string(round * kLists + list);
            const auto assets = production->GetAssetsWithParent(ImmutableString(number));
            calls.emplace_back(mClient.StartLoad(AsResource(assets)), assets);
        }
        for (std::size_t list = 0; list < kLists; ++list) {
            const auto& [call, assets] = calls[list];
            const std::size_t number = round * kLists + list;
            const Outcome outcome = mClient.Await(call);
            ASSERT_EQ(outcome.result < 0, AsResource(assets)->IsLoaded() ? false : outcome.result < 0);
            if (!AsResource(assets)->IsLoaded()) {
                EXPECT_NE(number % 2, 0u) << "a sound list fails: " << ZOCL::GetResultName(outcome.result);
                EXPECT_TRUE(assets->GetAllItems().empty());
                continue;
            }
            ++bound;
            const auto items = assets->GetAllItems();
            ASSERT_EQ(items.size(), 1u);
            EXPECT_EQ(ostcore::utility::ToUTF8(items[0].name), nameOf(std::to_string(number)));
            EXPECT_TRUE(number % 2 == 0 || (number / 2) % 7 == 6 || (number / 2) % 7 == 3) << number;
        }
    }
    EXPECT_GE(bound, kLists * kRounds / 2);
}

TEST_F(Flood, FramingInDoubtEndsTheConnectAndTheNextOneIsSound) {
    BadHub hub;
    for (const Step step : kConnectSteps) {
        for (const std::size_t kind : {1u, 2u, 4u, 5u}) {
            if (kind == 1 && step == Step::kLogin) {
                continue;  // what follows is the answer's body by its length, and nobody reads that one
            }
            hub.BeGood();
            const HubAnswer evil = hub.GoodAnswer(step).WithHeaders("Set-Cookie: login-token=evil\r\n");
            hub.Say(step, InDoubt(kind, hub.GoodAnswer(step), evil));
            const Outcome outcome = mClient.Connect(hub.URL(""));
            EXPECT_FALSE(outcome.server) << NameOf(step) << ", kind " << kind;
            EXPECT_EQ(outcome.result, kind == 1 ? ZOCL::kResultFailure : ZOCL::kResultNoHTTPResponse)
                << NameOf(step) << ", kind " << kind;
        }
        // An answer behind the answer is nobody's.
        hub.BeGood();
        const HubAnswer evil = hub.GoodAnswer(step).WithHeaders("Set-Cookie: login-token=evil\r\n");
        hub.Interfere(step,
                      [evil](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
                          return ioConnection.Write(inGood.Bytes() + evil.Bytes());
                      });
        const auto server = SignIn(hub);
        ASSERT_TRUE(server);
        EXPECT_EQ(server->GetCredentials().token.str(), "login-token=" + std::string(kTokenValue) + ";");
    }
    ExpectSecretsInTheirPlaces(hub.Requests());
}

}  // namespace
}  // namespace faults
