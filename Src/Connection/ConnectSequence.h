// The requests that lead from a server's address to a usable data server.
#pragma once

#include "Connection/ConnectRequests.h"
#include "Connection/DataServer.h"

namespace ZOCL {

/// One run through discovery document, links document and login form.
///
/// The requests go to the network directly: nothing is retried, parked or cached. Each goes to the origin of
/// the discovery URL; redirects are not followed. Whatever a server sends, the run ends: the form is posted
/// at most once, and the discovery document is asked for again only when a token was dropped for it.
///
/// Threads: Start on any; what follows runs on workers, one request after the other. The completion runs
/// once, on a worker with no lock held.
class ConnectSequence : public boost::enable_shared_from_this<ConnectSequence> {
public:
    enum class Goal { kSignedIn, kDocumentsOnly };

    ConnectSequence(const InterfaceRef<DataServer>& inServer, const Guid& inConnectID, Goal inGoal,
                    const IZOCDataServer::ConnectCompletion& inCompletion);

    /// False: nothing was started and the completion will not run.
    bool Start();

private:
    using ResponseRef = shared_ptr<ostnet::Response>;
    using Step = void (ConnectSequence::*)(const ResponseRef& inResponse);

    /// Each step gives kResultSuccess when its request is under way, else the result to end with.
    int FirstStep();
    int LoadServiceDocumentRoot();
    int LoadServiceDocumentLinks();
    int Login();
    void OnServiceDocumentRootLoaded(const ResponseRef& inResponse);
    void OnServiceDocumentLinksLoaded(const ResponseRef& inResponse);
    void OnLoginAnswered(const ResponseRef& inResponse);

    int StartGET(const ImmutableString& inURL, Step inNext);
    /// Makes the request known to the connect request, so that it can be cancelled, and starts it.
    int StartRequest(Step inNext,
                     const function<bool(const Guid&, const ostnet::http::CompletionFunction&)>& inStart);
    void GoOn(int inStepResult, const ResponseRef& inResponse);
    void Finish(int inResult, const ResponseRef& inResponse);
    void FinishWithServer(const ResponseRef& inResponse);
    void Complete(const InterfaceRef<IZOCDataServer>& inServer, int inResult, const ResponseRef& inResponse);

    const InterfaceRef<DataServer> mServer;
    const Guid mConnectID;
    const Goal mGoal;
    const shared_ptr<ostnet::http::RequestProcessor> mProcessor;
    IZOCDataServer::ConnectCompletion mCompletion;
    shared_ptr<AsyncConnectRequestInfo> mInfo;
    bool mHasPostedForm = false;
};

}  // namespace ZOCL
