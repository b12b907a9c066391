// The threads behind the executors.
#include "ostcore/threads/detail/ThreadPools.h"

#include <chrono>
#include <system_error>
#include <thread>

#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/thread_pool.hpp>

#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace threads {
namespace {

namespace asio = boost::asio;
using WorkGuard = asio::executor_work_guard<asio::io_context::executor_type>;

/// Threads for work that blocks. There is a thread for each function that runs or waits, up to the bound, so
/// that a blocked function never holds up another; beyond the bound functions wait.
class ElasticPool {
public:
    bool Run(function<void()> inFunction) ZO_EXCLUDES(mMutex) {
        if (!Reserve()) {
            return false;
        }
        asio::post(mContext, [this, run = std::move(inFunction)]() mutable {
            run();
            run.clear();
            MutexLock lock(mMutex);
            --mPending;
        });
        return true;
    }

private:
    static constexpr std::size_t kMostThreads = 256;
    static constexpr std::chrono::seconds kIdleTime{15};

    // Counts a function in and sees to it that a thread is there for it.
    bool Reserve() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        ++mPending;
        if (mPending <= mThreads || mThreads >= kMostThreads) {
            return true;
        }
        try {
            std::thread([this] { Work(); }).detach();
            ++mThreads;
        } catch (const std::system_error&) {
            if (mThreads == 0) {
                --mPending;
                return false;
            }
        }
        return true;
    }

    void Work() ZO_EXCLUDES(mMutex) {
        for (;;) {
            if (mContext.run_one_for(kIdleTime) > 0) {
                continue;
            }
            MutexLock lock(mMutex);
            if (mPending < mThreads) {
                --mThreads;
                return;
            }
        }
    }

    asio::io_context mContext;
    const WorkGuard mGuard{asio::make_work_guard(mContext)};
    Mutex mMutex;
    std::size_t mThreads ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mPending ZO_GUARDED_BY(mMutex) = 0;
};

/// One thread with a queue. The thread and the handle share the context; the handle's guard keeps the thread.
class ThreadLoop {
public:
    ThreadLoop()
        : mContext(boost::make_shared<asio::io_context>()), mGuard(asio::make_work_guard(*mContext)) {
        std::thread([context = mContext] { context->run(); }).detach();
    }
    ThreadLoop(const ThreadLoop&) = delete;
    ThreadLoop& operator=(const ThreadLoop&) = delete;

    void Run(function<void()> inFunction) { asio::post(*mContext, std::move(inFunction)); }

private:
    const shared_ptr<asio::io_context> mContext;
    const WorkGuard mGuard;
};

}  // namespace

// Neither pool is destroyed: its threads may be at work until the process ends.

bool RunOnCPUThreads(function<void()> inFunction) {
    static asio::thread_pool* const pool =
        new asio::thread_pool(std::max<std::size_t>(2, std::thread::hardware_concurrency()));
    asio::post(*pool, std::move(inFunction));
    return true;
}

bool RunOnIOThreads(function<void()> inFunction) {
    static ElasticPool* const pool = new ElasticPool;
    return pool->Run(std::move(inFunction));
}

function<bool(function<void()>)> MakeThreadLoop() {
    try {
        const auto loop = boost::make_shared<ThreadLoop>();
        return [loop](function<void()> inFunction) {
            loop->Run(std::move(inFunction));
            return true;
        };
    } catch (const std::system_error&) {
        return {};
    }
}

}  // namespace threads
}  // namespace ostcore
