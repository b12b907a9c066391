// watch: tells of commits and transactions as they come, until it has told enough or is interrupted.
#include <map>
#include <memory>
#include <utility>

#include "DisplayWidth.h"
#include "Numbers.h"
#include "ostcore/threads/MainThread.h"
#include "Verbs.h"
#include "Versions.h"
#include "ZOClient/ServerResourceChangeNotifier.h"

namespace zo {
namespace {

using ZOCL::InterfaceRef;

constexpr std::uint64_t kUsualInterval = 2000;
constexpr std::uint64_t kLongestInterval = 3600000;
constexpr std::uint64_t kMaximum = 1000000000;
// As good as for ever: longer than any process runs.
constexpr std::uint64_t kEndlessSeconds = 10ull * 365 * 24 * 3600;
constexpr std::uint64_t kMostCommitsAtOnce = 1000;

// One resource that is looked at again and again; changes are noted on the main thread.
class Watched {
public:
    Watched(const InterfaceRef<ZOCL::IZOCServerResource>& inResource, std::uint32_t inInterval)
        : mChanged(std::make_shared<bool>(false)) {
        if (!inResource) {
            return;
        }
        const auto changed = mChanged;
        mNotifier = inResource->SubscribeToChanges(
            [changed](const InterfaceRef<ZOCL::IZOCServerResource>&) {
                ostcore::threads::AsyncCallFromMainThread([changed] { *changed = true; });
            },
            false, inInterval);
    }
    ~Watched() {
        if (mNotifier) {
            mNotifier->StopNotifications();
        }
    }
    Watched(const Watched&) = delete;
    Watched& operator=(const Watched&) = delete;

    bool HasChanged() const { return *mChanged; }
    bool TakeChange() { return std::exchange(*mChanged, false); }

private:
    // Shared with calls that are still on their way to the main thread.
    const std::shared_ptr<bool> mChanged;
    boost::shared_ptr<ZOCL::ServerResourceChangeNotifier> mNotifier;
};

// The commits of one line.
class WatchedLine {
public:
    WatchedLine(Context& ioContext, const char* inName, const LoadedProduction& inLine,
                std::uint32_t inInterval)
        : mContext(ioContext),
          mName(inName),
          mLine(inLine),
          mWatched(RFL::QueryInterface<ZOCL::IZOCServerResource>(inLine.production), inInterval),
          mLastCommit(inLine.commit) {}

    bool HasChanged() const { return mWatched.HasChanged(); }

    /// The number of commits that were told.
    std::uint64_t TellNews() {
        if (!mWatched.TakeChange()) {
            return 0;
        }
        const std::vector<Version> news = LoadVersions(mContext, mLine, kMostCommitsAtOnce, mLastCommit);
        for (auto version = news.rbegin(); version != news.rend(); ++version) {
            Json json = VersionJson("change", *version);
            mContext.Out().Record(json.Set("what", "commit").Set("line", mName));
            const std::string origin = version->Origin();
            mContext.Out().Line(ForTerminal(ShortTime(version->time) + "  " + mName + "  " +
                                            version->committerName + ": " + version->message +
                                            (origin.empty() ? "" : " (" + origin + ")")));
        }
        if (!news.empty()) {
            mLastCommit = news.front().commit;
        }
        return news.size();
    }

private:
    Context& mContext;
    const char* const mName;
    const LoadedProduction mLine;
    Watched mWatched;
    std::string mLastCommit;
};

// The open transactions of the session.
class WatchedTransactions {
public:
    using Entry = ZOCL::IZOCTransactionList::Entry;

    WatchedTransactions(Context& ioContext, const InterfaceRef<ZOCL::IZOCTransactionList>& inList,
                        std::uint32_t inInterval)
        : mContext(ioContext),
          mList(inList),
          mWatched(RFL::QueryInterface<ZOCL::IZOCServerResource>(inList), inInterval),
          mKnown(Present()) {}

    bool HasChanged() const { return mWatched.HasChanged(); }

