// The hub of the endings: a few documents, and the memory of what was written.
#include "EndingsTest.h"
#include "MergeTest.h"

namespace ZOCL {

namespace {

constexpr const char* kPacketName = "a_xmp";

std::string SelfLinks(const std::string& inPath) {
    return LinkTo("self", inPath) + "," + LinkTo("edit", inPath);
}

/// The production's packet of metadata, as one state has it.
std::string Enclosure(const std::string& inRoot) {
    const std::string place = inRoot + "/x";
    return std::string("{'name':'") + kPacketName + "','zo:enclosureContentId':'" + place + "','links':[" +
           LinkTo(kRelation_Enclosures_Enclosure, place) + "," + SelfLinks(place) + "]}";
}

ScriptedAnswer Packet(const std::string& inDate) {
    return ScriptedAnswer::Body(PacketText("<xmp:MetadataDate>" + inDate + "</xmp:MetadataDate>"),
                                "application/xml");
}

std::string Lists(const std::string& inRoot) {
    return LinkTo(kRelation_Enclosures, inRoot + "/enclosures") + "," +
           LinkTo(kRelation_Assets, inRoot + "/assets");
}

std::string AssetConflict(const std::string& inID) {
    const std::string place = "/asset/" + inID;
    return "{'zo:assetId':'" + inID + "','zo:differenceType':'UPDATED','zo:name':'" + inID +
           "','zo:conflictsWithContentId':'x','links':[" + LinkTo("self", place) + "," +
           LinkTo("accept-theirs", "/theirs" + place) + "," + LinkTo("accept-yours", "/mine" + place) + "]}";
}

bool EndsIn(const std::string& inText, const std::string& inEnd) {
    return inText.size() >= inEnd.size() &&
           inText.compare(inText.size() - inEnd.size(), inEnd.size(), inEnd) == 0;
}

}  // namespace

ScriptedAnswer EndingsHub::Answer(const RecordedRequest& inRequest) {
    std::lock_guard<std::mutex> lock(mMutex);
    if (mIsDown) {
        return ScriptedAnswer::NoResponse();
    }
    return inRequest.verb == "GET" ? Read(inRequest.Path()) : Write(inRequest.verb + " " + inRequest.Path());
}

ScriptedAnswer EndingsHub::Session() const {
    return JSONAnswer("{'zo:sessionId':'s1','zo:parentProductionId':'p1','zo:commitId':'" + CommitId() +
                          "','zo:owner':'u1','properties':{'name':'N'},'links':[" + Lists("/s1") + "," +
                          LinkTo("self", "/s1") + "," + LinkTo("up", "/p1") + "," +
                          LinkTo(kRelation_Sessions_Session_Push, "/s1/push") + "," +
                          LinkTo(kRelation_Sessions_Session_Pull, "/s1/pull") + "," +
                          LinkTo(kRelation_Sessions_Session_OutgoingChanges, "/s1/out") + "," +
                          LinkTo(kRelation_Transactions, "/s1/transactions") + "," +
                          LinkTo(kRelation_Productions_Production_History, "/h") + "]}",
                      "\"" + CommitId() + "\"");
}

ScriptedAnswer EndingsHub::Differences() const {
    std::string assets;
    for (const char* const id : {"a", "b"}) {
        if (mIsPulled && mSettled.count(id) == 0) {
            assets += (assets.empty() ? "" : ",") + AssetConflict(id);
        }
    }
    const std::string packet = std::string("{'zo:name':'") + kPacketName +
                               "','zo:differenceType':'UPDATED','zo:conflictsWithContentId':'x',"
                               "'zo:baseCommitId':'c1','links':[" +
                               LinkTo("accept-theirs", "/theirs/asset/x") + "," +
                               LinkTo("accept-yours", "/mine/asset/x") + "]}";
    return JSONAnswer("{'info':{'leftSideCommitId':'c8','rightSideCommitId':'" + CommitId() +
                          "'},'differences':{'assets':[" + assets + "],'enclosures':[" +
                          (mIsPulled && !mIsMerged && mSettled.count("x") == 0 ? packet : "") + "]}}",
                      "\"d" + CommitId() + "\"");
}

ScriptedAnswer EndingsHub::Read(const std::string& inPath) const {
    if (inPath == "/s1") {
        return Session();
    }
    if (inPath == "/s1/out") {
        return Differences();
    }
    if (inPath == "/s1/transactions") {
        return JSONAnswer("{'links':[{'rel':'create','href':'" + HubURL("/s1/new-transaction").str() +
                          "'}],'transactions':[]}");
    }
    if (inPath == "/h") {
        return JSONAnswer("{'versions':[{'commitId':'c6'},{'commitId':'c5'}]}");
    }
    if (EndsIn(inPath, "/enclosures")) {
        const std::string root = inPath.substr(0, inPath.rfind('/'));
        return JSONAnswer("{'enclosures':[" + Enclosure(root) + "],'links':[" +
                          LinkTo("create", root + "/new-enclosure") + "]}");
    }
    if (EndsIn(inPath, "/assets")) {
        return JSONAnswer("{'assets':[{'zo:assetId':'a','properties':{'name':'Alpha'},'links':[]}]}");
    }
    if (EndsIn(inPath, "/x")) {
        return Packet(inPath == "/p1/c1/x" ? "2024-01" : inPath == "/p1/c8/x" ? "2024-02" : "2024-03");
    }
    if (inPath.compare(0, 3, "/p1") == 0) {
        return JSONAnswer("{'zo:productionId':'p1','zo:commitId':'c8','links':[" + Lists(inPath) + "," +
                          LinkTo("self", "/p1") + "," + LinkTo("latest-version", "/p1/latest") + "]}");
    }
    return ScriptedAnswer::Status(404);
}

ScriptedAnswer EndingsHub::Write(const std::string& inLine) {
    const std::string path = inLine.substr(inLine.find('/'));
    if (inLine == "POST /s1/new-transaction") {
        mIsOpen = true;
        return JSONAnswer(
            "{'zo:sessionId':'s1','zo:transactionId':'t1','zo:parentProductionId':'s1',"
            "'metadata':{'transactionType':'edit'},'properties':{'name':'N'},'links':[" +
            Lists("/t1") + "," + SelfLinks("/t1") + "," + LinkTo("up", "/s1") + "," +
            LinkTo(kRelation_Transactions_Transaction_Commit, "/t1/commit") + "," +
            LinkTo(kRelation_Transactions_Transaction_Rollback, "/t1/rollback") + "]}");
    }
    if (path == "/t1/rollback") {
        mIsOpen = false;
        return ScriptedAnswer::Status(204);
    }
    if (EndsIn(path, "/new-enclosure")) {
        return JSONAnswer(Enclosure("/s1/note"));
    }
    if (EndsIn(path, "/x") && path.find("/asset/") == std::string::npos) {
        return JSONAnswer(Enclosure(path.substr(0, path.rfind('/'))));
    }
    const bool isCommit = path == "/t1/commit";
    const bool isKnown =
        isCommit || path == "/s1/pull" || path == "/s1/push" || path.find("/asset/") != std::string::npos;
    if (!isKnown) {
        return ScriptedAnswer::Status(404);
    }
    mIsOpen = mIsOpen && !isCommit;
    mIsMerged = mIsMerged || isCommit;
    mIsPulled = mIsPulled || path == "/s1/pull";
    if (path.find("/asset/") != std::string::npos) {
        mSettled.insert(path.substr(path.rfind('/') + 1));
    }
    ++mCommit;
    return Session();
}

}  // namespace ZOCL
