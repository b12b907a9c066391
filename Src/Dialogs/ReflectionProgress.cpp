// A list that an operation fills, and the window that shows it.
#include <algorithm>

#include "Dialogs/ZOMultiColumnTree.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;
using ostcore::utility::ToUTF8;

namespace {

constexpr const char* kTree = "progressView";
constexpr const char* kCancelButton = "cancelButton";
const char kColumnName[] = "$$$/ZOCL/ZOReflectionProgressDialog/Col_Name=Name";
const char kColumnState[] = "$$$/ZOCL/ZOReflectionProgressDialog/Col_State=State";

}  // namespace

struct ReflectionProgressList::State {
    mutable Mutex mutex;
    std::vector<Item> items ZO_GUARDED_BY(mutex);
    function<void()> onChanged ZO_GUARDED_BY(mutex);
    bool isTelling ZO_GUARDED_BY(mutex) = false;

    std::vector<Item>::iterator Find(const std::string& inID) ZO_REQUIRES(mutex) {
        return std::find_if(items.begin(), items.end(),
                            [&](const Item& inItem) { return inItem.id == inID; });
    }

    /// Calls the function soon, unless that is under way.
    static void Tell(const shared_ptr<State>& inState) {
        {
            MutexLock lock(inState->mutex);
            if (inState->isTelling || !inState->onChanged) {
                return;
            }
            inState->isTelling = true;
        }
        ostcore::threads::AsyncCallFromMainThread([inState] {
            function<void()> tell;
            {
                MutexLock lock(inState->mutex);
                inState->isTelling = false;
                tell = inState->onChanged;
            }
            if (tell) {
                tell();
            }
        });
    }
};

ReflectionProgressList::ReflectionProgressList() : mState(boost::make_shared<State>()) {}
ReflectionProgressList::~ReflectionProgressList() = default;

void ReflectionProgressList::Set(const Item& inItem) {
    {
        MutexLock lock(mState->mutex);
        const auto found = mState->Find(inItem.id);
        if (found == mState->items.end()) {
            mState->items.push_back(inItem);
        } else {
            *found = inItem;
        }
    }
    State::Tell(mState);
}

void ReflectionProgressList::Remove(const std::string& inID) {
    {
        MutexLock lock(mState->mutex);
        const auto found = mState->Find(inID);
        if (found == mState->items.end()) {
            return;
        }
        mState->items.erase(found);
    }
    State::Tell(mState);
}

std::vector<ReflectionProgressList::Item> ReflectionProgressList::GetItems() const {
    MutexLock lock(mState->mutex);
    return mState->items;
}

void ReflectionProgressList::SetOnChanged(function<void()> inFunction) {
    MutexLock lock(mState->mutex);
    mState->onChanged.swap(inFunction);
}

ReflectionProgressDialog::ReflectionProgressDialog(const shared_ptr<ReflectionProgressList>& inItems)
    : ZODialogBaseImpl(u"ZOReflectionProgressDialog"), mItems(inItems) {}

ReflectionProgressDialog::~ReflectionProgressDialog() = default;

bool ReflectionProgressDialog::Initialize() {
    return ZODialogBaseImpl::Initialize();
}

void ReflectionProgressDialog::LookUpControls() {
    mTree = GetDialog().GetTree(kTree);
    mTree->SetSelectionMode(ostui::Tree::SelectionMode::kNone);
    ZOMultiColumnTree(mTree).SetColumns({kColumnName, kColumnState});
    // In the order in which they came, until the user wants another.
    mTree->SetSort({}, true);
    GetDialog().SetClosesByItself();
    GetDialog().SetHandler(kCancelButton, [this] { OnCancelButtonChanged(); });
}

int ReflectionProgressDialog::RunModal() {
    if (!HasDialog()) {
        return ostui::kResponseNone;
    }
    if (mItems) {
        ShowItems();
        mItems->SetOnChanged([this] { ShowItems(); });
    }
    const int response = ZODialogBaseImpl::RunModal();
    if (mItems) {
        mItems->SetOnChanged({});
    }
    return response;
}

void ReflectionProgressDialog::PostClose() {
    if (HasDialog()) {
        GetDialog().Close(ostui::kResponseOK);
    }
}

void ReflectionProgressDialog::OnCancelButtonChanged() {
    GetDialog().Close(ostui::kResponseCancel);
}

void ReflectionProgressDialog::ShowItems() {
    std::vector<ostui::TreeRow> rows;
    for (const ReflectionProgressList::Item& item : mItems->GetItems()) {
        ostui::TreeRow row;
        row.id = item.id;
        row.cells = {ToUTF8(item.name), ToUTF8(item.state)};
        rows.push_back(std::move(row));
    }
    mTree->SetRows(std::move(rows));
}

}  // namespace ZOCL
