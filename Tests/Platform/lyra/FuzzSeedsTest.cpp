// The seeds of the fuzzer, which are the layouts of the library: each whole, and cut off after every few
// bytes.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* inBytes, std::size_t inSize);

TEST(LayoutFuzzSeeds, EachEndsInADefinedResult) {
    int seeds = 0;
    for (const auto& entry : std::filesystem::directory_iterator(ZO_LAYOUTS)) {
        SCOPED_TRACE(entry.path());
        std::ifstream stream(entry.path(), std::ios::binary);
        const std::string bytes(std::istreambuf_iterator<char>(stream), {});
        for (std::size_t left = 0; left < bytes.size(); left += 7) {
            const auto* const begin = reinterpret_cast<const std::uint8_t*>(bytes.data());
            ASSERT_EQ(LLVMFuzzerTestOneInput(begin, bytes.size() - left), 0);
        }
        ++seeds;
    }
    EXPECT_GE(seeds, 10);
}
