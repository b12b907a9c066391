// Windows for hosts: the progress windows, the base of windows from layouts, the list of a reflection, and
// clearing the screen.
#include <stdlib.h>

#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Frame/BatchOperationBase.h"
#include "Frame/ProgressWindow.h"
#include "Frame/Station.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Scheduler.h"
#include "ostui/BackEnd.h"
#include "OutageMinder.h"
#include "ResourceFactory.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::StartsWith;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

/// Ends when the test says so, or when it is aborted; it cannot be torn down.
class Operation final : public BatchOperationBase, public IZOCOperationFinalText {
public:
    std::uint32_t AddRef() noexcept override { return BatchOperationBase::AddRef(); }
    std::uint32_t Release() noexcept override { return BatchOperationBase::Release(); }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        return BatchOperationBase::QueryInterface(inID, outInterface);
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        if (inID != IZOCOperationFinalText::kInterfaceID) {
            return BatchOperationBase::QueryInterfaceNoAddRef(inID, outInterface);
        }
        *outInterface = static_cast<IZOCOperationFinalText*>(this);
        return kResultSuccess;
    }
    UString GetDescription() override { return {}; }
    bool Start() override {
        ++starts;
        if (endsWith) {
            Finish(*endsWith);
        }
        return true;
    }
    void Abort() override {
        ++aborts;
        Finish(kResultSuccess);
    }
    UString GetFinalText() override { return finalText; }

    optional<int> endsWith;
    UString finalText;
    int starts = 0;
    int aborts = 0;
};

class DialogsTest : public testing::Test, public OutageMinder {
protected:
    DialogsTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (testing::TempDir() + "zoclient-dialogs-test").c_str(), 0);
        ostcore::threads::SetMainThread();
        RegisterStation();
        GetCompositionRoot().outages = this;
    }
    ~DialogsTest() override {
        EXPECT_THAT(windows.Mismatches(), testing::IsEmpty());
        GetCompositionRoot().outages = nullptr;
        ostcore::threads::ResetMainThread();
    }
    bool IsNetworkDown() override { return isDown; }
    bool SignOut() override {
        ++signOuts;
        return isDown && (EndSession(), true);
    }
    void OnProgressWindowsGone() override { ++gone; }

    bool Do(bool inCanCancel = true, bool inWaitForConfirm = false) {
        return DoProgressDialog(u"Title", u"Caption", operation, inCanCancel, inWaitForConfirm, u"Leave");
    }
    void OnShown(const ScriptedWindows::Script& inScript) { windows.Answer(kProgressWindowID, inScript); }
    void TellNetwork(bool inIsDown) {
        ZONetworkStateMessage message;
        message.isDown = isDown = inIsDown;
        PostLibraryMessage(message);
    }
    static void EndSession() {
        ZOTerminateConnectionMessage message;
        message.forced = true;
        PostLibraryMessage(message);
    }
    bool Clear(const CloseModalDialogsSettings& inSettings = {}) {
        return CloseModalDialogs([this] { ++completions; }, inSettings);
    }
    /// Lets the delays pass that follow each other, and what they bring.
    void PassChecks(int inCount) {
        for (int i = 0; i < inCount; ++i) {
            clock->Advance(std::chrono::milliseconds(100));
            ostcore::threads::PumpMainThread();
        }
    }
    static void MakeCancellable(ostui::Dialog& ioDialog, bool inIsStubborn = false) {
        ioDialog.AddButton("cancelButton", "Cancel", [&ioDialog, inIsStubborn] {
            if (!inIsStubborn) {
                ioDialog.Close(ostui::kResponseCancel);
            }
        });
        ioDialog.SetCancelButton("cancelButton");
        ioDialog.SetClosesByItself();
    }

    const shared_ptr<ostcore::threads::VirtualScheduler> clock =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    ostcore::threads::ScopedGlobalScheduler virtualTime{clock};
    ScriptedWindows windows;
    const InterfaceRef<Operation> operation{new Operation};
    bool isDown = false;
    int signOuts = 0;
    int gone = 0;
    int completions = 0;
};

TEST_F(DialogsTest, SuccessIsWhatTheOperationEndedWith) {
    for (const int result : {kResultSuccess, kResultFailure, kResultHTTPNotModified}) {
        operation->endsWith = result;
        EXPECT_EQ(Do(), result >= 0);
        EXPECT_EQ(DoIndeterminateProgressDialog(u"", u"", operation, true, false), result >= 0);
    }
    EXPECT_FALSE(DoProgressDialog(u"", u"", nullptr, true, true));
    std::thread([this] { EXPECT_FALSE(Do()); }).join();
    EXPECT_EQ(operation->starts, 6);
    EXPECT_EQ(windows.Shown()[0].title + ": " + windows.Shown()[0].Text(kProgressText), "Title: Caption");
    EXPECT_EQ(windows.Shown()[1].title, "Orvane Meridane");
    operation->endsWith = kResultSuccess;
    operation->finalText = u"Done";
    {
        const ScopedSilence silence(true);
        EXPECT_TRUE(Do(true, true));
    }
    EXPECT_EQ(windows.Shown().size(), 6u);
    EXPECT_EQ(gone, 6);
    ostui::SetBackEnd(nullptr);
    EXPECT_TRUE(Do(true, true)) << "nobody is there to confirm";
}

