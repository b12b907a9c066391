// Buttons, progress bars, images, and what holds other controls.
#pragma once

#include "ostuiqt/detail/ControlWidget.h"

class QAbstractButton;
class QGroupBox;
class QProgressBar;
class QPushButton;
class QTabWidget;

namespace ZOClientQt {
namespace detail {

class Button final : public ControlWidget {
public:
    Button(ControlHost& ioHost, const ostui::Control& inControl, const ostui::View* inView,
           QWidget* inParent);

    QAbstractButton* GetButton() const { return mButton; }
    void SetDefault(bool inIsDefault);
    std::vector<Caption> GetCaptions() const override;

private:
    void UpdateContent(const ostui::Control& inControl) override;
    bool HasOwnKey() const;

    QAbstractButton* mButton;
    /// Null for one that is a picture only.
    QPushButton* mPushButton = nullptr;
    std::string mImage;
};

class ProgressBar final : public ControlWidget {
public:
    ProgressBar(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QProgressBar* const mBar;
};

class Image final : public ControlWidget {
public:
    Image(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);

private:
    void UpdateContent(const ostui::Control& inControl) override;

    std::string mImage;
};

/// A box with a title, or a pane that is not seen.
class Group final : public ControlWidget {
public:
    Group(ControlHost& ioHost, const ostui::Control& inControl, const ostui::View* inView, QWidget* inParent);

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QGroupBox* mBox = nullptr;
};

/// A page of tabs.
class Page final : public ControlWidget {
public:
    Page(ControlHost& ioHost, const ostui::Control& inControl, QTabWidget* ioTabs, QWidget* inPage);

private:
    void UpdateContent(const ostui::Control&) override {}
    void ShowWidget(bool inIsVisible) override;

    QTabWidget* const mTabs;
};

}  // namespace detail
}  // namespace ZOClientQt
