// A user at the windows of the Qt back end: told beforehand what to do in each, and doing it with the mouse
// and the keyboard.
#pragma once

#include <deque>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <QtCore/QPointer>
#include <QtWidgets/QDialog>

#include "ostui/BackEnd.h"

class QAbstractButton;
class QTreeView;

/// Shows every dialog by the Qt back end. The user comes to it when it is active on the screen, and must have
/// closed it when his function returns, unless it closes by itself. One that nobody comes to is a failure,
/// and closed. Main thread.
class User final : public ostui::BackEnd {
public:
    using Act = std::function<void(QDialog& ioWindow)>;

    User();

    /// What is done in the next dialog of that identifier.
    void Expect(const std::string& inID, Act inAct);
    /// What is done in each dialog first; true: the dialog needs no more.
    std::function<bool(ostui::Dialog& ioDialog)> first;

    /// "identifier: title" of each that was shown.
    const std::vector<std::string>& Shown() const noexcept { return mShown; }
    /// Whether everything that was expected has come.
    bool IsDone() const noexcept { return mExpected.empty(); }
    void Forget() { mExpected.clear(); }

    void RunModal(ostui::Dialog& ioDialog) override;
    void OnControlChanged(ostui::Dialog& ioDialog, const ostui::Control& inControl) override;
    void OnDialogChanged(ostui::Dialog& ioDialog) override;

    /// Whether what the user does would come too late: the dialog is closed, and its window about to go.
    static bool IsOver(const QDialog& inWindow);

    // --- The hands. Each waits until it can be done, and fails the test when that does not come.

    static void Click(QDialog& ioWindow, const char* inButton);
    static void ClickCell(QDialog& ioWindow, const char* inText, int inColumn = 0);
    static void Type(QDialog& ioWindow, const char* inText);
    /// The texts of a tree from the top down; waits until there are so many rows.
    static std::vector<std::string> Rows(QDialog& ioWindow, int inCount);

private:
    void ComeTo(ostui::Dialog& ioDialog);

    const ostcore::shared_ptr<ostui::BackEnd> mQt;
    std::deque<std::pair<std::string, Act>> mExpected;
    std::vector<std::string> mShown;
};
