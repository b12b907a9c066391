// Logic of the Resolve window.
#include "Dialogs/ZOResolveDialog.h"

#include "Dialogs/AssetIcons.h"
#include "Dialogs/ResolveChoices.h"
#include "Dialogs/ZOMultiColumnTree.h"
#include "Frame/LibraryWindow.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::utility::ToUTF8;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOResolveDialog/Title=Resolve Conflicts: @0";
const char kResolveText[] = "$$$/Cadenzo/ZOCL/ZOResolveDialog/ResolveButton=Resolve";
const char kStopText[] = "$$$/Cadenzo/ZOCL/ZOResolveDialog/StopResolveButton=Stop Resolving";
const char kColumnName[] = "$$$/ZOCL/ZOResolveDialog/Col_Name=Name";
const char kColumnPath[] = "$$$/ZOCL/ZOResolveDialog/Col_Path=Path";
const char kColumnType[] = "$$$/ZOCL/ZOResolveDialog/Col_Type=Conflict Type";

}  // namespace

ZOResolveDialog::ZOResolveDialog(const Settings& inSettings)
    : ZODialogBaseImpl(u"ZOResolveDialog"), mSettings(inSettings) {
    Initialize();
}

void ZOResolveDialog::LookUpControls() {
    ostui::Dialog& dialog = GetDialog();
    dialog.SetTitle(UserText(kTitle, {ToUTF8(mSettings.productionName)}));
    const shared_ptr<ostui::Tree> tree = dialog.GetTree(kTree);
    tree->SetSelectionMode(ostui::Tree::SelectionMode::kMultiple);
    tree->SetOnSelectionChanged([this] { Refresh(); });
    ZOMultiColumnTree(tree).SetColumns({kColumnName, kColumnPath, kColumnType});
    dialog.SetText(kResolveButton, UserText(kResolveText));
    dialog.SetHandler(kResolveButton, [this] { OnOKButtonChanged(); });
    dialog.SetOnChanged(kResolveTypes, [this] { Refresh(); });
    // There is nothing to decide yet.
    dialog.SetEnabled(kResolveTypes, false);
    dialog.SetOnOpened([this] { OnOpened(); });
    Refresh();
}

void ZOResolveDialog::OnOpened() {
    mPrepare = InterfaceRef<ZOPrepareResolveOperation>(new ZOPrepareResolveOperation(mSettings.sessionURL));
    mWatch = boost::make_shared<OperationWatch>(mPrepare, [this] { OnPrepareFinished(); });
    // Without conflicts to show the window stays as it is.
    mWatch->Start();
}

void ZOResolveDialog::OnPrepareFinished() {
    if (mPrepare->GetResult() < 0) {
        return;
    }
    if (mSettings.onConflictsKnown) {
        mSettings.onConflictsKnown(mPrepare->GetCommitId());
    }
    ShowConflicts(mPrepare->GetConflicts());
    if (mItems.empty()) {
        GetDialog().Close(ostui::kResponseOK);
    }
}

void ZOResolveDialog::ShowConflicts(const std::vector<ConflictItemData>& inConflicts) {
    std::vector<ostui::TreeRow> rows;
    for (const ConflictItemData& item : inConflicts) {
        ostui::TreeRow row;
        row.id = std::to_string(rows.size());
        row.icon = GetChangeIcon(item.kind, item.type);
        row.cells = {item.displayName.str(), item.path.str(), ToUTF8(GetConflictKindText(item.kind))};
        mItems.emplace(row.id, item);
        rows.push_back(std::move(row));
    }
    GetDialog().GetTree(kTree)->SetRows(std::move(rows));
    GetDialog().SetEnabled(kResolveTypes, true);
    GetDialog().SetSelection(kResolveTypes, GetDialog().Find(kResolveTypes)->FindItem(kAcceptTheirs));
    Refresh();
}

std::vector<ConflictItemData> ZOResolveDialog::GetSelectedItems() const {
    std::vector<ConflictItemData> items;
    for (const std::string& row : GetDialog().GetTree(kTree)->GetSelectedIDs()) {
        items.push_back(mItems.at(row));
    }
    return items;
}

Publish::ResolveType ZOResolveDialog::GetResolveType() const {
    const ostui::Control& group = *GetDialog().Find(kResolveTypes);
    if (group.selection == group.FindItem(kAcceptYours)) {
        return Publish::kResolveType_AcceptYours;
    }
    return group.selection == group.FindItem(kAcceptTheirsAndCopy) ? Publish::kResolveType_AcceptTheirsAndCopy
                                                                   : Publish::kResolveType_AcceptTheirs;
}

void ZOResolveDialog::Refresh() {
    const std::vector<ConflictItemData> items = GetSelectedItems();
    const bool canCopy =
        AllowResolveType(items, Publish::kResolveType_AcceptTheirsAndCopy, mSettings.copyableTypes);
    GetDialog().SetEnabled(kAcceptTheirsAndCopy, canCopy);
    const bool isBusy = mIsResolving || (mSettings.mustWait && mSettings.mustWait());
    const bool isAllowed = canCopy || GetResolveType() != Publish::kResolveType_AcceptTheirsAndCopy;
    GetDialog().SetEnabled(kResolveButton, !items.empty() && isAllowed && !isBusy);
}

void ZOResolveDialog::OnOKButtonChanged() {
    const std::vector<std::string> rows = GetDialog().GetTree(kTree)->GetSelectedIDs();
    if (rows.empty() || mIsResolving || !mSettings.resolve) {
        return;
    }
    mIsResolving = true;
    Refresh();
    const std::size_t count = mSettings.resolve(GetSelectedItems(), GetResolveType());
    mIsResolving = false;
    RemoveItems(rows, count);
}

void ZOResolveDialog::RemoveItems(const std::vector<std::string>& inRows, std::size_t inCount) {
    const std::set<std::string> settled(
        inRows.begin(), inRows.begin() + static_cast<std::ptrdiff_t>(std::min(inCount, inRows.size())));
    // The tree tells of the change of its selection at once.
    GetDialog().GetTree(kTree)->RemoveRows(settled);
    for (const std::string& row : settled) {
        mItems.erase(row);
    }
    if (mItems.empty()) {
        GetDialog().Close(ostui::kResponseOK);
    } else if (!settled.empty()) {
        GetDialog().SetText(kStopButton, UserText(kStopText));
    }
    Refresh();
}

}  // namespace ZOCL
