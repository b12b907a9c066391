// fault_proxy: stands before a hub until it is stopped, and prints what it did.
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "FaultProxy.h"

namespace {

constexpr const char* kUsage =
    "usage: fault_proxy --hub PORT [--port PORT] [--seed N] [--faults N] [--gap N]\n"
    "  --hub PORT    the hub's plain port on this machine\n"
    "  --port PORT   where to listen; a free port without it\n"
    "  --seed N      what happens to which request follows from it; 1 without it\n"
    "  --faults N    at most so many faults, 8 without it\n"
    "  --gap N       so many requests between two faults on the average, 8 without it\n"
    "Ends on SIGINT or SIGTERM and then prints what it did to each request.\n";

struct Options {
    unsigned long hub = 0;
    unsigned long port = 0;
    unsigned long seed = 1;
    unsigned long faults = 8;
    unsigned long gap = 8;
};

bool ReadOptions(int inCount, char** inWords, Options& outOptions) {
    const struct {
        const char* name;
        unsigned long& value;
        unsigned long maximum;
    } table[] = {{"--hub", outOptions.hub, 65535},
                 {"--port", outOptions.port, 65535},
                 {"--seed", outOptions.seed, ~0ul},
                 {"--faults", outOptions.faults, 100000},
                 {"--gap", outOptions.gap, 100000}};
    for (int i = 1; i < inCount; i += 2) {
        bool isKnown = false;
        for (const auto& option : table) {
            if (std::strcmp(option.name, inWords[i]) == 0 && i + 1 < inCount) {
                char* end = nullptr;
                option.value = std::strtoul(inWords[i + 1], &end, 10);
                isKnown = *end == '\0' && end != inWords[i + 1] && option.value <= option.maximum;
            }
        }
        if (!isKnown) {
            return false;
        }
    }
    return outOptions.hub != 0 && outOptions.faults != 0 && outOptions.gap != 0;
}

}  // namespace

int main(int inCount, char** inWords) {
    Options options;
    if (!ReadOptions(inCount, inWords, options)) {
        std::fputs(kUsage, stderr);
        return 2;
    }
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    try {
        faultproxy::RandomScheduleLimits limits;
        limits.maximumFaults = static_cast<std::uint32_t>(options.faults);
        limits.meanGap = static_cast<std::uint32_t>(options.gap);
        const faultproxy::FaultProxy proxy(
            static_cast<std::uint16_t>(options.hub),
            faultproxy::ScheduleOf(faultproxy::RandomFaults(options.seed, limits)),
            static_cast<std::uint16_t>(options.port));
        std::printf("fault_proxy: listening on %s, seed %lu\n", proxy.URL().c_str(), options.seed);
        std::fflush(stdout);
        int received = 0;
        sigwait(&signals, &received);
        std::fputs(proxy.LogText(true).c_str(), stdout);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "fault_proxy: %s\n", error.what());
        return 1;
    }
    return 0;
}
