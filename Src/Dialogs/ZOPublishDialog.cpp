// Logic of the Share window.
#include "Dialogs/ZOPublishDialog.h"

#include "Dialogs/PublishChangeList.h"
#include "Dialogs/ZOMultiColumnTree.h"
#include "Frame/LibraryWindow.h"
#include "Frame/Station.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

namespace {

const char kTitle[] = "$$$/ZOCL/ZOPublishDialog/Title=Share \"@0\"";
constexpr const char* kProgressBar = "progressBar";
// The names of the keys are older than what the columns show.
const char kColumnName[] = "$$$/Cadenzo/ZOCL/ZOPublishDialog/Col_Name=Name";
const char kColumnAction[] = "$$$/Cadenzo/ZOCL/ZOPublishDialog/Col_Date=Action";
const char kColumnChangeType[] = "$$$/Cadenzo/ZOCL/ZOPublishDialog/Col_ChangeType=Change Type";
const char kColumnPath[] = "$$$/Cadenzo/ZOCL/ZOPublishDialog/Col_Synced=Path";

}  // namespace

ZOPublishDialog::ZOPublishDialog(const Settings& inSettings)
    : ZODialogBaseImpl(u"ZOPublishDialog"), mSettings(inSettings) {
    Initialize();
}

void ZOPublishDialog::LookUpControls() {
    ostui::Dialog& dialog = GetDialog();
    dialog.SetTitle(UserText(kTitle, {ostcore::utility::ToUTF8(mSettings.productionName)}));
    const shared_ptr<ostui::Tree> tree = dialog.GetTree(kAssetTree);
    tree->SetSelectionMode(ostui::Tree::SelectionMode::kNone);
    ZOMultiColumnTree(tree).SetColumns({kColumnName, kColumnAction, kColumnChangeType, kColumnPath});
    dialog.SetProgress(kProgressBar, 0, 0);
    dialog.SetVisible(kPublishView, false);
    dialog.SetHandler(kShareButton, [this] { OnShare(); });
    dialog.SetOnOpened([this] { OnOpened(); });
}

void ZOPublishDialog::OnOpened() {
    mPrepare = InterfaceRef<ZOPreparePublishOperation>(
        new ZOPreparePublishOperation(mSettings.sessionURL, mSettings.session));
    mWatch = boost::make_shared<OperationWatch>(mPrepare, [this] { OnPrepareFinished(); });
    if (!mWatch->Start()) {
        OnPrepareFinished();
    }
}

void ZOPublishDialog::OnPrepareFinished() {
    if (mPrepare->GetResult() >= 0) {
        GetDialog()
            .GetTree(kAssetTree)
            ->SetRows(
                MakePublishRows(mPrepare->GetItems(), ReadPublishChanges(mPrepare->GetOutgoingChanges())));
    }
    GetDialog().SetVisible(kProgressView, false);
    GetDialog().SetVisible(kPublishView, true);
}

ImmutableString ZOPublishDialog::GetLoadedCommit() const {
    const auto session = RFL::QueryInterface<IZOCProduction>(mSettings.session);
    return session ? session->GetLoadedRevision() : ImmutableString();
}

void ZOPublishDialog::OnShare() {
    if (mIsSharing) {
        return;
    }
    mIsSharing = true;
    mHasCommitted = true;
    const ImmutableString before = GetLoadedCommit();
    RFL::StationUtils::PostMessageToUIThread(CurrentStation(), ZOCommittedToPublishMessage(), true);
    const ImmutableString after = GetLoadedCommit();
    const UString comment = ostcore::utility::ToUTF16(GetDialog().GetText(kComment));
    const bool isShared = !GetDialog().IsClosed() && mSettings.share &&
                          mSettings.share(comment, after == before ? ImmutableString() : after);
    mIsSharing = false;
    if (isShared || !mSettings.staysOpenOnFailure) {
        GetDialog().Close(isShared ? ostui::kResponseOK : ostui::kResponseCancel);
    }
}

}  // namespace ZOCL
