// How many texts a second two threads can intern and drop, against one set under one mutex.
#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <functional>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <unordered_set>
#include <vector>

#include "ostcore/utility/ImmutableString.h"

namespace {

using ostcore::utility::ImmutableString;
using Clock = std::chrono::steady_clock;

constexpr int kThreads = 2;
constexpr std::size_t kTextsPerThread = 200000;
constexpr std::size_t kKnownTexts = 4000;
constexpr int kRounds = 7;
constexpr double kTarget = 3.0;

std::string KnownText(std::size_t inNumber) {
    return "/content/zo/data/productions/feature/asset-" + std::to_string(inNumber);
}

/// Nine of ten are repeats of a known text, as keys and links in answers are; the tenth was never seen
/// before.
std::vector<std::string> MakeTexts(unsigned inThread, unsigned inRound) {
    std::mt19937 random(inThread * 7919 + inRound);
    std::vector<std::string> texts;
    texts.reserve(kTextsPerThread);
    for (std::size_t i = 0; i < kTextsPerThread; ++i) {
        texts.push_back(random() % 10 != 0 ? KnownText(random() % kKnownTexts)
                                           : "/content/zo/data/commits/" + std::to_string(inThread) + "-" +
                                                 std::to_string(inRound) + "-" + std::to_string(i));
    }
    return texts;
}

// Operations a second of all threads together, which begin at one moment.
double Measure(const std::vector<std::vector<std::string>>& inTexts,
               const std::function<void(const std::vector<std::string>&)>& inBody) {
    std::atomic<int> ready{0};
    std::atomic<bool> go{false};
    std::vector<std::thread> threads;
    for (const std::vector<std::string>& texts : inTexts) {
        threads.emplace_back([&] {
            ready.fetch_add(1);
            while (!go.load()) {
                std::this_thread::yield();
            }
            inBody(texts);
        });
    }
    while (ready.load() < kThreads) {
        std::this_thread::yield();
    }
    const auto begin = Clock::now();
    go.store(true);
    for (std::thread& each : threads) {
        each.join();
    }
    const std::chrono::duration<double> seconds = Clock::now() - begin;
    return static_cast<double>(kThreads * kTextsPerThread) / seconds.count();
}

std::atomic<std::size_t> gSink{0};

void InternAndDrop(const std::vector<std::string>& inTexts) {
    std::size_t sum = 0;
    for (const std::string& text : inTexts) {
        const ImmutableString interned(text);
        sum += interned.size();
    }
    gSink += sum;
}

/// Holds its texts for good, which is the cheaper half of the work that ours does.
class LockedSet {
public:
    const std::string& Intern(const std::string& inText) {
        const std::lock_guard<std::mutex> lock(mMutex);
        return *mTexts.insert(inText).first;
    }

private:
    std::mutex mMutex;
    std::unordered_set<std::string> mTexts;
};

double Median(std::vector<double> inValues) {
    std::nth_element(inValues.begin(), inValues.begin() + static_cast<std::ptrdiff_t>(inValues.size() / 2),
                     inValues.end());
    return inValues[inValues.size() / 2];
}

}  // namespace

int main() {
    std::vector<ImmutableString> known;
    LockedSet set;
    for (std::size_t i = 0; i < kKnownTexts; ++i) {
        known.emplace_back(KnownText(i));
        set.Intern(KnownText(i));
    }
    std::vector<double> ours;
    std::vector<double> baseline;
    for (unsigned round = 0; round < kRounds; ++round) {
        std::vector<std::vector<std::string>> texts;
        for (unsigned thread = 0; thread < kThreads; ++thread) {
            texts.push_back(MakeTexts(thread, round));
        }
        ours.push_back(Measure(texts, InternAndDrop));
        baseline.push_back(Measure(texts, [&](const std::vector<std::string>& inTexts) {
            std::size_t sum = 0;
            for (const std::string& text : inTexts) {
                sum += set.Intern(text).size();
            }
            gSink += sum;
        }));
    }
    const double oursRate = Median(ours) / 1e6;
    const double baselineRate = Median(baseline) / 1e6;
    const double ratio = oursRate / baselineRate;
    std::printf(
        "bench interning: ours %.2f Mtexts/s, baseline %.2f Mtexts/s (%s), ratio %.2f, target %.0f: %s\n",
        oursRate, baselineRate, "one mutex and an unordered_set of std::string, nothing dropped", ratio,
        kTarget, ratio >= kTarget ? "holds" : "falls short");
    return 0;
}
