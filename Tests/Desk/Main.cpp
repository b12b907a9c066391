// The test program is a Qt application without a screen.
#include <gmock/gmock.h>

#include <QtWidgets/QApplication>

#include "ostcore/threads/MainThread.h"
#include "ZOClientQt/QtBackEnd.h"

int main(int inCount, char** inArguments) {
    if (!qEnvironmentVariableIsSet("QT_QPA_PLATFORM")) {
        qputenv("QT_QPA_PLATFORM", "offscreen");
    }
    testing::InitGoogleMock(&inCount, inArguments);
    QApplication application(inCount, inArguments);
    QApplication::setQuitOnLastWindowClosed(false);
    ZOClientQt::UseModernStyle(ZOClientQt::ColorScheme::kLight);
    ostcore::threads::SetMainThread();
    return RUN_ALL_TESTS();
}
