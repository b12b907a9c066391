// One schedule of the campaign: two users work together on a fresh production while their requests meet
// faults, and afterwards the hub is asked, over a clean connection, what came of it.
#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "Team.h"
#include "Tree.h"

namespace campaign {

/// What a schedule brought.
struct Outcome {
    std::vector<std::string> problems;
    /// What ended without an answer, for people.
    std::vector<std::string> doubts;
    /// Calls that ended with an honest failure: nobody can say whether the hub did the work.
    unsigned failures = 0;
    unsigned acknowledged = 0;
    unsigned faults = 0;
    unsigned requests = 0;
    bool isHang = false;
};

class Walk {
public:
    Walk(std::uint64_t inSeed, const RunningHub& inHub, User& ioAnna, User& ioBen, bool inWithSwaps);

    /// Throws ProcessFailure when a worker hangs or has gone.
    void Run();
    const Outcome& Result() const { return mOutcome; }

private:
    /// What is known of a change that was asked for.
    enum class Certainty { kDone, kRefused, kUnknown };
    struct Member {
        User* user;
        CleanReader reader;
        std::string session;
        Tree tree;
        /// Assets that this user has changed and not shared.
        std::set<std::string> changed;
    };

    void Prepare();
    void WorkTogether();
    void Verify();

    bool Open(Member& ioMember);
    void Edit(Member& ioMember, const json& inOrder);
    void EditAtOnce(const json& inAnnas, const json& inBens);
    void TakeEdit(Member& ioMember, const json& inOrder, const Reply& inReply);
    void Share(Member& ioMember, const std::string& inTitle, bool inIsBehind = false);
    void GetLatest(Member& ioMember);
    void DecideConflicts(Member& ioMember);
    void Merge(Member& ioMember);

    /// Repeats what is safe to repeat, a few times.
    Reply Insist(User& ioUser, const json& inOrder);
    void Judge(const User& inUser, const std::string& inWhat, const Reply& inReply);
    void Problem(const std::string& inText) { mOutcome.problems.push_back(inText); }

    json AssetOrder(const std::string& inName);
    std::string Marker(const std::string& inWhat);

    void VerifyHistory(const CleanReader& inReader, const json& inProduction);
    void VerifyMember(Member& ioMember);

    const std::uint64_t mSeed;
    const bool mWithSwaps;
    faultproxy::Dice mDice;
    Member mAnna;
    Member mBen;
    std::string mName;
    std::string mURL;
    Tree mProduction;
    std::map<std::string, Certainty> mShares;
    unsigned mMarkers = 0;
    /// Some of the faults may leave a call without an answer.
    bool mMayGiveUp = false;
    /// No change is in doubt, so the model says what must be there.
    bool mIsCertain = true;
    Outcome mOutcome;
};

}  // namespace campaign
