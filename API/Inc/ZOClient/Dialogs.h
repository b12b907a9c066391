// Windows for hosts: message boxes, progress windows around operations, and the base of windows that are told
// by a layout.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "ostlyra/UI_Lyra.h"
#include "ostui/MessageBox.h"
#include "RFL/BatchOperation.h"
#include "RFL/Messaging.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

// All windows belong to the main thread. Without a back end (ostui/BackEnd.h) none is shown: a question gets
// the answer that changes least, and an operation runs all the same. While a window is open, the main
// thread's queue is pumped; hold no lock.

// --- Message boxes.

/// Shows a text with standard buttons (ostui::MessageBoxButton, to be combined) and returns the one that was
/// pressed; see ostui::RunMessageBox. Off the main thread nothing is shown and ostui::kMessageBoxNoAnswer is
/// returned.
ZOCL_EXPORT int SimpleMessageBox(const UString& inTitle, const UString& inMessage,
                                 int inButtons = ostui::kMessageBoxOK,
                                 int inDefaultButton = ostui::kMessageBoxOK,
                                 ostui::MessageBoxIcon inIcon = ostui::MessageBoxIcon::kNone);
/// The same with OK and Cancel, each with a text of the caller's. Empty texts: "OK" and "Cancel".
ZOCL_EXPORT int SimpleMessageBoxWithCancel(const UString& inTitle, const UString& inMessage,
                                           const UString& inOKText = UString(),
                                           const UString& inCancelText = UString());

// --- Progress windows.

/// What an operation can answer that has something to tell at its end.
class ZOCL_EXPORT IZOCOperationFinalText : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f63466e616c54ull, 0x6578740000000001ull};

    /// Asked once, on the main thread, when the operation has ended. Empty: nothing to tell.
    virtual UString GetFinalText() = 0;
};

/// Runs an operation under a modal window with a bar that goes from nothing to all, and returns when it has
/// ended. True: it has ended with success, as far as it tells (ZOOperationBase::GetResult), and nobody
/// stopped it.
///
/// The caption stands there until the operation says something else. The cancel button, whose text may be
/// empty for "Cancel", asks the operation to stop and is disabled until it has. With inWaitForConfirm, what
/// the operation tells at its end (IZOCOperationFinalText) stays until the user confirms it. While the
/// network is down the window says so and offers to sign out. A forced end of the session stops the operation
/// and closes the window.
///
/// A null operation, and a call off the main thread: false, and nothing is done.
ZOCL_EXPORT bool DoProgressDialog(const UString& inTitle, const UString& inCaption,
                                  const InterfaceRef<RFL::IBatchOperation>& inOperation, bool inCanCancel,
                                  bool inWaitForConfirm, const UString& inCancelText = UString());
/// The same with a bar that only shows that something runs.
ZOCL_EXPORT bool DoIndeterminateProgressDialog(const UString& inTitle, const UString& inCaption,
                                               const InterfaceRef<RFL::IBatchOperation>& inOperation,
                                               bool inCanCancel, bool inWaitForConfirm,
                                               const UString& inCancelText = UString());

// --- Windows from layouts.

/// The base of all windows of the library, and of a host's that are told by a layout (Docs/layouts.md).
///
/// Place and size of the window, and width, order and sort of the columns of its trees are kept between runs,
/// by the name of the layout. A forced end of the session (ZOTerminateConnectionMessage) cancels the window.
/// Make it, Initialize it, run it. Main thread only.
class ZOCL_EXPORT ZODialogBaseImpl : public ostlyra::UI_Lyra {
public:
    /// A layout of the library.
    explicit ZODialogBaseImpl(const UString& inLayoutName);
    /// A layout of the host; the module must outlive this object.
    ZODialogBaseImpl(const UString& inLayoutName, const ostlyra::BinaryModule& inModule);
    ~ZODialogBaseImpl() override;

    /// Makes the dialog, listens for the end of the session, and calls LookUpControls.
    bool Initialize() override;
    /// Shows the window until it is closed. 0 without a dialog and off the main thread.
    int RunModal() override;
    /// The session was ended from elsewhere: cancels the window. True when there was one.
    virtual bool OnZOTerminateConnection();

protected:
    /// Where a derived class gives controls their content and their handlers, and trees their columns.
    virtual void LookUpControls();

private:
    void ApplyDialogProperties();
    void StoreDialogProperties();

    struct State;
    shared_ptr<State> mState;
};

/// A list of things that a server is busy with, filled by an operation and shown by a window. Threads: any.
class ZOCL_EXPORT ReflectionProgressList {
public:
    struct Item {
        /// Names it in the list.
        std::string id;
        UString name;
        /// What has become of it so far.
        UString state;
    };

    ReflectionProgressList();
    ~ReflectionProgressList();
    ReflectionProgressList(const ReflectionProgressList&) = delete;
    ReflectionProgressList& operator=(const ReflectionProgressList&) = delete;

    /// Adds an item at the end, or changes the one of that identifier.
    void Set(const Item& inItem);
    void Remove(const std::string& inID);
    std::vector<Item> GetItems() const;
    /// Called on the main thread after changes; changes that follow each other closely are told once. An
    /// empty function ends it; on the main thread there is no call after that.
    void SetOnChanged(function<void()> inFunction);

private:
    struct State;
    shared_ptr<State> mState;
};

/// Shows a list as it changes, until it is closed by PostClose or cancelled by its user.
class ZOCL_EXPORT ReflectionProgressDialog : public ZODialogBaseImpl {
public:
    explicit ReflectionProgressDialog(const shared_ptr<ReflectionProgressList>& inItems);
    ~ReflectionProgressDialog() override;

    bool Initialize() override;
    /// ostui::kResponseOK after PostClose, ostui::kResponseCancel after a cancel.
    int RunModal() override;
    /// Closes the window, also before it is open; threads: any.
    void PostClose();

protected:
    void LookUpControls() override;
    /// The user has pressed Cancel: closes the window.
    virtual void OnCancelButtonChanged();

private:
    void ShowItems();

    const shared_ptr<ReflectionProgressList> mItems;
    shared_ptr<ostui::Tree> mTree;
};

// --- The end of a session.

struct CloseModalDialogsSettings {
    /// The identifier of the caller's own window, which stays; empty when it has none.
    std::string ownDialog;
    /// That of the host's welcome window, which stays as well: with it in front all is well.
    std::string welcomeDialog;
};

/// Cancels the modal windows that are open, one after the other from the innermost, and then calls the
/// function, once and on the main thread: at once when there is none. A window that does not go is asked
/// again every 100 milliseconds; after ten seconds the user is told, and then it goes on. Shutdown ends it,
/// and the function is not called then. False, and nothing is done, off the main thread.
ZOCL_EXPORT bool CloseModalDialogs(const function<void()>& inCompletion,
                                   const CloseModalDialogsSettings& inSettings = {});

}  // namespace ZOCL
