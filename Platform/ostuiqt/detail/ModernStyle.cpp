// Which shape is drawn for what.
#include "ostuiqt/detail/ModernStyle.h"

#include <algorithm>

#include <QtCore/QElapsedTimer>
#include <QtCore/QTimer>
#include <QtGui/QKeyEvent>
#include <QtGui/QPainter>
#include <QtWidgets/QAbstractButton>
#include <QtWidgets/QAbstractItemView>
#include <QtWidgets/QAbstractScrollArea>
#include <QtWidgets/QApplication>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QGroupBox>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QScrollBar>
#include <QtWidgets/QStyleFactory>
#include <QtWidgets/QStyleOption>
#include <QtWidgets/QTabBar>

#include "ostuiqt/detail/StylePainter.h"

namespace ZOClientQt {
namespace detail {
namespace {

constexpr int kControlHeight = 32;
constexpr int kRowHeight = 28;
constexpr int kHeaderHeight = 30;
constexpr int kIndicator = 18;
constexpr int kScrollBar = 12;
/// Left of the texts of cells and of the heads above them.
constexpr int kCellMargin = 6;
/// What texts of edits and popups have beside what Fusion gives them.
constexpr int kFieldPadding = 6;
constexpr int kButtonPadding = 6;
constexpr int kBarHeight = 8;
constexpr int kSpaceBelowTitle = 3;
constexpr int kMillisecondsOfRound = 1600;
constexpr int kMillisecondsOfFrame = 33;
constexpr double kRunningPart = 0.3;

struct Colours {
    QRgb window, base, button, text, dimmed, accent, onAccent, link, tip, alternate, row;
};
constexpr Colours kLightColours{0xFFF5F6F8, 0xFFFFFFFF, 0xFFFFFFFF, 0xFF1B1E23, 0xFF9AA1AB, 0xFF2563EB,
                                0xFFFFFFFF, 0xFF1D4ED8, 0xFFFFFFFF, 0xFFF8F9FB, 0xFFD6E4FF};
constexpr Colours kDarkColours{0xFF1F2227, 0xFF17191D, 0xFF2C3037, 0xFFE7EAEE, 0xFF707781, 0xFF3B7BF6,
                               0xFFFFFFFF, 0xFF7FB0FF, 0xFF2C3037, 0xFF1B1D22, 0xFF253F6E};

/// The field that an edit, list or tree is, or belongs to, has the keyboard.
bool HasFocus(const QStyleOption* inOption, const QWidget* inWidget) {
    return inWidget ? inWidget->hasFocus() : inOption->state.testFlag(QStyle::State_HasFocus);
}

/// The frame of a box whose title stands above it.
QStyleOption BelowTitle(const QStyleOption& inOption, const QWidget* inWidget) {
    QStyleOption frame(inOption);
    const auto* const box = qobject_cast<const QGroupBox*>(inWidget);
    if (box && !box->title().isEmpty()) {
        frame.rect.setTop(frame.rect.top() + std::max(kIndicator, inOption.fontMetrics.height()) +
                          kSpaceBelowTitle);
    }
    return frame;
}

/// From 0 to 1 and again.
double RunningPhase() {
    static const QElapsedTimer& clock = *[] {
        auto* const started = new QElapsedTimer;
        started->start();
        return started;
    }();
    return static_cast<double>(clock.elapsed() % kMillisecondsOfRound) / kMillisecondsOfRound;
}

void PaintProgress(QPainter& ioPainter, const QStyleOptionProgressBar& inBar, const QWidget* inWidget) {
    if (inBar.maximum > inBar.minimum) {
        const double part =
            static_cast<double>(inBar.progress - inBar.minimum) / (inBar.maximum - inBar.minimum);
        PaintProgressPart(ioPainter, inBar, 0, std::clamp(part, 0.0, 1.0));
        return;
    }
    PaintProgressPart(ioPainter, inBar, RunningPhase() * (1 + kRunningPart) - kRunningPart, kRunningPart);
    // The next picture follows this one, so nothing runs for a bar that is not seen.
    auto* const widget = const_cast<QWidget*>(inWidget);
    if (widget) {
        QTimer::singleShot(kMillisecondsOfFrame, widget, [widget] { widget->update(); });
    }
}

}  // namespace

QPalette MakePalette(ColorScheme inScheme) {
    const Colours& colours = inScheme == ColorScheme::kDark ? kDarkColours : kLightColours;
    QPalette palette(QColor::fromRgb(colours.button), QColor::fromRgb(colours.window));
    const auto set = [&](QPalette::ColorRole inRole, QRgb inColour) {
        palette.setColor(inRole, QColor::fromRgb(inColour));
    };
    set(QPalette::Window, colours.window);
    set(QPalette::Base, colours.base);
    set(QPalette::AlternateBase, colours.alternate);
    set(QPalette::Button, colours.button);
    set(QPalette::WindowText, colours.text);
    set(QPalette::Text, colours.text);
    set(QPalette::ButtonText, colours.text);
    set(QPalette::PlaceholderText, colours.dimmed);
    set(QPalette::Highlight, colours.accent);
    set(QPalette::HighlightedText, colours.onAccent);
    set(QPalette::Link, colours.link);
    set(QPalette::ToolTipBase, colours.tip);
    set(QPalette::ToolTipText, colours.text);
    for (const QPalette::ColorRole role : {QPalette::WindowText, QPalette::Text, QPalette::ButtonText}) {
        palette.setColor(QPalette::Disabled, role, QColor::fromRgb(colours.dimmed));
    }
    return palette;
}

QPalette MakeRowPalette(ColorScheme inScheme) {
    const Colours& colours = inScheme == ColorScheme::kDark ? kDarkColours : kLightColours;
    QPalette palette = MakePalette(inScheme);
    palette.setColor(QPalette::Highlight, QColor::fromRgb(colours.row));
    palette.setColor(QPalette::HighlightedText, QColor::fromRgb(colours.text));
    return palette;
}

ModernStyle::ModernStyle() : QProxyStyle(QStyleFactory::create(QStringLiteral("Fusion"))) {}

void ModernStyle::polish(QWidget* ioWidget) {
    QProxyStyle::polish(ioWidget);
    if (qobject_cast<QAbstractButton*>(ioWidget) || qobject_cast<QComboBox*>(ioWidget) ||
        qobject_cast<QTabBar*>(ioWidget) || qobject_cast<QScrollBar*>(ioWidget)) {
        ioWidget->setAttribute(Qt::WA_Hover);
    }
    if (auto* const view = qobject_cast<QAbstractItemView*>(ioWidget)) {
        view->viewport()->setAttribute(Qt::WA_Hover);
    }
    if (auto* const tabs = qobject_cast<QTabBar*>(ioWidget)) {
        tabs->setDrawBase(false);
        tabs->setExpanding(false);
    }
}

void ModernStyle::polish(QApplication* ioApplication) {
    QProxyStyle::polish(ioApplication);
    ioApplication->installEventFilter(this);
}

bool ModernStyle::eventFilter(QObject* inWatched, QEvent* inEvent) {
    const bool isPress = inEvent->type() == QEvent::KeyPress;
    const bool isRelease = inEvent->type() == QEvent::KeyRelease;
    const bool isLeft = inEvent->type() == QEvent::ApplicationStateChange;
    const bool isAlt = (isPress || isRelease) && static_cast<QKeyEvent*>(inEvent)->key() == Qt::Key_Alt;
    if ((isAlt && isPress != mShowsMnemonics) || (isLeft && mShowsMnemonics)) {
        mShowsMnemonics = isPress;
        for (QWidget* const widget : QApplication::allWidgets()) {
            widget->update();
        }
    }
    return QProxyStyle::eventFilter(inWatched, inEvent);
}

int ModernStyle::pixelMetric(PixelMetric inMetric, const QStyleOption* inOption,
                             const QWidget* inWidget) const {
    switch (inMetric) {
        case PM_IndicatorWidth:
        case PM_IndicatorHeight:
        case PM_ExclusiveIndicatorWidth:
        case PM_ExclusiveIndicatorHeight:
            return kIndicator;
        case PM_CheckBoxLabelSpacing:
        case PM_RadioButtonLabelSpacing:
            return 8;
        case PM_ScrollBarExtent:
            return kScrollBar;
        case PM_HeaderMargin:
            return kCellMargin;
        case PM_FocusFrameHMargin:
            // A view adds one.
            return kCellMargin - 1;
        case PM_ButtonMargin:
            return 16;
        case PM_ButtonShiftHorizontal:
        case PM_ButtonShiftVertical:
            return 0;
        case PM_TabBarTabHSpace:
            return 28;
        case PM_TabBarTabVSpace:
            return 14;
        case PM_DefaultFrameWidth:
            return inWidget && qobject_cast<const QAbstractScrollArea*>(inWidget)
                       ? 2
                       : QProxyStyle::pixelMetric(inMetric, inOption, inWidget);
        default:
            return QProxyStyle::pixelMetric(inMetric, inOption, inWidget);
    }
}

int ModernStyle::styleHint(StyleHint inHint, const QStyleOption* inOption, const QWidget* inWidget,
                           QStyleHintReturn* outData) const {
    switch (inHint) {
        case SH_UnderlineShortcut:
            return mShowsMnemonics ? 1 : 0;
        case SH_EtchDisabledText:
        case SH_ItemView_ShowDecorationSelected:
            return inHint == SH_ItemView_ShowDecorationSelected ? 1 : 0;
        default:
            return QProxyStyle::styleHint(inHint, inOption, inWidget, outData);
    }
}

QSize ModernStyle::sizeFromContents(ContentsType inType, const QStyleOption* inOption, const QSize& inSize,
                                    const QWidget* inWidget) const {
    QSize size = QProxyStyle::sizeFromContents(inType, inOption, inSize, inWidget);
    const auto atLeast = [&](int inHeight) { size.setHeight(std::max(size.height(), inHeight)); };
    switch (inType) {
        case CT_PushButton:
            size.rwidth() += 2 * kButtonPadding;
            atLeast(kControlHeight);
            break;
        case CT_ComboBox:
            size.rwidth() += kFieldPadding;
            atLeast(kControlHeight);
            break;
        case CT_LineEdit:
            atLeast(kControlHeight);
            break;
        case CT_ToolButton:
            size = size.expandedTo(QSize(kRowHeight, kRowHeight));
            break;
        case CT_ItemViewItem:
            atLeast(kRowHeight);
            break;
        case CT_HeaderSection:
            atLeast(kHeaderHeight);
            break;
        case CT_ProgressBar:
            size.setHeight(kBarHeight);
            break;
        default:
            break;
    }
    return size;
}

QRect ModernStyle::subElementRect(SubElement inElement, const QStyleOption* inOption,
                                  const QWidget* inWidget) const {
    QRect rect = QProxyStyle::subElementRect(inElement, inOption, inWidget);
    if (inElement == SE_LineEditContents) {
        return rect.adjusted(kFieldPadding, 0, -kFieldPadding, 0);
    }
    if (inElement == SE_HeaderArrow) {
        rect.moveTop(inOption->rect.top() + (inOption->rect.height() - rect.height()) / 2);
    }
    return rect;
}

QRect ModernStyle::subControlRect(ComplexControl inControl, const QStyleOptionComplex* inOption,
                                  SubControl inPart, const QWidget* inWidget) const {
    const QRect rect = QProxyStyle::subControlRect(inControl, inOption, inPart, inWidget);
    if (inControl == CC_ComboBox && inPart == SC_ComboBoxEditField) {
        const bool isMirrored = inOption->direction == Qt::RightToLeft;
        return rect.adjusted(isMirrored ? 0 : kFieldPadding, 0, isMirrored ? -kFieldPadding : 0, 0);
    }
    return rect;
}

void ModernStyle::drawPrimitive(PrimitiveElement inElement, const QStyleOption* inOption, QPainter* ioPainter,
                                const QWidget* inWidget) const {
    switch (inElement) {
        case PE_PanelButtonCommand: {
            const auto* const button = qstyleoption_cast<const QStyleOptionButton*>(inOption);
            const bool isDefault = button && button->features.testFlag(QStyleOptionButton::DefaultButton);
            PaintButton(*ioPainter, *inOption, isDefault,
                        button && button->features.testFlag(QStyleOptionButton::Flat));
            return;
        }
        case PE_PanelButtonTool:
            PaintButton(*ioPainter, *inOption, false, inOption->state.testFlag(State_AutoRaise));
            return;
        case PE_FrameFocusRect:
        case PE_FrameDefaultButton:
            // The shapes show the keyboard themselves; rows by the selection. Boxes with a text have only
            // this.
            if (qobject_cast<const QAbstractItemView*>(inWidget) == nullptr) {
                return;
            }
            if (!inOption->state.testFlag(State_Selected) && HasFocus(inOption, inWidget)) {
                PaintFieldFrame(*ioPainter, *inOption, true);
            }
            return;
        case PE_PanelLineEdit:
            if (inWidget && qobject_cast<const QComboBox*>(inWidget->parentWidget())) {
                return;
            }
            PaintField(*ioPainter, *inOption, HasFocus(inOption, inWidget));
            return;
        case PE_FrameLineEdit:
            PaintFieldFrame(*ioPainter, *inOption, HasFocus(inOption, inWidget));
            return;
        case PE_Frame:
            PaintFieldFrame(*ioPainter, *inOption, HasFocus(inOption, inWidget));
            return;
        case PE_IndicatorCheckBox:
            PaintCheckBox(*ioPainter, *inOption);
            return;
        case PE_IndicatorRadioButton:
            PaintRadioButton(*ioPainter, *inOption);
            return;
        case PE_FrameGroupBox:
            PaintBox(*ioPainter, BelowTitle(*inOption, inWidget));
            return;
        case PE_FrameTabWidget:
            PaintBox(*ioPainter, *inOption);
            return;
        case PE_IndicatorArrowDown:
            PaintChevron(*ioPainter, *inOption, 0);
            return;
        case PE_IndicatorHeaderArrow: {
            const auto* const header = qstyleoption_cast<const QStyleOptionHeader*>(inOption);
            // Up for what grows downwards.
            PaintChevron(*ioPainter, *inOption,
                         header && header->sortIndicator == QStyleOptionHeader::SortUp ? 0 : 180);
            return;
        }
        case PE_IndicatorBranch:
            if (inOption->state.testFlag(State_Children)) {
                const int shut = inOption->direction == Qt::RightToLeft ? 90 : -90;
                PaintChevron(*ioPainter, *inOption, inOption->state.testFlag(State_Open) ? 0 : shut);
            }
            return;
        default:
            QProxyStyle::drawPrimitive(inElement, inOption, ioPainter, inWidget);
    }
}

void ModernStyle::drawControl(ControlElement inElement, const QStyleOption* inOption, QPainter* ioPainter,
                              const QWidget* inWidget) const {
    switch (inElement) {
        case CE_PushButtonLabel:
            if (const auto* const button = qstyleoption_cast<const QStyleOptionButton*>(inOption)) {
                QStyleOptionButton label(*button);
                if (button->features.testFlag(QStyleOptionButton::DefaultButton) &&
                    button->state.testFlag(State_Enabled)) {
                    label.palette.setColor(
                        QPalette::ButtonText,
                        button->palette.color(QPalette::Active, QPalette::HighlightedText));
                }
                QProxyStyle::drawControl(inElement, &label, ioPainter, inWidget);
                return;
            }
            break;
        case CE_HeaderSection: {
            const auto* const header = qstyleoption_cast<const QStyleOptionHeader*>(inOption);
            PaintHeader(*ioPainter, *inOption,
                        header && (header->position == QStyleOptionHeader::End ||
                                   header->position == QStyleOptionHeader::OnlyOneSection));
            return;
        }
        case CE_HeaderEmptyArea:
            PaintHeader(*ioPainter, *inOption, true);
            return;
        case CE_ProgressBarGroove:
            PaintProgressGroove(*ioPainter, *inOption);
            return;
        case CE_ProgressBarContents:
            if (const auto* const bar = qstyleoption_cast<const QStyleOptionProgressBar*>(inOption)) {
                PaintProgress(*ioPainter, *bar, inWidget);
            }
            return;
        case CE_TabBarTabShape:
            PaintTab(*ioPainter, *inOption);
            return;
        default:
            break;
    }
    QProxyStyle::drawControl(inElement, inOption, ioPainter, inWidget);
}

void ModernStyle::drawComplexControl(ComplexControl inControl, const QStyleOptionComplex* inOption,
                                     QPainter* ioPainter, const QWidget* inWidget) const {
    if (inControl == CC_ComboBox) {
        QStyleOption ground(*inOption);
        PaintButton(*ioPainter, ground, false, false);
        QStyleOption arrow(*inOption);
        arrow.rect = subControlRect(CC_ComboBox, inOption, SC_ComboBoxArrow, inWidget);
        PaintChevron(*ioPainter, arrow, 0);
        return;
    }
    if (inControl == CC_ScrollBar) {
        const auto* const slider = qstyleoption_cast<const QStyleOptionSlider*>(inOption);
        QStyleOption handle(*inOption);
        handle.rect = subControlRect(CC_ScrollBar, inOption, SC_ScrollBarSlider, inWidget);
        if (slider && slider->maximum > slider->minimum) {
            PaintScrollHandle(*ioPainter, handle, slider->orientation == Qt::Horizontal);
        }
        return;
    }
    QProxyStyle::drawComplexControl(inControl, inOption, ioPainter, inWidget);
}

}  // namespace detail

void UseModernStyle(ColorScheme inScheme) {
    if (dynamic_cast<detail::ModernStyle*>(QApplication::style()) == nullptr) {
        QApplication::setStyle(new detail::ModernStyle);
    }
    QApplication::setPalette(detail::MakePalette(inScheme));
    QApplication::setPalette(detail::MakeRowPalette(inScheme), "QAbstractItemView");
}

}  // namespace ZOClientQt
