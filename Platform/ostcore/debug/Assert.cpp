// One-shot assertions.
#include "ostcore/debug/Assert.h"

#include "ostcore/debug/Trace.h"
#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace debug {
namespace {

std::atomic<unsigned> gGeneration{1};

struct HandlerHolder {
    threads::Mutex mutex;
    AssertionHandler handler ZO_GUARDED_BY(mutex);
};

HandlerHolder& TheHandler() {
    static HandlerHolder* const holder = new HandlerHolder;
    return *holder;
}

AssertionHandler CurrentHandler() {
    HandlerHolder& holder = TheHandler();
    threads::MutexLock lock(holder.mutex);
    return holder.handler;
}

void TraceFailure(const AssertionFailure& inFailure) {
    if (TraceEnabled("ZOCL", kTraceLevel_Error)) {
        Trace("ZOCL", kTraceLevel_Error,
              StructuredText("Assertion failed: " + inFailure.message)
                  .Add("expression", inFailure.expression)
                  .Add("file", inFailure.file)
                  .Add("line", inFailure.line));
    }
}

}  // namespace

unsigned AssertionSite::CurrentGeneration() noexcept {
    return gGeneration.load(std::memory_order_relaxed);
}

void BreakAfterAssertDialog(AssertionSite& ioSite, std::string_view inExpression,
                            std::string_view inMessage) {
    if (!ioSite.Claim()) {
        return;
    }
    try {
        const AssertionFailure failure{ioSite.File(), ioSite.Line(), std::string(inExpression),
                                       std::string(inMessage)};
        TraceFailure(failure);
        if (const AssertionHandler handler = CurrentHandler()) {
            handler(failure);
        }
    } catch (...) {
        // An assertion stops nothing, whatever its handler thinks.
    }
}

AssertionHandler SetAssertionHandler(AssertionHandler inHandler) {
    HandlerHolder& holder = TheHandler();
    threads::MutexLock lock(holder.mutex);
    holder.handler.swap(inHandler);
    return inHandler;
}

void ResetAssertionSites() {
    gGeneration.fetch_add(1, std::memory_order_relaxed);
}

}  // namespace debug
}  // namespace ostcore
