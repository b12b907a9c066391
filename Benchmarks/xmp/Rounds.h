// Measures several ways in turn, so that whatever disturbs the machine disturbs all of them.
#pragma once

#include <algorithm>
#include <array>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <vector>

/// The median seconds of one call of each body, over many rounds.
template <std::size_t Count>
std::array<double, Count> MedianSeconds(const std::array<std::function<void()>, Count>& inBodies) {
    constexpr int kRounds = 41;
    constexpr int kCallsPerRound = 10;
    std::array<std::vector<double>, Count> seconds;
    for (int round = 0; round < kRounds; ++round) {
        for (std::size_t at = 0; at < Count; ++at) {
            const auto begin = std::chrono::steady_clock::now();
            for (int call = 0; call < kCallsPerRound; ++call) {
                inBodies[at]();
            }
            const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - begin;
            seconds[at].push_back(taken.count() / kCallsPerRound);
        }
    }
    std::array<double, Count> medians{};
    for (std::size_t at = 0; at < Count; ++at) {
        std::sort(seconds[at].begin(), seconds[at].end());
        medians[at] = seconds[at][kRounds / 2];
    }
    return medians;
}

inline void Require(bool inHolds, const char* inWhat) {
    if (!inHolds) {
        std::fprintf(stderr, "bench: %s\n", inWhat);
        std::exit(1);
    }
}

inline double MegabytesASecond(std::size_t inBytes, double inSeconds) {
    return static_cast<double>(inBytes) / 1e6 / inSeconds;
}
