// Large forms through the whole chain, over sockets, to a hub: packed on their way, whole where they arrive,
// and cheap in memory.
#include <random>

#include "HubSessionTest.h"
#include "JSONServerResource.h"
#include "ostnet/http/Compression.h"
#include "Relations.h"

namespace ZOCL {
namespace {

using ostnet::http::FormBuilder;
using Payloads = std::vector<std::string>;

constexpr std::size_t kMiB = std::size_t(1) << 20;

std::string Noise(std::size_t inSize, unsigned inSeed) {
    std::minstd_rand random(inSeed);
    std::string noise(inSize, '\0');
    for (char& byte : noise) {
        byte = static_cast<char>(random() >> 8);
    }
    return noise;
}

/// What is hard to carry: every byte, frames of another form, what does not shrink, nothing, and much.
Payloads HardPayloads() {
    std::string every;
    std::string frames;
    for (int i = 0; i < 300; ++i) {
        for (int byte = 0; byte < 256; ++byte) {
            every += static_cast<char>(byte);
        }
        frames += "\r\n--zo-0\r\nContent-Disposition: form-data; name=\"x\"\r\n\r\n--zo-0--\r\n";
    }
    std::string much;
    while (much.size() < 4 * kMiB) {
        much += Noise(100, static_cast<unsigned>(much.size())) + std::string(900, '.');
    }
    return {every, frames, Noise(kMiB, 7), "", much, "\r\n"};
}

std::uint64_t BytesSent() {
    ostnet::http::RequestProcessor::Statistics statistics;
    EXPECT_TRUE(ostnet::http::GetGlobalRequestProcessor()->GetStatistics(statistics));
    return statistics.bytesSent;
}

/// The peak of resident memory since the last call.
std::uint64_t TakePeak() {
    std::uint64_t kibibytes = 0;
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word == "VmHWM:") {
            status >> kibibytes;
        }
    }
    std::ofstream("/proc/self/clear_refs") << "5";
    return kibibytes << 10;
}

class UploadHubTest : public HubSessionTest {
protected:
    ImmutableString Link(const ImmutableString& inRelation) const {
        return dynamic_cast<JSONServerResourceBase&>(*As<ServerResource>(transaction))
            .GetLinkHref(inRelation);
    }
    template <typename Verb>
    static shared_ptr<ostnet::Response> Send(const Verb& inVerb) {
        const auto ended = std::make_shared<std::promise<shared_ptr<ostnet::Response>>>();
        EXPECT_TRUE(inVerb(Guid::CreateUnique(),
                           [ended](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                               ended->set_value(inResponse);
                           }));
        const auto response = ended->get_future().get();
        EXPECT_TRUE(response && response->status == 200)
            << (response ? response->GetPayloadAsUTF8String() : "");
        return response;
    }
    static void Append(FormBuilder& ioForm, const std::string& inName, const ImmutableString& inType,
                       std::string_view inBytes) {
        EXPECT_TRUE(ostnet::http::AppendFormPart(ioForm, ImmutableString(inName), inType, inBytes));
    }
    /// Creates one asset with these payloads as its enclosures, in one form.
    void Create(const Payloads& inPayloads) const {
        FormBuilder form;
        Append(form, "assets+0+properties", "application/json;charset=utf-8",
               R"({"name":"take","description":"","cdzo:assetType":"masterclip"})");
        for (std::size_t i = 0; i < inPayloads.size(); ++i) {
            const std::string part = "assets+0+enclosure+" + std::to_string(i);
            Append(form, part + "+name", "text/plain", NameOf(i).view());
            Append(form, part + "+data", "application/octet-stream", inPayloads[i]);
        }
        ostnet::Headers headers;
        ostnet::http::SetFormContentTypeHeader(form, headers);
        const auto body = ostnet::http::CompleteForm(form);
        const std::uint64_t before = BytesSent();
        Send([&](const Guid& inID, const ostnet::http::CompletionFunction& inDone) {
            return anna.server->POST(inID, inDone, Link(kRelation_Bulk_Create), headers, body);
        });
        EXPECT_EQ(BytesSent() - before, ostnet::http::CompressPayload(body)->size())
            << "not sent packed, once";
    }
    static ImmutableString NameOf(std::size_t inIndex) {
        return ImmutableString("payload" + std::to_string(inIndex));
    }
    InterfaceRef<IZOCEnclosures> Enclosures() const {
        const auto assets = As<IZOCProduction>(transaction)->GetAssets();
        bool changed = false;
        As<IZOCServerResource>(assets)->Refresh(changed, false);
        const auto enclosures = assets->GetAssetByName(u"take")->GetEnclosures();
        As<IZOCServerResource>(enclosures)->Refresh(changed, false);
        return enclosures;
    }
    void ExpectAtHub(const Payloads& inPayloads) const {
        const auto enclosures = Enclosures();
        ASSERT_EQ(enclosures->GetEnclosureNames().size(), inPayloads.size());
        for (std::size_t i = 0; i < inPayloads.size(); ++i) {
            const auto payload = enclosures->GetEnclosure(NameOf(i))->GetEnclosurePayload();
            EXPECT_TRUE(payload && payload->view() == inPayloads[i]) << "payload " << i << " is another one";
        }
    }
    /// Part names for the data of what exists.
    std::vector<ImmutableString> DataParts() const {
        const auto enclosures = Enclosures();
        const auto assets = As<IZOCProduction>(transaction)->GetAssets();
        const std::string asset = assets->GetAssetByName(u"take")->GetAssetIdentifier().str();
        std::vector<ImmutableString> parts;
        for (std::size_t i = 0; i < enclosures->GetEnclosureNames().size(); ++i) {
            parts.emplace_back("assets+" + asset + "+enclosure+" +
                               enclosures->GetEnclosure(NameOf(i))->GetEnclosureID().str() + "+data");
        }
        return parts;
    }

