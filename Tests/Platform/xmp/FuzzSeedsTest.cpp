// The seeds of the fuzzer, run once each.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* inBytes, std::size_t inSize);

TEST(XmpFuzzSeeds, EachEndsInADefinedResult) {
    int seeds = 0;
    for (const auto& entry : std::filesystem::directory_iterator(ZO_XMP_SEEDS)) {
        SCOPED_TRACE(entry.path());
        std::ifstream stream(entry.path(), std::ios::binary);
        const std::string bytes(std::istreambuf_iterator<char>(stream), {});
        for (const std::size_t size : {bytes.size(), bytes.size() / 2}) {
            EXPECT_EQ(LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), size), 0);
        }
        ++seeds;
    }
    EXPECT_GE(seeds, 10);
}