TEST_F(DialogsTest, WhatAnOperationTellsAtItsEndIsConfirmed) {
    operation->endsWith = kResultSuccess;
    EXPECT_TRUE(Do(true, true)) << "nothing to tell";
    operation->finalText = u"Copied 3 of 4 items.";
    EXPECT_TRUE(Do(true, false));
    for (const bool isConfirmed : {true, false}) {
        OnShown([](ScriptedWindow&) {});
        OnShown([&](ScriptedWindow& ioWindow) {
            EXPECT_EQ(ioWindow.Title() + ": " + ioWindow.Text(kProgressText), "Title: Copied 3 of 4 items.");
            EXPECT_FALSE(ioWindow.Find(kProgressCancelButton)->isVisible);
            isConfirmed ? ioWindow.Press(kProgressConfirmButton) : EndSession();
        });
        EXPECT_TRUE(Do(true, true));
    }
    EXPECT_EQ(operation->aborts, 0);
}

TEST_F(DialogsTest, TheNetworksMessageComesAndGoes) {
    for (const bool canCancel : {true, false}) {
        isDown = true;
        OnShown([&](ScriptedWindow& ioWindow) {
            const auto isVisible = [&] { return ioWindow.Find(kProgressCancelButton)->isVisible; };
            EXPECT_EQ(ioWindow.Title(), "Orvane Meridane");
            EXPECT_THAT(ioWindow.Text(kProgressText), StartsWith("Communication with the Meridane"));
            EXPECT_TRUE(isVisible()) << "there is no way out";
            RFL::StationUtils::PostMessageToUIThread(
                operation->GetStationID(), RFL::UpdateOperationDescriptionMessage(u"Meanwhile"), false);
            TellNetwork(false);
            ioWindow.WaitUntil([&] { return ioWindow.Text(kProgressText) == "Meanwhile"; });
            EXPECT_EQ(ioWindow.Title() + ioWindow.Text(kProgressCancelButton), "TitleLeave");
            EXPECT_EQ(isVisible(), canCancel);
            TellNetwork(true);
            ioWindow.WaitUntil([&] { return ioWindow.Text(kProgressCancelButton) == "Sign Out"; });
            operation->Abort();
        });
        EXPECT_TRUE(Do(canCancel));
    }
}

TEST_F(DialogsTest, OneButtonCancelsOrSignsOutAndAlwaysEndsTheWait) {
    // Whether the network is down when the window opens and when the button is pressed.
    const std::pair<bool, bool> rows[] = {{false, false}, {true, true}, {true, false}};
    int aborts = 0;
    for (const auto& row : rows) {
        isDown = row.first;
        OnShown([&](ScriptedWindow& ioWindow) {
            isDown = row.second;
            ioWindow.Press(kProgressCancelButton);
            ioWindow.WaitUntil([&] { return ioWindow.Text(kProgressCancelButton) == "Canceling..."; });
            EXPECT_EQ(operation->aborts, ++aborts);
        });
        EXPECT_FALSE(Do());
        EXPECT_EQ(signOuts, aborts - 1) << "a cancel signed out, or a sign-out did not";
    }
}

TEST_F(DialogsTest, AReflectionShowsItsListAsItChanges) {
    const auto list = boost::make_shared<ReflectionProgressList>();
    list->Set({"1", u"One", u"waits"});
    ReflectionProgressDialog window(list);
    ASSERT_TRUE(window.Initialize());
    windows.AnswerWith("ZOReflectionProgressDialog", "cancelButton");
    EXPECT_EQ(window.RunModal(), ostui::kResponseCancel);
    windows.Answer("ZOReflectionProgressDialog", [&](ScriptedWindow& ioWindow) {
        const auto rows = [&] { return ioWindow.Rows("progressView"); };
        EXPECT_THAT(rows(), ElementsAre("One | waits"));
        std::thread([&] {
            list->Set({"2", u"Two", u""});
            list->Set({"1", u"One", u"done"});
        }).join();
        ioWindow.WaitUntil([&] { return rows().size() == 2; });
        EXPECT_THAT(rows(), ElementsAre("One | done", "Two | "));
        list->Remove("1");
        ioWindow.WaitUntil([&] { return rows() == std::vector<std::string>{"Two | "}; });
        std::thread([&] { window.PostClose(); }).join();
    });
    EXPECT_EQ(window.RunModal(), ostui::kResponseOK);
    list->Set({"3", u"Three", u""});
    ostcore::threads::PumpMainThread();
}

