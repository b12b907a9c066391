// Texts and edits.
#include "ostuiqt/detail/TextWidgets.h"

#include <QtGui/QGuiApplication>
#include <QtWidgets/QLabel>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QPlainTextEdit>

#include "ostui/MessageBox.h"
#include "ostuiqt/detail/Icons.h"
#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::ControlType;
using ostui::Dialog;

namespace {

constexpr int kRowsOfMultiLineEdit = 4;
/// Qt's own limit would cut long texts in silence.
constexpr int kLongestLine = 1 << 24;

/// As high as it has to be, so that a list above it gets the room.
class PlainTextEdit final : public QPlainTextEdit {
public:
    using QPlainTextEdit::QPlainTextEdit;
    QSize sizeHint() const override { return {QPlainTextEdit::sizeHint().width(), minimumHeight()}; }
};

}  // namespace

StaticText::StaticText(ControlHost& ioHost, const Control& inControl, const ostui::View* inView,
                       QWidget* inParent)
    : ControlWidget(ioHost, inControl), mText(new QLabel(inParent)) {
    mText->setTextFormat(Qt::PlainText);
    // By the direction of the window; a name in another script does not jump to the other side.
    mText->setAlignment((QGuiApplication::isRightToLeft() ? Qt::AlignRight : Qt::AlignLeft) |
                        Qt::AlignAbsolute | Qt::AlignVCenter);
    mText->setWordWrap(inControl.isMultiLine || inControl.id == ostui::kMessageBoxText ||
                       !ioHost.GetDialog().GetLayout());
    if (inControl.isMultiLine || inControl.id == ostui::kMessageBoxText) {
        // What it says may be an error that somebody is to be sent.
        mText->setTextInteractionFlags(Qt::TextSelectableByMouse);
        mText->setCursor(Qt::IBeamCursor);
    }
    if (const int size = inView ? inView->GetNumber("fontSize", 0) : 0) {
        QFont font = mText->font();
        font.setPixelSize(size);
        mText->setFont(font);
    }
    SetWidget(mText);
}

void StaticText::SetNames(ControlWidget& ioNamed) {
    mNamesAnother = true;
    ioNamed.SetNamedBy(mText, GetCaption());
}

std::vector<Caption> StaticText::GetCaptions() const {
    if (!mNamesAnother) {
        return {};
    }
    return {{GetCaption(), [text = mText](const QString& inMarked) { text->setText(inMarked); }}};
}

void StaticText::UpdateContent(const Control& inControl) {
    if (SetCaption(ToQt(inControl.text))) {
        const QString& text = GetCaption();
        mText->setText(mNamesAnother       ? EscapeMnemonics(text)
                       : mText->wordWrap() ? BreakLongWords(text)
                                           : text);
    }
}

SingleLineEdit::SingleLineEdit(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl),
      mIsSearch(inControl.type == ControlType::kSearchEdit),
      mEdit(new QLineEdit(inParent)) {
    if (inControl.type == ControlType::kPasswordEdit) {
        mEdit->setEchoMode(QLineEdit::Password);
        mEdit->setInputMethodHints(Qt::ImhHiddenText | Qt::ImhSensitiveData | Qt::ImhNoPredictiveText);
    } else if (mIsSearch) {
        mEdit->addAction(Icons::Search(), QLineEdit::LeadingPosition);
        mEdit->setClearButtonEnabled(true);
    }
    mEdit->setMaxLength(kLongestLine);
    SetWidget(mEdit);
    connect(mEdit, &QLineEdit::textChanged, this, [this](const QString& inText) {
        if (mShown != inText) {
            mShown = inText;
            Act([id = GetID(), inText](Dialog& ioDialog) { ioDialog.Enter(id, FromQt(inText)); });
        }
    });
}

void SingleLineEdit::UpdateContent(const Control& inControl) {
    if (mIsSearch) {
        mEdit->setPlaceholderText(ToQt(inControl.label));
    }
    const QString text = ToQt(inControl.text);
    if (mShown != text) {
        mShown = text;
        mEdit->setText(text);
    }
}

MultiLineEdit::MultiLineEdit(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl), mEdit(new PlainTextEdit(inParent)) {
    mEdit->setTabChangesFocus(true);
    const QMargins margins = mEdit->contentsMargins();
    const int frame =
        2 * static_cast<int>(mEdit->document()->documentMargin()) + margins.top() + margins.bottom();
    mEdit->setMinimumHeight(kRowsOfMultiLineEdit * mEdit->fontMetrics().lineSpacing() + frame);
    SetWidget(mEdit);
    connect(mEdit, &QPlainTextEdit::textChanged, this, [this] {
        if (!mIsUpdating) {
            mShown = mEdit->toPlainText();
            Act([id = GetID(), text = mShown](Dialog& ioDialog) { ioDialog.Enter(id, FromQt(text)); });
        }
    });
}

void MultiLineEdit::UpdateContent(const Control& inControl) {
    const QString text = ToQt(inControl.text);
    if (mShown != text) {
        mShown = text;
        mIsUpdating = true;
        mEdit->setPlainText(text);
        mIsUpdating = false;
    }
}

}  // namespace detail
}  // namespace ZOClientQt
