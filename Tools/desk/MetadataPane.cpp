// Makes fields of a packet, and a packet of fields.
#include "MetadataPane.h"

#include <algorithm>
#include <stdexcept>

#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QPlainTextEdit>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "Text.h"

namespace Desk {
namespace {

constexpr int kLinesOfLongText = 3;

}  // namespace

MetadataPane::MetadataPane(QWidget* inParent)
    : QWidget(inParent),
      mHeading(new QLabel),
      mError(new QLabel),
      mText(new QLabel),
      mScroll(new QScrollArea),
      mSaveButton(new QPushButton(GetIcon("Save"), Text("$$$/ZODesk/Metadata/Save=&Save"))),
      mRevertButton(new QPushButton(Text("$$$/ZODesk/Metadata/Revert=Re&vert"))) {
    QFont bold = font();
    bold.setBold(true);
    bold.setPointSizeF(bold.pointSizeF() * 1.15);
    mHeading->setFont(bold);
    mHeading->setTextFormat(Qt::PlainText);
    mHeading->setWordWrap(true);
    mHeading->setObjectName(QStringLiteral("metadataHeading"));
    mError->setObjectName(QStringLiteral("metadataError"));
    mError->setTextFormat(Qt::PlainText);
    mError->setWordWrap(true);
    mError->hide();
    mText->setAlignment(Qt::AlignCenter);
    mText->setWordWrap(true);
    mText->setTextFormat(Qt::PlainText);
    mText->setObjectName(QStringLiteral("metadataText"));
    mScroll->setWidgetResizable(true);
    mScroll->setFrameShape(QFrame::NoFrame);
    mSaveButton->setObjectName(QStringLiteral("metadataSave"));
    mRevertButton->setObjectName(QStringLiteral("metadataRevert"));

    auto* const buttons = new QHBoxLayout;
    buttons->addStretch(1);
    buttons->addWidget(mRevertButton);
    buttons->addWidget(mSaveButton);
    auto* const layout = new QVBoxLayout(this);
    layout->setContentsMargins(14, 12, 14, 12);
    layout->setSpacing(10);
    layout->addWidget(mHeading);
    layout->addWidget(mError);
    layout->addWidget(mText, 1);
    layout->addWidget(mScroll, 1);
    layout->addLayout(buttons);
    connect(mSaveButton, &QPushButton::clicked, this, &MetadataPane::Save);
    connect(mRevertButton, &QPushButton::clicked, this, &MetadataPane::Revert);
    ShowNothing();
}

MetadataPane::~MetadataPane() = default;

QString MetadataPane::GetAssetName() const {
    return ToQt(mItem.name);
}

// --- Showing

void MetadataPane::ShowNothing() {
    mStore.CancelLoad();
    mItem = AssetItem();
    mAsset.Reset();
    mSession.Reset();
    Clear();
    mHeading->hide();
    ShowText(Text("$$$/ZODesk/Metadata/Choose=Choose an asset to see and edit what is known about it."));
}

void MetadataPane::ShowAsset(const ZOCL::InterfaceRef<ZOCL::IZOCAsset>& inAsset, const AssetItem& inItem,
                             const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& inSession) {
    const bool isSame = inItem.assetIdentifier == mItem.assetIdentifier;
    mAsset = inAsset;
    mSession = inSession;
    mItem = inItem;
    mHeading->setText(ToQt(inItem.name));
    mHeading->show();
    if (isSame && (mHasEdits || IsSaving())) {
        return;
    }
    if (!isSame) {
        Clear();
        ShowText(Text("$$$/ZODesk/Busy/Loading=Loading..."));
    }
    Load();
}

void MetadataPane::Load() {
    if (MetadataStore::EnclosureOf(mItem).empty()) {
        Clear();
        ShowText(Text("$$$/ZODesk/Metadata/None=\"@0\" has no media, and so no metadata.", {GetAssetName()}));
        return;
    }
    mStore.Load(mAsset, mItem, [this](const QString& inError, const Metadata& inMetadata) {
        OnLoaded(inError, inMetadata);
    });
}

void MetadataPane::OnLoaded(const QString& inError, const Metadata& inMetadata) {
    Clear();
    mBase = inMetadata;
    mPacket = OrvaneXMP::Packet();
    QString error = inError;
    if (error.isEmpty() && !mBase.packet.empty()) {
        const OrvaneXMP::ReadResult read = OrvaneXMP::ReadPacket(mBase.packet);
        if (read) {
            mPacket = *read.packet;
        } else {
            error = Text("$$$/ZODesk/Metadata/Damaged=The metadata cannot be read: @0.",
                         {QString::fromStdString(read.failure.Text())});
        }
    }
    if (error.isEmpty()) {
        ShowFields();
    } else {
        ShowText(error);
    }
}

void MetadataPane::Clear() {
    delete mScroll->takeWidget();
    mEditors.clear();
    mHasEdits = false;
    mBase = Metadata();
    ShowError(QString());
    UpdateButtons();
    Q_EMIT EditsChanged();
}

void MetadataPane::ShowText(const QString& inText) {
    mText->setText(inText);
    mText->show();
    mScroll->hide();
}

void MetadataPane::ShowFields() {
    auto* const page = new QWidget;
    auto* const form = new QFormLayout(page);
    form->setContentsMargins(0, 0, 8, 0);
    form->setSpacing(10);
    form->setRowWrapPolicy(QFormLayout::WrapAllRows);
    for (const XmpField& field : ReadXmpFields(mPacket)) {
        mEditors.push_back(MakeEditor(field));
        auto* const label = new QLabel(field.label);
        label->setTextFormat(Qt::PlainText);
        label->setBuddy(mEditors.back().widget);
        form->addRow(label, mEditors.back().widget);
    }
    mScroll->setWidget(page);
    mScroll->show();
    mText->hide();
    UpdateButtons();
}

MetadataPane::Editor MetadataPane::MakeEditor(const XmpField& inField) {
    QWidget* widget = nullptr;
    // A line edit would make one line of a text of several.
    if (inField.isLong || inField.value.contains(QLatin1Char('\n'))) {
        auto* const edit = new QPlainTextEdit(inField.value);
        edit->setTabChangesFocus(true);
        edit->setFixedHeight(edit->fontMetrics().lineSpacing() * kLinesOfLongText + 18);
        connect(edit, &QPlainTextEdit::textChanged, this, &MetadataPane::OnEdited);
        widget = edit;
    } else {
        auto* const edit = new QLineEdit(inField.value);
        edit->setCursorPosition(0);
        connect(edit, &QLineEdit::textEdited, this, &MetadataPane::OnEdited);
        connect(edit, &QLineEdit::returnPressed, this, &MetadataPane::Save);
        widget = edit;
    }
    widget->setAccessibleName(inField.label);
    widget->setObjectName(QString::fromUtf8(inField.name.LocalName().data(),
                                            static_cast<qsizetype>(inField.name.LocalName().size())));
    if (inField.form == XmpField::Form::kOrderedList || inField.form == XmpField::Form::kUnorderedList) {
        widget->setToolTip(Text("$$$/ZODesk/Metadata/ListTip=Several entries are parted by semicolons."));
    }
    return {inField, widget};
}

QString MetadataPane::ValueOf(const Editor& inEditor) {
    const auto* const edit = qobject_cast<const QPlainTextEdit*>(inEditor.widget);
    return edit ? edit->toPlainText() : static_cast<const QLineEdit*>(inEditor.widget)->text();
}

// --- Editing

bool MetadataPane::HasEdits() const {
    return mHasEdits;
}

void MetadataPane::OnEdited() {
    const bool hadEdits = mHasEdits;
    mHasEdits = std::any_of(mEditors.begin(), mEditors.end(),
                            [](const Editor& inEditor) { return ValueOf(inEditor) != inEditor.field.value; });
    if (mHasEdits != hadEdits) {
        UpdateButtons();
        Q_EMIT EditsChanged();
    }
}

void MetadataPane::Revert() {
    Clear();
    Load();
}

bool MetadataPane::MakePacket(std::string& outPacket) {
    try {
        OrvaneXMP::Packet packet = mPacket;
        for (const Editor& editor : mEditors) {
            XmpField field = editor.field;
            field.value = ValueOf(editor);
            packet = field.value != editor.field.value ? WithXmpField(packet, field) : packet;
        }
        outPacket = OrvaneXMP::WritePacket(packet);
        return true;
    } catch (const std::invalid_argument&) {
        ShowError(
            Text("$$$/ZODesk/Metadata/BadText=One of the texts has characters that metadata cannot hold."));
    } catch (const std::length_error&) {
        ShowError(Text("$$$/ZODesk/Metadata/TooLong=The metadata would become too long."));
    }
    return false;
}

void MetadataPane::Save() {
    std::string packet;
    if (!mHasEdits || IsSaving()) {
        return;
    }
    if (!MakePacket(packet)) {
        Q_EMIT Saved(false);
        return;
    }
    ShowError(QString());
    mWritten = packet;
    mStore.Save(mSession, mItem, mBase, packet, [this](const QString& inError) { OnSaved(inError); });
    UpdateButtons();
}

void MetadataPane::OnSaved(const QString& inError) {
    if (inError.isEmpty()) {
        // The tree brings the new state of the asset, and with it the packet as it is now.
        mHasEdits = false;
        mBase = {mWritten, {}};
        mPacket = *OrvaneXMP::ReadPacket(mWritten).packet;
        for (Editor& editor : mEditors) {
            editor.field.value = ValueOf(editor);
        }
    }
    ShowError(inError);
    UpdateButtons();
    Q_EMIT EditsChanged();
    Q_EMIT Saved(inError.isEmpty());
}

void MetadataPane::ShowError(const QString& inError) {
    mError->setText(inError);
    mError->setVisible(!inError.isEmpty());
}

void MetadataPane::UpdateButtons() {
    const bool isSaving = IsSaving();
    mSaveButton->setVisible(!mEditors.empty());
    mRevertButton->setVisible(!mEditors.empty());
    mSaveButton->setEnabled(mHasEdits && !isSaving);
    mRevertButton->setEnabled(mHasEdits && !isSaving);
    mSaveButton->setText(isSaving ? Text("$$$/ZODesk/Metadata/Saving=Saving...")
                                  : Text("$$$/ZODesk/Metadata/Save=&Save"));
    if (QWidget* const page = mScroll->widget()) {
        page->setEnabled(!isSaving);
    }
}

}  // namespace Desk
