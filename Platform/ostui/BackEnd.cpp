// The back end in place, and the dialogs that run.
#include "ostui/BackEnd.h"

#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostui/detail/RunningDialogs.h"

namespace ostui {
namespace {

constexpr std::uint32_t kForEver = 0xFFFFFFFFu;

struct Place {
    ostcore::threads::Mutex mutex;
    shared_ptr<BackEnd> backEnd ZO_GUARDED_BY(mutex);
};

// Never destroyed: a dialog may be asked for until the process ends.
Place& ThePlace() {
    static Place& place = *new Place;
    return place;
}

// The main thread's own.
std::vector<Dialog*>& Running() {
    static std::vector<Dialog*>& running = *new std::vector<Dialog*>;
    return running;
}

}  // namespace

BackEnd::~BackEnd() = default;

void BackEnd::OnControlChanged(Dialog&, const Control&) {}
void BackEnd::OnDialogChanged(Dialog&) {}

shared_ptr<BackEnd> SetBackEnd(const shared_ptr<BackEnd>& inBackEnd) {
    shared_ptr<BackEnd> former = inBackEnd;
    Place& place = ThePlace();
    ostcore::threads::MutexLock lock(place.mutex);
    former.swap(place.backEnd);
    return former;
}

shared_ptr<BackEnd> GetBackEnd() {
    Place& place = ThePlace();
    ostcore::threads::MutexLock lock(place.mutex);
    return place.backEnd;
}

const std::vector<Dialog*>& GetRunningDialogs() {
    return Running();
}

detail::RunningDialog::RunningDialog(Dialog& ioDialog) {
    Running().push_back(&ioDialog);
}

detail::RunningDialog::~RunningDialog() {
    Running().pop_back();
}

void PumpUntilClosed(const Dialog& inDialog) {
    while (ostcore::threads::IsMainThread() && !inDialog.IsClosed()) {
        ostcore::threads::WaitAndPumpMainThread(kForEver);
    }
}

}  // namespace ostui
