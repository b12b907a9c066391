// The user of the endings: goes on in every window, until the end comes.
#include <algorithm>
#include <chrono>

#include "EndingsTest.h"

namespace ZOCL {

void PlayedWindows::RunModal(ostui::Dialog& ioDialog) {
    shown.push_back(ioDialog.GetID() + ": " + ioDialog.GetTitle());
    ioDialog.TellOpened();
    player(ioDialog);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (!ioDialog.IsClosed()) {
        tick();
        if (std::chrono::steady_clock::now() >= deadline) {
            ADD_FAILURE() << ioDialog.GetID() << " stays open";
            ioDialog.Close(ostui::kResponseCancel);
        }
    }
}

std::size_t PlayedWindows::CountOf(const std::string& inText) const {
    return static_cast<std::size_t>(std::count(shown.begin(), shown.end(), inText));
}

void EndingsTest::CancelWindow(ostui::Dialog& ioDialog) {
    if (!ioDialog.Press(ioDialog.GetCancelButton())) {
        ioDialog.Dismiss();
    }
}

void EndingsTest::OnWindow(ostui::Dialog& ioDialog) {
    if (IsSessionOver()) {
        mShownAfterEnd.push_back(windows->shown.back());
    }
    if (++mWindows == mEnding.window) {
        mIsHit = true;
        mEnding.kind == EndingKind::kCancel ? CancelWindow(ioDialog) : End();
    }
    if (mIsHit && (mEnding.kind == EndingKind::kSignOut || mEnding.kind == EndingKind::kTerminate)) {
        return;
    }
    Play(ioDialog);
}

void EndingsTest::Play(ostui::Dialog& ioDialog) {
    if (ioDialog.GetID() == ostui::kMessageBoxID) {
        ioDialog.Press("okButton");
    } else if (ioDialog.GetID() == ZOResolveDialog::kID) {
        PlayResolve(ioDialog);
    } else if (ioDialog.GetID() == ZOPublishDialog::kID) {
        PlayShare(ioDialog);
    } else {
        EXPECT_EQ(ioDialog.GetID(), kProgressWindowID);
    }
}

void EndingsTest::PlayResolve(ostui::Dialog& ioDialog) {
    const auto tree = ioDialog.GetTree(ZOResolveDialog::kTree);
    WaitUntil([&] { return ioDialog.IsClosed() || !tree->GetRows().empty(); });
    while (!ioDialog.IsClosed() && !IsSessionOver()) {
        const std::size_t rows = tree->GetRows().size();
        // The first is taken from the others, the last is kept.
        const ostui::Control& choice = *ioDialog.Find(ZOResolveDialog::kResolveTypes);
        ioDialog.SelectRows(ZOResolveDialog::kTree, {0});
        ioDialog.Select(
            ZOResolveDialog::kResolveTypes,
            choice.FindItem(rows > 1 ? ZOResolveDialog::kAcceptTheirs : ZOResolveDialog::kAcceptYours));
        if (!ioDialog.Press(ZOResolveDialog::kResolveButton) || tree->GetRows().size() == rows) {
            ioDialog.Dismiss();
        }
    }
}

void EndingsTest::PlayShare(ostui::Dialog& ioDialog) {
    WaitUntil([&] {
        return ioDialog.IsClosed() || ioDialog.IsShown(*ioDialog.Find(ZOPublishDialog::kPublishView));
    });
    if (!ioDialog.IsClosed() && !IsSessionOver()) {
        ioDialog.Enter(ZOPublishDialog::kComment, "Day one");
        ioDialog.Press(ZOPublishDialog::kShareButton);
        ioDialog.Dismiss();
    }
}

}  // namespace ZOCL
