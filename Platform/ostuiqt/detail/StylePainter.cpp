// Drawing of the shapes.
#include "ostuiqt/detail/StylePainter.h"

#include <algorithm>

#include <QtGui/QGuiApplication>
#include <QtGui/QPainter>
#include <QtGui/QPainterPath>
#include <QtWidgets/QStyleOption>

namespace ZOClientQt {
namespace detail {
namespace {

constexpr qreal kRadius = 6;
constexpr qreal kSmallRadius = 4;

/// Saves what a shape changes.
class Scope {
public:
    explicit Scope(QPainter& ioPainter) : mPainter(ioPainter) {
        mPainter.save();
        mPainter.setRenderHint(QPainter::Antialiasing);
    }
    ~Scope() { mPainter.restore(); }
    Scope(const Scope&) = delete;
    Scope& operator=(const Scope&) = delete;

private:
    QPainter& mPainter;
};

QColor Mix(const QColor& inFrom, const QColor& inTo, double inPart) {
    const auto mix = [&](float inA, float inB) { return static_cast<float>(inA + (inB - inA) * inPart); };
    return QColor::fromRgbF(mix(inFrom.redF(), inTo.redF()), mix(inFrom.greenF(), inTo.greenF()),
                            mix(inFrom.blueF(), inTo.blueF()));
}

bool Has(const QStyleOption& inOption, QStyle::StateFlag inState) {
    return inOption.state.testFlag(inState);
}

QColor Border(const QStyleOption& inOption) {
    const double part = Has(inOption, QStyle::State_Enabled) ? 0.24 : 0.14;
    return Mix(inOption.palette.color(QPalette::Window), inOption.palette.color(QPalette::WindowText), part);
}

/// Not the option's own: rows have a paler one.
QColor Accent() {
    return QGuiApplication::palette().color(QPalette::Active, QPalette::Highlight);
}

QColor OnAccent() {
    return QGuiApplication::palette().color(QPalette::Active, QPalette::HighlightedText);
}

QRectF Inner(const QStyleOption& inOption) {
    return QRectF(inOption.rect).adjusted(0.5, 0.5, -0.5, -0.5);
}

void PaintFocusRing(QPainter& ioPainter, const QRectF& inRect, const QColor& inColour, qreal inRadius) {
    ioPainter.setBrush(Qt::NoBrush);
    ioPainter.setPen(QPen(inColour, 2));
    ioPainter.drawRoundedRect(inRect.adjusted(0.5, 0.5, -0.5, -0.5), inRadius, inRadius);
}

/// The ground of a check box or radio button, and its border.
void ChooseIndicatorColours(QPainter& ioPainter, const QStyleOption& inOption, bool inIsOn) {
    const bool isEnabled = Has(inOption, QStyle::State_Enabled);
    const QColor off = inOption.palette.color(isEnabled ? QPalette::Base : QPalette::Window);
    const QColor on = isEnabled ? Accent() : Border(inOption);
    const bool isMarked = Has(inOption, QStyle::State_HasFocus) || Has(inOption, QStyle::State_MouseOver);
    ioPainter.setBrush(inIsOn ? on : off);
    ioPainter.setPen(QPen(inIsOn ? on : isMarked ? Accent() : Mix(Border(inOption), Qt::gray, 0.4), 1.2));
}

}  // namespace

void PaintButton(QPainter& ioPainter, const QStyleOption& inOption, bool inIsDefault, bool inIsFlat) {
    const Scope scope(ioPainter);
    const QRectF rect = Inner(inOption);
    const bool isEnabled = Has(inOption, QStyle::State_Enabled);
    const bool isDown = Has(inOption, QStyle::State_Sunken) || Has(inOption, QStyle::State_On);
    const bool isHot = Has(inOption, QStyle::State_MouseOver) && isEnabled;
    const QColor text = inOption.palette.color(QPalette::ButtonText);
    const QColor ground = inIsDefault && isEnabled ? Accent() : inOption.palette.color(QPalette::Button);
    const bool isAccent = inIsDefault && isEnabled;
    if (!inIsFlat || isDown || isHot) {
        const double part = isDown ? 0.16 : isHot ? 0.07 : 0.0;
        ioPainter.setPen(isAccent || inIsFlat ? QPen(Qt::NoPen) : QPen(Border(inOption), 1));
        ioPainter.setBrush(Mix(ground, isAccent ? QColor(Qt::black) : text, part));
        ioPainter.drawRoundedRect(rect, kRadius, kRadius);
    }
    if (Has(inOption, QStyle::State_HasFocus) && isEnabled) {
        const QColor ring =
            isAccent ? Mix(Accent(), inOption.palette.color(QPalette::WindowText), 0.55) : Accent();
        PaintFocusRing(ioPainter, rect, ring, kRadius - 0.5);
    }
}

void PaintField(QPainter& ioPainter, const QStyleOption& inOption, bool inHasFocus) {
    const Scope scope(ioPainter);
    const bool isEnabled = Has(inOption, QStyle::State_Enabled);
    ioPainter.setPen(Qt::NoPen);
    ioPainter.setBrush(inOption.palette.color(isEnabled ? QPalette::Base : QPalette::Window));
    ioPainter.drawRoundedRect(Inner(inOption), kRadius, kRadius);
    PaintFieldFrame(ioPainter, inOption, inHasFocus && isEnabled);
}

void PaintFieldFrame(QPainter& ioPainter, const QStyleOption& inOption, bool inHasFocus) {
    const Scope scope(ioPainter);
    if (inHasFocus) {
        PaintFocusRing(ioPainter, Inner(inOption), Accent(), kRadius - 0.5);
        return;
    }
    ioPainter.setBrush(Qt::NoBrush);
    ioPainter.setPen(QPen(Border(inOption), 1));
    ioPainter.drawRoundedRect(Inner(inOption), kRadius, kRadius);
}

void PaintCheckBox(QPainter& ioPainter, const QStyleOption& inOption) {
    const Scope scope(ioPainter);
    const bool isOn = Has(inOption, QStyle::State_On);
    const QRectF rect = Inner(inOption).adjusted(1, 1, -1, -1);
    ChooseIndicatorColours(ioPainter, inOption, isOn || Has(inOption, QStyle::State_NoChange));
    ioPainter.drawRoundedRect(rect, kSmallRadius, kSmallRadius);
    const qreal size = rect.width();
    ioPainter.setPen(QPen(OnAccent(), 1.8, Qt::SolidLine, Qt::RoundCap, Qt::RoundJoin));
    if (isOn) {
        const QPointF points[] = {rect.topLeft() + QPointF(0.24, 0.52) * size,
                                  rect.topLeft() + QPointF(0.43, 0.70) * size,
                                  rect.topLeft() + QPointF(0.76, 0.32) * size};
        ioPainter.drawPolyline(points, 3);
    }
}

void PaintRadioButton(QPainter& ioPainter, const QStyleOption& inOption) {
    const Scope scope(ioPainter);
    const bool isOn = Has(inOption, QStyle::State_On);
    const QRectF rect = Inner(inOption).adjusted(1, 1, -1, -1);
    ChooseIndicatorColours(ioPainter, inOption, isOn);
    ioPainter.drawEllipse(rect);
    if (isOn) {
        ioPainter.setPen(Qt::NoPen);
        ioPainter.setBrush(OnAccent());
        ioPainter.drawEllipse(rect.center(), rect.width() * 0.2, rect.width() * 0.2);
    }
}

void PaintChevron(QPainter& ioPainter, const QStyleOption& inOption, int inAngle) {
    const Scope scope(ioPainter);
    QColor colour = inOption.palette.color(QPalette::WindowText);
    colour.setAlphaF(Has(inOption, QStyle::State_Enabled) ? 0.7f : 0.35f);
    ioPainter.setPen(QPen(colour, 1.5, Qt::SolidLine, Qt::RoundCap, Qt::RoundJoin));
    ioPainter.translate(QRectF(inOption.rect).center());
    ioPainter.rotate(inAngle);
    const QPointF points[] = {{-3.5, -1.75}, {0, 1.75}, {3.5, -1.75}};
    ioPainter.drawPolyline(points, 3);
}

namespace {

/// The bar is thinner than the room that it has.
QRectF BarOf(const QStyleOption& inOption) {
    constexpr qreal kThickness = 6;
    QRectF bar(inOption.rect);
    const qreal height = std::min<qreal>(kThickness, bar.height());
    bar.setTop(bar.top() + (bar.height() - height) / 2);
    bar.setHeight(height);
    return bar;
}

}  // namespace

void PaintProgressGroove(QPainter& ioPainter, const QStyleOption& inOption) {
    const Scope scope(ioPainter);
    const QRectF bar = BarOf(inOption);
    ioPainter.setPen(Qt::NoPen);
    ioPainter.setBrush(
        Mix(inOption.palette.color(QPalette::Window), inOption.palette.color(QPalette::WindowText), 0.14));
    ioPainter.drawRoundedRect(bar, bar.height() / 2, bar.height() / 2);
}

void PaintProgressPart(QPainter& ioPainter, const QStyleOption& inOption, double inFrom, double inPart) {
    const Scope scope(ioPainter);
    const QRectF bar = BarOf(inOption);
    const qreal width = bar.width() * inPart;
    const qreal from =
        inOption.direction == Qt::RightToLeft ? bar.width() * (1 - inFrom) - width : bar.width() * inFrom;
    QRectF part(bar.left() + from, bar.top(), width, bar.height());
    part = part.intersected(bar);
    if (part.width() <= 0) {
        return;
    }
    QPainterPath groove;
    groove.addRoundedRect(bar, bar.height() / 2, bar.height() / 2);
    ioPainter.setClipPath(groove);
    ioPainter.setPen(Qt::NoPen);
    ioPainter.setBrush(Accent());
    ioPainter.drawRoundedRect(part, bar.height() / 2, bar.height() / 2);
}

void PaintTab(QPainter& ioPainter, const QStyleOption& inOption) {
    const Scope scope(ioPainter);
    const QRectF rect = QRectF(inOption.rect);
    if (Has(inOption, QStyle::State_Selected)) {
        const QRectF line(rect.left() + 8, rect.bottom() - 3, rect.width() - 16, 3);
        ioPainter.setPen(Qt::NoPen);
        ioPainter.setBrush(Accent());
        ioPainter.drawRoundedRect(line, 1.5, 1.5);
    } else if (Has(inOption, QStyle::State_MouseOver) && Has(inOption, QStyle::State_Enabled)) {
        ioPainter.setPen(Qt::NoPen);
        ioPainter.setBrush(Mix(inOption.palette.color(QPalette::Window),
                               inOption.palette.color(QPalette::WindowText), 0.07));
        ioPainter.drawRoundedRect(rect.adjusted(2, 2, -2, -4), kRadius, kRadius);
    }
    if (Has(inOption, QStyle::State_HasFocus)) {
        PaintFocusRing(ioPainter, rect.adjusted(2.5, 2.5, -2.5, -4.5), Accent(), kRadius - 0.5);
    }
}

void PaintHeader(QPainter& ioPainter, const QStyleOption& inOption, bool inIsLast) {
    const QRect rect = inOption.rect;
    const QColor ground = inOption.palette.color(QPalette::Base);
    const QColor text = inOption.palette.color(QPalette::Text);
    const bool isHot = Has(inOption, QStyle::State_MouseOver) && Has(inOption, QStyle::State_Enabled);
    const double part = Has(inOption, QStyle::State_Sunken) ? 0.12 : isHot ? 0.07 : 0.03;
    ioPainter.fillRect(rect, Mix(ground, text, part));
    const QColor line = Mix(ground, text, 0.14);
    ioPainter.fillRect(QRect(rect.left(), rect.bottom(), rect.width(), 1), line);
    if (!inIsLast) {
        const int at = inOption.direction == Qt::RightToLeft ? rect.left() : rect.right();
        ioPainter.fillRect(QRect(at, rect.top() + 6, 1, rect.height() - 12), line);
    }
}

void PaintScrollHandle(QPainter& ioPainter, const QStyleOption& inOption, bool inIsHorizontal) {
    const Scope scope(ioPainter);
    QColor colour = inOption.palette.color(QPalette::WindowText);
    const bool isUsed = Has(inOption, QStyle::State_MouseOver) || Has(inOption, QStyle::State_Sunken);
    colour.setAlphaF(isUsed ? 0.5f : 0.28f);
    const QRectF rect = QRectF(inOption.rect)
                            .adjusted(inIsHorizontal ? 2 : 3, inIsHorizontal ? 3 : 2,
                                      inIsHorizontal ? -2 : -3, inIsHorizontal ? -3 : -2);
    const qreal radius = std::min(rect.width(), rect.height()) / 2;
    ioPainter.setPen(Qt::NoPen);
    ioPainter.setBrush(colour);
    ioPainter.drawRoundedRect(rect, radius, radius);
}

void PaintBox(QPainter& ioPainter, const QStyleOption& inOption) {
    const Scope scope(ioPainter);
    ioPainter.setBrush(Qt::NoBrush);
    ioPainter.setPen(QPen(
        Mix(inOption.palette.color(QPalette::Window), inOption.palette.color(QPalette::WindowText), 0.15),
        1));
    ioPainter.drawRoundedRect(Inner(inOption), kRadius, kRadius);
}

}  // namespace detail
}  // namespace ZOClientQt
