// From views to widgets.
#include "ostuiqt/detail/LayoutBuilder.h"

#include <algorithm>

#include <QtWidgets/QApplication>
#include <QtWidgets/QBoxLayout>
#include <QtWidgets/QDialogButtonBox>
#include <QtWidgets/QGridLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QTabWidget>

#include "ostuiqt/detail/ActionWidgets.h"
#include "ostuiqt/detail/ChoiceWidgets.h"
#include "ostuiqt/detail/Text.h"
#include "ostuiqt/detail/TextWidgets.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::ControlType;
using ostui::View;

namespace {

constexpr int kWindowMargin = 18;
constexpr int kPageMargin = 12;
constexpr int kWindowSpacing = 12;
constexpr int kSpacing = 8;
constexpr int kLabelGap = 8;
constexpr int kSpaceAboveButtons = 6;

bool IsButtonRow(const View& inView) {
    return inView.tag == "ost_ok_cancel_row" || inView.tag == "ost_cancel_row";
}

bool FillsWidth(const View& inView) {
    static constexpr std::string_view kTags[] = {
        "ost_multi_column_tree", "ost_text_edit",     "ost_search_box",    "ost_popup",
        "ost_progress_bar",      "ost_tab_container", "ost_ok_cancel_row", "ost_cancel_row"};
    return std::find(std::begin(kTags), std::end(kTags), inView.tag) != std::end(kTags);
}

void SetMinimumSize(QWidget* ioWidget, const View& inView) {
    if (const int width = inView.GetNumber("minWidth", 0)) {
        ioWidget->setMinimumWidth(width);
    }
    if (const int height = inView.GetNumber("minHeight", 0)) {
        ioWidget->setMinimumHeight(height);
    }
}

/// Left of it where the language is read from the left, right of it elsewhere.
void SetMargins(QLayout* ioLayout, int inLeading, int inTop) {
    const bool isMirrored = QApplication::isRightToLeft();
    ioLayout->setContentsMargins(isMirrored ? 0 : inLeading, inTop, isMirrored ? inLeading : 0, 0);
}

/// The buttons that say yes stand last on some desktops, first on others.
bool AcceptStandsLast() {
    const int order = QApplication::style()->styleHint(QStyle::SH_DialogButtonLayout);
    return order == QDialogButtonBox::GnomeLayout || order == QDialogButtonBox::MacLayout;
}

/// Edits below each other begin at one line.
void AlignLabels(const std::vector<QLabel*>& inLabels) {
    int width = 0;
    for (const QLabel* const label : inLabels) {
        width = std::max(width, label->sizeHint().width());
    }
    for (QLabel* const label : inLabels) {
        label->setMinimumWidth(width);
    }
}

/// Pushes a layout to the middle or the end of the room across a line. An alignment would not: what has
/// stretches in it takes all room that it gets.
QLayout* Pad(QLayout* inContent, bool inIsRow, bool inIsCentered, bool inIsTrailing) {
    if (!inIsCentered && !inIsTrailing) {
        return inContent;
    }
    auto* const padded = new QBoxLayout(inIsRow ? QBoxLayout::TopToBottom : QBoxLayout::LeftToRight);
    padded->setContentsMargins(0, 0, 0, 0);
    padded->addStretch(1);
    padded->addLayout(inContent);
    if (inIsCentered) {
        padded->addStretch(1);
    }
    return padded;
}

}  // namespace

void LayoutBuilder::Build(QWidget& ioWindow) {
    const View* const layout = mHost.GetDialog().GetLayout();
    if (!layout) {
        Stack(ioWindow);
        return;
    }
    QLayout* const content = Arrange(*layout, &ioWindow, kWindowSpacing);
    content->setContentsMargins(kWindowMargin, kWindowMargin, kWindowMargin, kWindowMargin);
    ioWindow.setLayout(content);
}

