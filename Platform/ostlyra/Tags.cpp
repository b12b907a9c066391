// The table of tags.
#include "ostlyra/Tags.h"

#include <algorithm>

namespace ostlyra {
namespace {

using Parameters = std::vector<TagParameter>;

const Parameters kIdentity{{"identifier", ValueKind::kName}};
/// How a view stands in the one around it.
const Parameters kSize{{"minWidth", ValueKind::kNumber}, {"minHeight", ValueKind::kNumber}};
const Parameters kPosition{{"leftSpace", ValueKind::kNumber},
                           {"topSpace", ValueKind::kNumber},
                           {"horizontal", ValueKind::kHorizontal},
                           {"vertical", ValueKind::kVertical}};
/// How what is in it is arranged.
const Parameters kArrangement{{"placement", ValueKind::kPlacement},
                              {"spacing", ValueKind::kNumber},
                              {"child_horizontal", ValueKind::kHorizontal},
                              {"child_vertical", ValueKind::kVertical}};
const Parameters kLabelled{{"label", ValueKind::kText},
                           {"minLabelHeight", ValueKind::kNumber},
                           {"gap", ValueKind::kNumber},
                           {"setAsFocused", ValueKind::kFlag}};
const Parameters kName{{"name", ValueKind::kText}};
const Parameters kTooltip{{"tooltip", ValueKind::kText}};

Parameters Join(const std::vector<Parameters>& inLists) {
    Parameters all;
    for (const Parameters& list : inLists) {
        all.insert(all.end(), list.begin(), list.end());
    }
    return all;
}

Tag Container(std::string_view inTag, const Parameters& inOwn = {}) {
    return {inTag, TagPlace::kAnywhere, TagContent::kViews, false,
            Join({kIdentity, inOwn, kSize, kPosition, kArrangement})};
}

Tag Leaf(std::string_view inTag, const Parameters& inOwn) {
    return {inTag, TagPlace::kAnywhere, TagContent::kNothing, true,
            Join({kIdentity, inOwn, kTooltip, kSize, kPosition})};
}

std::vector<Tag> MakeTags() {
    const Parameters dialog = Join({kIdentity,
                                    kName,
                                    kSize,
                                    {{"canResize", ValueKind::kFlag}, {"layoutChildren", ValueKind::kFlag}},
                                    kArrangement});
    const Parameters tab = Join({kIdentity, {{"name", ValueKind::kText, true}}, kSize, kArrangement});
    const Parameters radio = {{"identifier", ValueKind::kName, true}, {"name", ValueKind::kText, true}};
    const Parameters group = Join({kIdentity, kSize, kPosition, kArrangement});
    const Parameters cancelRow{{"cancelText", ValueKind::kText}, {"cancelIdentifier", ValueKind::kName}};
    const Parameters okRow{{"okText", ValueKind::kText}, {"okIdentifier", ValueKind::kName}};
    return {
        {"ost_dialog", TagPlace::kTop, TagContent::kViews, false, dialog},
        Container("column"),
        Container("row"),
        Container("ost_subview"),
        Container("ost_arrangement"),
        Container("ost_groupbox", kName),
        {"ost_tab_container", TagPlace::kAnywhere, TagContent::kTabs, true,
         Join({kIdentity, kSize, kPosition})},
        {"ost_tab_view", TagPlace::kTabs, TagContent::kViews, true, tab},
        Leaf("ost_static_text",
             Join({kName, {{"multiLine", ValueKind::kFlag}, {"fontSize", ValueKind::kNumber}}})),
        Leaf("ost_static_image", {{"image", ValueKind::kName, true}}),
        Leaf("ost_text_edit",
             Join({kName, kLabelled, {{"password", ValueKind::kFlag}, {"multiLine", ValueKind::kFlag}}})),
        Leaf("ost_search_box", kLabelled),
        {"ost_popup", TagPlace::kAnywhere, TagContent::kItems, true,
         Join({kIdentity, kLabelled, kTooltip, kSize, kPosition})},
        {"ost_popup_item", TagPlace::kPopup, TagContent::kNothing, false, Join({kIdentity, kName})},
        Leaf("ost_checkbox", Join({kName, {{"setAsFocused", ValueKind::kFlag}}})),
        {"ost_radio_button_group", TagPlace::kAnywhere, TagContent::kViews, true, group},
        {"ost_radio_button", TagPlace::kRadioGroup, TagContent::kNothing, false,
         Join({radio, kTooltip, kSize, kPosition})},
        Leaf("ost_multi_column_tree", {{"label", ValueKind::kText}, {"setAsFocused", ValueKind::kFlag}}),
        Leaf("ost_progress_bar",
             {{"key_start_value", ValueKind::kNumber}, {"key_total_value", ValueKind::kNumber}}),
        Leaf("ost_button", kName),
        Leaf("ost_picture_button",
             Join({{{"image", ValueKind::kName, true}, {"showBorder", ValueKind::kFlag}}, kName})),
        {"ost_ok_cancel_row", TagPlace::kAnywhere, TagContent::kNothing, false,
         Join({kIdentity, okRow, cancelRow, kPosition})},
        {"ost_cancel_row", TagPlace::kAnywhere, TagContent::kNothing, false,
         Join({kIdentity, cancelRow, kPosition})},
        {kLayoutScriptTag,
         TagPlace::kAnywhere,
         TagContent::kNothing,
         false,
         {{"identifier", ValueKind::kName, true}}},
    };
}

}  // namespace

const TagParameter* Tag::FindParameter(std::string_view inName) const noexcept {
    const auto found = std::find_if(parameters.begin(), parameters.end(),
                                    [&](const TagParameter& inOne) { return inOne.name == inName; });
    return found == parameters.end() ? nullptr : &*found;
}

const std::vector<Tag>& GetTags() {
    static const std::vector<Tag>* const tags = new std::vector<Tag>(MakeTags());
    return *tags;
}

const Tag* FindTag(std::string_view inName) {
    const std::vector<Tag>& tags = GetTags();
    const auto found =
        std::find_if(tags.begin(), tags.end(), [&](const Tag& inTag) { return inTag.name == inName; });
    return found == tags.end() ? nullptr : &*found;
}

const std::vector<std::string_view>& GetWords(ValueKind inKind) {
    static const std::vector<std::string_view> kNone;
    static const std::vector<std::string_view> kFlagWords{"true", "false"};
    static const std::vector<std::string_view> kHorizontalWords{"fill", "left", "center", "right"};
    static const std::vector<std::string_view> kVerticalWords{"fill", "top", "center", "bottom"};
    static const std::vector<std::string_view> kPlacementWords{"column", "row", "overlay"};
    switch (inKind) {
        case ValueKind::kFlag:
            return kFlagWords;
        case ValueKind::kHorizontal:
            return kHorizontalWords;
        case ValueKind::kVertical:
            return kVerticalWords;
        case ValueKind::kPlacement:
            return kPlacementWords;
        default:
            return kNone;
    }
}

}  // namespace ostlyra
