// One control of a dialog and the widgets that show it.
#pragma once

#include <functional>
#include <memory>
#include <vector>

#include <QtCore/QObject>
#include <QtCore/QString>

#include "ostui/Dialog.h"

class QLabel;
class QWidget;

namespace ZOClientQt {
namespace detail {

class Icons;

/// The window that holds the controls, as these see it.
class ControlHost {
public:
    /// Hands what the user did to the dialog. The window, and whoever calls, may be gone afterwards.
    virtual void Act(const std::function<void(ostui::Dialog&)>& inAction) = 0;
    virtual ostui::Dialog& GetDialog() = 0;
    virtual Icons& GetIcons() = 0;
    /// A text that carries a mnemonic has changed.
    virtual void CaptionsChanged() = 0;

protected:
    ~ControlHost() = default;
};

/// A text that can carry a mnemonic.
struct Caption {
    QString text;
    std::function<void(const QString& inMarked)> show;
};

/// Made once for each control, shows its state, and tells the dialog what the user does with it.
class ControlWidget : public QObject {
public:
    ControlWidget(ControlHost& ioHost, const ostui::Control& inControl);

    const std::string& GetID() const { return mID; }
    QWidget* GetWidget() const { return mWidget; }
    /// The label beside or above it; null when it has none.
    QLabel* GetLabel() const { return mLabel; }
    /// Whether it is higher than a line, so that a label beside it stands at its top.
    virtual bool IsTall() const { return false; }

    /// Shows the control as it is now.
    void Update(const ostui::Control& inControl);
    /// The widgets that take the keyboard, in the order in which it goes through them.
    virtual std::vector<QWidget*> GetFocusWidgets() const;
    virtual std::vector<Caption> GetCaptions() const;

    /// A static text in front that names this control.
    void SetNamedBy(QLabel* inLabel, const QString& inText);
    /// For screen readers, where the control has no text of its own.
    void SetNameUnlessNamed(const QString& inName);

protected:
    void SetWidget(QWidget* inWidget) { mWidget = inWidget; }
    virtual void UpdateContent(const ostui::Control& inControl) = 0;
    virtual void ShowWidget(bool inIsVisible);
    /// False for those whose label is for screen readers only, or shown inside.
    virtual bool HasVisibleLabel() const { return true; }
    void Act(const std::function<void(ostui::Dialog&)>& inAction) { mHost.Act(inAction); }
    ControlHost& GetHost() const { return mHost; }
    /// Notes a caption; true when it is another one than before.
    bool SetCaption(const QString& inText);
    const QString& GetCaption() const { return mCaption; }

private:
    void ShowLabel(const ostui::Control& inControl);

    ControlHost& mHost;
    const std::string mID;
    QWidget* mWidget = nullptr;
    QLabel* mLabel = nullptr;
    QString mLabelText;
    QString mCaption;
    bool mHasName = false;
};

/// inParent is the widget that will hold it.
std::unique_ptr<ControlWidget> MakeControlWidget(ControlHost& ioHost, const ostui::Control& inControl,
                                                 const ostui::View* inView, QWidget* inParent);

}  // namespace detail
}  // namespace ZOClientQt