void LayoutBuilder::Stack(QWidget& ioWindow) {
    std::vector<Placed> rows;
    std::vector<Placed> images;
    std::vector<const Control*> buttons;
    std::vector<QLabel*> labels;
    for (const Control& control : mHost.GetDialog().GetControls()) {
        if (control.type == ControlType::kButton) {
            buttons.push_back(&control);
            continue;
        }
        if (control.type == ControlType::kImage) {
            images.push_back(
                {MakeControl(control, nullptr, &ioWindow), Place::kLeading, Place::kLeading, false});
            continue;
        }
        const bool isTall = control.type == ControlType::kList || control.type == ControlType::kTree;
        rows.push_back({MakeControl(control, nullptr, &ioWindow), Place::kFill,
                        isTall ? Place::kFill : Place::kLeading, false});
        if (!images.empty()) {
            // Beside what comes next.
            Placed text = rows.back();
            text.vertical = Place::kCenter;
            images.push_back(text);
            rows.back() = {Item{nullptr, Line(images, true, kWindowSpacing)}, Place::kFill, Place::kLeading,
                           false};
            images.clear();
        }
        const ControlWidget* const made = mControls.Find(control.id);
        if (made && made->GetLabel() && !made->IsTall()) {
            labels.push_back(made->GetLabel());
        }
    }
    AlignLabels(labels);
    if (!buttons.empty()) {
        rows.push_back({MakeButtons(std::move(buttons), &ioWindow), Place::kFill, Place::kLeading, true});
    }
    QLayout* const content = Line(rows, false, kWindowSpacing);
    content->setContentsMargins(kWindowMargin, kWindowMargin, kWindowMargin, kWindowMargin);
    ioWindow.setLayout(content);
}

QLayout* LayoutBuilder::Arrange(const View& inView, QWidget* inParent, int inDefaultSpacing) {
    const std::string* const placement = inView.Find("placement");
    const bool isRow = placement ? *placement == "row" : inView.tag == "row";
    const std::vector<Placed> children = MakeChildren(inView, inParent, isRow);
    if (placement && *placement == "overlay") {
        return Overlay(children);
    }
    return Line(children, isRow, inView.GetNumber("spacing", inDefaultSpacing));
}

std::vector<LayoutBuilder::Placed> LayoutBuilder::MakeChildren(const View& inView, QWidget* inParent,
                                                               bool inIsRow) {
    const auto read = [](const View& inChild, const View& inAround, const char* inOwn, const char* inOfAll,
                         Place inDefault) {
        const std::string* word = inChild.Find(inOwn);
        word = word ? word : inAround.Find(inOfAll);
        if (!word) {
            return inDefault;
        }
        return *word == "fill"                         ? Place::kFill
               : *word == "center"                     ? Place::kCenter
               : *word == "right" || *word == "bottom" ? Place::kTrailing
                                                       : Place::kLeading;
    };
    std::vector<Placed> children;
    std::vector<QLabel*> labels;
    for (const View& child : inView.children) {
        const Item item = MakeItem(child, inParent);
        if (item.widget || item.layout) {
            const Place width = FillsWidth(child) ? Place::kFill : Place::kLeading;
            const Place height = inIsRow ? Place::kCenter : Place::kLeading;
            children.push_back({item, read(child, inView, "horizontal", "child_horizontal", width),
                                read(child, inView, "vertical", "child_vertical", height),
                                IsButtonRow(child)});
        }
        const ControlWidget* const control = mControls.Find(child.GetIdentifier());
        if (control && control->GetLabel() && !inIsRow) {
            labels.push_back(control->GetLabel());
        }
    }
    AlignLabels(labels);
    return children;
}

