// Builds the tree, and loads what lies below an asset when it is unfolded.
#include "AssetTreeModel.h"

#include <map>

#include "Icons.h"
#include "Text.h"
#include "ZOClient/IZOCRendition.h"

namespace Desk {

using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;

struct AssetTreeModel::Node {
    enum class Parts { kUnknown, kLoading, kShown };

    QString name;
    QString type;
    QIcon icon;
    /// Of an asset; the identifier is empty for all else.
    AssetItem item;
    Node* parent = nullptr;
    int row = 0;
    std::vector<std::unique_ptr<Node>> children;
    Parts parts = Parts::kShown;

    bool IsAsset() const { return !item.assetIdentifier.empty(); }
    void Add(std::unique_ptr<Node> inChild) {
        inChild->parent = this;
        inChild->row = static_cast<int>(children.size());
        children.push_back(std::move(inChild));
    }
};

/// What lies below one asset: two lists that come in any order.
struct AssetTreeModel::Loading {
    InterfaceRef<ZOCL::IZOCEnclosures> enclosures;
    InterfaceRef<ZOCL::IZOCRenditions> renditions;
    int missing = 2;
    int failure = 0;
};

namespace {

template <class Node>
std::unique_ptr<Node> MakePart(const QString& inName, const QString& inType, const char* inIcon) {
    auto node = std::make_unique<Node>();
    node->name = inName;
    node->type = inType;
    node->icon = GetIcon(inIcon);
    return node;
}

}  // namespace

AssetTreeModel::AssetTreeModel(QObject* inParent)
    : QAbstractItemModel(inParent), mRoot(std::make_unique<Node>()) {}

AssetTreeModel::~AssetTreeModel() = default;

void AssetTreeModel::SetAssets(const InterfaceRef<ZOCL::IZOCAssetList>& inAssets) {
    mRequests.Cancel();
    beginResetModel();
    mAssets = inAssets;
    mRoot = std::make_unique<Node>();
    if (mAssets) {
        AddAssets(mAssets->GetAllItems());
    }
    endResetModel();
}

void AssetTreeModel::AddAssets(const std::vector<AssetItem>& inItems) {
    std::multimap<ImmutableString, std::unique_ptr<Node>> waiting;
    std::map<ImmutableString, bool> isKnown;
    for (const AssetItem& item : inItems) {
        isKnown[item.assetIdentifier] = true;
    }
    for (const AssetItem& item : inItems) {
        auto node = std::make_unique<Node>();
        node->name = ToQt(item.name);
        node->type = ToQt(ZOCL::GetAssetTypeDisplayName(item.assetType));
        node->icon = GetAssetIcon(item.assetType.str());
        node->item = item;
        node->parts = Node::Parts::kUnknown;
        // What names a parent that is not there stands at the top, where it can be seen.
        waiting.emplace(isKnown.count(item.parentIdentifier) ? item.parentIdentifier : ImmutableString(),
                        std::move(node));
    }
    std::vector<Node*> parents{mRoot.get()};
    const auto addChildren = [&] {
        Node* const parent = parents.back();
        parents.pop_back();
        const auto [first, last] = waiting.equal_range(parent->item.assetIdentifier);
        for (auto each = first; each != last; ++each) {
            parents.push_back(each->second.get());
            parent->Add(std::move(each->second));
        }
        waiting.erase(first, last);
    };
    while (!parents.empty() || !waiting.empty()) {
        if (parents.empty()) {
            // Bins that lie in each other: one of them comes to the top.
            auto loose = waiting.extract(waiting.begin());
            parents.push_back(loose.mapped().get());
            mRoot->Add(std::move(loose.mapped()));
        }
        addChildren();
    }
}

AssetTreeModel::Node* AssetTreeModel::NodeAt(const QModelIndex& inIndex) const {
    return inIndex.isValid() ? static_cast<Node*>(inIndex.internalPointer()) : mRoot.get();
}

QModelIndex AssetTreeModel::IndexOf(const Node* inNode) const {
    return inNode == mRoot.get() ? QModelIndex() : createIndex(inNode->row, kName, inNode);
}

const AssetItem* AssetTreeModel::FindAsset(const QModelIndex& inIndex) const {
    const Node* node = NodeAt(inIndex);
    while (node && !node->IsAsset()) {
        node = node->parent;
    }
    return node ? &node->item : nullptr;
}

QModelIndex AssetTreeModel::FindIndex(const ImmutableString& inAssetID) const {
    std::vector<const Node*> nodes{mRoot.get()};
    while (!nodes.empty() && !inAssetID.empty()) {
        const Node* const node = nodes.back();
        nodes.pop_back();
        if (node->item.assetIdentifier == inAssetID) {
            return IndexOf(node);
        }
        for (const auto& child : node->children) {
            nodes.push_back(child.get());
        }
    }
    return {};
}

QModelIndex AssetTreeModel::index(int inRow, int inColumn, const QModelIndex& inParent) const {
    const Node* const parent = NodeAt(inParent);
    const bool isThere = inRow >= 0 && inRow < static_cast<int>(parent->children.size()) && inColumn >= 0 &&
                         inColumn < kColumnCount;
    return isThere ? createIndex(inRow, inColumn, parent->children[static_cast<std::size_t>(inRow)].get())
                   : QModelIndex();
}

QModelIndex AssetTreeModel::parent(const QModelIndex& inIndex) const {
    return inIndex.isValid() ? IndexOf(NodeAt(inIndex)->parent) : QModelIndex();
}

int AssetTreeModel::rowCount(const QModelIndex& inParent) const {
    return inParent.column() > 0 ? 0 : static_cast<int>(NodeAt(inParent)->children.size());
}

int AssetTreeModel::columnCount(const QModelIndex&) const {
    return kColumnCount;
}

QVariant AssetTreeModel::data(const QModelIndex& inIndex, int inRole) const {
    const Node* const node = NodeAt(inIndex);
    if (node == mRoot.get()) {
        return {};
    }
    const QString text = inIndex.column() == kName ? node->name : node->type;
    switch (inRole) {
        case Qt::DisplayRole:
            return text;
        case Qt::DecorationRole:
            return inIndex.column() == kName ? QVariant(node->icon) : QVariant();
        case Qt::ToolTipRole:
            return ToTip(text);
        case kSortRole: {
            const bool isBin = node->item.assetType == ZOCL::kAssetType_Bin;
            return QString(QLatin1Char(!node->IsAsset() ? '2' : isBin ? '0' : '1')) + text;
        }
        default:
            return {};
    }
}

QVariant AssetTreeModel::headerData(int inSection, Qt::Orientation inOrientation, int inRole) const {
    if (inOrientation != Qt::Horizontal || inRole != Qt::DisplayRole) {
        return {};
    }
    return inSection == kName ? Text("$$$/ZODesk/Assets/Name=Name") : Text("$$$/ZODesk/Assets/Type=Type");
}

bool AssetTreeModel::hasChildren(const QModelIndex& inParent) const {
    const Node* const node = NodeAt(inParent);
    return inParent.column() <= 0 && (!node->children.empty() || node->parts == Node::Parts::kUnknown);
}

bool AssetTreeModel::canFetchMore(const QModelIndex& inParent) const {
    return NodeAt(inParent)->parts == Node::Parts::kUnknown;
}

void AssetTreeModel::fetchMore(const QModelIndex& inParent) {
    Node* const node = NodeAt(inParent);
    const auto asset = mAssets ? mAssets->GetAssetByIdentifier(node->item.assetIdentifier) : nullptr;
    if (!canFetchMore(inParent) || !asset) {
        node->parts = Node::Parts::kShown;
        return;
    }
    node->parts = Node::Parts::kLoading;
    const auto loading = std::make_shared<Loading>();
    loading->enclosures = asset->GetEnclosures();
    loading->renditions = asset->GetRenditions();
    // A reset of the model cancels, so that the node is there when this runs.
    const auto onLoaded = [this, node, loading](const Outcome& inOutcome) {
        loading->failure = inOutcome.Succeeded() ? loading->failure : inOutcome.result;
        if (--loading->missing == 0) {
            ShowParts(node, *loading);
        }
    };
    mRequests.Load(loading->enclosures, onLoaded);
    mRequests.Load(loading->renditions, onLoaded);
}

void AssetTreeModel::ShowParts(Node* inNode, const Loading& inLoading) {
    std::vector<std::unique_ptr<Node>> parts;
    if (inLoading.failure < 0) {
        parts.push_back(
            MakePart<Node>(DescribeResult(inLoading.failure), QString(), "SP_IncompatibleAlert_Sm"));
    } else {
        const ImmutableString xmp = MetadataStore::EnclosureOf(inNode->item);
        for (const ImmutableString& name : inLoading.enclosures->GetEnclosureNames()) {
            parts.push_back(
                name == xmp
                    ? MakePart<Node>(Text("$$$/ZODesk/Assets/Metadata=Metadata"),
                                     Text("$$$/ZODesk/Assets/XmpPacket=XMP Packet"), "SP_Tag_Md")
                    : MakePart<Node>(ToQt(name), Text("$$$/ZODesk/Assets/Enclosure=Enclosure"), "Enclosure"));
        }
        for (const ImmutableString& flavour : inLoading.renditions->GetFlavors()) {
            parts.push_back(
                MakePart<Node>(ToQt(flavour), Text("$$$/ZODesk/Assets/Rendition=Rendition"), "Picture"));
        }
    }
    inNode->parts = Node::Parts::kShown;
    const int first = static_cast<int>(inNode->children.size());
    if (parts.empty() && first > 0) {
        return;
    }
    if (parts.empty()) {
        parts.push_back(MakePart<Node>(Text("$$$/ZODesk/Assets/Nothing=Nothing is attached"), QString(), ""));
    }
    beginInsertRows(IndexOf(inNode), first, first + static_cast<int>(parts.size()) - 1);
    for (auto& part : parts) {
        inNode->Add(std::move(part));
    }
    endInsertRows();
}

}  // namespace Desk
