// Watches a registry key: a thread sleeps on the directory of the store and compares revisions when it is
// woken.
//
// The event of a write can come before the write can be read: a commit first writes its log, which is the
// event, and then publishes it in shared memory, which is none. So after each event the thread looks again
// after growing pauses, the last of which repeats for ever and bounds the delay even for a writer that was
// stopped in between.
#include "RFL/RegistryChangeNotifier.h"

#include <atomic>
#include <thread>

#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/detail/FileChangeWatch.h"
#include "RFL/detail/RegistryFiles.h"
#include "RFL/detail/RegistryStore.h"
#include "RFL/RFLUnknown.h"

namespace RFL {

namespace {

constexpr std::chrono::milliseconds kPauses[] = {
    std::chrono::milliseconds(10), std::chrono::milliseconds(100), std::chrono::milliseconds(1000),
    std::chrono::milliseconds(10000)};

/// What changes whenever the key or anything below it does.
struct KeyState {
    std::int64_t count = 0;
    std::int64_t revision = 0;
    std::uint64_t inode = 0;

    friend bool operator==(const KeyState& inLeft, const KeyState& inRight) {
        return inLeft.count == inRight.count && inLeft.revision == inRight.revision &&
               inLeft.inode == inRight.inode;
    }
};

/// Reads the state of one key over a connection of its own.
class KeyReader {
public:
    KeyReader(RegistryRoot inRoot, std::string inFile, std::string inPath)
        : mRoot(inRoot), mFile(std::move(inFile)), mPath(std::move(inPath)) {}

    /// The former state when the store cannot be read at this moment.
    KeyState Read() {
        if (mConnection && !mConnection->IsStillTheFile()) {
            mConnection.reset();
            mDataVersion = -1;
        }
        if (!mConnection) {
            const auto mode = mRoot == RegistryRoot::User ? RegistryConnection::Mode::ReadWrite
                                                          : RegistryConnection::Mode::ReadOnly;
            const int result = RegistryConnection::Open(mRoot, mFile, mode, mConnection);
            if (result == kResultRegistryMissing) {
                mState = KeyState();
            }
            if (result != kResultSuccess) {
                return mState;
            }
        }
        mConnection->StartClock();
        const std::int64_t version = mConnection->DataVersion();
        if (version >= 0 && version != mDataVersion && ReadState()) {
            mDataVersion = version;
        }
        return mState;
    }

private:
    bool ReadState() {
        RegistryStatement statement = mConnection->Prepare(
            "SELECT count(*), coalesce(max(revision),0) FROM keys WHERE path=?1 OR (path>=?2 AND path<?3)");
        const std::string first = mPath + "\\";
        const std::string last = mPath + "]";
        if (statement.Bind(1, mPath).Bind(2, first).Bind(3, last).Step() != kResultSuccess) {
            return false;
        }
        RegistryFileIdentity identity;
        IdentifyRegistryFile(mFile, identity);
        mState.count = statement.Number(0);
        mState.revision = statement.Number(1);
        mState.inode = mState.count == 0 ? 0 : identity.inode;
        return true;
    }

    const RegistryRoot mRoot;
    const std::string mFile;
    const std::string mPath;
    std::unique_ptr<RegistryConnection> mConnection;
    std::int64_t mDataVersion = -1;
    KeyState mState;
};

}  // namespace

struct RegistryChangeNotifier::State : enable_shared_from_this<RegistryChangeNotifier::State> {
    State(KeyReader inReader, std::unique_ptr<FileChangeWatch> inWatch, function<void()> inOnChanged)
        : reader(std::move(inReader)), watch(std::move(inWatch)), onChanged(std::move(inOnChanged)) {}

    void Start() {
        const KeyState first = reader.Read();
        thread = std::thread([this, first] { Watch(first); });
    }

    void Stop() {
        if (!isStopped.exchange(true)) {
            watch->Wake();
            thread.join();
        }
    }

    KeyReader reader;
    const std::unique_ptr<FileChangeWatch> watch;
    const function<void()> onChanged;
    std::thread thread;
    std::atomic<bool> isStopped{false};
    std::atomic<bool> isTold{false};

private:
    void Watch(KeyState inKnown) {
        std::size_t pause = std::size(kPauses) - 1;
        while (!isStopped.load()) {
            const FileChangeWatch::Event event = watch->Wait(kPauses[pause]);
            if (event == FileChangeWatch::Event::Changed) {
                pause = 0;
            } else {
                pause = std::min(pause + 1, std::size(kPauses) - 1);
            }
            const KeyState now = reader.Read();
            if (!(now == inKnown)) {
                inKnown = now;
                Tell();
            }
        }
    }

    /// Queues one call, unless one is queued that has not begun: it will see this change too.
    void Tell() {
        if (isTold.exchange(true)) {
            return;
        }
        const weak_ptr<State> weakState = shared_from_this();
        ostcore::threads::AsyncCallFromMainThread([weakState] {
            const shared_ptr<State> state = weakState.lock();
            if (!state || state->isStopped.load()) {
                return;
            }
            state->isTold.store(false);
            state->onChanged();
        });
    }
};

RegistryChangeNotifier::RegistryChangeNotifier(shared_ptr<State> inState) : mState(std::move(inState)) {}

RegistryChangeNotifier::~RegistryChangeNotifier() {
    Stop();
}

shared_ptr<RegistryChangeNotifier> RegistryChangeNotifier::Create(RegistryRoot inRoot, const UString& inPath,
                                                                  function<void()> inOnChanged) {
    std::string path;
    if (!NormaliseRegistryPath(inPath, path)) {
        return nullptr;
    }
    const std::string file = RegistryFile(inRoot);
    if (inRoot == RegistryRoot::User) {
        MakeRegistryDirectory(inRoot, file);
    }
    std::unique_ptr<FileChangeWatch> watch = FileChangeWatch::Create(RegistryDirectory(file));
    if (!watch) {
        return nullptr;
    }
    const auto state =
        boost::make_shared<State>(KeyReader(inRoot, file, path), std::move(watch), std::move(inOnChanged));
    state->Start();
    return shared_ptr<RegistryChangeNotifier>(new RegistryChangeNotifier(state));
}

void RegistryChangeNotifier::Stop() {
    mState->Stop();
}

}  // namespace RFL
