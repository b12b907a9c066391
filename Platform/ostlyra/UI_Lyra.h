// The base of a window whose controls are told by a layout.
#pragma once

#include <string>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/BinaryResource.h"
#include "ostlyra/Layout.h"
#include "ostui/Dialog.h"

namespace ostlyra {

using ostcore::utility::BinaryModule;
using ostcore::utility::BinaryResource;

/// Make it, Initialize it, give its dialog the handlers, run it; it may run again. Main thread only.
class ZOPLATFORM_EXPORT UI_Lyra {
public:
    /// The module holds the layout, as a "LYRA" resource of that name, and must outlive this object.
    UI_Lyra(std::string inLayoutName, const BinaryModule& inModule);
    virtual ~UI_Lyra();
    UI_Lyra(const UI_Lyra&) = delete;
    UI_Lyra& operator=(const UI_Lyra&) = delete;

    /// Reads the layout and makes the dialog, whose identifier is the layout's name. False: there is no such
    /// layout, or it is none, which is traced (channel "ostlyra", level 5); there is no dialog then.
    /// A derived class calls this first, and then looks up its controls.
    virtual bool Initialize();
    /// The text of a layout, this one's or one that it pulls in; null when there is none. A derived class may
    /// change the text of the module's.
    virtual BinaryResource GetLayoutStream(const std::string& inName) const;
    /// Shows the dialog until it is closed, and gives its response; kResponseNone without a dialog.
    virtual int RunModal();
    /// The response of the last run; kResponseNone before there was one.
    virtual int GetResponse() const;
    /// What the user does who does not answer: presses the cancel button, or closes the window. Nothing
    /// without a dialog.
    virtual void DoCancel();

    const std::string& GetLayoutName() const noexcept { return mName; }
    bool HasDialog() const noexcept { return mDialog != nullptr; }
    /// Throws std::logic_error when Initialize has not been called, or has failed.
    ostui::Dialog& GetDialog() const;
    /// Why Initialize has failed.
    const LayoutError& GetLayoutError() const noexcept { return mError; }

private:
    const std::string mName;
    const BinaryModule& mModule;
    ostcore::shared_ptr<ostui::Dialog> mDialog;
    LayoutError mError;
    int mResponse = ostui::kResponseNone;
};

}  // namespace ostlyra
