// The shapes that our own look is made of.
#pragma once

class QPainter;
class QStyleOption;
class QWidget;

namespace ZOClientQt {
namespace detail {

/// A push button, tool button or closed popup: filled by its state, the default one in the accent colour.
void PaintButton(QPainter& ioPainter, const QStyleOption& inOption, bool inIsDefault, bool inIsFlat);
/// The frame of an edit, a list or a tree, with its ground.
void PaintField(QPainter& ioPainter, const QStyleOption& inOption, bool inHasFocus);
/// The same without its ground, over what is there.
void PaintFieldFrame(QPainter& ioPainter, const QStyleOption& inOption, bool inHasFocus);
void PaintCheckBox(QPainter& ioPainter, const QStyleOption& inOption);
void PaintRadioButton(QPainter& ioPainter, const QStyleOption& inOption);
/// An arrow of two strokes; the angle turns it from pointing down, clockwise.
void PaintChevron(QPainter& ioPainter, const QStyleOption& inOption, int inAngle);
void PaintProgressGroove(QPainter& ioPainter, const QStyleOption& inOption);
/// inPart of the bar from inFrom on, each from 0 to 1.
void PaintProgressPart(QPainter& ioPainter, const QStyleOption& inOption, double inFrom, double inPart);
void PaintTab(QPainter& ioPainter, const QStyleOption& inOption);
void PaintHeader(QPainter& ioPainter, const QStyleOption& inOption, bool inIsLast);
void PaintScrollHandle(QPainter& ioPainter, const QStyleOption& inOption, bool inIsHorizontal);
/// Of a group or of the pages of tabs.
void PaintBox(QPainter& ioPainter, const QStyleOption& inOption);

}  // namespace detail
}  // namespace ZOClientQt
