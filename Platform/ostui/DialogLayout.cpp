// Makes the controls of a dialog from the views of its layout.
#include <algorithm>

#include "ostcore/config/ZString.h"
#include "ostui/Dialog.h"

namespace ostui {
namespace {

constexpr const char* kOKButton = "okButton";
constexpr const char* kCancelButton = "cancelButton";
constexpr const char* kOKText = "$$$/ostui/MessageBox/OK=OK";
constexpr const char* kCancelText = "$$$/ostui/MessageBox/Cancel=Cancel";
constexpr std::string_view kRadioButtonTag = "ost_radio_button";

void SetIdentifier(View& ioView, const std::string& inID) {
    for (ViewParameter& parameter : ioView.parameters) {
        if (parameter.name == "identifier") {
            parameter.value = inID;
            return;
        }
    }
    ioView.parameters.push_back({"identifier", inID});
}

std::string IdentifierOr(const View& inView, std::string_view inParameter, const char* inStandard) {
    const std::string* const own = inView.Find(inParameter);
    return own && !own->empty() ? *own : inStandard;
}

U8String TextOr(const View& inView, std::string_view inParameter, const char* inStandard) {
    return inView.Find(inParameter) ? inView.GetText(inParameter) : ostcore::ZString(inStandard).AsUTF8();
}

std::uint32_t CountOf(const View& inView, std::string_view inParameter) {
    return static_cast<std::uint32_t>(std::max(0, inView.GetNumber(inParameter, 0)));
}

}  // namespace

/// Walks the views; what makes no control of its own passes its group on to what is in it.
class Dialog::LayoutReader {
public:
    explicit LayoutReader(Dialog& ioDialog) : mDialog(ioDialog) {}

    void ReadChildren(View& ioView, const std::string& inGroup) {
        for (View& child : ioView.children) {
            Read(child, inGroup);
        }
    }

private:
    using Reader = void (LayoutReader::*)(View&, const std::string&);

    void Read(View& ioView, const std::string& inGroup) {
        static constexpr std::pair<std::string_view, Reader> kReaders[] = {
            {"ost_static_text", &LayoutReader::ReadStaticText},
            {"ost_static_image", &LayoutReader::ReadImage},
            {"ost_text_edit", &LayoutReader::ReadTextEdit},
            {"ost_search_box", &LayoutReader::ReadSearchBox},
            {"ost_popup", &LayoutReader::ReadPopup},
            {"ost_radio_button_group", &LayoutReader::ReadRadioGroup},
            {kRadioButtonTag, &LayoutReader::ReadNothing},
            {"ost_checkbox", &LayoutReader::ReadCheckBox},
            {"ost_multi_column_tree", &LayoutReader::ReadTree},
            {"ost_progress_bar", &LayoutReader::ReadProgressBar},
            {"ost_button", &LayoutReader::ReadButton},
            {"ost_picture_button", &LayoutReader::ReadButton},
            {"ost_ok_cancel_row", &LayoutReader::ReadOKCancelRow},
            {"ost_cancel_row", &LayoutReader::ReadCancelRow},
            {"ost_tab_container", &LayoutReader::ReadTabs},
            {"ost_groupbox", &LayoutReader::ReadGroup},
        };
        const auto* const found =
            std::find_if(std::begin(kReaders), std::end(kReaders),
                         [&](const auto& inEntry) { return inEntry.first == ioView.tag; });
        const Reader other =
            ioView.GetIdentifier().empty() ? &LayoutReader::ReadChildren : &LayoutReader::ReadGroup;
        (this->*(found == std::end(kReaders) ? other : found->second))(ioView, inGroup);
    }

    /// The view gets the identifier of its control, where it has none or one that is taken. Valid until the
    /// next one is added.
    Control& Add(ControlType inType, View& ioView, const std::string& inGroup) {
        Control& control = mDialog.Add(inType, ioView.GetIdentifier());
        SetIdentifier(ioView, control.id);
        control.group = inGroup;
        control.label = ioView.GetText("label");
        control.text = ioView.GetText("name");
        control.tooltip = ioView.GetText("tooltip");
        const std::string* const image = ioView.Find("image");
        control.image = image ? *image : std::string();
        control.isMultiLine = ioView.GetFlag("multiLine", false);
        if (ioView.GetFlag("setAsFocused", false)) {
            mDialog.SetFocus(control.id);
        }
        return control;
    }

    void ReadNothing(View&, const std::string&) {}

