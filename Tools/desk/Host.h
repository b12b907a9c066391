// The library in a desktop application, from its start to its end.
#pragma once

#include <memory>

#include "MainWindow.h"
#include "ZOClientQt/QtBackEnd.h"

namespace Desk {

/// Starts the library as a host with windows does, and shows the main window. What is under way when it goes
/// is cancelled: no window, request or thread of the library is left. Needs a QApplication; main thread only.
class Host {
public:
    explicit Host(const StartOptions& inOptions);
    ~Host();
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    MainWindow& GetWindow() { return *mWindow; }

private:
    std::unique_ptr<MainWindow> mWindow;
    ZOCL::shared_ptr<ZOClientQt::MainThreadDriver> mDriver;
};

}  // namespace Desk
