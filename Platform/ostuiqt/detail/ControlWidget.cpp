// What all controls have in common, and which class shows which.
#include "ostuiqt/detail/ControlWidget.h"

#include <QtWidgets/QLabel>

#include "ostuiqt/detail/ActionWidgets.h"
#include "ostuiqt/detail/ChoiceWidgets.h"
#include "ostuiqt/detail/Text.h"
#include "ostuiqt/detail/TextWidgets.h"
#include "ostuiqt/detail/TreeWidget.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::ControlType;

ControlWidget::ControlWidget(ControlHost& ioHost, const Control& inControl)
    : mHost(ioHost), mID(inControl.id) {}

void ControlWidget::Update(const Control& inControl) {
    ShowLabel(inControl);
    const QString tip = ToTip(inControl.tooltip);
    if (mWidget->toolTip() != tip) {
        mWidget->setToolTip(tip);
        mWidget->setAccessibleDescription(ToQt(inControl.tooltip));
    }
    UpdateContent(inControl);
    mWidget->setEnabled(inControl.isEnabled);
    ShowWidget(inControl.isVisible);
    if (mLabel) {
        mLabel->setEnabled(inControl.isEnabled);
        mLabel->setVisible(inControl.isVisible);
    }
}

void ControlWidget::ShowLabel(const Control& inControl) {
    const QString text = ToQt(inControl.label);
    if (mLabelText == text) {
        return;
    }
    mLabelText = text;
    mWidget->setAccessibleName(NameFromLabel(text));
    mHasName = true;
    if (!HasVisibleLabel()) {
        return;
    }
    if (!mLabel) {
        mLabel = new QLabel(mWidget->parentWidget());
        mLabel->setTextFormat(Qt::PlainText);
        mLabel->setBuddy(mWidget);
    }
    mLabel->setText(EscapeMnemonics(text));
    mHost.CaptionsChanged();
}

void ControlWidget::ShowWidget(bool inIsVisible) {
    mWidget->setVisible(inIsVisible);
}

std::vector<QWidget*> ControlWidget::GetFocusWidgets() const {
    return mWidget->focusPolicy() & Qt::TabFocus ? std::vector<QWidget*>{mWidget} : std::vector<QWidget*>{};
}

std::vector<Caption> ControlWidget::GetCaptions() const {
    if (!mLabel) {
        return {};
    }
    return {{mLabelText, [label = mLabel](const QString& inMarked) { label->setText(inMarked); }}};
}

void ControlWidget::SetNamedBy(QLabel* inLabel, const QString& inText) {
    inLabel->setBuddy(mWidget);
    SetNameUnlessNamed(NameFromLabel(inText));
}

void ControlWidget::SetNameUnlessNamed(const QString& inName) {
    if (!mHasName && !inName.isEmpty()) {
        mWidget->setAccessibleName(inName);
    }
}

bool ControlWidget::SetCaption(const QString& inText) {
    if (mCaption == inText) {
        return false;
    }
    mCaption = inText;
    mHost.CaptionsChanged();
    return true;
}

std::unique_ptr<ControlWidget> MakeControlWidget(ControlHost& ioHost, const Control& inControl,
                                                 const ostui::View* inView, QWidget* inParent) {
    switch (inControl.type) {
        case ControlType::kStaticText:
            return std::make_unique<StaticText>(ioHost, inControl, inView, inParent);
        case ControlType::kTextEdit:
            if (inControl.isMultiLine) {
                return std::make_unique<MultiLineEdit>(ioHost, inControl, inParent);
            }
            return std::make_unique<SingleLineEdit>(ioHost, inControl, inParent);
        case ControlType::kPasswordEdit:
        case ControlType::kSearchEdit:
            return std::make_unique<SingleLineEdit>(ioHost, inControl, inParent);
        case ControlType::kList:
            return std::make_unique<List>(ioHost, inControl, inParent);
        case ControlType::kPopup:
            return std::make_unique<Popup>(ioHost, inControl, inParent);
        case ControlType::kRadioGroup:
            return std::make_unique<RadioGroup>(ioHost, inControl, inParent);
        case ControlType::kCheckBox:
            return std::make_unique<CheckBox>(ioHost, inControl, inParent);
        case ControlType::kTree:
            return std::make_unique<TreeWidget>(ioHost, inControl, inParent);
        case ControlType::kImage:
            return std::make_unique<Image>(ioHost, inControl, inParent);
        case ControlType::kProgressBar:
            return std::make_unique<ProgressBar>(ioHost, inControl, inParent);
        case ControlType::kButton:
            return std::make_unique<Button>(ioHost, inControl, inView, inParent);
        case ControlType::kTabs:
            return std::make_unique<Tabs>(ioHost, inControl, inParent);
        case ControlType::kGroup:
            return std::make_unique<Group>(ioHost, inControl, inView, inParent);
    }
    return nullptr;
}

}  // namespace detail
}  // namespace ZOClientQt
