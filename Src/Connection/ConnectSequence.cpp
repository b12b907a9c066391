// The steps of a connect.
#include "Connection/ConnectSequence.h"

#include "HLM/HLM.h"
#include "ostcore/logging/SyslogLogger.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"
#include "Relations.h"
#include "ZOClient/Library.h"
#include "zourl/http/URL.h"

namespace ZOCL {

using ostnet::http::CompletionFunction;
using ostnet::http::RequestOptions;

namespace {

constexpr std::int32_t kStatusUnauthorized = 401;
constexpr std::uint32_t kMaximumPort = 65535;

const char kFormUsername[] = "j_username";
const char kFormPassword[] = "j_password";

bool IsSuccess(const shared_ptr<ostnet::Response>& inResponse) {
    return inResponse && inResponse->IsSuccess();
}

int ResultOf(const shared_ptr<ostnet::Response>& inResponse) {
    return GetResultFromResponse(inResponse, kResultNoResponseObject);
}

void TellSyslogLogger(const ServiceDocument::Description& inServer) {
    if (inServer.syslogAddress.IsNull() || inServer.syslogPort == 0 || inServer.syslogPort > kMaximumPort) {
        return;
    }
    if (const auto logger = GetSyslogLogger()) {
        logger->SetServer(inServer.syslogAddress.str(), static_cast<std::uint16_t>(inServer.syslogPort));
    }
}

}  // namespace

ConnectSequence::ConnectSequence(const InterfaceRef<DataServer>& inServer, const Guid& inConnectID,
                                 Goal inGoal, const IZOCDataServer::ConnectCompletion& inCompletion)
    : mServer(inServer),
      mConnectID(inConnectID),
      mGoal(inGoal),
      mProcessor(inServer->Chain().global),
      mCompletion(inCompletion) {}

bool ConnectSequence::Start() {
    mInfo = AddNewConnectRequest(mConnectID, mServer);
    mServer->Chain().recoverableError->SetRetriesEnabled(false);
    const int result = FirstStep();
    if (result == kResultSuccess) {
        return true;
    }
    // The completion must not run on the caller's stack.
    const auto finish = [self = shared_from_this(), result] { self->Finish(result, nullptr); };
    if (mProcessor->PostFunction(finish, 0)) {
        return true;
    }
    RemoveConnectRequest(mConnectID);
    return false;
}

int ConnectSequence::FirstStep() {
    const DataServer::FilledTables filled = mServer->GetFilledTables();
    if (!filled.root) {
        return LoadServiceDocumentRoot();
    }
    return filled.loginLinks ? Login() : LoadServiceDocumentLinks();
}

int ConnectSequence::LoadServiceDocumentRoot() {
    return StartGET(mServer->GetDiscoveryURL(), &ConnectSequence::OnServiceDocumentRootLoaded);
}

void ConnectSequence::OnServiceDocumentRootLoaded(const ResponseRef& inResponse) {
    if (IsSuccess(inResponse)) {
        ServiceDocument document;
        if (!ParseServiceDocument(inResponse->payload, document)) {
            Finish(kResultFailure, inResponse);
            return;
        }
        mServer->TakeRootDocument(document);
        TellSyslogLogger(document.server);
        GoOn(LoadServiceDocumentLinks(), inResponse);
        return;
    }
    const bool isRefused = inResponse && inResponse->status == kStatusUnauthorized;
    if (isRefused && HLM::GetIsHeadless() && !mServer->GetToken().IsNull()) {
        mServer->DropToken();
        GoOn(LoadServiceDocumentRoot(), inResponse);
        return;
    }
    Finish(ResultOf(inResponse), inResponse);
}

int ConnectSequence::LoadServiceDocumentLinks() {
    const ImmutableString url = mServer->GetLink(kRelation_Discovery_V1);
    if (url.IsNull()) {
        return kResultFailure;
    }
    return StartGET(url, &ConnectSequence::OnServiceDocumentLinksLoaded);
}

void ConnectSequence::OnServiceDocumentLinksLoaded(const ResponseRef& inResponse) {
    if (IsSuccess(inResponse)) {
        ServiceDocument document;
        if (!ParseServiceDocument(inResponse->payload, document)) {
            Finish(kResultFailure, inResponse);
            return;
        }
        mServer->TakeLinksDocument(document);
    }
    if (mGoal == Goal::kDocumentsOnly) {
        if (IsSuccess(inResponse)) {
            FinishWithServer(inResponse);
        } else {
            Finish(ResultOf(inResponse), inResponse);
        }
        return;
    }
    if (mServer->VerifyAuthentication(inResponse)) {
        FinishWithServer(inResponse);
    } else if (!IsSuccess(inResponse)) {
        Finish(ResultOf(inResponse), inResponse);
    } else if (mHasPostedForm) {
        // The server took the login and still does not treat us as signed in.
        Finish(kResultFailure, inResponse);
    } else {
        GoOn(Login(), inResponse);
    }
}

int ConnectSequence::Login() {
    const ImmutableString link = mServer->GetLink(kRelation_System_Login);
    const ImmutableString url = link.IsNull() ? link : mServer->MakeRequestURL(link);
    if (!zourl::http::Create(url.view())) {
        return kResultNotStarted;
    }
    const ZOSCredentials credentials = mServer->GetCredentials();
    const ostnet::http::Form form{{ImmutableString(kFormUsername), credentials.username.str()},
                                  {ImmutableString(kFormPassword), credentials.password}};
    mHasPostedForm = true;
    const int result = StartRequest(&ConnectSequence::OnLoginAnswered,
                                    [&](const Guid& inRequestID, const CompletionFunction& inCompletion) {
                                        return mProcessor->POST(inRequestID, inCompletion, url,
                                                                ostnet::Headers(), form, RequestOptions());
                                    });
    if (result == kResultNotStarted) {
        mServer->Chain().authorization->SetAuthToken(ImmutableString());
    }
    return result;
}

void ConnectSequence::OnLoginAnswered(const ResponseRef& inResponse) {
    if (mServer->TakeTokenFromResponse(inResponse)) {
        GoOn(LoadServiceDocumentLinks(), inResponse);
    } else {
        Finish(ResultOf(inResponse), inResponse);
    }
}

int ConnectSequence::StartGET(const ImmutableString& inURL, Step inNext) {
    const ImmutableString url = mServer->MakeRequestURL(inURL);
    if (!zourl::http::Create(url.view())) {
        return kResultNotStarted;
    }
    ostnet::Headers headers;
    const ImmutableString token = mServer->GetToken();
    if (!token.IsNull()) {
        headers.emplace(ostnet::kHEADER_COOKIE, token);
    }
    return StartRequest(inNext, [&](const Guid& inRequestID, const CompletionFunction& inCompletion) {
        return mProcessor->GET(inRequestID, inCompletion, url, headers, RequestOptions());
    });
}

int ConnectSequence::StartRequest(Step inNext,
                                  const function<bool(const Guid&, const CompletionFunction&)>& inStart) {
    if (mInfo->IsCancelled()) {
        return kResultRequestCancelled;
    }
    const Guid requestID = Guid::CreateUnique();
    mInfo->SetCurrentRequest(requestID, mProcessor);
    const bool started =
        inStart(requestID, [self = shared_from_this(), inNext](const Guid&, const ResponseRef& inResponse) {
            if (self->mInfo->IsCancelled()) {
                self->Finish(kResultRequestCancelled, inResponse);
            } else {
                (self.get()->*inNext)(inResponse);
            }
        });
    if (!started) {
        return kResultNotStarted;
    }
    // A cancel may have come when the request was known to the table and not yet to the network.
    if (mInfo->IsCancelled()) {
        mProcessor->TryToCancelRequest(requestID);
    }
    return kResultSuccess;
}

void ConnectSequence::GoOn(int inStepResult, const ResponseRef& inResponse) {
    if (inStepResult != kResultSuccess) {
        Finish(inStepResult, inResponse);
    }
}

void ConnectSequence::Finish(int inResult, const ResponseRef& inResponse) {
    Complete(nullptr, inResult, inResponse);
}

void ConnectSequence::FinishWithServer(const ResponseRef& inResponse) {
    Complete(mServer, kResultSuccess, inResponse);
}

void ConnectSequence::Complete(const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                               const ResponseRef& inResponse) {
    if (!RemoveConnectRequest(mConnectID)) {
        return;
    }
    IZOCDataServer::ConnectCompletion completion;
    completion.swap(mCompletion);
    completion(mConnectID, inServer, inResult, inResponse);
}

}  // namespace ZOCL
