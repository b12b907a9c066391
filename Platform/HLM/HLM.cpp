// Whether this process runs without a user before it.
#include "HLM/HLM.h"

#include <atomic>
#include <cstdlib>

#include "ostcore/utility/StringConversion.h"

namespace HLM {
namespace {

bool IsHeadlessByEnvironment() {
    const char* const value = std::getenv("ZOCLIENT_HEADLESS");
    return value && *value && std::string_view(value) != "0" &&
           !ostcore::utility::EqualsIgnoreCaseASCII(value, "false");
}

std::atomic<bool>& Headless() {
    static std::atomic<bool> isHeadless{IsHeadlessByEnvironment()};
    return isHeadless;
}

}  // namespace

bool GetIsHeadless() {
    return Headless().load(std::memory_order_relaxed);
}
void SetIsHeadless(bool inIsHeadless) {
    Headless().store(inIsHeadless, std::memory_order_relaxed);
}

}  // namespace HLM
