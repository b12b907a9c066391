// Sessions and transactions made from bodies, and the routes that a test answers.
#pragma once

#include <map>

#include "Model/Production.h"
#include "ModelTest.h"

namespace ZOCL {

class SessionTest : public ModelTest {
protected:
    using Route = std::function<ScriptedAnswer(const RecordedRequest&)>;

    static std::string Lists(const std::string& inRoot) {
        return LinkTo(kRelation_Enclosures, inRoot + "/enclosures") + "," +
               LinkTo(kRelation_Assets, inRoot + "/assets");
    }
    static std::string SessionBody(const std::string& inCommit = "c5") {
        return "{'zo:sessionId':'s1','zo:parentProductionId':'p1','zo:commitId':'" + inCommit +
               "','zo:owner':'u1','properties':{'name':'N','description':'D','kept':1},'links':[" +
               Lists("/s1") + ",{'rel':'self','href':'" + HubURL("/s1").str() + "'},{'rel':'up','href':'" +
               HubURL("/p1").str() + "'}," + LinkTo(kRelation_Sessions_Session_Push, "/s1/push") + "," +
               LinkTo(kRelation_Sessions_Session_Pull, "/s1/pull") + "," +
               LinkTo(kRelation_Sessions_Session_OutgoingChanges, "/s1/out") + "," +
               LinkTo(kRelation_Sessions_Session_IncomingChanges, "/s1/in") + "," +
               LinkTo(kRelation_Transactions, "/s1/transactions") + "]}";
    }
    static std::string TransactionBody(const std::string& inID, const std::string& inMetadata) {
        const std::string root = "/" + inID;
        return "{'zo:sessionId':'s1','zo:transactionId':'" + inID +
               "','zo:parentProductionId':'s1','metadata':" + inMetadata +
               ",'properties':{'name':'N','kept':1},'links':[" + Lists(root) + ",{'rel':'self','href':'" +
               HubURL(root).str() + "'},{'rel':'edit','href':'" + HubURL(root).str() +
               "'},{'rel':'up','href':'" + HubURL("/s1").str() + "'}," +
               LinkTo(kRelation_Assets_Asset_Create, root + "/new-asset") + "," +
               LinkTo(kRelation_Transactions_Transaction_Commit, root + "/commit") + "," +
               LinkTo(kRelation_Transactions_Transaction_Rollback, root + "/rollback") + "]}";
    }
    static std::string ListItem(const std::string& inID, const std::string& inSession,
                                const std::string& inMetadata) {
        return "{'zo:sessionId':'" + inSession + "','zo:transactionId':'" + inID +
               "','zo:owner':'u1','zo:baseCommitId':'c5','metadata':" + inMetadata +
               ",'links':[{'rel':'self','href':'" + HubURL("/" + inID).str() + "'}]}";
    }
    static std::string ListBody(const std::string& inItems) {
        return "{'links':[{'rel':'create','href':'" + HubURL("/s1/new-transaction").str() +
               "'}],'transactions':[" + inItems + "]}";
    }
    InterfaceRef<Production> MakeSession() { return Make<Production>(SessionBody()); }

    /// From here on requests are answered by "VERB /path"; what has no route gets 404.
    void On(const std::string& inLine, Route inRoute) {
        {
            std::lock_guard<std::mutex> lock(mRouteMutex);
            mRoutes[inLine] = std::move(inRoute);
        }
        net->SetHandler([this](const RecordedRequest& inRequest) {
            Route route;
            {
                std::lock_guard<std::mutex> lock(mRouteMutex);
                const auto found = mRoutes.find(inRequest.verb + " " + inRequest.Path());
                route = found == mRoutes.end() ? Route() : found->second;
            }
            return route ? route(inRequest) : ScriptedAnswer::Status(404);
        });
    }
    void On(const std::string& inLine, const ScriptedAnswer& inAnswer) {
        On(inLine, [inAnswer](const RecordedRequest&) { return inAnswer; });
    }
    std::size_t CountOf(const std::string& inVerb, const std::string& inPath) const {
        std::size_t count = 0;
        for (const RecordedRequest& request : net->Requests()) {
            count += request.verb == inVerb && request.Path() == inPath ? 1 : 0;
        }
        return count;
    }
    RecordedRequest Last(const std::string& inVerb, const std::string& inPath) const {
        RecordedRequest last;
        for (const RecordedRequest& request : net->Requests()) {
            if (request.verb == inVerb && request.Path() == inPath) {
                last = request;
            }
        }
        return last;
    }

private:
    std::mutex mRouteMutex;
    std::map<std::string, Route> mRoutes;
};

}  // namespace ZOCL
