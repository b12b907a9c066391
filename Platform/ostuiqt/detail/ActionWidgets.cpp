// Buttons, progress, images, groups.
#include "ostuiqt/detail/ActionWidgets.h"

#include <QtGui/QPainter>
#include <QtWidgets/QGroupBox>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QTabWidget>
#include <QtWidgets/QToolButton>

#include "ostuiqt/detail/Icons.h"
#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::Dialog;

namespace {

constexpr int kMinimumButtonWidth = 88;
/// Finer than any screen; the bar's own range is a signed one.
constexpr int kProgressSteps = 10000;
constexpr int kMinimumBarWidth = 160;

/// Draws an icon at the resolution of whatever screen it is on.
class IconView final : public QWidget {
public:
    explicit IconView(QWidget* inParent) : QWidget(inParent) {
        setSizePolicy(QSizePolicy::Fixed, QSizePolicy::Fixed);
    }
    void SetIcon(const QIcon& inIcon) {
        mIcon = inIcon;
        updateGeometry();
        update();
    }
    QSize sizeHint() const override { return GetNaturalSize(mIcon); }

private:
    void paintEvent(QPaintEvent*) override {
        QPainter painter(this);
        mIcon.paint(&painter, rect(), Qt::AlignCenter, isEnabled() ? QIcon::Normal : QIcon::Disabled);
    }

    QIcon mIcon;
};

}  // namespace

Button::Button(ControlHost& ioHost, const Control& inControl, const ostui::View* inView, QWidget* inParent)
    : ControlWidget(ioHost, inControl) {
    if (inView && inView->tag == "ost_picture_button") {
        auto* const picture = new QToolButton(inParent);
        picture->setAutoRaise(!inView->GetFlag("showBorder", false));
        picture->setFocusPolicy(Qt::StrongFocus);
        mButton = picture;
    } else {
        mPushButton = new QPushButton(inParent);
        // Enter is the dialog's to decide.
        mPushButton->setAutoDefault(false);
        mPushButton->setMinimumWidth(kMinimumButtonWidth);
        mButton = mPushButton;
    }
    SetWidget(mButton);
    connect(mButton, &QAbstractButton::clicked, this,
            [this] { Act([id = GetID()](Dialog& ioDialog) { ioDialog.Press(id); }); });
}

void Button::SetDefault(bool inIsDefault) {
    if (mPushButton && mPushButton->isDefault() != inIsDefault) {
        mPushButton->setDefault(inIsDefault);
        GetHost().CaptionsChanged();
    }
}

bool Button::HasOwnKey() const {
    const Dialog& dialog = GetHost().GetDialog();
    return GetID() == dialog.GetDefaultButton() || GetID() == dialog.GetCancelButton();
}

std::vector<Caption> Button::GetCaptions() const {
    if (!mPushButton) {
        return {};
    }
    if (HasOwnKey()) {
        // Enter and Escape are theirs; the letters are for the others.
        mButton->setText(EscapeMnemonics(GetCaption()));
        return {};
    }
    return {{GetCaption(), [button = mButton](const QString& inMarked) { button->setText(inMarked); }}};
}

void Button::UpdateContent(const Control& inControl) {
    if (!mPushButton) {
        mButton->setAccessibleName(ToQt(inControl.text.empty() ? inControl.tooltip : inControl.text));
    } else if (SetCaption(ToQt(inControl.text))) {
        mButton->setText(EscapeMnemonics(GetCaption()));
    }
    if (mImage != inControl.image) {
        mImage = inControl.image;
        const QIcon icon = GetHost().GetIcons().Get(mImage);
        mButton->setIcon(icon);
        mButton->setIconSize(GetNaturalSize(icon));
    }
}

ProgressBar::ProgressBar(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mBar(new QProgressBar(inParent)) {
    mBar->setTextVisible(false);
    mBar->setMinimumWidth(kMinimumBarWidth);
    SetWidget(mBar);
}

void ProgressBar::UpdateContent(const Control& inControl) {
    const bool isRunning = inControl.total == 0;
    const int range = isRunning ? 0 : kProgressSteps;
    if (mBar->maximum() != range) {
        mBar->setRange(0, range);
    }
    if (!isRunning) {
        const double part = static_cast<double>(inControl.value) / inControl.total;
        mBar->setValue(static_cast<int>(part * kProgressSteps));
    }
}

Image::Image(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl) {
    SetWidget(new IconView(inParent));
}

void Image::UpdateContent(const Control& inControl) {
    if (mImage != inControl.image) {
        mImage = inControl.image;
        static_cast<IconView*>(GetWidget())->SetIcon(GetHost().GetIcons().Get(mImage));
    }
    SetNameUnlessNamed(ToQt(inControl.tooltip));
}

Group::Group(ControlHost& ioHost, const Control& inControl, const ostui::View* inView, QWidget* inParent)
    : ControlWidget(ioHost, inControl) {
    if (inView && inView->tag == "ost_groupbox") {
        mBox = new QGroupBox(inParent);
        SetWidget(mBox);
    } else {
        SetWidget(new QWidget(inParent));
    }
}

void Group::UpdateContent(const Control& inControl) {
    if (mBox && SetCaption(ToQt(inControl.text))) {
        mBox->setTitle(EscapeMnemonics(GetCaption()));
    }
}

Page::Page(ControlHost& ioHost, const Control& inControl, QTabWidget* ioTabs, QWidget* inPage)
    : ControlWidget(ioHost, inControl), mTabs(ioTabs) {
    SetWidget(inPage);
}

void Page::ShowWidget(bool inIsVisible) {
    mTabs->setTabVisible(mTabs->indexOf(GetWidget()), inIsVisible);
}

}  // namespace detail
}  // namespace ZOClientQt
