// Texts to be read, and edits.
#pragma once

#include "ostuiqt/detail/ControlWidget.h"

class QLineEdit;
class QPlainTextEdit;

namespace ZOClientQt {
namespace detail {

class StaticText final : public ControlWidget {
public:
    StaticText(ControlHost& ioHost, const ostui::Control& inControl, const ostui::View* inView,
               QWidget* inParent);

    QLabel* GetTextLabel() const { return mText; }
    /// Its letter leads to the control that it names.
    void SetNames(ControlWidget& ioNamed);
    std::vector<Caption> GetCaptions() const override;

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QLabel* const mText;
    bool mNamesAnother = false;
};

/// A line of text, a password or a text to search for.
class SingleLineEdit final : public ControlWidget {
public:
    SingleLineEdit(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);

private:
    bool HasVisibleLabel() const override { return !mIsSearch; }
    void UpdateContent(const ostui::Control& inControl) override;

    const bool mIsSearch;
    QLineEdit* const mEdit;
    /// The control's text as far as it is known here.
    QString mShown;
};

class MultiLineEdit final : public ControlWidget {
public:
    MultiLineEdit(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);
    bool IsTall() const override { return true; }

private:
    void UpdateContent(const ostui::Control& inControl) override;

    QPlainTextEdit* const mEdit;
    /// The control's text as far as it is known here; what the edit makes of it may differ in its white
    /// space.
    QString mShown;
    bool mIsUpdating = false;
};

}  // namespace detail
}  // namespace ZOClientQt
