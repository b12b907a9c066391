// Counting and drawing.
#include "Faults/FaultInjector.h"

#include <utility>

namespace zohub {

FaultInjector::FaultInjector(FaultScript inScript, ExpireFunction inExpire, TellFunction inTell)
    : mScript(std::move(inScript)),
      mExpire(std::move(inExpire)),
      mTell(std::move(inTell)),
      mCounts(mScript.rules.size()) {}

// The same for the same seed, rule and number, in whatever order requests come.
double FaultInjector::Draw(std::size_t inRule, std::uint64_t inNumber) const {
    std::uint64_t mixed = mScript.seed * 0x9e3779b97f4a7c15ull + (inRule + 1) * 0xd1b54a32d192ed03ull +
                          inNumber * 0x8cb92ba72f3d8dd7ull;
    mixed = (mixed ^ (mixed >> 30)) * 0xbf58476d1ce4e5b9ull;
    mixed = (mixed ^ (mixed >> 27)) * 0x94d049bb133111ebull;
    mixed ^= mixed >> 31;
    return static_cast<double>(mixed >> 11) / static_cast<double>(1ull << 53);
}

FaultPlan FaultInjector::PlanFor(Request const& inRequest) {
    FaultRule const* chosen = nullptr;
    for (std::size_t i = 0; i < mScript.rules.size(); ++i) {
        FaultRule const& rule = mScript.rules[i];
        if (!rule.Matches(inRequest))
            continue;
        std::uint64_t number = 0;
        {
            std::lock_guard const lock(mMutex);
            number = ++mCounts[i];
        }
        if (!chosen && rule.occasion.Includes(number, Draw(i, number)))
            chosen = &rule;
    }
    if (!chosen)
        return {};
    std::string const path = inRequest.target.substr(0, inRequest.target.find('?'));
    mTell("line " + std::to_string(chosen->line) + ": " + chosen->text + ": " + inRequest.method + " " +
          path);
    FaultPlan plan = chosen->plan;
    if (chosen->expiresToken)
        plan.beforeWork = mExpire;
    return plan;
}

}  // namespace zohub