QLayout* LayoutBuilder::Overlay(const std::vector<Placed>& inChildren) {
    auto* const grid = new QGridLayout;
    grid->setContentsMargins(0, 0, 0, 0);
    for (const Placed& child : inChildren) {
        const Qt::Alignment across = child.horizontal == Place::kFill       ? Qt::Alignment()
                                     : child.horizontal == Place::kCenter   ? Qt::AlignHCenter
                                     : child.horizontal == Place::kTrailing ? Qt::AlignRight
                                                                            : Qt::AlignLeft;
        const Qt::Alignment down = child.vertical == Place::kFill       ? Qt::Alignment()
                                   : child.vertical == Place::kCenter   ? Qt::AlignVCenter
                                   : child.vertical == Place::kTrailing ? Qt::AlignBottom
                                                                        : Qt::AlignTop;
        if (child.item.widget) {
            // The window keeps its size when one takes the place of the other.
            QSizePolicy policy = child.item.widget->sizePolicy();
            policy.setRetainSizeWhenHidden(true);
            child.item.widget->setSizePolicy(policy);
            grid->addWidget(child.item.widget, 0, 0, across | down);
        } else {
            grid->addLayout(child.item.layout, 0, 0, across | down);
        }
    }
    return grid;
}

QLayout* LayoutBuilder::Line(const std::vector<Placed>& inChildren, bool inIsRow, int inSpacing) {
    auto* const line = new QBoxLayout(inIsRow ? QBoxLayout::LeftToRight : QBoxLayout::TopToBottom);
    line->setContentsMargins(0, 0, 0, 0);
    line->setSpacing(inSpacing);
    const auto along = [&](const Placed& inChild) { return inIsRow ? inChild.horizontal : inChild.vertical; };
    const bool isFilled = std::any_of(inChildren.begin(), inChildren.end(),
                                      [&](const Placed& inChild) { return along(inChild) == Place::kFill; });
    bool hasSpace = isFilled;
    const auto addSpace = [&] {
        if (!hasSpace) {
            line->addStretch(1);
            hasSpace = true;
        }
    };
    const bool isCentered =
        !isFilled && !inChildren.empty() && along(inChildren.front()) == Place::kCenter && inIsRow;
    if (isCentered) {
        line->addStretch(1);
    }
    for (const Placed& child : inChildren) {
        const bool isLast = &child == &inChildren.back();
        if (along(child) == Place::kTrailing || (child.isButtonRow && isLast && !inIsRow)) {
            addSpace();
        }
        const Place place = inIsRow ? child.vertical : child.horizontal;
        const Qt::Alignment leading = inIsRow ? Qt::AlignTop : Qt::AlignLeft;
        const Qt::Alignment trailing = inIsRow ? Qt::AlignBottom : Qt::AlignRight;
        const Qt::Alignment center = inIsRow ? Qt::AlignVCenter : Qt::AlignHCenter;
        const Qt::Alignment across = place == Place::kFill       ? Qt::Alignment()
                                     : place == Place::kCenter   ? center
                                     : place == Place::kTrailing ? trailing
                                                                 : leading;
        const int stretch = along(child) == Place::kFill ? 1 : 0;
        if (child.item.widget) {
            line->addWidget(child.item.widget, stretch, across);
        } else {
            line->addLayout(
                Pad(child.item.layout, inIsRow, place == Place::kCenter, place == Place::kTrailing), stretch);
        }
    }
    addSpace();
    return line;
}

