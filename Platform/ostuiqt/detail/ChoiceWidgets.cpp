// Lists, popups, radio buttons, check boxes and tabs.
#include "ostuiqt/detail/ChoiceWidgets.h"

#include <algorithm>

#include <QtWidgets/QButtonGroup>
#include <QtWidgets/QCheckBox>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QListWidget>
#include <QtWidgets/QRadioButton>
#include <QtWidgets/QTabBar>
#include <QtWidgets/QTabWidget>
#include <QtWidgets/QVBoxLayout>

#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::Dialog;

namespace {

constexpr int kSpaceBetweenButtons = 6;

QStringList ToList(const std::vector<ostui::U8String>& inTexts) {
    QStringList texts;
    for (const ostui::U8String& text : inTexts) {
        texts.push_back(ToQt(text));
    }
    return texts;
}

int FindPlace(const std::vector<std::string>& inIDs, const std::string& inID) {
    const auto found = std::find(inIDs.begin(), inIDs.end(), inID);
    return found == inIDs.end() ? -1 : static_cast<int>(found - inIDs.begin());
}

}  // namespace

List::List(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mList(new QListWidget(inParent)) {
    mList->setUniformItemSizes(true);
    SetWidget(mList);
    // The current row is not the selected one: it moves when the list gets the keyboard.
    connect(mList, &QListWidget::itemSelectionChanged, this, [this] {
        if (!mIsUpdating) {
            Act([id = GetID(), row = GetRow()](Dialog& ioDialog) { ioDialog.Select(id, row); });
        }
    });
}

int List::GetRow() const {
    const QList<QListWidgetItem*> selected = mList->selectedItems();
    return selected.isEmpty() ? -1 : mList->row(selected.front());
}

void List::UpdateContent(const Control& inControl) {
    mIsUpdating = true;
    if (mItems != inControl.items) {
        mItems = inControl.items;
        mList->clear();
        mList->addItems(ToList(mItems));
    }
    if (GetRow() != inControl.selection) {
        mList->setCurrentRow(inControl.selection, QItemSelectionModel::ClearAndSelect);
    }
    mIsUpdating = false;
}

Popup::Popup(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mBox(new QComboBox(inParent)) {
    mBox->setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Fixed);
    SetWidget(mBox);
    connect(mBox, &QComboBox::activated, this, [this](int inRow) {
        Act([id = GetID(), inRow](Dialog& ioDialog) { ioDialog.Select(id, inRow); });
    });
}

void Popup::UpdateContent(const Control& inControl) {
    if (mItems != inControl.items) {
        mItems = inControl.items;
        mBox->clear();
        mBox->addItems(ToList(mItems));
    }
    if (mBox->currentIndex() != inControl.selection) {
        mBox->setCurrentIndex(inControl.selection);
    }
}

RadioGroup::RadioGroup(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mPane(new QWidget(inParent)), mGroup(new QButtonGroup(mPane)) {
    mItemIDs = inControl.itemIDs;
    for (std::size_t item = 0; item < inControl.items.size(); ++item) {
        mButtons.push_back(new QRadioButton(mPane));
        mGroup->addButton(mButtons.back(), static_cast<int>(item));
    }
    mTexts.resize(mButtons.size());
    SetWidget(mPane);
    connect(mGroup, &QButtonGroup::idClicked, this, [this](int inRow) {
        Act([id = GetID(), inRow](Dialog& ioDialog) { ioDialog.Select(id, inRow); });
    });
}

QWidget* RadioGroup::GetButton(const std::string& inItemID) const {
    const int place = FindPlace(mItemIDs, inItemID);
    return place < 0 || place >= static_cast<int>(mButtons.size())
               ? nullptr
               : mButtons[static_cast<std::size_t>(place)];
}

void RadioGroup::StackButtons() {
    auto* const stack = new QVBoxLayout(mPane);
    stack->setContentsMargins(0, 0, 0, 0);
    stack->setSpacing(kSpaceBetweenButtons);
    for (QRadioButton* const button : mButtons) {
        stack->addWidget(button);
    }
}

std::vector<QWidget*> RadioGroup::GetFocusWidgets() const {
    return {mButtons.begin(), mButtons.end()};
}

std::vector<Caption> RadioGroup::GetCaptions() const {
    std::vector<Caption> captions = ControlWidget::GetCaptions();
    for (std::size_t item = 0; item < mButtons.size(); ++item) {
        captions.push_back({mTexts[item], [button = mButtons[item]](const QString& inMarked) {
                                button->setText(inMarked);
                            }});
    }
    return captions;
}

void RadioGroup::UpdateContent(const Control& inControl) {
    for (std::size_t item = 0; item < mButtons.size() && item < inControl.items.size(); ++item) {
        const QString text = ToQt(inControl.items[item]);
        if (mTexts[item] != text) {
            mTexts[item] = text;
            mButtons[item]->setText(EscapeMnemonics(text));
            GetHost().CaptionsChanged();
        }
        mButtons[item]->setEnabled(inControl.IsItemEnabled(static_cast<int>(item)));
    }
    if (mGroup->checkedId() != inControl.selection) {
        // A group in which one must be chosen cannot be without a choice.
        mGroup->setExclusive(false);
        for (std::size_t item = 0; item < mButtons.size(); ++item) {
            mButtons[item]->setChecked(static_cast<int>(item) == inControl.selection);
        }
        mGroup->setExclusive(true);
    }
}

CheckBox::CheckBox(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mBox(new QCheckBox(inParent)) {
    SetWidget(mBox);
    connect(mBox, &QCheckBox::clicked, this, [this](bool inIsChecked) {
        Act([id = GetID(), inIsChecked](Dialog& ioDialog) { ioDialog.Check(id, inIsChecked); });
    });
}

std::vector<Caption> CheckBox::GetCaptions() const {
    return {{GetCaption(), [box = mBox](const QString& inMarked) { box->setText(inMarked); }}};
}

void CheckBox::UpdateContent(const Control& inControl) {
    if (SetCaption(ToQt(inControl.text))) {
        mBox->setText(EscapeMnemonics(GetCaption()));
    }
    mBox->setChecked(inControl.isChecked);
}

Tabs::Tabs(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mTabs(new QTabWidget(inParent)) {
    mItemIDs = inControl.itemIDs;
    for (std::size_t item = 0; item < mItemIDs.size(); ++item) {
        mTabs->addTab(new QWidget, QString());
    }
    mTexts.resize(mItemIDs.size());
    SetWidget(mTabs);
    connect(mTabs, &QTabWidget::currentChanged, this, [this](int inPage) {
        if (!mIsUpdating) {
            Act([id = GetID(), inPage](Dialog& ioDialog) { ioDialog.Select(id, inPage); });
        }
    });
}

QWidget* Tabs::GetPage(const std::string& inItemID) const {
    return mTabs->widget(FindPlace(mItemIDs, inItemID));
}

std::vector<QWidget*> Tabs::GetFocusWidgets() const {
    return {mTabs->tabBar()};
}

std::vector<Caption> Tabs::GetCaptions() const {
    std::vector<Caption> captions;
    for (std::size_t item = 0; item < mTexts.size(); ++item) {
        captions.push_back({mTexts[item], [tabs = mTabs, item](const QString& inMarked) {
                                tabs->setTabText(static_cast<int>(item), inMarked);
                            }});
    }
    return captions;
}

void Tabs::UpdateContent(const Control& inControl) {
    mIsUpdating = true;
    for (std::size_t item = 0; item < mTexts.size() && item < inControl.items.size(); ++item) {
        const int page = static_cast<int>(item);
        const QString text = ToQt(inControl.items[item]);
        if (mTexts[item] != text) {
            mTexts[item] = text;
            mTabs->setTabText(page, EscapeMnemonics(text));
            GetHost().CaptionsChanged();
        }
    }
    if (inControl.selection >= 0) {
        mTabs->setCurrentIndex(inControl.selection);
    }
    mIsUpdating = false;
}

}  // namespace detail
}  // namespace ZOClientQt
