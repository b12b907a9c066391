// A dialog as a window of Qt.
#include "ostuiqt/detail/DialogWindow.h"

#include <QtCore/QAbstractEventDispatcher>
#include <QtCore/QEventLoop>
#include <QtCore/QScopedValueRollback>
#include <QtGui/QClipboard>
#include <QtGui/QKeyEvent>
#include <QtGui/QScreen>
#include <QtWidgets/QApplication>
#include <QtWidgets/QLayout>
#include <QtWidgets/QPushButton>

#include "ostui/MessageBox.h"
#include "ostuiqt/detail/ActionWidgets.h"
#include "ostuiqt/detail/LayoutBuilder.h"
#include "ostuiqt/detail/Mnemonics.h"
#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::Dialog;

namespace {

constexpr int kLeastWidth = 360;
/// So much of a window's top has to be on a screen, to be dragged by.
constexpr int kGrip = 48;

bool CanResize(const Dialog& inDialog) {
    if (const ostui::View* const layout = inDialog.GetLayout()) {
        return layout->GetFlag("canResize", false);
    }
    return false;
}

bool IsReachable(const QRect& inFrame) {
    const QRect grip(inFrame.left(), inFrame.top(), inFrame.width(), kGrip);
    for (const QScreen* const screen : QGuiApplication::screens()) {
        const QRect seen = screen->availableGeometry().intersected(grip);
        if (seen.width() >= kGrip && seen.height() >= kGrip / 2) {
            return true;
        }
    }
    return false;
}

}  // namespace

DialogWindow::DialogWindow(Dialog& ioDialog, Icons& ioIcons, QWidget* inParent)
    : QDialog(inParent), mDialog(ioDialog), mIcons(ioIcons), mCanResize(CanResize(ioDialog)) {
    setObjectName(QString::fromStdString(ioDialog.GetID()));
    setModal(true);
    // A host may show dialogs while it has no window of its own.
    setAttribute(Qt::WA_QuitOnClose, false);
    setSizeGripEnabled(false);
    LayoutBuilder(*this, mControls).Build(*this);
    if (layout()) {
        layout()->setSizeConstraint(QLayout::SetNoConstraint);
    }
    NameControls(mDialog, mControls);
    OrderFocus();
    ShowDialog();
    ShowMnemonics();
}

DialogWindow::~DialogWindow() {
    if (mLoop) {
        mLoop->exit();
    }
}

std::exception_ptr DialogWindow::Run() {
    QEventLoop loop;
    std::exception_ptr thrown;
    mLoop = &loop;
    mThrown = &thrown;
    const QPointer<DialogWindow> self(this);
    // Whatever closes the dialog, on whatever thread, wakes the loop; each of these comes round once it is
    // awake.
    QAbstractEventDispatcher* const dispatcher = QAbstractEventDispatcher::instance();
    connect(dispatcher, &QAbstractEventDispatcher::awake, this, [this] { LeaveIfClosed(); });
    connect(dispatcher, &QAbstractEventDispatcher::aboutToBlock, this, [this] { LeaveIfClosed(); });
    Open();
    if (!mDialog.IsClosed()) {
        loop.exec(QEventLoop::DialogExec);
    }
    if (self) {
        mLoop = nullptr;
        mThrown = nullptr;
        disconnect(dispatcher, nullptr, this, nullptr);
        hide();
    }
    return thrown;
}

void DialogWindow::Open() {
    PlaceWindow();
    TakeInitialFocus();
    show();
    raise();
    activateWindow();
    // From the loop, so that the window is on the screen before the logic goes on.
    QMetaObject::invokeMethod(
        this, [this] { Act([](Dialog& ioDialog) { ioDialog.TellOpened(); }); }, Qt::QueuedConnection);
}

void DialogWindow::PlaceWindow() {
    ensurePolished();
    const ostui::View* const view = mDialog.GetLayout();
    mLeastSize =
        view ? QSize(view->GetNumber("minWidth", 0), view->GetNumber("minHeight", 0)) : QSize(kLeastWidth, 0);
    resize(layout()->totalSizeHint().expandedTo(mLeastSize));
    FitToContents();
    mIsPlaced = true;
    const ostcore::optional<ostui::Geometry>& wanted = mDialog.GetGeometry();
    if (!wanted) {
        return;
    }
    if (mCanResize && wanted->width > 0 && wanted->height > 0) {
        const QSize screen = QGuiApplication::primaryScreen()->availableVirtualSize();
        resize(QSize(wanted->width, wanted->height).expandedTo(minimumSize()).boundedTo(screen));
    }
    const QRect frame(QPoint(wanted->left, wanted->top), size());
    if (IsReachable(frame)) {
        move(frame.topLeft());
    }
}

void DialogWindow::FitToContents() {
    if (mIsFitting || !layout()) {
        return;
    }
    const QScopedValueRollback<bool> fitting(mIsFitting, true);
    const int width = std::max({this->width(), mLeastSize.width(), layout()->totalMinimumSize().width()});
    const bool followsWidth = layout()->hasHeightForWidth();
    const int needed =
        followsWidth ? layout()->totalMinimumHeightForWidth(width) : layout()->totalMinimumSize().height();
    const int wanted =
        followsWidth ? layout()->totalHeightForWidth(width) : layout()->totalSizeHint().height();
    const int height = std::max({mLeastSize.height(), needed, wanted});
    if (!mCanResize) {
        setFixedSize(width, height);
        return;
    }
    setMinimumSize(std::max(mLeastSize.width(), layout()->totalMinimumSize().width()),
                   std::max(mLeastSize.height(), needed));
    if (!mIsPlaced) {
        resize(width, height);
    }
}

