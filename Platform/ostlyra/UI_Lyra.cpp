// From a layout's text to a dialog.
#include "ostlyra/UI_Lyra.h"

#include <stdexcept>

#include "ostcore/debug/Trace.h"

namespace ostlyra {

namespace {

const char kChannel[] = "ostlyra";
const char kLayoutType[] = "LYRA";

}  // namespace

UI_Lyra::UI_Lyra(std::string inLayoutName, const BinaryModule& inModule)
    : mName(std::move(inLayoutName)), mModule(inModule) {}

UI_Lyra::~UI_Lyra() = default;

bool UI_Lyra::Initialize() {
    const auto read = [this](const std::string& inName) {
        const BinaryResource stream = GetLayoutStream(inName);
        return stream ? optional<std::string>(std::string(stream.View())) : optional<std::string>();
    };
    mDialog.reset();
    mError = {mName, 1, 1, "there is no such layout"};
    if (const optional<std::string> text = read(mName)) {
        if (optional<Layout> layout = ParseLayout(*text, mError, read)) {
            if (layout->name == mName && layout->view.tag == "ost_dialog") {
                mDialog = ostcore::make_shared<ostui::Dialog>(mName, std::move(layout->view));
                mError = {};
                return true;
            }
            mError = {mName, layout->view.line, layout->view.column,
                      "expected 'ost_dialog' in '" + mName + "', found '" + layout->view.tag + "' in '" +
                          layout->name + "'"};
        }
    }
    ostcore::debug::Trace(kChannel, ostcore::debug::kTraceLevel_Error, mError.AsText());
    return false;
}

BinaryResource UI_Lyra::GetLayoutStream(const std::string& inName) const {
    return ostcore::utility::GetBinaryFromModule(mModule, kLayoutType, inName);
}

int UI_Lyra::RunModal() {
    mResponse = mDialog ? mDialog->RunModal() : ostui::kResponseNone;
    return mResponse;
}

int UI_Lyra::GetResponse() const {
    return mResponse;
}

void UI_Lyra::DoCancel() {
    if (mDialog) {
        mDialog->Dismiss();
    }
}

ostui::Dialog& UI_Lyra::GetDialog() const {
    if (!mDialog) {
        throw std::logic_error("the window " + mName + " has no dialog");
    }
    return *mDialog;
}

}  // namespace ostlyra