TEST_F(DialogsTest, AMessageBoxShowsTheIconThatItsCallerNames) {
    using ostui::MessageBoxIcon;
    const std::pair<MessageBoxIcon, const char*> rows[] = {{MessageBoxIcon::kNone, ""},
                                                           {MessageBoxIcon::kNote, "MessageBoxNote"},
                                                           {MessageBoxIcon::kCaution, "MessageBoxCaution"},
                                                           {MessageBoxIcon::kStop, "MessageBoxStop"}};
    for (const auto& row : rows) {
        windows.Answer(ostui::kMessageBoxID, [&](ScriptedWindow& ioWindow) {
            const ostui::Control* const image = ioWindow.Find(ostui::kMessageBoxImage);
            EXPECT_EQ(image ? image->image : "", row.second);
            ioWindow.Press("okButton");
        });
        EXPECT_EQ(SimpleMessageBox(u"Title", u"Text", ostui::kMessageBoxOK, ostui::kMessageBoxOK, row.first),
                  ostui::kMessageBoxOK);
    }
}

TEST_F(DialogsTest, TheScreenIsClearedFromTheInnermostWindowOut) {
    EXPECT_TRUE(Clear());
    EXPECT_EQ(completions, 1);
    std::thread([&] { EXPECT_FALSE(Clear()); }).join();
    ostui::Dialog outer("Outer", ""), inner("Inner", "");
    MakeCancellable(outer);
    MakeCancellable(inner);
    windows.Answer("Outer", [&](ScriptedWindow&) {
        inner.RunModal();
        // The host's own and its welcome window stay, and are no obstacle.
        EXPECT_TRUE(Clear({"Outer", ""}) && Clear({"", "Outer"}));
        EXPECT_EQ(completions, 3);
        EXPECT_FALSE(outer.IsClosed());
        PassChecks(1);
        EXPECT_TRUE(outer.IsClosed()) << "the check that follows forgot it";
    });
    windows.Answer("Inner", [&](ScriptedWindow& ioWindow) {
        EXPECT_TRUE(Clear());
        EXPECT_TRUE(ioWindow.IsClosed());
        EXPECT_EQ(completions, 1);
    });
    outer.RunModal();
    PassChecks(2);
    EXPECT_EQ(completions, 4);
}

TEST_F(DialogsTest, AWindowThatDoesNotGoIsToldOfAfterTenSeconds) {
    ostui::Dialog dialog("Stubborn", "");
    MakeCancellable(dialog, true);
    windows.Answer("Stubborn", [&](ScriptedWindow& ioWindow) {
        Clear();
        PassChecks(99);
        EXPECT_EQ(windows.Shown().size(), 1u);
        windows.AnswerWith(ostui::kMessageBoxID, "okButton");
        PassChecks(51);
        ASSERT_EQ(windows.Shown().size(), 2u);
        EXPECT_THAT(windows.Shown()[1].Text(ostui::kMessageBoxText),
                    StartsWith("We have detected open dialogs. Please cancel all dialogs to "));
        EXPECT_FALSE(ioWindow.IsClosed() || completions > 0);
        dialog.Close(ostui::kResponseOK);
    });
    dialog.RunModal();
    PassChecks(5);
    EXPECT_EQ(completions, 1);
}

TEST_F(DialogsTest, TheEndOfTheLibraryEndsTheClearingOfTheScreen) {
    Initialize();
    ostui::Dialog dialog("Stubborn", "");
    MakeCancellable(dialog, true);
    windows.Answer("Stubborn", [&](ScriptedWindow&) {
        // One waits for its time, the other for its turn in the main thread's queue.
        Clear();
        clock->Advance(std::chrono::milliseconds(100));
        EXPECT_EQ(ostcore::threads::MainThreadQueueSize(), 1u);
        Clear();
        EXPECT_EQ(clock->PendingCount(), 1u);
        Shutdown();
        EXPECT_EQ(clock->PendingCount(), 0u);
        int presses = 0;
        dialog.SetHandler("cancelButton", [&presses] { ++presses; });
        PassChecks(5);
        EXPECT_EQ(presses, 0) << "a window was cancelled after the end";
        dialog.Close(ostui::kResponseOK);
    });
    dialog.RunModal();
    PassChecks(5);
    EXPECT_EQ(completions, 0);
}

}  // namespace
}  // namespace ZOCL