LayoutBuilder::Item LayoutBuilder::MakeItem(const View& inView, QWidget* inParent) {
    if (inView.tag == "ost_radio_button") {
        QWidget* const button =
            mRadioGroups.empty() ? nullptr : mRadioGroups.back()->GetButton(inView.GetIdentifier());
        if (button) {
            SetMinimumSize(button, inView);
        }
        return {button, nullptr};
    }
    const Control* const control = mHost.GetDialog().Find(inView.GetIdentifier());
    Item item;
    if (!control || control->type == ControlType::kGroup) {
        item = IsButtonRow(inView) ? MakeButtonRow(inView, inParent) : MakeContainer(inView, inParent);
    } else if (control->type == ControlType::kTabs) {
        item = MakeTabs(*control, inView, inParent);
    } else if (control->type == ControlType::kRadioGroup) {
        item = MakeRadioGroup(*control, inView, inParent);
    } else {
        item = MakeControl(*control, &inView, inParent);
    }
    const int left = inView.GetNumber("leftSpace", 0);
    const int top = inView.GetNumber("topSpace", 0);
    if (left == 0 && top == 0) {
        return item;
    }
    auto* const space = new QHBoxLayout;
    SetMargins(space, left, top);
    if (item.widget) {
        space->addWidget(item.widget);
    } else if (item.layout) {
        space->addLayout(item.layout);
    }
    return {nullptr, space};
}

LayoutBuilder::Item LayoutBuilder::MakeContainer(const View& inView, QWidget* inParent) {
    const Control* const control = mHost.GetDialog().Find(inView.GetIdentifier());
    const bool hasSize = inView.Find("minWidth") || inView.Find("minHeight");
    if (!control && !hasSize) {
        return {nullptr, Arrange(inView, inParent, kSpacing)};
    }
    QWidget* pane = nullptr;
    if (control) {
        ControlWidget* const group = mControls.Add(MakeControlWidget(mHost, *control, &inView, inParent));
        if (!group) {
            return {};
        }
        group->Update(*control);
        pane = group->GetWidget();
    } else {
        pane = new QWidget(inParent);
    }
    QLayout* const content = Arrange(inView, pane, kSpacing);
    if (inView.tag == "ost_groupbox") {
        content->setContentsMargins(kPageMargin, kPageMargin, kPageMargin, kPageMargin);
    }
    pane->setLayout(content);
    SetMinimumSize(pane, inView);
    return {pane, nullptr};
}

LayoutBuilder::Item LayoutBuilder::MakeControl(const Control& inControl, const View* inView,
                                               QWidget* inParent) {
    ControlWidget* const made = mControls.Add(MakeControlWidget(mHost, inControl, inView, inParent));
    if (!made) {
        return {};
    }
    made->Update(inControl);
    if (inControl.type == ControlType::kRadioGroup) {
        static_cast<RadioGroup*>(made)->StackButtons();
    }
    if (inView) {
        SetMinimumSize(made->GetWidget(), *inView);
    }
    return WithLabel(*made, inView);
}

LayoutBuilder::Item LayoutBuilder::MakeTabs(const Control& inControl, const View& inView, QWidget* inParent) {
    auto made = std::make_unique<Tabs>(mHost, inControl, inParent);
    Tabs* const tabs = made.get();
    if (!mControls.Add(std::move(made))) {
        return {};
    }
    for (const View& view : inView.children) {
        QWidget* const page = tabs->GetPage(view.GetIdentifier());
        const Control* const control = mHost.GetDialog().Find(view.GetIdentifier());
        if (!page || !control) {
            continue;
        }
        ControlWidget* const group = mControls.Add(
            std::make_unique<Page>(mHost, *control, static_cast<QTabWidget*>(tabs->GetWidget()), page));
        QLayout* const content = Arrange(view, page, kSpacing);
        content->setContentsMargins(kPageMargin, kPageMargin, kPageMargin, kPageMargin);
        page->setLayout(content);
        SetMinimumSize(page, view);
        if (group) {
            group->Update(*control);
        }
    }
    tabs->Update(inControl);
    SetMinimumSize(tabs->GetWidget(), inView);
    return {tabs->GetWidget(), nullptr};
}

LayoutBuilder::Item LayoutBuilder::MakeRadioGroup(const Control& inControl, const View& inView,
                                                  QWidget* inParent) {
    auto made = std::make_unique<RadioGroup>(mHost, inControl, inParent);
    RadioGroup* const group = made.get();
    if (!mControls.Add(std::move(made))) {
        return {};
    }
    mRadioGroups.push_back(group);
    QWidget* const pane = group->GetWidget();
    pane->setLayout(Arrange(inView, pane, kSpacing));
    mRadioGroups.pop_back();
    group->Update(inControl);
    SetMinimumSize(pane, inView);
    return WithLabel(*group, &inView);
}