    void ReadStaticText(View& ioView, const std::string& inGroup) {
        Add(ControlType::kStaticText, ioView, inGroup);
    }
    void ReadImage(View& ioView, const std::string& inGroup) { Add(ControlType::kImage, ioView, inGroup); }
    void ReadTextEdit(View& ioView, const std::string& inGroup) {
        const bool isPassword = ioView.GetFlag("password", false);
        Add(isPassword ? ControlType::kPasswordEdit : ControlType::kTextEdit, ioView, inGroup);
    }
    void ReadSearchBox(View& ioView, const std::string& inGroup) {
        Add(ControlType::kSearchEdit, ioView, inGroup);
    }
    void ReadCheckBox(View& ioView, const std::string& inGroup) {
        Add(ControlType::kCheckBox, ioView, inGroup);
    }
    void ReadTree(View& ioView, const std::string& inGroup) { Add(ControlType::kTree, ioView, inGroup); }
    void ReadButton(View& ioView, const std::string& inGroup) { Add(ControlType::kButton, ioView, inGroup); }

    void ReadProgressBar(View& ioView, const std::string& inGroup) {
        Control& bar = Add(ControlType::kProgressBar, ioView, inGroup);
        bar.total = CountOf(ioView, "key_total_value");
        bar.value = std::min(CountOf(ioView, "key_start_value"), bar.total);
    }

    void ReadPopup(View& ioView, const std::string& inGroup) {
        Control& popup = Add(ControlType::kPopup, ioView, inGroup);
        for (const View& item : ioView.children) {
            popup.items.push_back(item.GetText("name"));
            popup.itemIDs.push_back(item.GetIdentifier());
        }
        popup.selection = popup.items.empty() ? -1 : 0;
    }

    void ReadRadioGroup(View& ioView, const std::string& inGroup) {
        Control& group = Add(ControlType::kRadioGroup, ioView, inGroup);
        CollectRadioButtons(ioView, group);
        const std::string id = group.id;
        ReadChildren(ioView, id);
    }

    static void CollectRadioButtons(const View& inView, Control& ioGroup) {
        for (const View& child : inView.children) {
            if (child.tag == kRadioButtonTag) {
                ioGroup.items.push_back(child.GetText("name"));
                ioGroup.itemIDs.push_back(child.GetIdentifier());
            } else {
                CollectRadioButtons(child, ioGroup);
            }
        }
    }

    void ReadGroup(View& ioView, const std::string& inGroup) {
        const std::string id = Add(ControlType::kGroup, ioView, inGroup).id;
        ReadChildren(ioView, id);
    }

    void ReadTabs(View& ioView, const std::string& inGroup) {
        const std::string id = Add(ControlType::kTabs, ioView, inGroup).id;
        const std::size_t index = mDialog.mControls.size() - 1;
        for (View& page : ioView.children) {
            ReadGroup(page, id);
            Control& tabs = mDialog.mControls[index];
            tabs.items.push_back(page.GetText("name"));
            tabs.itemIDs.push_back(page.GetIdentifier());
            tabs.selection = 0;
        }
    }

    void ReadCancelRow(View& ioView, const std::string& inGroup) {
        const std::string row = Add(ControlType::kGroup, ioView, inGroup).id;
        mDialog.SetCancelButton(AddCloser(ioView, row, kCancel));
    }

    void ReadOKCancelRow(View& ioView, const std::string& inGroup) {
        const std::string row = Add(ControlType::kGroup, ioView, inGroup).id;
        mDialog.SetDefaultButton(AddCloser(ioView, row, kOK));
        mDialog.SetCancelButton(AddCloser(ioView, row, kCancel));
    }

    /// A button of a row that closes the dialog.
    struct Closer {
        std::string_view identifierParameter;
        const char* identifier;
        std::string_view textParameter;
        const char* text;
        int response;
    };
    static constexpr Closer kOK{"okIdentifier", kOKButton, "okText", kOKText, kResponseOK};
    static constexpr Closer kCancel{"cancelIdentifier", kCancelButton, "cancelText", kCancelText,
                                    kResponseCancel};

    std::string AddCloser(const View& inRow, const std::string& inGroup, const Closer& inCloser) {
        const std::string id = IdentifierOr(inRow, inCloser.identifierParameter, inCloser.identifier);
        mDialog.AddButton(id, TextOr(inRow, inCloser.textParameter, inCloser.text), inCloser.response);
        mDialog.mControls.back().group = inGroup;
        return mDialog.mControls.back().id;
    }

    Dialog& mDialog;
};

Dialog::Dialog(std::string inID, View inLayout)
    : mID(std::move(inID)), mTitle(inLayout.GetText("name")), mLayout(std::move(inLayout)) {
    LayoutReader(*this).ReadChildren(*mLayout, {});
}

}  // namespace ostui
