// Dialogs as their logic sees them: answered by a script, closed from elsewhere, or with nobody to ask; and
// the progress window around an operation.
#include <unistd.h>

#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Frame/ProgressWindow.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/MessageBox.h"
#include "ostui/TerminalBackEnd.h"
#include "ZOClient/Types.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

/// Ends when the test says so, or when it is aborted.
class Operation final : public RFL::IBatchOperation {
public:
    std::uint32_t AddRef() noexcept override { return mReferences.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mReferences.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID&, void** outInterface) noexcept override {
        *outInterface = nullptr;
        return RFL::kResultInterfaceNotSupported;
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        return QueryInterface(inID, outInterface);
    }
    ImmutableString GetStationID() override { return mStation; }
    UString GetDescription() override { return u"Operation"; }
    bool Start() override {
        ++starts;
        if (endsAtOnce) {
            Post(RFL::OperationCompleteMessage());
        }
        return canStart;
    }
    void Abort() override {
        ++aborts;
        Post(RFL::OperationCompleteMessage());
    }
    template <class T>
    void Post(const T& inMessage) {
        RFL::StationUtils::PostMessageToUIThread(mStation, inMessage, false);
    }

    bool canStart = true;
    bool endsAtOnce = false;
    int starts = 0;
    int aborts = 0;

private:
    const ImmutableString mStation = RFL::StationRegistry::RegisterUniqueStation();
    RFL::RefCount mReferences;
};

class WindowsTest : public testing::Test {
protected:
    WindowsTest() { ostcore::threads::SetMainThread(); }
    ~WindowsTest() override { ostcore::threads::ResetMainThread(); }

    const InterfaceRef<Operation> operation{new Operation};
    ProgressWindowSettings settings;
};

TEST_F(WindowsTest, WithNobodyToAskTheAnswerChangesNothing) {
    ostui::MessageBoxSettings box;
    EXPECT_EQ(ostui::RunMessageBox(box), ostui::kMessageBoxOK);
    box.buttons = ostui::kMessageBoxYes | ostui::kMessageBoxNo;
    box.defaultButton = ostui::kMessageBoxYes;
    EXPECT_EQ(ostui::RunMessageBox(box), ostui::kMessageBoxNo);
    box.buttons |= ostui::kMessageBoxCancel;
    EXPECT_EQ(ostui::RunMessageBox(box), ostui::kMessageBoxCancel);

    operation->endsAtOnce = true;
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kCompleted);
}

TEST_F(WindowsTest, OffTheMainThreadNothingIsShown) {
    ScriptedWindows windows;
    std::thread([&] {
        EXPECT_EQ(ostui::RunMessageBox({}), ostui::kMessageBoxNoAnswer);
        EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kNotRun);
        ostui::Dialog dialog("Any", "");
        EXPECT_EQ(dialog.RunModal(), ostui::kResponseNone);
    }).join();
    EXPECT_EQ(operation->starts, 0);
    EXPECT_EQ(RunProgressWindow(nullptr, settings), ProgressEnd::kNotRun);
    EXPECT_THAT(windows.Shown(), IsEmpty());
}

TEST_F(WindowsTest, ADialogRunsAgainAndIsClosedFromAnywhere) {
    ScriptedWindows windows;
    std::string password;
    ostui::Dialog dialog("Ask", "Title");
    dialog.AddPasswordEdit("password", "Password");
    dialog.AddButton("ok", "OK", [&] {
        password = dialog.GetText("password");
        dialog.Close(ostui::kResponseOK);
    });
    windows.Answer("Title", [](ScriptedWindow& ioWindow) {
        ioWindow.Enter("password", "first");
        ioWindow.Press("ok");
        EXPECT_TRUE(ioWindow.IsClosed());
    });
    EXPECT_EQ(dialog.RunModal(), ostui::kResponseOK);
    EXPECT_EQ(password, "first");
    std::thread closer;
    windows.Answer("Ask", [&](ScriptedWindow&) { closer = std::thread([&] { dialog.Close(7); }); });
    EXPECT_EQ(dialog.RunModal(), 7);
    closer.join();
    dialog.Close(8);
    EXPECT_EQ(dialog.RunModal(), 8) << "what closed it came before it could run";
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
    ASSERT_EQ(windows.Shown().size(), 2u);
    EXPECT_THAT(windows.Shown()[0].changes, IsEmpty()) << "a password was recorded";
}

