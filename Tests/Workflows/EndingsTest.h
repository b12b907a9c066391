// Flows that end before their time: a hub in memory, a user who always goes on, and an end that comes at a
// request or at a window of which only the number is known.
#pragma once

#include <set>

#include "Connection/LoggedInServer.h"
#include "Dialogs/UIProperties.h"
#include "Dialogs/ZOPublishDialog.h"
#include "Dialogs/ZOResolveDialog.h"
#include "Frame/ProgressWindow.h"
#include "Frame/Station.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Gate.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "RFL/Registry.h"
#include "SessionTest.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

/// How a flow ends before its time.
enum class EndingKind {
    /// Its user cancels: the cancel button where there is one, else the closing box.
    kCancel,
    /// The session is ended by force, and the host clears the screen and gives up the server.
    kSignOut,
    /// The host gives up the server first, and says so.
    kTerminate,
    /// From here on nothing is answered.
    kDrop
};
enum class Moment {
    kBeforeTheRequest,
    kInFlight,
    kWhenAnswered,
    /// In flight, and the answer does not come as long as the flow runs, unless it must be waited for.
    kNeverAnswered,
    /// The end comes while the request starts, and then it is not answered either.
    kWhileItStarts
};

/// A session at c5 of a production that has gone on to c8, with metadata in conflict that merges by itself
/// and two assets in conflict that do not.
class EndingsHub {
public:
    /// Answers as a hub does that remembers what it was told. Threads: any.
    ScriptedAnswer Answer(const RecordedRequest& inRequest);
    void GoDown() {
        std::lock_guard<std::mutex> lock(mMutex);
        mIsDown = true;
    }
    bool IsDown() const {
        std::lock_guard<std::mutex> lock(mMutex);
        return mIsDown;
    }
    std::size_t OpenTransactions() const {
        std::lock_guard<std::mutex> lock(mMutex);
        return mIsOpen ? 1 : 0;
    }
    /// Assets whose conflicts were settled.
    std::size_t CountSettled() const {
        std::lock_guard<std::mutex> lock(mMutex);
        return mSettled.size();
    }

private:
    ScriptedAnswer Read(const std::string& inPath) const;
    ScriptedAnswer Write(const std::string& inLine);
    ScriptedAnswer Session() const;
    ScriptedAnswer Differences() const;
    std::string CommitId() const { return "c" + std::to_string(mCommit); }

    mutable std::mutex mMutex;
    bool mIsDown = false;
    bool mIsPulled = false;
    bool mIsMerged = false;
    bool mIsOpen = false;
    int mCommit = 5;
    std::set<std::string> mSettled;
};

/// Shows dialogs to a function that answers them, and waits for each to close.
class PlayedWindows final : public ostui::BackEnd {
public:
    function<void(ostui::Dialog& ioDialog)> player;
    /// Lets the main thread's queue, and time, go on a little.
    function<void()> tick;
    /// "identifier: title" of each that was shown.
    std::vector<std::string> shown;

    void RunModal(ostui::Dialog& ioDialog) override;
    std::size_t CountOf(const std::string& inText) const;
};

class EndingsTest : public SessionTest {
protected:
    using Flow = std::function<void()>;
    struct Ending {
        EndingKind kind = EndingKind::kCancel;
        /// Of the request or of the window, from 1 on; the other one is 0.
        std::size_t request = 0;
        std::size_t window = 0;
        Moment moment = Moment::kBeforeTheRequest;
        std::string Text() const;
    };

    EndingsTest();
    ~EndingsTest() override;

    /// Runs the flow and ends it there. False: it was over before.
    bool Run(const Flow& inFlow, const Ending& inEnding);
    /// At each request and each window until the flow is over before it comes to the next one. Gives how many
    /// there were.
    std::size_t EndAtEachRequest(const Flow& inFlow, EndingKind inKind, Moment inMoment);
    std::size_t EndAtEachWindow(const Flow& inFlow, EndingKind inKind);

    /// Share as a whole: the latest, the merge of metadata, a conflict each way, the comment.
    void Share();
    void GetLatest(bool inIsSilent);
    void ResolveOneByOne();

    /// While no flow runs, or while one waits for its host.
    void EndNow(EndingKind inKind);
    void Settle();
    std::size_t CountOf(const std::string& inLine) const;

    shared_ptr<EndingsHub> hub;
    shared_ptr<PlayedWindows> windows = boost::make_shared<PlayedWindows>();
    /// Calls of the host's functions.
    std::size_t published = 0;
    std::size_t synced = 0;
    std::size_t resolved = 0;
    bool continuesLater = false;
    std::vector<Publish::Continuation> later;

private:
    void Begin(const Ending& inEnding);
    ScriptedAnswer OnRequest(const RecordedRequest& inRequest);
    ScriptedAnswer EndAt(const RecordedRequest& inRequest);
    void OnWindow(ostui::Dialog& ioDialog);
    void Play(ostui::Dialog& ioDialog);
    void PlayResolve(ostui::Dialog& ioDialog);
    void PlayShare(ostui::Dialog& ioDialog);
    /// On the main thread.
    void End();
    void CancelWindow(ostui::Dialog& ioDialog);
    bool IsSessionOver() const { return mIsTold; }
    /// Whether what runs now is let to come to its end by itself.
    bool IsLetToFinish() const;
    bool MustBeWaitedFor(const RecordedRequest& inRequest) const;
    void ReleaseAll(const ScriptedAnswer& inAnswer);
    /// False when it was given up, since nothing goes on any more.
    bool WaitUntil(const std::function<bool()>& inCondition);
    bool IsQuiet();
    void Tick();
    void ExpectAllIsBack();
    void ExpectNothingLeft();
    void ExpectHostWasTold();
    Publish::SyncCompletion OnSynced();
    Publish::ResolveCompletion OnResolved();
    Publish::ConflictsKeptFunction OnKept();
    void Continue(const Publish::Continuation& inContinue, const ImmutableString& inCommitId);

    const shared_ptr<ostcore::threads::VirtualScheduler> mClock =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    ostcore::threads::ScopedGlobalScheduler mVirtualTime{mClock};
    shared_ptr<ostui::BackEnd> mFormer;
    shared_ptr<RFL::Listener> mHost;
    Ending mEnding;
    std::atomic<std::size_t> mRequests{0};
    std::size_t mWindows = 0;
    /// How often the latest was got without a window.
    std::size_t mSilent = 0;
    std::atomic<bool> mIsHit{false};
    /// The host has heard that the session is over.
    bool mIsTold = false;
    /// What was held back is answered with this once the flow has returned.
    ScriptedAnswer mLateAnswer;
    std::atomic<bool> mMayStayOut{false};
    std::vector<std::string> mShownAfterEnd;
};

}  // namespace ZOCL
