// Controls by which the user chooses.
#pragma once

#include "ostuiqt/detail/ControlWidget.h"

class QButtonGroup;
class QCheckBox;
class QComboBox;
class QListWidget;
class QRadioButton;
class QTabWidget;

namespace ZOClientQt {
namespace detail {

class List final : public ControlWidget {
public:
    List(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);
    bool IsTall() const override { return true; }

private:
    void UpdateContent(const ostui::Control& inControl) override;
    /// The selected one; -1 is none.
    int GetRow() const;

    QListWidget* const mList;
    std::vector<ostui::U8String> mItems;
    bool mIsUpdating = false;
};

class Popup final : public ControlWidget {
public:
    Popup(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QComboBox* const mBox;
    std::vector<ostui::U8String> mItems;
};

/// Its widget holds the buttons, and whatever else a layout puts among them.
class RadioGroup final : public ControlWidget {
public:
    RadioGroup(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);
    bool IsTall() const override { return true; }

    /// The button of an item, to be placed by the layout; null when there is no such item.
    QWidget* GetButton(const std::string& inItemID) const;
    /// Stacks the buttons, for a window without a layout.
    void StackButtons();
    std::vector<QWidget*> GetFocusWidgets() const override;
    std::vector<Caption> GetCaptions() const override;

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QWidget* const mPane;
    QButtonGroup* const mGroup;
    std::vector<QRadioButton*> mButtons;
    std::vector<std::string> mItemIDs;
    std::vector<QString> mTexts;
};

class CheckBox final : public ControlWidget {
public:
    CheckBox(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);
    std::vector<Caption> GetCaptions() const override;

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QCheckBox* const mBox;
};

class Tabs final : public ControlWidget {
public:
    Tabs(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);

    /// The page of an item, to be filled by the layout; null when there is no such item.
    QWidget* GetPage(const std::string& inItemID) const;
    std::vector<QWidget*> GetFocusWidgets() const override;
    std::vector<Caption> GetCaptions() const override;

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QTabWidget* const mTabs;
    std::vector<std::string> mItemIDs;
    std::vector<QString> mTexts;
    bool mIsUpdating = false;
};

}  // namespace detail
}  // namespace ZOClientQt
