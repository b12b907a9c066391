// The vocabulary of layouts: the tags, what each may hold, and its parameters. Docs/layouts.md tells what
// they mean; this table decides.
#pragma once

#include <string_view>
#include <vector>

#include "ostcore/Export.h"

namespace ostlyra {

enum class ValueKind {
    /// A quoted text for the user.
    kText,
    /// A word, quoted or not: an identifier, the name of an icon or of a layout.
    kName,
    /// From 0 to kLargestNumber.
    kNumber,
    kFlag,
    kHorizontal,
    kVertical,
    kPlacement
};

constexpr int kLargestNumber = 10000;

struct TagParameter {
    std::string_view name;
    ValueKind kind;
    bool isRequired = false;
};

/// What may stand between the braces of a tag.
enum class TagContent { kNothing, kViews, kTabs, kItems };

/// Where a tag may stand.
enum class TagPlace {
    /// In whatever holds views.
    kAnywhere,
    /// At the top of a layout.
    kTop,
    /// In a tab container, or at the top of a layout that is pulled into one.
    kTabs,
    kPopup,
    /// Somewhere inside a group of radio buttons.
    kRadioGroup
};

struct ZOPLATFORM_EXPORT Tag {
    std::string_view name;
    TagPlace place;
    TagContent content;
    /// A control gets an identifier when the layout gives it none.
    bool isControl;
    std::vector<TagParameter> parameters;

    const TagParameter* FindParameter(std::string_view inName) const noexcept;
};

/// The tag that another layout takes the place of.
constexpr std::string_view kLayoutScriptTag = "ost_layout_script";

/// All tags. Threads: any.
ZOPLATFORM_EXPORT const std::vector<Tag>& GetTags();
/// Null when there is no such tag.
ZOPLATFORM_EXPORT const Tag* FindTag(std::string_view inName);
/// The words that a kind of value is one of; empty for the others.
ZOPLATFORM_EXPORT const std::vector<std::string_view>& GetWords(ValueKind inKind);

}  // namespace ostlyra
