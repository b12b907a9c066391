// Start and end of the library: puts the floors together and takes them down in an order in which nothing is
// used after it has gone.
#include "Collaboration/CollaborationResources.h"
#include "Connection/AutoAuthentication.h"
#include "Connection/ContentCache.h"
#include "Dialogs/CloseModalDialogs.h"
#include "Frame/Station.h"
#include "Frame/SyslogLogger.h"
#include "Model/ModelResourceFactory.h"
#include "OrvaneXMPCompareAndMerge/Library.h"
#include "ostcore/threads/MainThread.h"
#include "ostnet/http/NetworkProcessor.h"
#include "OutageMinder.h"
#include "PollCancellation.h"
#include "ResourceFactory.h"
#include "Resources/PollingResourceMonitor.h"
#include "RFL/Registry.h"
#include "ZOClient/Library.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {

namespace {

/// Calls of Initialize that no Shutdown has matched yet. Main thread only.
std::int32_t gInitCount = 0;

}  // namespace

void Initialize() {
    if (gInitCount++ != 0) {
        return;
    }
    ostcore::threads::SetMainThread();
    ostnet::Startup();
    RegisterStation();
    OrvaneXMPCompareAndMerge::StartLibrary();
    GetCompositionRoot().resources = GetModelResourceFactory();
    GetCompositionRoot().collaboration = GetCollaborationFactory();
    GetCompositionRoot().outages = GetOutageMinder();
    GetCompositionRoot().polls = GetPollCancellation();
}

void Shutdown() {
    if (gInitCount-- != 1) {
        return;
    }
    StopClosingModalDialogs();
    StopAutoAuthentication();
    ResetSyslogLogger();
    SetCurrentZOSandbox(nullptr);
    OrvaneXMPCompareAndMerge::EndLibrary();
    // Before the network goes, which the polls use.
    PollingResourceMonitor::CancelAllOutstandingPolls(true);
    // The network's last completions still make resources, so the factory goes after it.
    ostnet::Shutdown();
    GetCompositionRoot().resources = nullptr;
    GetCompositionRoot().collaboration = nullptr;
    GetCompositionRoot().outages = nullptr;
    GetCompositionRoot().polls = nullptr;
    // After the network, whose last completions may still have stored something.
    ReleaseContentCache();
    // Last, since whatever ran until here may have remembered something.
    RFL::CloseRegistry();
}

}  // namespace ZOCL
