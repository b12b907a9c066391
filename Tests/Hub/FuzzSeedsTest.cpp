// The seeds of the form fuzzer, run once each.
#include <cstdint>

#include "HubFixture.h"

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* inBytes, std::size_t inSize);

namespace zohub::test {

TEST(FormFuzzSeeds, EachEndsInADefinedResult) {
    int seeds = 0;
    for (auto const& entry : std::filesystem::directory_iterator(ZOHUB_FORM_SEEDS)) {
        SCOPED_TRACE(entry.path());
        std::string const bytes = ReadFile(entry.path());
        for (std::size_t const size : {bytes.size(), bytes.size() * 3 / 4, bytes.size() / 2})
            EXPECT_EQ(LLVMFuzzerTestOneInput(reinterpret_cast<std::uint8_t const*>(bytes.data()), size), 0);
        ++seeds;
    }
    EXPECT_GE(seeds, 15);
}

}  // namespace zohub::test
