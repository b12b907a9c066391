// What all windows from layouts share: the end of the session, and geometry that outlives them.
#include "Dialogs/UIProperties.h"
#include "Dialogs/ZOMultiColumnTree.h"
#include "Frame/LibraryModule.h"
#include "Frame/Station.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

struct ZODialogBaseImpl::State {
    shared_ptr<RFL::Listener> listener;
    /// How the trees stood when the window opened.
    std::map<std::string, TreeProperties> trees;
};

namespace {

template <class F>
void ForEachTree(const ostui::Dialog& inDialog, const F& inFunction) {
    for (const ostui::Control& control : inDialog.GetControls()) {
        if (control.tree) {
            inFunction(control.id, ZOMultiColumnTree(control.tree));
        }
    }
}

}  // namespace

ZODialogBaseImpl::ZODialogBaseImpl(const UString& inLayoutName)
    : ZODialogBaseImpl(inLayoutName, GetLibraryModule()) {}

ZODialogBaseImpl::ZODialogBaseImpl(const UString& inLayoutName, const ostlyra::BinaryModule& inModule)
    : UI_Lyra(ostcore::utility::ToUTF8(inLayoutName), inModule), mState(boost::make_shared<State>()) {}

ZODialogBaseImpl::~ZODialogBaseImpl() = default;

bool ZODialogBaseImpl::Initialize() {
    if (!UI_Lyra::Initialize()) {
        return false;
    }
    mState->listener = boost::make_shared<RFL::Listener>(CurrentStation());
    mState->listener->AddHandler<ZOTerminateConnectionMessage>(
        [this](const ZOTerminateConnectionMessage& inMessage) {
            if (inMessage.forced) {
                OnZOTerminateConnection();
            }
        });
    LookUpControls();
    return true;
}

void ZODialogBaseImpl::LookUpControls() {}

int ZODialogBaseImpl::RunModal() {
    if (!HasDialog()) {
        return UI_Lyra::RunModal();
    }
    ApplyDialogProperties();
    const int response = UI_Lyra::RunModal();
    if (response != ostui::kResponseNone) {
        StoreDialogProperties();
    }
    return response;
}

bool ZODialogBaseImpl::OnZOTerminateConnection() {
    DoCancel();
    return HasDialog();
}

void ZODialogBaseImpl::ApplyDialogProperties() {
    const DialogProperties properties = GetDialogProperties(GetLayoutName());
    if (properties.geometry) {
        GetDialog().SetGeometry(*properties.geometry);
    }
    ForEachTree(GetDialog(), [&](const std::string& inID, ZOMultiColumnTree inTree) {
        const auto known = properties.trees.find(inID);
        if (known != properties.trees.end()) {
            inTree.ApplyAllColumnProperties(known->second);
        }
        mState->trees[inID] = inTree.StoreAllColumnProperties();
    });
}

void ZODialogBaseImpl::StoreDialogProperties() {
    DialogProperties properties;
    properties.geometry = GetDialog().GetGeometry();
    ForEachTree(GetDialog(), [&](const std::string& inID, const ZOMultiColumnTree& inTree) {
        TreeProperties tree = inTree.StoreAllColumnProperties();
        if (!(tree == mState->trees[inID])) {
            properties.trees[inID] = std::move(tree);
        }
    });
    SetDialogProperties(GetLayoutName(), properties);
}

}  // namespace ZOCL
