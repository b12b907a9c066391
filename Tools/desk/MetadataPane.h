// The pane that edits the metadata of the chosen asset.
#pragma once

#include <vector>

#include <QtWidgets/QFormLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QScrollArea>
#include <QtWidgets/QWidget>

#include "MetadataStore.h"
#include "OrvaneXMP/Tree.h"
#include "XmpFields.h"

namespace Desk {

class MetadataPane : public QWidget {
    Q_OBJECT
public:
    explicit MetadataPane(QWidget* inParent = nullptr);
    ~MetadataPane() override;

    /// Loads the packet of an asset. When that asset is being edited, the edits stay: what others change
    /// meanwhile is merged with them by Save.
    void ShowAsset(const ZOCL::InterfaceRef<ZOCL::IZOCAsset>& inAsset, const AssetItem& inItem,
                   const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& inSession);
    void ShowNothing();

    const ZOCL::ImmutableString& GetAssetID() const { return mItem.assetIdentifier; }
    QString GetAssetName() const;
    bool HasEdits() const;
    bool IsSaving() const { return mStore.IsSaving(); }
    /// Ends with Saved, whatever comes of it.
    void Save();
    /// Drops the edits and loads anew.
    void Revert();

Q_SIGNALS:
    void EditsChanged();
    void Saved(bool inSucceeded);

private:
    struct Editor {
        XmpField field;
        QWidget* widget;
    };

    void Clear();
    void ShowText(const QString& inText);
    void Load();
    void OnLoaded(const QString& inError, const Metadata& inMetadata);
    void ShowFields();
    Editor MakeEditor(const XmpField& inField);
    static QString ValueOf(const Editor& inEditor);
    void OnEdited();
    bool MakePacket(std::string& outPacket);
    void OnSaved(const QString& inError);
    void ShowError(const QString& inError);
    void UpdateButtons();

    QLabel* mHeading;
    QLabel* mError;
    QLabel* mText;
    QScrollArea* mScroll;
    QPushButton* mSaveButton;
    QPushButton* mRevertButton;

    MetadataStore mStore;
    ZOCL::InterfaceRef<ZOCL::IZOCAsset> mAsset;
    ZOCL::InterfaceRef<ZOCL::IZOCEditingSession> mSession;
    AssetItem mItem;
    Metadata mBase;
    OrvaneXMP::Packet mPacket;
    std::vector<Editor> mEditors;
    /// What Save was given last.
    std::string mWritten;
    bool mHasEdits = false;
};

}  // namespace Desk
