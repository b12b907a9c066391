// Start and end, in the order that matters.
#include "Host.h"

#include "HLM/HLM.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/config/ZString.h"
#include "ostui/BackEnd.h"
#include "RFL/Registry.h"
#include "ZOClient/Library.h"

namespace Desk {

Host::Host(const StartOptions& inOptions) {
    HLM::SetIsHeadless(false);
    ostcore::config::SetClientName("zo-desk");
    ostcore::config::SetClientBuildNumber(DESK_VERSION);
    ZOCL::Initialize();
    // Completions and messages reach the main thread through Qt's event loop from here on.
    mDriver = ZOClientQt::DriveMainThread();
    mWindow = std::make_unique<MainWindow>(inOptions);
    ostui::SetBackEnd(ZOClientQt::CreateQtBackEnd(mWindow.get(), ZOCL::GetGenericButtonImageSupply()));
    mWindow->show();
    mWindow->Start();
}

Host::~Host() {
    ostui::SetBackEnd(nullptr);
    mWindow.reset();
    ZOCL::IZOCDataServer::Terminate(false);
    ZOCL::Shutdown();
    mDriver.reset();
    RFL::CloseRegistry();
}

}  // namespace Desk