LayoutBuilder::Item LayoutBuilder::MakeButtonRow(const View& inView, QWidget* inParent) {
    const Control* const row = mHost.GetDialog().Find(inView.GetIdentifier());
    ControlWidget* const group =
        row ? mControls.Add(MakeControlWidget(mHost, *row, &inView, inParent)) : nullptr;
    if (!group) {
        return {};
    }
    group->Update(*row);
    std::vector<const Control*> buttons;
    for (const Control& control : mHost.GetDialog().GetControls()) {
        if (control.group == row->id && control.type == ControlType::kButton) {
            buttons.push_back(&control);
        }
    }
    if (AcceptStandsLast()) {
        std::reverse(buttons.begin(), buttons.end());
    }
    const Item content = MakeButtons(std::move(buttons), group->GetWidget());
    group->GetWidget()->setLayout(content.layout);
    return {group->GetWidget(), nullptr};
}

LayoutBuilder::Item LayoutBuilder::MakeButtons(std::vector<const Control*> inButtons, QWidget* inParent) {
    auto* const row = new QHBoxLayout;
    row->setContentsMargins(0, kSpaceAboveButtons, 0, 0);
    row->setSpacing(kSpacing);
    row->addStretch(1);
    for (const Control* const button : inButtons) {
        if (QWidget* const widget = MakeControl(*button, nullptr, inParent).widget) {
            row->addWidget(widget);
        }
    }
    return {nullptr, row};
}

LayoutBuilder::Item LayoutBuilder::WithLabel(ControlWidget& inControl, const View* inView) {
    QLabel* const label = inControl.GetLabel();
    if (!label) {
        return {inControl.GetWidget(), nullptr};
    }
    const bool isAbove = !inView && inControl.IsTall();
    auto* const pair = new QBoxLayout(isAbove ? QBoxLayout::TopToBottom : QBoxLayout::LeftToRight);
    pair->setContentsMargins(0, 0, 0, 0);
    pair->setSpacing(inView ? inView->GetNumber("gap", kLabelGap) : kLabelGap);
    if (inView) {
        label->setMinimumHeight(inView->GetNumber("minLabelHeight", 0));
    }
    const bool isAtTop = inControl.IsTall() && !isAbove;
    pair->addWidget(label, 0, isAtTop ? Qt::AlignTop : Qt::Alignment());
    pair->addWidget(inControl.GetWidget(), 1);
    return {nullptr, pair};
}

void NameControls(const ostui::Dialog& inDialog, const ControlSet& inControls) {
    const Control* before = nullptr;
    for (const Control& control : inDialog.GetControls()) {
        const bool canBeNamed = control.type == ControlType::kTextEdit ||
                                control.type == ControlType::kPasswordEdit ||
                                control.type == ControlType::kList || control.type == ControlType::kPopup ||
                                control.type == ControlType::kTree;
        ControlWidget* const named = inControls.Find(control.id);
        ControlWidget* const namer = before ? inControls.Find(before->id) : nullptr;
        if (named && namer && canBeNamed && control.label.empty() && before->group == control.group &&
            before->type == ControlType::kStaticText && !before->text.empty() && before->text.back() == ':') {
            static_cast<StaticText*>(namer)->SetNames(*named);
        } else if (named && control.label.empty()) {
            const bool hasNoText =
                control.type == ControlType::kTree || control.type == ControlType::kProgressBar;
            named->SetNameUnlessNamed(hasNoText ? ToQt(inDialog.GetTitle()) : QString());
        }
        before = &control;
    }
}

}  // namespace detail
}  // namespace ZOClientQt
