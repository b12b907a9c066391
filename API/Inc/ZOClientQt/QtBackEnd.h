// Windows for hosts that are Qt 6 applications: the library's dialogs as Qt Widgets, and its main-thread
// queue run from Qt's event loop. In a library of its own, libZOClientQt.so; nothing else of ours needs Qt.
#pragma once

#include <string>

#include "ostcore/Types.h"
#include "ostcore/utility/BinaryResource.h"
#include "ostui/BackEnd.h"

#if defined(_WIN32)
#define ZOCLIENTQT_EXPORT __declspec(dllexport)
#else
#define ZOCLIENTQT_EXPORT __attribute__((visibility("default")))
#endif

class QWidget;

namespace ZOClientQt {

using ostcore::function;
using ostcore::shared_ptr;

/// Gives the SVG text of an icon by its name ("SP_Folder_Sm"); null bytes for an icon that does not exist.
/// `currentColor` in it stands for the colour of texts. Called on the main thread, once for each name.
using IconSource = function<ostcore::utility::BinaryResource(const std::string& inName)>;

/// Runs the library's main-thread queue from Qt's event loop for as long as somebody holds it.
class ZOCLIENTQT_EXPORT MainThreadDriver {
public:
    virtual ~MainThreadDriver();
};

/// Takes the place of the wake function (ostcore/threads/MainThread.h), and gives it up when the last holder
/// lets go; all holders share one. No timer runs: the loop wakes when something is queued.
/// Threads: the main thread, which must be the one of the QApplication, while that exists.
ZOCLIENTQT_EXPORT shared_ptr<MainThreadDriver> DriveMainThread();

/// A back end that shows dialogs as modal windows above inParent or, without one, above the window that is
/// active. It drives the main-thread queue for as long as it lives. The parent may go before the back end
/// does; a dialog above it is then dismissed. So is one that runs when the application quits. An exception of
/// a dialog's handler closes the dialog and comes out of its RunModal. Without a QApplication a dialog that
/// closes by itself is waited for, any other one is dismissed. Threads: the main thread, which must be the
/// one of the QApplication. Let go of it there, too.
ZOCLIENTQT_EXPORT shared_ptr<ostui::BackEnd> CreateQtBackEnd(QWidget* inParent,
                                                             const IconSource& inIcons = IconSource());

enum class ColorScheme { kLight, kDark };

/// Gives the whole application our own look: a flat style on top of Qt's Fusion, and a palette. For hosts
/// that have no look of their own; without this call dialogs look as the host does. May be called again to
/// change the colours while windows are open. Main thread.
ZOCLIENTQT_EXPORT void UseModernStyle(ColorScheme inScheme);

}  // namespace ZOClientQt
