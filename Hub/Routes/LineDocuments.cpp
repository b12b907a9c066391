// The documents of lines: productions and templates, sessions, transactions; and their items in lists.
#include <algorithm>

#include "Base/Text.h"
#include "Http/Message.h"
#include "Routes/DifferenceLinks.h"
#include "Routes/Documents.h"

namespace zohub {

void AppendRaw(std::string& ioTarget, std::string_view inKey, std::string_view inJson) {
    if (ioTarget.back() != '{')
        ioTarget += ',';
    ioTarget += '"';
    ioTarget += inKey;
    ioTarget += "\":";
    ioTarget += inJson;
}

void BeginLinks(std::string& ioTarget) {
    AppendRaw(ioTarget, "links", "");
}

std::string DocumentWriter::ProductionTag() const {
    LineRecord const& line = mView.line;
    return TagOf(line.kind, mView.commit.id + "\n" + (mView.isPinned ? "" : line.baseCommit));
}

std::string DocumentWriter::ParentPrefix() const {
    return mApi + "/p/" + PercentEncode(mView.line.parent);
}

void DocumentWriter::AppendIdentity(std::string& ioTarget) const {
    LineRecord const& line = mView.line;
    bool const isOnAnother = mView.IsSession() || mView.IsTransaction();
    if (mView.IsTransaction()) {
        AppendMember(ioTarget, "zo:sessionId", line.parent);
        AppendMember(ioTarget, "zo:transactionId", line.id);
    } else {
        AppendMember(ioTarget, mView.IsSession() ? "zo:sessionId" : "zo:productionId", line.id);
    }
    if (isOnAnother)
        AppendMember(ioTarget, "zo:parentProductionId", line.parent);
    AppendMember(ioTarget, "zo:commitId", mView.commit.id);
    if (isOnAnother && !mView.isPinned)
        AppendMember(ioTarget, "zo:baseCommitId", line.baseCommit);
    AppendMember(ioTarget, "zo:owner", line.owner);
    AppendMember(ioTarget, "created", FormatTime(line.created));
    // A new line may begin with a commit that is older than itself.
    AppendMember(ioTarget, "modified", FormatTime(std::max(line.created, mView.commit.time)));
    if (!line.metadata.empty() && !mView.IsSession())
        AppendRaw(ioTarget, "metadata", line.metadata);
    AppendRaw(ioTarget, "properties", mView.tree.properties);
}

void DocumentWriter::WriteContentLinks(LinkWriter& ioLinks) const {
    ioLinks.Named("/assets", mPrefix + "/a");
    ioLinks.Named("/assets#full", mPrefix + "/full");
    ioLinks.Named("/assets/asset#byId", mLivePrefix + "/at/{commitId}/a/{assetId}");
    ioLinks.Named("/enclosures", mPrefix + "/e");
    if (IsWritable()) {
        ioLinks.Plain("edit", mLivePrefix);
        ioLinks.Named("/assets/asset#create", mLivePrefix + "/a");
    }
}

void DocumentWriter::WriteProductionLinks(LinkWriter& ioLinks) const {
    bool const isTemplate = mView.line.kind == kLineTemplate;
    ioLinks.Plain("up", mApi + (isTemplate ? "/templates" : "/p"));
    WriteContentLinks(ioLinks);
    if (mView.isPinned)
        return;
    ioLinks.Named(isTemplate ? "/productions/production#create-production" : "/productions/production#copy",
                  mLivePrefix + "/copy");
    ioLinks.Named("/productions/production#history", mLivePrefix + "/history");
    if (mView.mayWrite)
        ioLinks.Named("/sessions", mLivePrefix + "/sessions");
}

void DocumentWriter::WriteSessionLinks(LinkWriter& ioLinks) const {
    ioLinks.Plain("up", ParentPrefix());
    WriteContentLinks(ioLinks);
    if (mView.isPinned)
        return;
    ioLinks.Named("/sessions/session#copy", mLivePrefix + "/copy");
    ioLinks.Named("/productions/production#history", mLivePrefix + "/history");
    ioLinks.Named("/sessions/session#outgoingChanges", mLivePrefix + kOutgoingTail);
    ioLinks.Named("/sessions/session#incomingChanges", mLivePrefix + kIncomingTail);
    ioLinks.Named("/transactions", mLivePrefix + "/transactions");
    if (!mView.mayManage)
        return;
    ioLinks.Plain("delete", mLivePrefix);
    ioLinks.Named("/sessions/session#push", mLivePrefix + "/push");
    ioLinks.Named("/sessions/session#pull", mLivePrefix + "/pull");
}

void DocumentWriter::WriteTransactionLinks(LinkWriter& ioLinks) const {
    ioLinks.Plain("up", ParentPrefix());
    WriteContentLinks(ioLinks);
    if (!IsWritable())
        return;
    ioLinks.Named("/transactions/transaction#commit", mLivePrefix + "/commit");
    ioLinks.Named("/transactions/transaction#rollback", mLivePrefix + "/rollback");
    ioLinks.Named("/bulk#create", mLivePrefix + "/bulk/create");
    ioLinks.Named("/bulk#edit", mLivePrefix + "/bulk/edit");
    ioLinks.Named("/bulk#delete", mLivePrefix + "/bulk/delete");
}

void DocumentWriter::AppendLineLinks(std::string& ioTarget) const {
    BeginLinks(ioTarget);
    LinkWriter links(ioTarget);
    links.Plain("self", mPrefix);
    links.Plain("latest-version", mLivePrefix);
    if (mView.IsSession())
        WriteSessionLinks(links);
    else if (mView.IsTransaction())
        WriteTransactionLinks(links);
    else
        WriteProductionLinks(links);
}

std::string DocumentWriter::Production() const {
    std::string text = "{";
    AppendIdentity(text);
    AppendLineLinks(text);
    text += '}';
    return text;
}

void DocumentWriter::AppendProductionItem(std::string& ioTarget, Micros inLastModifiedOfAll) const {
    ioTarget += '{';
    AppendIdentity(ioTarget);
    AppendMember(ioTarget, "zo:lastModified", FormatTime(mView.line.modified));
    AppendMember(ioTarget, "zo:lastModifiedOfAllSessions", FormatTime(inLastModifiedOfAll));
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        links.Plain("self", mLivePrefix);
        links.Plain("latest-version", mLivePrefix);
        if (mView.line.kind == kLineTemplate)
            links.Named("/productions/production#create-production", mLivePrefix + "/copy");
    }
    ioTarget += '}';
}

