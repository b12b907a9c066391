// The Share window: lists what will be shared, takes a comment, shares.
#pragma once

#include "Collaboration/ZOPreparePublishOperation.h"
#include "Dialogs/OperationWatch.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

/// Main thread. The window stays open after an attempt that failed, so that its comment is not lost.
class ZOPublishDialog final : public ZODialogBaseImpl {
public:
    static constexpr const char* kID = "ZOPublishDialog";
    static constexpr const char* kShareButton = "okButton";
    static constexpr const char* kComment = "commitMessageTextEdit";
    static constexpr const char* kAssetTree = "assetTree";
    static constexpr const char* kPublishView = "ZOPublishView";
    static constexpr const char* kProgressView = "ProgressView";

    struct Settings {
        UString productionName;
        /// Of the session.
        ImmutableString sessionURL;
        InterfaceRef<IZOCEditingSession> session;
        /// Called when Share is pressed, after the host was told (ZOCommittedToPublishMessage); blocks. True:
        /// the session was shared. inMovedTo is the commit to which the host's writes have moved the session,
        /// null when they have not.
        function<bool(const UString& inComment, const ImmutableString& inMovedTo)> share;
        /// False: an attempt that failed closes the window, too.
        bool staysOpenOnFailure = true;
    };

    /// Initializes itself.
    explicit ZOPublishDialog(const Settings& inSettings);

    /// Whether Share was pressed, with whatever outcome.
    bool HasCommitted() const noexcept { return mHasCommitted; }

private:
    void LookUpControls() override;
    void OnOpened();
    void OnPrepareFinished();
    void OnShare();
    ImmutableString GetLoadedCommit() const;

    const Settings mSettings;
    bool mHasCommitted = false;
    bool mIsSharing = false;
    InterfaceRef<ZOPreparePublishOperation> mPrepare;
    shared_ptr<OperationWatch> mWatch;
};

}  // namespace ZOCL
