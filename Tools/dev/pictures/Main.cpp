// Takes a picture of every window, light and dark: zo_pictures FOLDER [NAME...]
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>

#include <QtCore/QElapsedTimer>
#include <QtGui/QPainter>
#include <QtGui/QPixmap>
#include <QtWidgets/QApplication>
#include <QtWidgets/QDialog>

#include "ostcore/threads/MainThread.h"
#include "ostlyra/Layout.h"
#include "ostui/BackEnd.h"
#include "Scenes.h"
#include "ZOClientQt/QtBackEnd.h"

namespace {

using ostcore::optional;
using ZOClientQt::ColorScheme;

constexpr int kTitleHeight = 36;
constexpr int kShadow = 20;
constexpr int kRadius = 8;

optional<std::string> ReadFile(const std::string& inPath) {
    std::ifstream file(inPath, std::ios::binary);
    std::stringstream text;
    text << file.rdbuf();
    return file ? optional<std::string>(text.str()) : boost::none;
}

optional<std::string> ReadLayout(const std::string& inName) {
    return ReadFile(std::string(ZO_RESOURCES "/layouts/") + inName + ".lyra");
}

ostcore::utility::BinaryResource ReadIcon(const std::string& inName) {
    const optional<std::string> svg = ReadFile(std::string(ZO_RESOURCES "/icons/") + inName + ".svg");
    return svg ? ostcore::utility::MakeBinaryResource(*svg) : ostcore::utility::BinaryResource();
}

/// The window with the frame that a desktop gives it.
QPixmap TakePicture(QDialog& ioWindow, double inScale) {
    const QRectF frame(kShadow, kShadow, ioWindow.width(), ioWindow.height() + kTitleHeight);
    QPixmap picture(
        QSizeF((frame.width() + 2 * kShadow) * inScale, (frame.height() + 2 * kShadow) * inScale).toSize());
    picture.setDevicePixelRatio(inScale);
    const QPalette palette = ioWindow.palette();
    picture.fill(palette.color(QPalette::Window).lightness() > 128 ? QColor(0xC9D3DF) : QColor(0x0D0F12));
    QPainter painter(&picture);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(Qt::NoPen);
    for (int edge = 10; edge > 0; edge -= 2) {
        painter.setBrush(QColor(0, 0, 0, 10));
        painter.drawRoundedRect(frame.adjusted(-edge, 3 - edge, edge, 3 + edge), kRadius + edge,
                                kRadius + edge);
    }
    painter.setBrush(palette.color(QPalette::Window));
    painter.drawRoundedRect(frame.adjusted(0, 0, 0, 0), kRadius, kRadius);
    QFont font = painter.font();
    font.setBold(true);
    painter.setFont(font);
    painter.setPen(palette.color(QPalette::WindowText));
    painter.drawText(QRectF(frame.left(), frame.top(), frame.width(), kTitleHeight), Qt::AlignCenter,
                     ioWindow.windowTitle());
    const QRectF box(ioWindow.isRightToLeft() ? frame.left() + 15 : frame.right() - 25, frame.top() + 13, 10,
                     10);
    painter.drawLine(box.topLeft(), box.bottomRight());
    painter.drawLine(box.topRight(), box.bottomLeft());
    painter.end();
    ioWindow.render(&picture, QPoint(kShadow, kShadow + kTitleHeight), QRegion(), QWidget::DrawChildren);
    return picture;
}

/// Lets the window settle, and a running bar get under way.
void Settle() {
    QElapsedTimer clock;
    clock.start();
    while (clock.elapsed() < 600) {
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
    }
}

std::unique_ptr<ostui::Dialog> MakeDialog(const Scene& inScene) {
    if (inScene.layout.empty()) {
        return inScene.name.rfind("Gallery", 0) == 0
                   ? std::make_unique<ostui::Dialog>(inScene.name, MakeGallery())
                   : std::make_unique<ostui::Dialog>(inScene.name, std::string());
    }
    const optional<std::string> text = ReadLayout(inScene.layout);
    ostlyra::LayoutError error;
    const auto layout = text ? ostlyra::ParseLayout(*text, error, &ReadLayout) : optional<ostlyra::Layout>();
    if (!layout) {
        std::fprintf(stderr, "zo_pictures: %s: %s\n", inScene.layout.c_str(),
                     text ? error.AsText().c_str() : "no such file");
        return nullptr;
    }
    return std::make_unique<ostui::Dialog>(inScene.layout, layout->view);
}

bool Take(const Scene& inScene, const std::string& inPath) {
    QApplication::setLayoutDirection(inScene.isRightToLeft ? Qt::RightToLeft : Qt::LeftToRight);
    const std::unique_ptr<ostui::Dialog> dialog = MakeDialog(inScene);
    if (!dialog) {
        return false;
    }
    inScene.fill(*dialog);
    bool isSaved = false;
    dialog->SetOnOpened([&] {
        Settle();
        if (auto* const window = qobject_cast<QDialog*>(QApplication::activeModalWidget())) {
            isSaved = TakePicture(*window, inScene.scale).save(QString::fromStdString(inPath));
        }
        dialog->Close(ostui::kResponseCancel);
    });
    dialog->RunModal();
    std::printf("%s%s\n", inPath.c_str(), isSaved ? "" : ": not written");
    return isSaved;
}

}  // namespace

int main(int inCount, char** inArguments) {
    QApplication application(inCount, inArguments);
    ostcore::threads::SetMainThread();
    if (inCount < 2) {
        std::fprintf(stderr, "usage: zo_pictures FOLDER [NAME...]\n");
        return 2;
    }
    const std::filesystem::path folder = inArguments[1];
    const std::vector<std::string> wanted(inArguments + 2, inArguments + inCount);
    std::filesystem::create_directories(folder);
    int failures = 0;
    for (const ColorScheme scheme : {ColorScheme::kLight, ColorScheme::kDark}) {
        ZOClientQt::UseModernStyle(scheme);
        const auto former = ostui::SetBackEnd(ZOClientQt::CreateQtBackEnd(nullptr, &ReadIcon));
        for (const Scene& scene : GetScenes()) {
            if (wanted.empty() || std::find(wanted.begin(), wanted.end(), scene.name) != wanted.end()) {
                const char* const ending = scheme == ColorScheme::kDark ? "-dark.png" : "-light.png";
                failures += Take(scene, folder / (scene.name + ending)) ? 0 : 1;
            }
        }
        ostui::SetBackEnd(former);
    }
    return failures == 0 ? 0 : 1;
}
