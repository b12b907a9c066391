// Whether this process runs without a user before it.
#include "HLM/HLM.h"

#include <atomic>
#include <cstdlib>

#include "ostcore/threads/Mutex.h"
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

std::atomic<bool> gWaitsForNetwork{false};

struct Ending {
    ostcore::threads::Mutex mutex;
    ostcore::function<void()> function ZO_GUARDED_BY(mutex);
};

Ending& TheEnding() {
    static Ending& ending = *new Ending;
    return ending;
}

}  // namespace

bool GetIsHeadless() {
    return Headless().load(std::memory_order_relaxed);
}
void SetIsHeadless(bool inIsHeadless) {
    Headless().store(inIsHeadless, std::memory_order_relaxed);
}

bool GetWaitsForNetwork() {
    return gWaitsForNetwork;
}
void SetWaitsForNetwork(bool inWaits) {
    gWaitsForNetwork = inWaits;
}

void SetEndProcessFunction(ostcore::function<void()> inFunction) {
    Ending& ending = TheEnding();
    ostcore::threads::MutexLock lock(ending.mutex);
    ending.function.swap(inFunction);
    lock.Unlock();
}

void EndProcess() {
    ostcore::function<void()> end;
    {
        Ending& ending = TheEnding();
        ostcore::threads::MutexLock lock(ending.mutex);
        end = ending.function;
    }
    if (end) {
        end();
    } else {
        std::exit(EXIT_FAILURE);
    }
}

}  // namespace HLM
