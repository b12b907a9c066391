// Makes the widgets of a dialog and arranges them, by its layout or, without one, below each other.
#pragma once

#include "ostui/Dialog.h"
#include "ostuiqt/detail/ControlSet.h"

class QBoxLayout;
class QLayout;

namespace ZOClientQt {
namespace detail {

class RadioGroup;

class LayoutBuilder {
public:
    LayoutBuilder(ControlHost& ioHost, ControlSet& ioControls) : mHost(ioHost), mControls(ioControls) {}

    /// Fills an empty window.
    void Build(QWidget& ioWindow);

private:
    enum class Place { kFill, kLeading, kCenter, kTrailing };
    /// What stands in a layout: one of the two.
    struct Item {
        QWidget* widget = nullptr;
        QLayout* layout = nullptr;
    };
    struct Placed {
        Item item;
        Place horizontal = Place::kLeading;
        Place vertical = Place::kLeading;
        bool isButtonRow = false;
    };

    void Stack(QWidget& ioWindow);
    /// The layout of a container's children, whose widgets get inParent.
    QLayout* Arrange(const ostui::View& inView, QWidget* inParent, int inDefaultSpacing);
    QLayout* Overlay(const std::vector<Placed>& inChildren);
    QLayout* Line(const std::vector<Placed>& inChildren, bool inIsRow, int inSpacing);
    std::vector<Placed> MakeChildren(const ostui::View& inView, QWidget* inParent, bool inIsRow);
    Item MakeItem(const ostui::View& inView, QWidget* inParent);
    Item MakeContainer(const ostui::View& inView, QWidget* inParent);
    Item MakeControl(const ostui::Control& inControl, const ostui::View* inView, QWidget* inParent);
    Item MakeTabs(const ostui::Control& inControl, const ostui::View& inView, QWidget* inParent);
    Item MakeRadioGroup(const ostui::Control& inControl, const ostui::View& inView, QWidget* inParent);
    Item MakeButtonRow(const ostui::View& inView, QWidget* inParent);
    Item MakeButtons(std::vector<const ostui::Control*> inButtons, QWidget* inParent);
    /// The control with its label beside it.
    Item WithLabel(ControlWidget& inControl, const ostui::View* inView);

    ControlHost& mHost;
    ControlSet& mControls;
    /// The groups of radio buttons around the view that is being made, the innermost last.
    std::vector<const RadioGroup*> mRadioGroups;
};

/// Gives controls without a label the name of the text in front of them.
void NameControls(const ostui::Dialog& inDialog, const ControlSet& inControls);

}  // namespace detail
}  // namespace ZOClientQt