    std::uint64_t TellNews() {
        if (!mWatched.TakeChange()) {
            return 0;
        }
        const std::map<std::string, Entry> before = std::exchange(mKnown, Present());
        std::uint64_t told = 0;
        for (const auto& [id, entry] : mKnown) {
            told += before.count(id) == 0 ? Tell(entry, "opened") : 0;
        }
        for (const auto& [id, entry] : before) {
            told += mKnown.count(id) == 0 ? Tell(entry, "ended") : 0;
        }
        return told;
    }

private:
    std::map<std::string, Entry> Present() const {
        std::map<std::string, Entry> present;
        for (const Entry& entry : mList->GetAllItems()) {
            present.emplace(entry.identifier.str(), entry);
        }
        return present;
    }

    std::uint64_t Tell(const Entry& inEntry, const char* inState) const {
        Json json("change");
        json.Set("what", "transaction").Set("state", inState).Set("id", inEntry.identifier);
        json.Set("owner", inEntry.owner).Set("application", inEntry.metadata.applicationName);
        mContext.Out().Record(json.Set("machine", inEntry.metadata.machineName).Set("line", "session"));
        mContext.Out().Line(ForTerminal(ShortTime(inEntry.created) + "  session  transaction " + inState +
                                        " by " + inEntry.metadata.applicationName.str() + " on " +
                                        inEntry.metadata.machineName.str()));
        return 1;
    }

    Context& mContext;
    const InterfaceRef<ZOCL::IZOCTransactionList> mList;
    Watched mWatched;
    std::map<std::string, Entry> mKnown;
};

struct Limits {
    std::uint64_t count;
    std::uint32_t interval;
    std::chrono::milliseconds time;
};

Limits LimitsOf(const Arguments& inArgs) {
    const std::uint64_t seconds = NumberOption(inArgs, "for", kEndlessSeconds, 1, kEndlessSeconds);
    return {
        NumberOption(inArgs, "count", kMaximum, 1, kMaximum),
        static_cast<std::uint32_t>(NumberOption(inArgs, "interval", kUsualInterval, 50, kLongestInterval)),
        std::chrono::seconds(seconds)};
}

void Follow(Context& ioContext, const Limits& inLimits, std::vector<std::unique_ptr<WatchedLine>>& ioLines,
            WatchedTransactions* ioTransactions) {
    const auto hasNews = [&] {
        bool has = ioTransactions && ioTransactions->HasChanged();
        for (const auto& line : ioLines) {
            has = has || line->HasChanged();
        }
        return has;
    };
    const auto end = std::chrono::steady_clock::now() + inLimits.time;
    for (std::uint64_t told = 0; told < inLimits.count;) {
        const auto left =
            std::chrono::ceil<std::chrono::milliseconds>(end - std::chrono::steady_clock::now());
        if (!ioContext.Loop().WaitUntil(hasNews, left)) {
            return;
        }
        told += ioTransactions ? ioTransactions->TellNews() : 0;
        for (const auto& line : ioLines) {
            told += line->TellNews();
        }
    }
}

}  // namespace

void RunWatch(Context& ioContext) {
    const Limits limits = LimitsOf(ioContext.Args());
    const OpenRecord open = RequireOpen(ioContext);
    const auto session = FindSession(ioContext);
    std::vector<std::unique_ptr<WatchedLine>> lines;
    lines.push_back(std::make_unique<WatchedLine>(
        ioContext, "shared", LoadProductionAt(ioContext, open.production, ""), limits.interval));
    std::unique_ptr<WatchedTransactions> transactions;
    if (session) {
        lines.push_back(std::make_unique<WatchedLine>(ioContext, "session", session->view, limits.interval));
        const auto list = session->session->GetOrCreateTransactionList();
        LoadResource(ioContext, list, "listing the transactions on the session");
        transactions = std::make_unique<WatchedTransactions>(ioContext, list, limits.interval);
    }
    ioContext.Out().Note("watching " + open.name + (session ? " and your session on it" : "") +
                         "; Ctrl-C ends it");
    Follow(ioContext, limits, lines, transactions.get());
}

}  // namespace zo
