// The engine behind the icons, and the shapes of the desk's own.
#include "Icons.h"

#include <map>
#include <string>

#include <QtGui/QIconEngine>
#include <QtGui/QPainter>
#include <QtGui/QPalette>
#include <QtSvg/QSvgRenderer>
#include <QtWidgets/QApplication>

#include "ZOClient/IZOCAsset.h"
#include "ZOClient/Library.h"

namespace Desk {
namespace {

const std::map<std::string, const char*>& OwnShapes() {
    static const std::map<std::string, const char*> shapes{
        {"Share",
         "<path d='M10 12.5V3M6.5 6.2 10 2.7l3.5 3.5M3.5 11.5v4a1.5 1.5 0 0 0 1.5 1.5h10a1.5 1.5 0 0 0 "
         "1.5-1.5v-4'/>"},
        {"Latest",
         "<path d='M10 3v9.5M6.5 9.3 10 12.8l3.5-3.5M3.5 11.5v4a1.5 1.5 0 0 0 1.5 1.5h10a1.5 1.5 0 0 "
         "0 1.5-1.5v-4'/>"},
        {"Resolve",
         "<path d='M5 3v3.5C5 10 10 10 10 13.5V17M15 3v3.5c0 2-1.6 3-3 3.9M7.2 14.6 10 17.3l2.8-2.7'/>"},
        {"History", "<path d='M3.2 10a6.8 6.8 0 1 0 2-4.8L3.2 7.2M3.2 3.4v3.8H7M10 6.4V10l2.6 1.7'/>"},
        {"Refresh", "<path d='M16.6 8.2A6.9 6.9 0 1 0 17 10M16.8 4v4.3h-4.3'/>"},
        {"Save",
         "<path d='M4.5 3h9L17 6.5v9a1.5 1.5 0 0 1-1.5 1.5h-11A1.5 1.5 0 0 1 3 15.5v-11A1.5 1.5 0 0 1 4.5 "
         "3ZM6.5 3v4h6V3M6 17v-5.5h8V17'/>"},
        {"Enclosure",
         "<path d='M13.8 6.2 7.9 12.1a1.4 1.4 0 0 0 2 2l6-6a2.9 2.9 0 0 0-4.1-4.1l-6.1 6.1a4.4 4.4 0 "
         "0 0 6.2 6.2l4.9-4.9'/>"},
        {"Picture",
         "<path d='M4.5 4h11A1.5 1.5 0 0 1 17 5.5v9a1.5 1.5 0 0 1-1.5 1.5h-11A1.5 1.5 0 0 1 3 "
         "14.5v-9A1.5 1.5 0 0 1 4.5 4ZM3.5 14.5l4-4 3 3 2.5-2.5 3.7 3.7M12.6 7.6h.1'/>"}};
    return shapes;
}

QByteArray GetSvg(const char* inName) {
    const auto own = OwnShapes().find(inName);
    if (own != OwnShapes().end()) {
        return QByteArrayLiteral(
                   "<svg xmlns='http://www.w3.org/2000/svg' width='20' height='20' viewBox='0 0 20 20'>"
                   "<g fill='none' stroke='currentColor' stroke-width='1.5' stroke-linecap='round' "
                   "stroke-linejoin='round'>") +
               own->second + QByteArrayLiteral("</g></svg>");
    }
    const ostcore::utility::BinaryResource svg = ZOCL::GetGenericButtonImageSupply()(inName);
    return svg ? QByteArray(svg.bytes.get(), static_cast<qsizetype>(svg.size)) : QByteArray();
}

/// The colour is looked up at each drawing, so that icons follow a change from light to dark.
class SvgIconEngine final : public QIconEngine {
public:
    explicit SvgIconEngine(const QByteArray& inSvg) : mSvg(inSvg) {}

    void paint(QPainter* ioPainter, const QRect& inRect, QIcon::Mode inMode, QIcon::State) override {
        const auto group = inMode == QIcon::Disabled ? QPalette::Disabled : QPalette::Active;
        QByteArray svg = mSvg;
        svg.replace("currentColor",
                    QApplication::palette().color(group, QPalette::WindowText).name().toLatin1());
        QSvgRenderer renderer(svg);
        renderer.setAspectRatioMode(Qt::KeepAspectRatio);
        ioPainter->save();
        ioPainter->setOpacity(inMode == QIcon::Disabled ? 0.6 : 1.0);
        renderer.render(ioPainter, QRectF(inRect));
        ioPainter->restore();
    }
    QPixmap pixmap(const QSize& inSize, QIcon::Mode inMode, QIcon::State inState) override {
        QPixmap drawn(inSize);
        drawn.fill(Qt::transparent);
        QPainter painter(&drawn);
        paint(&painter, QRect(QPoint(), inSize), inMode, inState);
        return drawn;
    }
    QIconEngine* clone() const override { return new SvgIconEngine(*this); }

private:
    const QByteArray mSvg;
};

}  // namespace

QIcon GetIcon(const char* inName) {
    const QByteArray svg = GetSvg(inName);
    return svg.isEmpty() ? QIcon() : QIcon(new SvgIconEngine(svg));
}

QIcon GetAssetIcon(const std::string& inAssetType) {
    static const std::map<std::string, const char*> icons{
        {ZOCL::kAssetType_Bin.str(), "SP_Folder_Sm"},
        {ZOCL::kAssetType_SmartBin.str(), "SP_SmartBin_Sm"},
        {ZOCL::kAssetType_Sequence.str(), "SP_Sequence_Sm"},
        {ZOCL::kAssetType_MasterClip.str(), "SP_VideoColored_Sm"},
        {ZOCL::kAssetType_SubClip.str(), "SP_VideoSubClip_Sm"},
        {ZOCL::kAssetType_Composition.str(), "SP_SFComp_Sm"},
        {ZOCL::kAssetType_Synthetic_SF.str(), "SP_SFComp_Sm"}};
    const auto found = icons.find(inAssetType);
    return GetIcon(found == icons.end() ? "SP_Tag_Md" : found->second);
}

}  // namespace Desk
