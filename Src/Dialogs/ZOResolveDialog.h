// The window in which a user settles conflicts, one selection after the other.
#pragma once

#include <map>

#include "Collaboration/ZOPrepareResolveOperation.h"
#include "Dialogs/OperationWatch.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

/// Main thread. Closes by itself with kResponseOK when no conflict is left.
class ZOResolveDialog final : public ZODialogBaseImpl {
public:
    static constexpr const char* kID = "ZOResolveDialog";
    static constexpr const char* kResolveButton = "okButton";
    static constexpr const char* kStopButton = "cancelButton";
    static constexpr const char* kTree = "conflictTreeSubView";
    static constexpr const char* kResolveTypes = "resolveTypeRadioGroup";
    static constexpr const char* kAcceptTheirs = "acceptTheirsRadioButton";
    static constexpr const char* kAcceptTheirsAndCopy = "acceptTheirsAndCopyRadioButton";
    static constexpr const char* kAcceptYours = "acceptYoursRadioButton";

    struct Settings {
        UString productionName;
        ImmutableString sessionURL;
        std::set<ImmutableString> copyableTypes;
        /// Told once, when the conflicts are known: the session's commit that they were read at.
        function<void(const ImmutableString& inCommitId)> onConflictsKnown;
        /// Called when Resolve is pressed, never with an empty list; blocks. How many of the items, from the
        /// first on, were settled.
        function<std::size_t(const std::vector<ConflictItemData>& inItems, Publish::ResolveType inType)>
            resolve;
        /// Whether a further resolve must wait, for the host; ask again after Refresh.
        function<bool()> mustWait;
    };

    /// Initializes itself.
    explicit ZOResolveDialog(const Settings& inSettings);

    /// Looks anew what can be pressed.
    void Refresh();

private:
    void LookUpControls() override;
    void OnOpened();
    void OnPrepareFinished();
    void OnOKButtonChanged();
    void ShowConflicts(const std::vector<ConflictItemData>& inConflicts);
    std::vector<ConflictItemData> GetSelectedItems() const;
    Publish::ResolveType GetResolveType() const;
    void RemoveItems(const std::vector<std::string>& inRows, std::size_t inCount);

    const Settings mSettings;
    /// What is left, by row.
    std::map<std::string, ConflictItemData> mItems;
    bool mIsResolving = false;
    InterfaceRef<ZOPrepareResolveOperation> mPrepare;
    shared_ptr<OperationWatch> mWatch;
};

}  // namespace ZOCL
