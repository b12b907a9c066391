// One-shot assertions: each site speaks once, and nothing stops.
#pragma once

#include <atomic>
#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace debug {

/// One place in the code that asserts; of static lifetime.
class AssertionSite {
public:
    constexpr AssertionSite(const char* inFile, int inLine) noexcept : mFile(inFile), mLine(inLine) {}
    AssertionSite(const AssertionSite&) = delete;
    AssertionSite& operator=(const AssertionSite&) = delete;

    const char* File() const noexcept { return mFile; }
    int Line() const noexcept { return mLine; }
    /// True for the first caller only, until the sites are reset.
    bool Claim() noexcept {
        return mGeneration.exchange(CurrentGeneration(), std::memory_order_relaxed) != CurrentGeneration();
    }
    ZOPLATFORM_EXPORT static unsigned CurrentGeneration() noexcept;

private:
    const char* const mFile;
    const int mLine;
    std::atomic<unsigned> mGeneration{0};
};

struct AssertionFailure {
    std::string file;
    int line = 0;
    std::string expression;
    std::string message;
};

/// Notes a failed assertion: the first time at a site, it is traced at level 5 on the channel "ZOCL" and the
/// handler is called, on this thread. Always returns, whatever the handler does.
ZOPLATFORM_EXPORT void BreakAfterAssertDialog(AssertionSite& ioSite, std::string_view inExpression,
                                              std::string_view inMessage);

using AssertionHandler = function<void(const AssertionFailure& inFailure)>;
/// Replaces the handler and returns the former one; an empty one means the trace alone. Threads: any.
ZOPLATFORM_EXPORT AssertionHandler SetAssertionHandler(AssertionHandler inHandler);
/// Lets every site speak once more.
ZOPLATFORM_EXPORT void ResetAssertionSites();

}  // namespace debug
}  // namespace ostcore

/// Raises the assertion when the condition does not hold; the message is only made then.
#define ZO_ASSERT_ONCE(condition, expressionText, message)                                          \
    do {                                                                                            \
        if (!(condition)) {                                                                         \
            static ::ostcore::debug::AssertionSite zoAssertionSite(__FILE__, __LINE__);             \
            ::ostcore::debug::BreakAfterAssertDialog(zoAssertionSite, (expressionText), (message)); \
        }                                                                                           \
    } while (false)
