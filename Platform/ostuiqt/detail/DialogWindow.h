// The window of a dialog that runs.
#pragma once

#include <exception>

#include <QtCore/QPointer>
#include <QtWidgets/QDialog>

#include "ostuiqt/detail/ControlSet.h"

class QEventLoop;

namespace ZOClientQt {
namespace detail {

/// On the heap, since a parent that goes takes it along.
class DialogWindow final : public QDialog, private ControlHost {
public:
    DialogWindow(ostui::Dialog& ioDialog, Icons& ioIcons, QWidget* inParent);
    ~DialogWindow() override;

    /// Opens it and stays until the dialog is closed, this window is gone or the application quits. Gives
    /// what a handler has thrown, if one has.
    std::exception_ptr Run();
    void ShowControl(const ostui::Control& inControl);
    /// The title and the default button.
    void ShowDialog();
    const ostui::Dialog* GetShown() const { return &mDialog; }

private:
    void Act(const std::function<void(ostui::Dialog&)>& inAction) override;
    ostui::Dialog& GetDialog() override { return mDialog; }
    Icons& GetIcons() override { return mIcons; }
    void CaptionsChanged() override { mHaveCaptionsChanged = true; }

    void reject() override;
    void keyPressEvent(QKeyEvent* inEvent) override;
    void moveEvent(QMoveEvent* inEvent) override;
    void resizeEvent(QResizeEvent* inEvent) override;
    bool event(QEvent* inEvent) override;

    void Open();
    void PlaceWindow();
    /// As high as its texts need at its width, which it keeps.
    void FitToContents();
    void OrderFocus();
    void TakeInitialFocus();
    void ShowMnemonics();
    bool PressDefault();
    void TellGeometry();
    void LeaveIfClosed();

    ostui::Dialog& mDialog;
    Icons& mIcons;
    const bool mCanResize;
    QSize mLeastSize;
    ControlSet mControls;
    /// Null while it does not run. Not owned.
    QEventLoop* mLoop = nullptr;
    /// What the run keeps of a handler's exception; not owned.
    std::exception_ptr* mThrown = nullptr;
    bool mHaveCaptionsChanged = false;
    bool mIsFitting = false;
    /// From here on its size is the user's.
    bool mIsPlaced = false;
};

}  // namespace detail
}  // namespace ZOClientQt
