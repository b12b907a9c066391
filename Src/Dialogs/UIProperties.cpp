// The properties as JSON, and their way to and from the registry.
#include "Dialogs/UIProperties.h"

#include "ostcore/debug/Trace.h"
#include "ostcore/serialization/JSON.h"
#include "ostcore/threads/RecursiveMutex.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

using ostcore::serialization::AddToObject;
using ostcore::serialization::GetVariantInObject;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;
using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;
using RFL::RegistryChange;
using RFL::RegistryKey;

namespace {

const UString kValueName = u"UIProperties";
constexpr const char* kDialog = "dialogProperties";
constexpr const char* kLeft = "left";
constexpr const char* kTop = "top";
constexpr const char* kWidth = "width";
constexpr const char* kHeight = "height";
constexpr const char* kTrees = "treeProperties";
constexpr const char* kColumns = "columnProperties";
constexpr const char* kSortColumn = "sortColumnID";
constexpr const char* kSortAscending = "isSortDirectionAscending";
constexpr const char* kIndex = "index";

/// What no window of ours comes near to.
constexpr std::size_t kLargestText = 1 << 20;
constexpr std::int64_t kFarthest = 100000;
constexpr int kAttempts = 5;

// --- Reading. No value of the text is trusted to be of any type.

optional<int> ReadNumber(JSONView inObject, const char* inKey, std::int64_t inLowest) {
    const JSONView value = inObject.IsObject() ? inObject.Find(inKey) : JSONView();
    if (value.Type() != ostcore::serialization::JSONType::Integer) {
        return boost::none;
    }
    const std::int64_t number = value.AsInt64();
    return number >= inLowest && number <= kFarthest ? optional<int>(static_cast<int>(number)) : boost::none;
}

JSONView ReadMember(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.IsObject() ? inObject.Find(inKey) : JSONView();
    return value.IsObject() ? value : JSONView();
}

optional<ostui::Geometry> ReadGeometry(JSONView inDialog) {
    const JSONView object = ReadMember(inDialog, kDialog);
    const optional<int> left = ReadNumber(object, kLeft, -kFarthest);
    const optional<int> top = ReadNumber(object, kTop, -kFarthest);
    const optional<int> width = ReadNumber(object, kWidth, 1);
    const optional<int> height = ReadNumber(object, kHeight, 1);
    if (!left || !top || !width || !height) {
        return boost::none;
    }
    return ostui::Geometry{*left, *top, *width, *height};
}

TreeProperties ReadTree(JSONView inTree) {
    TreeProperties tree;
    ReadMember(inTree, kColumns).ForEachMember([&](std::string_view inID, JSONView inColumn) {
        tree.columns[std::string(inID)] = {ReadNumber(inColumn, kWidth, 1), ReadNumber(inColumn, kIndex, 0)};
    });
    const JSONView sort = inTree.Find(kSortColumn);
    if (sort.IsString()) {
        tree.sortColumnID = std::string(sort.AsString());
    }
    const JSONView ascending = inTree.Find(kSortAscending);
    tree.isSortDirectionAscending = !ascending.IsBool() || ascending.AsBool();
    return tree;
}

DialogProperties ReadDialog(JSONView inDialog) {
    DialogProperties dialog;
    dialog.geometry = ReadGeometry(inDialog);
    ReadMember(inDialog, kTrees).ForEachMember([&](std::string_view inID, JSONView inTree) {
        if (inTree.IsObject()) {
            dialog.trees[std::string(inID)] = ReadTree(inTree);
        }
    });
    return dialog;
}

/// An object in any case.
JSONValue ParseText(const UString& inText) {
    if (inText.empty() || inText.size() > kLargestText) {
        return JSONValue::EmptyObject();
    }
    try {
        JSONValue parsed = ostcore::serialization::JSONParse(ostcore::utility::ToUTF8(inText));
        return parsed.IsObject() ? parsed : JSONValue::EmptyObject();
    } catch (const std::exception& inError) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              std::string("The stored window properties cannot be read: ") + inError.what());
        return JSONValue::EmptyObject();
    }
}

// --- Writing: into what is there, so that what others keep in it stays.

JSONValue MemberAsObject(const JSONValue& inObject, std::string_view inKey) {
    const JSONValue member = GetVariantInObject(inObject, inKey);
    return member.IsObject() ? member : JSONValue::EmptyObject();
}

void WriteGeometry(JSONValue& ioDialog, const ostui::Geometry& inGeometry) {
    JSONValue object = MemberAsObject(ioDialog, kDialog);
    AddToObject(object, kLeft, inGeometry.left);
    AddToObject(object, kTop, inGeometry.top);
    AddToObject(object, kWidth, inGeometry.width);
    AddToObject(object, kHeight, inGeometry.height);
    AddToObject(ioDialog, kDialog, object);
}

void WriteTree(JSONValue& ioTree, const TreeProperties& inTree) {
    JSONValue columns = MemberAsObject(ioTree, kColumns);
    for (const auto& entry : inTree.columns) {
        JSONValue column = MemberAsObject(columns, entry.first);
        if (entry.second.width) {
            AddToObject(column, kWidth, *entry.second.width);
        }
        if (entry.second.index) {
            AddToObject(column, kIndex, *entry.second.index);
        }
        AddToObject(columns, entry.first, column);
    }
    AddToObject(ioTree, kColumns, columns);
    AddToObject(ioTree, kSortColumn, inTree.sortColumnID);
    AddToObject(ioTree, kSortAscending, inTree.isSortDirectionAscending);
}