void DialogWindow::OrderFocus() {
    QWidget* before = nullptr;
    for (const auto& control : mControls.GetAll()) {
        for (QWidget* const widget : control->GetFocusWidgets()) {
            if (before) {
                setTabOrder(before, widget);
            }
            before = widget;
        }
    }
}

void DialogWindow::TakeInitialFocus() {
    const ControlWidget* wanted = mControls.Find(mDialog.GetFocus());
    const auto takesFocus = [](const ControlWidget* inControl) {
        const std::vector<QWidget*> widgets =
            inControl ? inControl->GetFocusWidgets() : std::vector<QWidget*>();
        return !widgets.empty() && widgets.front()->isEnabled() ? widgets.front() : nullptr;
    };
    if (!takesFocus(wanted)) {
        wanted = mControls.Find(mDialog.GetDefaultButton());
        for (const auto& control : mControls.GetAll()) {
            const Control* const state = mDialog.Find(control->GetID());
            if (state && state->type != ostui::ControlType::kButton && mDialog.IsShown(*state) &&
                takesFocus(control.get())) {
                wanted = control.get();
                break;
            }
        }
    }
    if (QWidget* const widget = takesFocus(wanted)) {
        widget->setFocus(Qt::ActiveWindowFocusReason);
    }
}

void DialogWindow::ShowMnemonics() {
    mHaveCaptionsChanged = false;
    std::vector<QString> texts;
    std::vector<Caption> captions;
    for (const auto& control : mControls.GetAll()) {
        for (Caption& caption : control->GetCaptions()) {
            texts.push_back(caption.text);
            captions.push_back(std::move(caption));
        }
    }
    const std::vector<QString> marked = AssignMnemonics(texts);
    for (std::size_t which = 0; which < captions.size(); ++which) {
        captions[which].show(marked[which]);
    }
}

void DialogWindow::ShowControl(const Control& inControl) {
    if (ControlWidget* const control = mControls.Find(inControl.id)) {
        control->Update(inControl);
    }
    if (mHaveCaptionsChanged) {
        ShowMnemonics();
    }
}

void DialogWindow::ShowDialog() {
    setWindowTitle(ToTitle(mDialog.GetTitle()));
    for (const auto& control : mControls.GetAll()) {
        if (auto* const button = dynamic_cast<Button*>(control.get())) {
            button->SetDefault(button->GetID() == mDialog.GetDefaultButton());
        }
    }
    if (mHaveCaptionsChanged) {
        ShowMnemonics();
    }
}

void DialogWindow::Act(const std::function<void(Dialog&)>& inAction) {
    const QPointer<DialogWindow> self(this);
    Dialog& dialog = mDialog;
    std::exception_ptr* const thrown = mThrown;
    if (!thrown || dialog.IsClosed()) {
        return;
    }
    try {
        inAction(dialog);
    } catch (...) {
        // Not through Qt's frames: out of the run, which is over.
        *thrown = std::current_exception();
        dialog.Close(ostui::kResponseCancel);
    }
    if (self) {
        LeaveIfClosed();
    }
}

void DialogWindow::LeaveIfClosed() {
    if (mLoop && mDialog.IsClosed()) {
        mLoop->exit();
    }
}

// The escape key and the closing box.
void DialogWindow::reject() {
    const QPointer<DialogWindow> self(this);
    Act([](Dialog& ioDialog) { ioDialog.Dismiss(); });
    if (self && mDialog.IsClosed()) {
        // A window that stays after it was asked to close holds up the end of the application.
        hide();
    }
}

bool DialogWindow::PressDefault() {
    const auto* const button = dynamic_cast<Button*>(mControls.Find(mDialog.GetDefaultButton()));
    if (!button || !button->GetButton()->isEnabled() || !button->GetButton()->isVisible()) {
        return false;
    }
    button->GetButton()->click();
    return true;
}

void DialogWindow::keyPressEvent(QKeyEvent* inEvent) {
    const bool isEnter = inEvent->key() == Qt::Key_Return || inEvent->key() == Qt::Key_Enter;
    if (isEnter) {
        inEvent->accept();
        auto* const focused = qobject_cast<QAbstractButton*>(focusWidget());
        if (focused && !focused->isCheckable() && inEvent->modifiers() != Qt::ControlModifier) {
            focused->click();
        } else {
            PressDefault();
        }
        return;
    }
    const Control* const message = mDialog.Find(ostui::kMessageBoxText);
    if (message && inEvent->matches(QKeySequence::Copy)) {
        QGuiApplication::clipboard()->setText(ToQt(message->text));
        return;
    }
    QDialog::keyPressEvent(inEvent);
}

void DialogWindow::TellGeometry() {
    if (isVisible() && mLoop) {
        mDialog.SetGeometry({x(), y(), width(), height()});
    }
}

void DialogWindow::moveEvent(QMoveEvent* inEvent) {
    QDialog::moveEvent(inEvent);
    TellGeometry();
}

void DialogWindow::resizeEvent(QResizeEvent* inEvent) {
    QDialog::resizeEvent(inEvent);
    FitToContents();
    TellGeometry();
}

bool DialogWindow::event(QEvent* inEvent) {
    const bool isHandled = QDialog::event(inEvent);
    if (inEvent->type() == QEvent::LayoutRequest) {
        FitToContents();
    }
    return isHandled;
}

}  // namespace detail
}  // namespace ZOClientQt