    const Member anna = SignIn("anna");
    const InterfaceRef<IZOCTransaction> transaction = OpenTransaction(anna.OpenSession());
};

TEST_F(UploadHubTest, APackedFormArrivesByteForByte) {
    Payloads payloads = HardPayloads();
    Create(payloads);
    ExpectAtHub(payloads);
    // The same as fields, the other kind of form; each payload takes the place of the next.
    std::rotate(payloads.begin(), payloads.begin() + 1, payloads.end());
    const auto parts = DataParts();
    ASSERT_EQ(parts.size(), payloads.size());
    ostnet::http::Form form;
    std::size_t size = 0;
    for (std::size_t i = 0; i < payloads.size(); ++i) {
        form.emplace_back(parts[i], payloads[i]);
        size += payloads[i].size();
    }
    const std::uint64_t before = BytesSent();
    Send([&](const Guid& inID, const ostnet::http::CompletionFunction& inDone) {
        return anna.server->PUT(inID, inDone, Link(kRelation_Bulk_Edit), {}, form);
    });
    EXPECT_LT(BytesSent() - before, size / 2) << "not sent packed";
    ExpectAtHub(payloads);
}

// Beside the body itself an upload costs what it is packed to, twice for a moment, and buffers of a fixed
// size. Fields become a body first, which may not move while it grows: one more copy would show.
TEST_F(UploadHubTest, TheMemoryOfOneLargeUploadIsBounded) {
    [[maybe_unused]] constexpr std::uint64_t kBuffers = 4 * kMiB;
    Create({"small", "and packed all the same: " + std::string(kMiB / 8, '.')});
    const auto parts = DataParts();
    std::string large;
    for (large.reserve(32 * kMiB); large.size() < 32 * kMiB;) {
        large += Noise(100, static_cast<unsigned>(large.size())) + std::string(924, '.');
    }
    const auto measure = [](const char* inName, std::uint64_t inBound, const auto& inVerb) {
        TakePeak();
        const std::uint64_t before = TakePeak();
        const std::uint64_t sentBefore = BytesSent();
        Send(inVerb);
        const std::uint64_t packed = BytesSent() - sentBefore;
        const std::uint64_t rise = TakePeak() - before;
        EXPECT_LT(packed, 6 * kMiB);
        RecordProperty(std::string(inName) + "_packed", std::to_string(packed));
        RecordProperty(std::string(inName) + "_rise", std::to_string(rise));
#if !defined(__SANITIZE_THREAD__) && !defined(__SANITIZE_ADDRESS__)
        EXPECT_GT(before, 32 * kMiB);
        EXPECT_LE(rise, inBound + 2 * packed + kBuffers) << inName;
#else
        static_cast<void>(inBound);  // sanitizers keep what was freed
#endif
    };
    const ostnet::http::Form fields{{parts[0], large.substr(0, 28 * kMiB)},
                                    {parts[1], large.substr(28 * kMiB)}};
    measure("fields", large.size(), [&](const Guid& inID, const auto& inDone) {
        return anna.server->PUT(inID, inDone, Link(kRelation_Bulk_Edit), {}, fields);
    });
    ostnet::Headers headers;
    const auto body = ostnet::http::ConvertFormToPayload({{parts[0], large}}, headers);
    measure("body", 0, [&](const Guid& inID, const auto& inDone) {
        return anna.server->PUT(inID, inDone, Link(kRelation_Bulk_Edit), headers, body);
    });
    ExpectAtHub({large, fields[1].second});
}

}  // namespace
}  // namespace ZOCL