TEST_F(WindowsTest, ProgressTellsWhatTheOperationSays) {
    ScriptedWindows windows;
    settings.caption = "Working";
    windows.Answer(kProgressWindowID, [&](ScriptedWindow& ioWindow) {
        operation->Post(RFL::UpdateOperationDescriptionMessage(u"Half way"));
        operation->Post(RFL::UpdateOperationProgressMessage(2, 4));
        ioWindow.WaitUntil([&] { return ioWindow.Find(kProgressBar)->value == 50; });
        EXPECT_EQ(ioWindow.Text(kProgressText), "Half way");
        operation->Post(RFL::UpdateOperationProgressMessage(9, 3));
        operation->Post(RFL::UpdateOperationProgressMessage(1, 0));
        ioWindow.WaitUntil([&] { return ioWindow.Find(kProgressBar)->value == 100; });
        operation->Post(RFL::OperationCompleteMessage());
    });
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kCompleted);
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
    ASSERT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(windows.Shown()[0].title, "Orvane Meridane");
    EXPECT_EQ(windows.Shown()[0].Text(kProgressText), "Working");
    EXPECT_EQ(windows.Shown()[0].Text(kProgressCancelButton), "Cancel");
    EXPECT_EQ(operation->aborts, 0);

    operation->canStart = false;
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kNotStarted);
    EXPECT_EQ(windows.Shown().size(), 1u);
}

TEST_F(WindowsTest, CancelAbortsOnceAndWaitsForTheEnd) {
    ScriptedWindows windows;
    windows.Answer(kProgressWindowID, [&](ScriptedWindow& ioWindow) {
        ioWindow.Press(kProgressCancelButton);
        EXPECT_FALSE(ioWindow.IsClosed());
        EXPECT_FALSE(ioWindow.Find(kProgressCancelButton)->isEnabled);
        ioWindow.Dismiss();
    });
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kCancelled);
    EXPECT_EQ(operation->aborts, 1);
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
}

TEST_F(WindowsTest, TheSecondButtonAsksAndClosesOnlyWhenItMay) {
    ScriptedWindows windows;
    settings.layout = kPendingTransactionWindowID;
    settings.secondText = "Discard";
    settings.onSecond = [] {
        ostui::MessageBoxSettings question;
        question.buttons = ostui::kMessageBoxYes | ostui::kMessageBoxNo;
        return ostui::RunMessageBox(question) == ostui::kMessageBoxYes;
    };
    windows.Answer(kPendingTransactionWindowID, [](ScriptedWindow& ioWindow) {
        ioWindow.Press(kProgressSecondButton);
        EXPECT_FALSE(ioWindow.IsClosed());
        ioWindow.Press(kProgressSecondButton);
        EXPECT_TRUE(ioWindow.IsClosed());
    });
    windows.AnswerWith(ostui::kMessageBoxID, "noButton");
    windows.AnswerWith(ostui::kMessageBoxID, "yesButton");
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kSecondButton);
    EXPECT_EQ(operation->aborts, 0);
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
    EXPECT_EQ(windows.Shown().size(), 3u);
}

TEST_F(WindowsTest, OffATerminalNothingIsAskedAndAnInterruptDismisses) {
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    bool isInterrupted = false;
    const auto former =
        ostui::SetBackEnd(ostui::CreateTerminalBackEnd({ends[0], ends[1], [&] { return isInterrupted; }}));
    ostui::MessageBoxSettings question;
    question.message = "Discard?";
    question.buttons = ostui::kMessageBoxYes | ostui::kMessageBoxNo;
    question.defaultButton = ostui::kMessageBoxYes;
    EXPECT_EQ(ostui::RunMessageBox(question), ostui::kMessageBoxNo);
    ostcore::threads::AsyncCallFromMainThread([&] { isInterrupted = true; });
    EXPECT_EQ(RunProgressWindow(operation, settings), ProgressEnd::kCancelled);
    close(ends[1]);
    char byte = 0;
    EXPECT_EQ(read(ends[0], &byte, 1), 0) << "something was written";
    close(ends[0]);
    ostui::SetBackEnd(former);
}

}  // namespace
}  // namespace ZOCL
