// Reports on servers: held per server, asked for anew whenever somebody looks.
#include "ZOClient/ServerFeatureReport.h"

#include <map>

#include "Connection/DataServer.h"
#include "Connection/ServerURLs.h"
#include "Frame/MediaProtocolVersions.h"
#include "Frame/Station.h"
#include "ostcore/threads/RecursiveMutex.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;
using ReportRef = shared_ptr<ServerFeatureReport const>;

namespace {

struct Reports {
    RecursiveMutex mutex;
    std::map<ImmutableString, ReportRef> byURL ZO_GUARDED_BY(mutex);
};

Reports& TheReports() {
    static Reports& reports = *new Reports;
    return reports;
}

ReportRef MakeReport(const InterfaceRef<IZOCDataServer>& inServer, bool inSecure) {
    const auto report = boost::make_shared<ServerFeatureReport>();
    if (const auto server = RFL::QueryInterface<DataServer>(inServer)) {
        report->serverID = server->GetServerID();
    }
    report->name = inServer->GetServerName();
    report->version = inServer->GetServerVersion();
    report->secure = inSecure;
    report->renderProtocolVersions = UsableRenderProtocolVersions(inServer->GetRenderProtocolVersions());
    return report;
}

void NotifyServerFeatureReport(const ImmutableString& inURL, const ReportRef& inReport) {
    {
        Reports& reports = TheReports();
        ScopedLock lock(reports.mutex, "ZOCL::NotifyServerFeatureReport");
        reports.byURL[inURL] = inReport;
    }
    ServerFeatureReportUpdatedMessage message;
    message.url = inURL;
    message.report = inReport;
    PostLibraryMessage(message);
}

void AskServer(const ImmutableString& inKey, const ImmutableString& inServer, bool inSecure) {
    IZOCDataServer::CreateUnauthenticatedDataServer(
        Guid::CreateUnique(), inServer,
        [inKey, inSecure](int inResult, const InterfaceRef<IZOCDataServer>& inAnswered) {
            if (inResult >= 0 && inAnswered) {
                NotifyServerFeatureReport(inKey, MakeReport(inAnswered, inSecure));
            }
        },
        inSecure);
}

}  // namespace

bool GetServerFeatureReport(const ImmutableString& inServerURL, ReportRef& outReport) {
    const ImmutableString key(WithoutScheme(inServerURL.view()));
    bool isHeld = false;
    {
        Reports& reports = TheReports();
        ScopedLock lock(reports.mutex, "ZOCL::GetServerFeatureReport");
        const auto found = reports.byURL.find(key);
        isHeld = found != reports.byURL.end();
        if (isHeld) {
            outReport = found->second;
        }
    }
    if (key != inServerURL) {
        AskServer(key, inServerURL, inServerURL.view().substr(0, 8) == "https://");
        return isHeld;
    }
    AskServer(key, inServerURL, true);
    AskServer(key, inServerURL, false);
    return isHeld;
}

bool ParseWhitelistPayload(const shared_ptr<RecycledMemory const>& inPayload,
                           std::set<ImmutableString>& outNames) {
    if (!inPayload) {
        return false;
    }
    try {
        const auto root = ostcore::serialization::JSONParse(inPayload);
        const auto list = ostcore::serialization::JSONView(root).Find("whitelist");
        if (!list.IsArray()) {
            return false;
        }
        std::set<ImmutableString> names;
        list.ForEachElement(
            [&](ostcore::serialization::JSONView inName) { names.insert(inName.AsInternedString()); });
        outNames.swap(names);
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

}  // namespace ZOCL
