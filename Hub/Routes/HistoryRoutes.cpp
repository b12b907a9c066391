// The history of productions and sessions, newest first, page by page.
#include <charconv>
#include <map>

#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kPage = 50;
constexpr std::size_t kMaxPage = 500;

// Walks a line into the past. A session's own commits end where they left the shared line; what it has got
// from there since is the shared line from its base.
class HistoryWalk {
public:
    HistoryWalk(Call& ioCall, View const& inView, std::string const& inFrom)
        : mTransaction(ioCall.transaction), mLine(inView.line), mAt(inView.commit) {
        if (inFrom.empty())
            return;
        mAt = mTransaction.FindCommit(inFrom);
        if (!mAt || !Repository::HasCommit(mLine, *mAt))
            throw Failure(404, "not-found", "There is no such commit in this history.");
    }

    std::optional<CommitRecord> const& At() const { return mAt; }

    void Next() {
        bool const isOwn = mAt->line == mLine.id && mLine.id != mLine.production;
        auto before = mTransaction.FindCommit(mAt->parent);
        if (isOwn && before && before->line != mLine.id)
            before = mTransaction.FindCommit(mLine.baseCommit);
        mAt = std::move(before);
    }

private:
    Transaction& mTransaction;
    LineRecord const& mLine;
    std::optional<CommitRecord> mAt;
};

class CommitterNames {
public:
    explicit CommitterNames(Transaction& inTransaction) : mTransaction(inTransaction) {}

    std::string const& Of(std::string const& inUser) {
        auto const [at, isNew] = mNames.try_emplace(inUser);
        if (isNew)
            at->second = Find(inUser);
        return at->second;
    }

private:
    std::string Find(std::string const& inUser) {
        auto const user = mTransaction.FindUser(inUser);
        std::string const whole = user ? user->firstName + " " + user->lastName : std::string();
        std::string name(Trim(whole));
        return name.empty() ? inUser : name;
    }

    Transaction& mTransaction;
    std::map<std::string, std::string> mNames;
};

std::size_t PageSize(Request const& inRequest) {
    auto const asked = inRequest.query.find("count");
    if (asked == inRequest.query.end())
        return kPage;
    std::string const& text = asked->second;
    std::size_t count = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), count);
    if (error != std::errc() || end != text.data() + text.size() || count == 0 || count > kMaxPage)
        throw Failure(400, "count-invalid", "\"count\" is a number from 1 to 500.");
    return count;
}

void AppendVersion(std::string& ioTarget, CommitRecord const& inCommit, CommitterNames& ioNames,
                   std::string const& inLinePrefix) {
    ioTarget += '{';
    AppendMember(ioTarget, "commitId", inCommit.id);
    AppendMember(ioTarget, "timestamp", FormatTime(inCommit.time));
    AppendMember(ioTarget, "title", inCommit.title);
    ioTarget += ",\"committer\":{";
    AppendMember(ioTarget, "name", inCommit.committer);
    AppendMember(ioTarget, "displayName", ioNames.Of(inCommit.committer));
    ioTarget += "},\"links\":";
    { LinkWriter(ioTarget).Plain("self", inLinePrefix + "/at/" + inCommit.id); }
    ioTarget += '}';
}

std::string Query(Request const& inRequest, std::string const& inFrom) {
    std::string query;
    if (auto const count = inRequest.query.find("count"); count != inRequest.query.end())
        query += "?count=" + PercentEncode(count->second);
    if (!inFrom.empty())
        query += (query.empty() ? "?from=" : "&from=") + PercentEncode(inFrom);
    return query;
}

Response History(Call& ioCall) {
    View const view = OpenView(ioCall, false);
    if (view.IsTransaction())
        throw Failure(404, "not-found", "A transaction has no history of its own; its session has.");
    std::size_t const size = PageSize(ioCall.request);
    auto const asked = ioCall.request.query.find("from");
    std::string const from = asked == ioCall.request.query.end() ? std::string() : asked->second;
    std::string const prefix = DocumentWriter(ioCall.api, view).LivePrefix();
    HistoryWalk walk(ioCall, view, from);
    CommitterNames names(ioCall.transaction);
    std::string text = "{\"versions\":[";
    for (std::size_t i = 0; i < size && walk.At(); ++i, walk.Next()) {
        text += i == 0 ? "" : ",";
        AppendVersion(text, *walk.At(), names, prefix);
    }
    text += "],\"links\":";
    {
        LinkWriter links(text);
        links.Plain("self", prefix + "/history" + Query(ioCall.request, from));
        links.Plain("up", prefix);
        if (walk.At())
            links.Plain("next", prefix + "/history" + Query(ioCall.request, walk.At()->id));
    }
    text += '}';
    return JsonResponse(200, std::move(text));
}

}  // namespace

void AddHistoryRoutes(std::vector<Route>& ioRoutes) {
    ioRoutes.push_back({"GET", std::string(kApiPath) + "/p/{}/history", SignIn::Needed, History});
}

}  // namespace zohub
