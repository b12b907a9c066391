// The assets of a production as a tree: bins hold assets, and below each lie its enclosures and renditions.
#pragma once

#include <memory>
#include <vector>

#include <QtCore/QAbstractItemModel>

#include "MetadataStore.h"

namespace Desk {

/// The tree comes out of the list at once; what lies below an asset is loaded when it is first unfolded.
class AssetTreeModel : public QAbstractItemModel {
    Q_OBJECT
public:
    enum Column { kName, kType, kColumnCount };
    /// Of kName: bins come before all else.
    static constexpr int kSortRole = Qt::UserRole;

    explicit AssetTreeModel(QObject* inParent = nullptr);
    ~AssetTreeModel() override;

    /// Null empties the tree.
    void SetAssets(const ZOCL::InterfaceRef<ZOCL::IZOCAssetList>& inAssets);
    /// The asset of a row or of the row above it; null when there is none.
    const AssetItem* FindAsset(const QModelIndex& inIndex) const;
    QModelIndex FindIndex(const ZOCL::ImmutableString& inAssetID) const;

    QModelIndex index(int inRow, int inColumn, const QModelIndex& inParent = {}) const override;
    QModelIndex parent(const QModelIndex& inIndex) const override;
    int rowCount(const QModelIndex& inParent = {}) const override;
    int columnCount(const QModelIndex& inParent = {}) const override;
    QVariant data(const QModelIndex& inIndex, int inRole) const override;
    QVariant headerData(int inSection, Qt::Orientation inOrientation, int inRole) const override;
    bool hasChildren(const QModelIndex& inParent = {}) const override;
    bool canFetchMore(const QModelIndex& inParent) const override;
    void fetchMore(const QModelIndex& inParent) override;

private:
    struct Node;
    struct Loading;
    Node* NodeAt(const QModelIndex& inIndex) const;
    QModelIndex IndexOf(const Node* inNode) const;
    void AddAssets(const std::vector<AssetItem>& inItems);
    void ShowParts(Node* inNode, const Loading& inLoading);

    ZOCL::InterfaceRef<ZOCL::IZOCAssetList> mAssets;
    std::unique_ptr<Node> mRoot;
    Requests mRequests;
};

}  // namespace Desk
