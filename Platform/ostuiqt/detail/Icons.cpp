// The engine behind the icons.
#include "ostuiqt/detail/Icons.h"

#include <QtGui/QIconEngine>
#include <QtGui/QPainter>
#include <QtGui/QPalette>
#include <QtGui/QPixmapCache>
#include <QtSvg/QSvgRenderer>
#include <QtWidgets/QApplication>

namespace ZOClientQt {
namespace detail {
namespace {

constexpr int kDefaultSize = 16;
const char kTextColour[] = "currentColor";
const char kSearch[] =
    "<svg xmlns='http://www.w3.org/2000/svg' width='16' height='16' viewBox='0 0 16 16'>"
    "<g fill='none' stroke='currentColor' stroke-width='1.5' stroke-linecap='round' opacity='.65'>"
    "<circle cx='7' cy='7' r='4.25'/><path d='M10.2 10.2 L13.5 13.5'/></g></svg>";

/// For message boxes, which a host need not supply.
constexpr struct {
    const char* name;
    const char* svg;
} kOfMessageBoxes[] = {
    {"MessageBoxNote",
     "<svg xmlns='http://www.w3.org/2000/svg' width='32' height='32' viewBox='0 0 32 32'>"
     "<circle cx='16' cy='16' r='13' fill='#2f7de1'/><circle cx='16' cy='9.8' r='1.9' fill='#fff'/>"
     "<path d='M16 14.6 V23' stroke='#fff' stroke-width='3.4' stroke-linecap='round'/></svg>"},
    {"MessageBoxCaution",
     "<svg xmlns='http://www.w3.org/2000/svg' width='32' height='32' viewBox='0 0 32 32'>"
     "<path d='M16 5 L29 27 H3 Z' fill='#e8a317' stroke='#e8a317' stroke-width='3' stroke-linejoin='round'/>"
     "<path d='M16 12.4 V18.6' stroke='#fff' stroke-width='3' stroke-linecap='round'/>"
     "<circle cx='16' cy='23.6' r='1.8' fill='#fff'/></svg>"},
    {"MessageBoxStop",
     "<svg xmlns='http://www.w3.org/2000/svg' width='32' height='32' viewBox='0 0 32 32'>"
     "<circle cx='16' cy='16' r='13' fill='#d63b3b'/><path d='M11.2 11.2 L20.8 20.8 M20.8 11.2 L11.2 20.8' "
     "stroke='#fff' stroke-width='3.2' stroke-linecap='round'/></svg>"}};

QByteArray FindOwn(const std::string& inName) {
    for (const auto& own : kOfMessageBoxes) {
        if (inName == own.name) {
            return QByteArray(own.svg);
        }
    }
    return {};
}

QColor TextColour(QIcon::Mode inMode) {
    const QPalette palette = QApplication::palette();
    switch (inMode) {
        case QIcon::Disabled:
            return palette.color(QPalette::Disabled, QPalette::WindowText);
        case QIcon::Selected:
            // What is selected stands in a list.
            return QApplication::palette("QAbstractItemView")
                .color(QPalette::Active, QPalette::HighlightedText);
        default:
            return palette.color(QPalette::Active, QPalette::WindowText);
    }
}

class SvgIconEngine final : public QIconEngine {
public:
    explicit SvgIconEngine(const QByteArray& inSvg) : mSvg(inSvg), mSize(QSvgRenderer(inSvg).defaultSize()) {}

    QPixmap pixmap(const QSize& inSize, QIcon::Mode inMode, QIcon::State) override {
        const QColor colour = TextColour(inMode);
        const QString key = QStringLiteral("zo-svg-%1-%2x%3-%4-%5")
                                .arg(qHash(mSvg), 0, 16)
                                .arg(inSize.width())
                                .arg(inSize.height())
                                .arg(colour.rgba(), 0, 16)
                                .arg(inMode == QIcon::Disabled ? 1 : 0);
        QPixmap pixmap;
        if (!QPixmapCache::find(key, &pixmap)) {
            pixmap = Draw(inSize, colour, inMode == QIcon::Disabled);
            QPixmapCache::insert(key, pixmap);
        }
        return pixmap;
    }

    void paint(QPainter* ioPainter, const QRect& inRect, QIcon::Mode inMode, QIcon::State inState) override {
        const qreal ratio = ioPainter->device()->devicePixelRatioF();
        QPixmap drawn = pixmap((QSizeF(inRect.size()) * ratio).toSize(), inMode, inState);
        drawn.setDevicePixelRatio(ratio);
        ioPainter->drawPixmap(inRect.topLeft(), drawn);
    }

    QSize actualSize(const QSize& inSize, QIcon::Mode, QIcon::State) override {
        return mSize.isEmpty() ? inSize : mSize.scaled(inSize, Qt::KeepAspectRatio);
    }
    QList<QSize> availableSizes(QIcon::Mode, QIcon::State) override { return {mSize}; }
    QIconEngine* clone() const override { return new SvgIconEngine(*this); }
    bool isNull() override { return mSize.isEmpty(); }

private:
    QPixmap Draw(const QSize& inSize, const QColor& inColour, bool inIsDisabled) const {
        QByteArray svg = mSvg;
        svg.replace(kTextColour, inColour.name().toLatin1());
        QPixmap pixmap(inSize);
        pixmap.fill(Qt::transparent);
        QPainter painter(&pixmap);
        painter.setOpacity(inIsDisabled ? 0.5 : 1.0);
        QSvgRenderer renderer(svg);
        renderer.setAspectRatioMode(Qt::KeepAspectRatio);
        renderer.render(&painter, QRectF(QPointF(), QSizeF(inSize)));
        return pixmap;
    }

    const QByteArray mSvg;
    const QSize mSize;
};

}  // namespace

QIcon Icons::Get(const std::string& inName) {
    if (inName.empty()) {
        return {};
    }
    const QByteArray name = QByteArray::fromStdString(inName);
    const auto known = mIcons.constFind(name);
    if (known != mIcons.constEnd()) {
        return *known;
    }
    QIcon icon;
    QByteArray bytes = FindOwn(inName);
    if (const ostcore::utility::BinaryResource svg =
            mSource ? mSource(inName) : ostcore::utility::BinaryResource()) {
        bytes = QByteArray(svg.bytes.get(), static_cast<qsizetype>(svg.size));
    }
    if (!bytes.isEmpty() && QSvgRenderer(bytes).isValid()) {
        icon = QIcon(new SvgIconEngine(bytes));
    }
    mIcons.insert(name, icon);
    return icon;
}

QIcon Icons::Search() {
    return QIcon(new SvgIconEngine(QByteArray::fromRawData(kSearch, sizeof kSearch - 1)));
}

QSize GetNaturalSize(const QIcon& inIcon) {
    const QList<QSize> sizes = inIcon.isNull() ? QList<QSize>() : inIcon.availableSizes();
    return sizes.isEmpty() || sizes.front().isEmpty() ? QSize(kDefaultSize, kDefaultSize) : sizes.front();
}

}  // namespace detail
}  // namespace ZOClientQt