namespace {

void AppendItemEnd(std::string& ioTarget, std::string const& inApi, LineRecord const& inLine) {
    BeginLinks(ioTarget);
    { LinkWriter(ioTarget).Plain("self", inApi + "/p/" + PercentEncode(inLine.id)); }
    ioTarget += '}';
}

void AppendItemDates(std::string& ioTarget, LineRecord const& inLine) {
    AppendMember(ioTarget, "zo:owner", inLine.owner);
    AppendMember(ioTarget, "zo:baseCommitId", inLine.baseCommit);
    AppendMember(ioTarget, "created", FormatTime(inLine.created));
    AppendMember(ioTarget, "modified", FormatTime(inLine.modified));
}

}  // namespace

void AppendSessionItem(std::string& ioTarget, std::string const& inApi, LineRecord const& inLine) {
    ioTarget += '{';
    AppendMember(ioTarget, "zo:sessionId", inLine.id);
    AppendItemDates(ioTarget, inLine);
    AppendMember(ioTarget, "zo:lastModified", FormatTime(inLine.modified));
    AppendRaw(ioTarget, "properties", inLine.metadata);
    AppendItemEnd(ioTarget, inApi, inLine);
}

void AppendTransactionItem(std::string& ioTarget, std::string const& inApi, LineRecord const& inLine) {
    ioTarget += '{';
    AppendMember(ioTarget, "zo:sessionId", inLine.parent);
    AppendMember(ioTarget, "zo:transactionId", inLine.id);
    AppendItemDates(ioTarget, inLine);
    AppendRaw(ioTarget, "metadata", inLine.metadata);
    AppendItemEnd(ioTarget, inApi, inLine);
}

}  // namespace zohub
