// Our own look, for hosts that have none: flat, rounded, one accent.
#pragma once

#include <QtGui/QPalette>
#include <QtWidgets/QProxyStyle>

#include "ZOClientQt/QtBackEnd.h"

namespace ZOClientQt {
namespace detail {

QPalette MakePalette(ColorScheme inScheme);
/// Of lists and trees, whose icons have to be seen on selected rows, too.
QPalette MakeRowPalette(ColorScheme inScheme);

/// Draws by the palette of what it draws; sizes and behaviour that it does not name are Fusion's.
class ModernStyle final : public QProxyStyle {
public:
    ModernStyle();

    void polish(QWidget* ioWidget) override;
    void polish(QApplication* ioApplication) override;
    void polish(QPalette&) override {}
    int pixelMetric(PixelMetric inMetric, const QStyleOption* inOption,
                    const QWidget* inWidget) const override;
    int styleHint(StyleHint inHint, const QStyleOption* inOption, const QWidget* inWidget,
                  QStyleHintReturn* outData) const override;
    QSize sizeFromContents(ContentsType inType, const QStyleOption* inOption, const QSize& inSize,
                           const QWidget* inWidget) const override;
    QRect subElementRect(SubElement inElement, const QStyleOption* inOption,
                         const QWidget* inWidget) const override;
    QRect subControlRect(ComplexControl inControl, const QStyleOptionComplex* inOption, SubControl inPart,
                         const QWidget* inWidget) const override;
    void drawPrimitive(PrimitiveElement inElement, const QStyleOption* inOption, QPainter* ioPainter,
                       const QWidget* inWidget) const override;
    void drawControl(ControlElement inElement, const QStyleOption* inOption, QPainter* ioPainter,
                     const QWidget* inWidget) const override;
    void drawComplexControl(ComplexControl inControl, const QStyleOptionComplex* inOption,
                            QPainter* ioPainter, const QWidget* inWidget) const override;

private:
    bool eventFilter(QObject* inWatched, QEvent* inEvent) override;

    /// The letters of mnemonics are underlined while the key that uses them is held.
    bool mShowsMnemonics = false;
};

}  // namespace detail
}  // namespace ZOClientQt
