// The walk of two users, and what must be true after it.
#include "Walk.h"

#include <algorithm>
#include <future>

#include "Payload.h"

namespace campaign {

namespace {

constexpr int kInteractive = 3;
constexpr int kAttempts = 4;
constexpr std::size_t kSizes[] = {0, 20, 900, 5000, 70000, 200000};

/// The sign-in is asked for once and makes no retry, so a fault there ends the host's work; it has tests of
/// its own.
bool BelongsToSignIn(const faultproxy::RequestLine& inRequest) {
    static const std::set<std::string> kPaths = {"/content/zo/api/discovery.json", "/zo/1/links",
                                                 "/zo/1/system/login"};
    return kPaths.count(inRequest.path) != 0;
}

/// An answer that is no HTTP is no failure of the network: it ends the call and leaves it in doubt. Most
/// schedules do without, so that every call must be answered.
bool HasGarbage(std::uint64_t inSeed) {
    return inSeed % 5 == 0;
}

/// While a token is renewed nothing is retried, so a call that meets another fault just then ends without an
/// answer.
bool HasRenewal(const std::map<std::size_t, faultproxy::Fault>& inFaults) {
    return std::any_of(inFaults.begin(), inFaults.end(), [](const auto& inFault) {
        return inFault.second.kind == faultproxy::FaultKind::kStatusWithoutWork &&
               inFault.second.status == 401;
    });
}

/// Whether a call may end without an answer.
bool Begin(User& ioUser, std::uint64_t inSeed, const faultproxy::RandomScheduleLimits& inLimits,
           Outcome& ioOutcome) {
    const auto faults = faultproxy::RandomFaults(inSeed, inLimits);
    ioOutcome.faults += static_cast<unsigned>(faults.size());
    ioUser.Proxy().Follow(faultproxy::ScheduleOf(faults, BelongsToSignIn));
    return inLimits.withGarbage || inLimits.withSwaps || HasRenewal(faults);
}

/// A list of sessions that cannot be read leads on to a new session, even when one was made before whose
/// answer was no HTTP either. How often that can have been.
std::ptrdiff_t SessionsMadeUnseen(const std::vector<faultproxy::LogEntry>& inLog) {
    std::ptrdiff_t count = 0;
    bool isMadeUnseen = false;
    for (const faultproxy::LogEntry& entry : inLog) {
        const std::string_view path = entry.request.path;
        constexpr std::string_view kSessions = "/sessions";
        if (path.size() < kSessions.size() || path.substr(path.size() - kSessions.size()) != kSessions) {
            continue;
        }
        const bool isMade = entry.request.method == "POST" && entry.hubStatus == 201;
        const bool isGarbage = entry.fault.kind == faultproxy::FaultKind::kGarbageAfterWork ||
                               entry.fault.kind == faultproxy::FaultKind::kGarbageWithoutWork;
        isMadeUnseen |= isMade && isGarbage;
        count += isMadeUnseen && isGarbage && entry.request.method == "GET" ? 1 : 0;
    }
    return count;
}

}  // namespace

Walk::Walk(std::uint64_t inSeed, const RunningHub& inHub, User& ioAnna, User& ioBen, bool inWithSwaps)
    : mSeed(inSeed),
      mWithSwaps(inWithSwaps),
      mDice(inSeed ^ 0x5eedull),
      mAnna{&ioAnna, CleanReader(inHub.SignedIn(ioAnna.Name())), {}, {}, {}},
      mBen{&ioBen, CleanReader(inHub.SignedIn(ioBen.Name())), {}, {}, {}},
      mName("campaign-" + std::to_string(inSeed)) {}

void Walk::Run() {
    Prepare();
    if (Open(mAnna) && Open(mBen)) {
        WorkTogether();
    }
    for (Member* member : {&mAnna, &mBen}) {
        mOutcome.requests += static_cast<unsigned>(member->user->Proxy().RequestCount());
        member->user->Proxy().BeGood();
    }
    Verify();
    for (Member* member : {&mAnna, &mBen}) {
        member->user->Do({{"do", "close"}});
    }
}

void Walk::Prepare() {
    // Each proxy has dice of its own: the two users' requests come in any order.
    faultproxy::RandomScheduleLimits limits;
    limits.withSwaps = mWithSwaps;
    limits.withGarbage = HasGarbage(mSeed);
    mMayGiveUp = Begin(*mAnna.user, 2 * mSeed, limits, mOutcome);
    mMayGiveUp = Begin(*mBen.user, 2 * mSeed + 1, limits, mOutcome) || mMayGiveUp;
    const Reply created = mAnna.user->Do({{"do", "create"}, {"name", mName}});
    Judge(*mAnna.user, "create", created);
    if (created.Succeeded()) {
        mURL = created.content.at("production");
    }
}

void Walk::WorkTogether() {
    const std::string first = Marker("clip");
    json order = {{"message", Marker("commit")}, {"add", json::array({AssetOrder(first)})}};
    for (std::uint32_t more = mDice.Below(3); more > 0; --more) {
        order["add"].push_back(AssetOrder(Marker("clip")));
    }
    order["notes"] = json::array({{{"name", "notes.txt"}, {"text", Marker("note")}}});
    Edit(mAnna, order);
    Share(mAnna, Marker("share"));
    GetLatest(mBen);

    for (std::uint32_t round = 0; round < 1 + mDice.Below(2); ++round) {
        const auto change = [&](const std::string& inWho) {
            return json{{"message", Marker("commit")},
                        {"change", json::array({{{"name", first}, {"description", Marker(inWho)}}})},
                        {"add", json::array({AssetOrder(Marker(inWho + "-clip"))})}};
        };
        const json annas = change("anna");
        const json bens = change("ben");
        EditAtOnce(annas, bens);
        Share(mAnna, Marker("share"));
        Share(mBen, Marker("too-early"), true);
        GetLatest(mBen);
        DecideConflicts(mBen);
        Share(mBen, Marker("share"));
        GetLatest(mAnna);
    }
    const Reply history = Insist(*mAnna.user, {{"do", "history"}});
    if (history.Succeeded() &&
        history.content.at("titles") != mAnna.reader.ReadTitles(mAnna.reader.Get(mURL))) {
        Problem("anna's history is not the hub's: " + history.content.at("titles").dump());
    }
}

bool Walk::Open(Member& ioMember) {
    if (mURL.empty()) {
        return false;
    }
    const Reply opened = Insist(*ioMember.user, {{"do", "open"}, {"production", mURL}});
    if (opened.Succeeded()) {
        ioMember.session = opened.content.at("session");
    }
    return opened.Succeeded();
}

// --- Changes. Each is asked for once; what ends without an answer stays in doubt.

json Walk::AssetOrder(const std::string& inName) {
    json enclosures = json::array();
    for (std::uint32_t count = 1 + mDice.Below(2); count > 0; --count) {
        const std::size_t size = kSizes[mDice.Below(std::size(kSizes))];
        enclosures.push_back({{"name", Marker("payload")}, {"size", size}});
    }
    return {{"name", inName}, {"description", ""}, {"enclosures", enclosures}};
}

std::string Walk::Marker(const std::string& inWhat) {
    return inWhat + "-" + std::to_string(mSeed) + "-" + std::to_string(mMarkers++);
}

void Walk::Edit(Member& ioMember, const json& inOrder) {
    json order = inOrder;
    order["do"] = "edit";
    TakeEdit(ioMember, inOrder, ioMember.user->Do(order));
}

void Walk::EditAtOnce(const json& inAnnas, const json& inBens) {
    const auto run = [](User* ioUser, json inOrder) {
        inOrder["do"] = "edit";
        return ioUser->Do(inOrder);
    };
    auto annas = std::async(std::launch::async, run, mAnna.user, inAnnas);
    auto bens = std::async(std::launch::async, run, mBen.user, inBens);
    annas.wait();
    bens.wait();
    TakeEdit(mAnna, inAnnas, annas.get());
    TakeEdit(mBen, inBens, bens.get());
}

void Walk::TakeEdit(Member& ioMember, const json& inOrder, const Reply& inReply) {
    Judge(*ioMember.user, "edit", inReply);
    if (!inReply.Succeeded()) {
        return;
    }
    for (const json& asset : inOrder.value("add", json::array())) {
        AssetState state{asset.at("description"), {}};
        for (const json& enclosure : asset.at("enclosures")) {
            const std::string name = enclosure.at("name");
            state.enclosures[name] = DigestOf(PayloadOf(name, enclosure.at("size")));
        }
        ioMember.tree.Add(asset.at("name"), state);
    }
    for (const json& change : inOrder.value("change", json::array())) {
        ioMember.tree.assets[change.at("name")].description = change.at("description");
        ioMember.changed.insert(change.at("name").get<std::string>());
    }
    for (const json& note : inOrder.value("notes", json::array())) {
        ioMember.tree.enclosures[note.at("name")] = DigestOf(note.at("text").get<std::string>());
    }
}

void Walk::Share(Member& ioMember, const std::string& inTitle, bool inIsBehind) {
    const bool hadDoubts = !mIsCertain;
    const Reply reply = ioMember.user->Do({{"do", "share"}, {"message", inTitle}});
    if (reply.IsConflict() && (inIsBehind || hadDoubts)) {
        mShares[inTitle] = Certainty::kRefused;
        return;
    }
    if (inIsBehind && reply.Succeeded() && !hadDoubts) {
        Problem(ioMember.user->Name() + " was behind and could share all the same");
    }
    Judge(*ioMember.user, "share", reply);
    if (!reply.Succeeded()) {
        mShares[inTitle] = reply.WasRefused() ? Certainty::kRefused : Certainty::kUnknown;
        return;
    }
    // With something in doubt there may have been nothing left to share, and then no commit is made.
    mShares[inTitle] = hadDoubts ? Certainty::kUnknown : Certainty::kDone;
    mProduction = ioMember.tree;
    ioMember.changed.clear();
}

void Walk::GetLatest(Member& ioMember) {
    const Reply reply = ioMember.user->Do({{"do", "pull"}, {"strategy", kInteractive}});
    Judge(*ioMember.user, "get latest", reply);
    if (reply.Succeeded()) {
        Merge(ioMember);
    }
}

void Walk::Merge(Member& ioMember) {
    for (const auto& [name, asset] : mProduction.assets) {
        if (ioMember.changed.count(name) == 0) {
            ioMember.tree.assets[name] = asset;
        }
    }
    ioMember.tree.enclosures = mProduction.enclosures;
}

void Walk::DecideConflicts(Member& ioMember) {
    std::size_t expected = 0;
    for (const std::string& name : ioMember.changed) {
        const auto shared = mProduction.assets.find(name);
        expected += shared != mProduction.assets.end() && !(shared->second == ioMember.tree.assets[name]);
    }
    for (std::size_t decided = 0;; ++decided) {
        const Reply reply = Insist(*ioMember.user, {{"do", "conflicts"}});
        if (!reply.Succeeded()) {
            return;
        }
        const json& conflicts = reply.content.at("conflicts");
        if (mIsCertain && decided + conflicts.size() != expected) {
            Problem(ioMember.user->Name() + " sees " + std::to_string(conflicts.size()) +
                    " conflicts after " + std::to_string(decided) + " of " + std::to_string(expected));
        }
        if (conflicts.empty() || decided > expected + 2) {
            return;
        }
        const json& conflict = conflicts[0];
        const bool takesTheirs = mDice.Below(2) == 0;
        const Reply accepted = ioMember.user->Do({{"do", "accept"},
                                                  {"url", conflict.at(takesTheirs ? "theirs" : "yours")},
                                                  {"commit", reply.content.at("commit")}});
        Judge(*ioMember.user, "accept", accepted);
        if (accepted.Succeeded() && takesTheirs) {
            const std::string name = conflict.at("name");
            ioMember.tree.assets[name] = mProduction.assets[name];
        }
    }
}

Reply Walk::Insist(User& ioUser, const json& inOrder) {
    Reply reply = ioUser.Do(inOrder);
    for (int attempt = 1; attempt < kAttempts && !reply.Succeeded() && !reply.WasRefused(); ++attempt) {
        ++mOutcome.failures;
        mOutcome.doubts.push_back(ioUser.Name() + ": " + reply.Describe() + " (repeated)");
        reply = ioUser.Do(inOrder);
    }
    Judge(ioUser, inOrder.at("do"), reply);
    return reply;
}

void Walk::Judge(const User& inUser, const std::string& inWhat, const Reply& inReply) {
    if (inReply.Succeeded()) {
        ++mOutcome.acknowledged;
        return;
    }
    // Nobody else works in this user's session, so no refusal is the fault of the request.
    if (inReply.WasRefused() && mIsCertain) {
        Problem(inUser.Name() + ": " + inWhat + " was refused: " + inReply.Describe());
    }
    if (!inReply.WasRefused()) {
        ++mOutcome.failures;
    }
    mOutcome.doubts.push_back(inUser.Name() + ": " + inWhat + ": " + inReply.Describe());
    mIsCertain = false;
}

// --- Afterwards.

void Walk::Verify() {
    const std::size_t productions = mAnna.reader.CountProductions(mName);
    if (productions > 1 || (productions == 0 && !mURL.empty())) {
        Problem("the production is there " + std::to_string(productions) + " times");
    }
    if (mURL.empty()) {
        return;
    }
    const json production = mAnna.reader.Get(mURL);
    VerifyHistory(mAnna.reader, production);
    const Tree shared = mAnna.reader.ReadTree(production);
    if (!shared.repeated.empty()) {
        Problem("the production has more than one of " + json(shared.repeated).dump());
    }
    if (mIsCertain && !(shared == mProduction)) {
        Problem("the production is not what was shared: " + DifferenceOf(mProduction, shared));
    }
    VerifyMember(mAnna);
    VerifyMember(mBen);
    if (mOutcome.failures != 0 && !mMayGiveUp) {
        Problem("the client gave up on a call: " + json(mOutcome.doubts).dump());
    }
}

void Walk::VerifyHistory(const CleanReader& inReader, const json& inProduction) {
    std::map<std::string, std::size_t> found;
    for (const std::string& title : inReader.ReadTitles(inProduction)) {
        ++found[title];
    }
    for (const auto& [title, certainty] : mShares) {
        const std::size_t count = found.count(title) ? found[title] : 0;
        found.erase(title);
        const bool isRight = certainty == Certainty::kDone      ? count == 1
                             : certainty == Certainty::kRefused ? count == 0
                                                                : count <= 1;
        if (!isRight) {
            Problem(title + (certainty == Certainty::kDone ? " was acknowledged" : " was not acknowledged") +
                    " and is in the history " + std::to_string(count) + " times");
        }
    }
    // What is left is the commit that made the production.
    if (found.size() != 1 || found.begin()->second != 1) {
        Problem("the history has commits that nobody asked for: " + json(found).dump());
    }
}

void Walk::VerifyMember(Member& ioMember) {
    const std::string& name = ioMember.user->Name();
    if (ioMember.session.empty()) {
        return;
    }
    const json production = ioMember.reader.Get(mURL);
    // Administrators see those of others as well.
    const json list = ioMember.reader.Follow(production, "/sessions");
    const auto& all = list.at("sessions");
    const auto sessions = std::count_if(all.begin(), all.end(),
                                        [&](const json& inItem) { return inItem.at("zo:owner") == name; });
    const auto mayBeMore = SessionsMadeUnseen(ioMember.user->Proxy().Log());
    if (sessions < 1 || sessions > 1 + mayBeMore) {
        Problem(name + " has " + std::to_string(sessions) + " sessions");
    } else if (sessions > 1) {
        mOutcome.doubts.push_back(name + ": has " + std::to_string(sessions) +
                                  " sessions, as the list of them could not be read");
    }
    const json session = ioMember.reader.Get(ioMember.session);
    const Tree there = ioMember.reader.ReadTree(session);
    if (mIsCertain && !(there == ioMember.tree)) {
        Problem("the session of " + name +
                " is not what was acknowledged: " + DifferenceOf(ioMember.tree, there));
    }
    const std::size_t open = ioMember.reader.Follow(session, "/transactions").at("transactions").size();
    if (mOutcome.failures == 0 && open != 0) {
        Problem(name + " has " + std::to_string(open) + " open transactions");
    }
    const Reply look = ioMember.user->Do({{"do", "look"}});
    if (!look.Succeeded()) {
        Problem(name + " cannot look over a sound connection: " + look.Describe());
    } else if (const Tree seen = TreeOfLook(look.content); !(seen == there)) {
        Problem(name + " sees something else than the hub has: " + DifferenceOf(there, seen));
    }
    const json counts = ioMember.user->Do({{"do", "counts"}}).content;
    if (counts.at("started") != counts.at("ended") || counts.at("endedAgain") != 0) {
        Problem(name + "'s calls did not end once each: " + counts.dump());
    }
}

}  // namespace campaign