UString MergeIntoText(const UString& inText, const std::string& inDialogID,
                      const DialogProperties& inProperties) {
    JSONValue root = ParseText(inText);
    JSONValue dialog = MemberAsObject(root, inDialogID);
    if (inProperties.geometry) {
        WriteGeometry(dialog, *inProperties.geometry);
    }
    if (!inProperties.trees.empty()) {
        JSONValue trees = MemberAsObject(dialog, kTrees);
        for (const auto& entry : inProperties.trees) {
            JSONValue tree = MemberAsObject(trees, entry.first);
            WriteTree(tree, entry.second);
            AddToObject(trees, entry.first, tree);
        }
        AddToObject(dialog, kTrees, trees);
    }
    AddToObject(root, inDialogID, dialog);
    return ostcore::serialization::GetJSONString(root);
}

// --- The map.

struct Properties {
    RecursiveMutex mutex;
    bool isRead ZO_GUARDED_BY(mutex) = false;
    std::map<std::string, DialogProperties> dialogs ZO_GUARDED_BY(mutex);
};

// Never destroyed: windows may close until the process ends.
Properties& TheProperties() {
    static Properties& properties = *new Properties;
    return properties;
}

void ReadCurrentUIProperties(Properties& ioProperties) ZO_REQUIRES(ioProperties.mutex) {
    if (ioProperties.isRead) {
        return;
    }
    ioProperties.isRead = true;
    UString text;
    Registry::GetZORegistryValue(kValueName, text);
    std::map<std::string, DialogProperties> dialogs;
    JSONView(ParseText(text)).ForEachMember([&dialogs](std::string_view inID, JSONView inDialog) {
        if (inDialog.IsObject()) {
            dialogs[std::string(inID)] = ReadDialog(inDialog);
        }
    });
    ioProperties.dialogs.swap(dialogs);
}

/// Another process may have written since: its text is merged into, not replaced.
void SaveUIProperties(const std::string& inDialogID, const DialogProperties& inProperties) {
    RegistryKey key;
    if (RegistryKey::Create(RFL::RegistryRoot::User, Registry::GetZORegistryBaseKey(), key) < 0) {
        return;
    }
    int result = RFL::kResultRegistryChanged;
    for (int attempt = 0; attempt < kAttempts && result == RFL::kResultRegistryChanged; ++attempt) {
        UString text;
        const bool isThere = key.GetStringValue(kValueName, text) >= 0;
        const UString merged = MergeIntoText(text, inDialogID, inProperties);
        result = key.Apply({isThere ? RegistryChange::ExpectString(kValueName, text)
                                    : RegistryChange::ExpectAbsent(kValueName),
                            RegistryChange::SetString(kValueName, merged)});
    }
    if (result < 0) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              "The properties of the window " + inDialogID +
                                  " cannot be stored: " + RFL::DescribeRegistryResult(result));
    }
}

bool IsSame(const optional<ostui::Geometry>& inLeft, const optional<ostui::Geometry>& inRight) {
    return inLeft && inRight && inLeft->left == inRight->left && inLeft->top == inRight->top &&
           inLeft->width == inRight->width && inLeft->height == inRight->height;
}

/// Leaves of the properties what is not known yet, and makes it known.
bool TakeChanges(DialogProperties& ioKnown, DialogProperties& ioProperties) {
    if (IsSame(ioKnown.geometry, ioProperties.geometry)) {
        ioProperties.geometry = boost::none;
    } else if (ioProperties.geometry) {
        ioKnown.geometry = ioProperties.geometry;
    }
    for (auto entry = ioProperties.trees.begin(); entry != ioProperties.trees.end();) {
        const auto known = ioKnown.trees.find(entry->first);
        if (known != ioKnown.trees.end() && known->second == entry->second) {
            entry = ioProperties.trees.erase(entry);
        } else {
            ioKnown.trees[entry->first] = entry->second;
            ++entry;
        }
    }
    return ioProperties.geometry || !ioProperties.trees.empty();
}

}  // namespace

DialogProperties GetDialogProperties(const std::string& inDialogID) {
    Properties& properties = TheProperties();
    ScopedLock lock(properties.mutex, "ReadCurrentUIProperties()");
    ReadCurrentUIProperties(properties);
    const auto found = properties.dialogs.find(inDialogID);
    return found == properties.dialogs.end() ? DialogProperties() : found->second;
}

void SetDialogProperties(const std::string& inDialogID, const DialogProperties& inProperties) {
    DialogProperties changes = inProperties;
    Properties& properties = TheProperties();
    ScopedLock lock(properties.mutex, "SaveUIProperties()");
    ReadCurrentUIProperties(properties);
    if (TakeChanges(properties.dialogs[inDialogID], changes)) {
        SaveUIProperties(inDialogID, changes);
    }
}

void ForgetUIProperties() {
    Properties& properties = TheProperties();
    ScopedLock lock(properties.mutex, "ReadCurrentUIProperties()");
    properties.isRead = false;
    properties.dialogs.clear();
}

}  // namespace ZOCL
