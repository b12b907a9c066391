// Wakes Qt's event loop when something is queued for the main thread, and runs it there.
#include <atomic>
#include <QtCore/QCoreApplication>
#include <QtCore/QEvent>
#include <QtCore/QThread>
#include <QtCore/QTimer>

#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostuiqt/detail/MainThreadPump.h"
#include "ZOClientQt/QtBackEnd.h"

namespace ZOClientQt {
namespace detail {
namespace {

const QEvent::Type kPumpEvent = static_cast<QEvent::Type>(QEvent::registerEventType());

/// Lives in the main thread.
class Pump final : public QObject {
public:
    /// Any thread. Many calls before the loop comes round are one event.
    void Wake() {
        if (!mIsWoken.exchange(true)) {
            if (mDepth > 0 && QThread::currentThread() == thread()) {
                // What the queue queues again waits for its turn behind input and painting.
                QTimer::singleShot(0, this, [this] { Run(); });
            } else {
                QCoreApplication::postEvent(this, new QEvent(kPumpEvent));
            }
        }
    }

    bool IsRunning() const { return mDepth > 0; }

    bool event(QEvent* inEvent) override {
        if (inEvent->type() != kPumpEvent) {
            return QObject::event(inEvent);
        }
        Run();
        return true;
    }

private:
    void Run() {
        mIsWoken = false;
        ++mDepth;
        ostcore::threads::PumpMainThread();
        --mDepth;
    }

    std::atomic<bool> mIsWoken{false};
    std::atomic<int> mDepth{0};
};

/// Between the wake function, which any thread may still be in when the driver goes, and the pump.
class Link {
public:
    explicit Link(Pump* inPump) : mPump(inPump) {}
    void Wake() ZO_EXCLUDES(mMutex) {
        ostcore::threads::MutexLock lock(mMutex);
        if (mPump) {
            mPump->Wake();
        }
    }
    void Cut() ZO_EXCLUDES(mMutex) {
        ostcore::threads::MutexLock lock(mMutex);
        mPump = nullptr;
    }

private:
    ostcore::threads::Mutex mMutex;
    Pump* mPump ZO_GUARDED_BY(mMutex);
};

class Driver final : public MainThreadDriver {
public:
    Driver() : mPump(new Pump), mLink(ostcore::make_shared<Link>(mPump)) { TakeWakeFunction(); }
    ~Driver() override {
        ostcore::threads::SetMainThreadWakeFunction({});
        mLink->Cut();
        if (mPump->IsRunning()) {
            mPump->deleteLater();
        } else {
            delete mPump;
        }
    }
    void TakeWakeFunction() {
        ostcore::threads::SetMainThreadWakeFunction([link = mLink] { link->Wake(); });
    }

private:
    Pump* const mPump;
    const shared_ptr<Link> mLink;
};

ostcore::weak_ptr<Driver>& TheDriver() {
    static ostcore::weak_ptr<Driver> driver;
    return driver;
}

}  // namespace

void TakeWakeFunction() {
    if (const shared_ptr<Driver> driver = TheDriver().lock()) {
        driver->TakeWakeFunction();
    }
}

}  // namespace detail

MainThreadDriver::~MainThreadDriver() = default;

shared_ptr<MainThreadDriver> DriveMainThread() {
    shared_ptr<detail::Driver> driver = detail::TheDriver().lock();
    if (!driver) {
        driver = ostcore::make_shared<detail::Driver>();
        detail::TheDriver() = driver;
    }
    return driver;
}

}  // namespace ZOClientQt
