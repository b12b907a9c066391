// The back end: one window for each dialog that runs.
#include "ZOClientQt/QtBackEnd.h"

#include <algorithm>
#include <vector>

#include <QtCore/QPointer>
#include <QtCore/QThread>
#include <QtWidgets/QApplication>

#include "ostuiqt/detail/DialogWindow.h"
#include "ostuiqt/detail/Icons.h"
#include "ostuiqt/detail/MainThreadPump.h"

namespace ZOClientQt {
namespace detail {
namespace {

using ostui::Control;
using ostui::Dialog;

bool CanShowWindows() {
    const auto* const application = qobject_cast<QApplication*>(QCoreApplication::instance());
    return application && application->thread() == QThread::currentThread() &&
           !QCoreApplication::closingDown();
}

class QtBackEnd final : public ostui::BackEnd {
public:
    QtBackEnd(QWidget* inParent, const IconSource& inIcons)
        : mDriver(DriveMainThread()), mParent(inParent), mIcons(inIcons) {}

    void RunModal(Dialog& ioDialog) override {
        if (CanShowWindows()) {
            TakeWakeFunction();
            Show(ioDialog);
        } else if (ioDialog.ClosesByItself()) {
            ioDialog.TellOpened();
            ostui::PumpUntilClosed(ioDialog);
        } else {
            ioDialog.Dismiss();
        }
    }

    void OnControlChanged(Dialog& ioDialog, const Control& inControl) override {
        if (DialogWindow* const window = FindWindow(ioDialog)) {
            window->ShowControl(inControl);
        }
    }

    void OnDialogChanged(Dialog& ioDialog) override {
        if (DialogWindow* const window = FindWindow(ioDialog)) {
            window->ShowDialog();
        }
    }

private:
    void Show(Dialog& ioDialog) {
        mWindows.emplace_back(new DialogWindow(ioDialog, mIcons, FindParent()));
        const QPointer<DialogWindow> window = mWindows.back();
        const std::exception_ptr thrown = window->Run();
        mWindows.pop_back();
        delete window.data();
        if (!ioDialog.IsClosed()) {
            // The window went with its parent, or the application quits.
            ioDialog.Dismiss();
            ioDialog.Close(ostui::kResponseCancel);
        }
        if (thrown) {
            std::rethrow_exception(thrown);
        }
    }

    QWidget* FindParent() const {
        const auto inner =
            std::find_if(mWindows.rbegin(), mWindows.rend(),
                         [](const QPointer<DialogWindow>& inWindow) { return !inWindow.isNull(); });
        if (inner != mWindows.rend()) {
            return *inner;
        }
        return mParent ? mParent.data() : QApplication::activeWindow();
    }

    DialogWindow* FindWindow(const Dialog& inDialog) const {
        for (const QPointer<DialogWindow>& window : mWindows) {
            if (window && window->GetShown() == &inDialog) {
                return window;
            }
        }
        return nullptr;
    }

    const shared_ptr<MainThreadDriver> mDriver;
    const QPointer<QWidget> mParent;
    Icons mIcons;
    /// Of the dialogs that run, the innermost last.
    std::vector<QPointer<DialogWindow>> mWindows;
};

}  // namespace
}  // namespace detail

shared_ptr<ostui::BackEnd> CreateQtBackEnd(QWidget* inParent, const IconSource& inIcons) {
    return ostcore::make_shared<detail::QtBackEnd>(inParent, inIcons);
}

}  // namespace ZOClientQt
