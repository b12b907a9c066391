// Connections to registry files.
//
// Waiting is left to SQLite's busy handler with a deadline per operation; no lock of ours is held while
// SQLite works. Each operation takes an idle connection or opens one, so threads of one process meet each
// other as processes do.
#include "RFL/detail/RegistryStore.h"

#include <sqlite3.h>
#include <unistd.h>

#include <atomic>
#include <random>
#include <thread>
#include <unordered_map>
#include <vector>

#include "ostcore/threads/Mutex.h"
#include "RFL/detail/RegistryFiles.h"
#include "RFL/RFLUnknown.h"

namespace RFL {

namespace {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;
using Clock = std::chrono::steady_clock;

/// "ZOrg"; tells a registry from any other SQLite file.
constexpr std::int64_t kApplicationID = 0x5A4F7267;
constexpr std::int64_t kVersion = 1;
constexpr std::size_t kIdleConnections = 8;

std::atomic<std::int64_t> gTimeLimitMilliseconds{5000};

int ResultOfCode(int inCode) {
    switch (inCode & 0xFF) {
        case SQLITE_OK:
        case SQLITE_DONE:
        case SQLITE_ROW:
            return kResultSuccess;
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
            return kResultRegistryBusy;
        case SQLITE_CORRUPT:
        case SQLITE_NOTADB:
        case SQLITE_FORMAT:
            return kResultRegistryDamaged;
        case SQLITE_READONLY:
            return kResultRegistryReadOnly;
        default:
            return kResultRegistryFailed;
    }
}

/// A time that grows with the attempts and differs between waiters, so that they do not march in step.
std::chrono::microseconds Backoff(int inAttempt) {
    thread_local std::minstd_rand random(std::random_device{}());
    const int highest = std::min(100 << std::min(inAttempt, 5), 2000);
    return std::chrono::microseconds(std::uniform_int_distribution<int>(50, highest)(random));
}

constexpr const char* kSchema =
    "CREATE TABLE keys(path TEXT PRIMARY KEY, revision INTEGER NOT NULL) WITHOUT ROWID;"
    "CREATE TABLE vals(path TEXT NOT NULL, name TEXT NOT NULL, type INTEGER NOT NULL, data NOT NULL,"
    " PRIMARY KEY(path, name)) WITHOUT ROWID;"
    "CREATE TABLE sequence(value INTEGER NOT NULL);"
    "INSERT INTO sequence VALUES(0);"
    "PRAGMA application_id=1515156071;"
    "PRAGMA user_version=1;";
static_assert(kApplicationID == 1515156071, "the schema names the same number");

/// The idle connections of this process. A child of fork() starts with none: it must not use, nor even
/// close, what its parent opened.
class IdleConnections {
public:
    static IdleConnections& Get() {
        static IdleConnections& idle = *new IdleConnections;
        return idle;
    }

    std::unique_ptr<RegistryConnection> Take(const std::string& inFile, bool inMustWrite) {
        const MutexLock lock(mMutex);
        AbandonAfterFork();
        for (auto entry = mEntries.begin(); entry != mEntries.end(); ++entry) {
            if (entry->file == inFile && entry->connection->CanWrite() == inMustWrite) {
                std::unique_ptr<RegistryConnection> connection = std::move(entry->connection);
                mEntries.erase(entry);
                return connection;
            }
        }
        return nullptr;
    }

    /// The connection is closed, outside of the lock, when there are idle ones enough.
    void Give(const std::string& inFile, std::unique_ptr<RegistryConnection> inConnection) {
        const MutexLock lock(mMutex);
        AbandonAfterFork();
        if (mEntries.size() < kIdleConnections) {
            mEntries.push_back(Entry{inFile, std::move(inConnection)});
        }
    }

    void Clear() {
        std::vector<Entry> entries;
        const MutexLock lock(mMutex);
        AbandonAfterFork();
        entries.swap(mEntries);
    }

private:
    struct Entry {
        std::string file;
        std::unique_ptr<RegistryConnection> connection;
    };

    void AbandonAfterFork() ZO_REQUIRES(mMutex) {
        if (mProcess == ::getpid()) {
            return;
        }
        mProcess = ::getpid();
        for (Entry& entry : mEntries) {
            entry.connection.release();
        }
        mEntries.clear();
    }

    Mutex mMutex;
    pid_t mProcess ZO_GUARDED_BY(mMutex) = ::getpid();
    std::vector<Entry> mEntries ZO_GUARDED_BY(mMutex);
};

int ReadNumber(RegistryConnection& inConnection, const char* inSQL, std::int64_t& outNumber) {
    RegistryStatement statement = inConnection.Prepare(inSQL);
    const int result = statement.Step();
    if (result == kResultSuccess) {
        outNumber = statement.Number(0);
    }
    return result;
}

}  // namespace

struct RegistryConnection::Statements {
    ~Statements() {
        for (const auto& entry : byText) {
            sqlite3_finalize(entry.second);
        }
    }
    std::unordered_map<const char*, sqlite3_stmt*> byText;
};

// ---- RegistryStatement

RegistryStatement::~RegistryStatement() {
    if (mStatement) {
        sqlite3_reset(mStatement);
        sqlite3_clear_bindings(mStatement);
    }
}

RegistryStatement& RegistryStatement::Bind(int inPosition, std::string_view inText) {
    if (mStatement) {
        sqlite3_bind_text(mStatement, inPosition, inText.data(), static_cast<int>(inText.size()),
                          SQLITE_STATIC);
    }
    return *this;
}

RegistryStatement& RegistryStatement::Bind(int inPosition, std::int64_t inNumber) {
    if (mStatement) {
        sqlite3_bind_int64(mStatement, inPosition, inNumber);
    }
    return *this;
}

int RegistryStatement::Step() {
    if (!mStatement) {
        return mFailure;
    }
    const int code = sqlite3_step(mStatement);
    return code == SQLITE_DONE ? kResultRegistryMissing : ResultOfCode(code);
}

int RegistryStatement::Run() {
    const int result = Step();
    return result == kResultRegistryMissing ? kResultSuccess : result;
}

std::int64_t RegistryStatement::Number(int inColumn) const {
    return sqlite3_column_int64(mStatement, inColumn);
}

bool RegistryStatement::IsNumber(int inColumn) const {
    return sqlite3_column_type(mStatement, inColumn) == SQLITE_INTEGER;
}

std::string RegistryStatement::Text(int inColumn) const {
    const auto* text = reinterpret_cast<const char*>(sqlite3_column_text(mStatement, inColumn));
    return text ? std::string(text, static_cast<std::size_t>(sqlite3_column_bytes(mStatement, inColumn)))
                : std::string();
}

// ---- RegistryConnection

RegistryConnection::RegistryConnection(std::string inFile, bool inCanWrite)
    : mFile(std::move(inFile)), mCanWrite(inCanWrite), mStatements(std::make_unique<Statements>()) {
    StartClock();
}

RegistryConnection::~RegistryConnection() {
    mStatements.reset();
    sqlite3_close(mDatabase);
}

int RegistryConnection::Open(RegistryRoot inRoot, const std::string& inFile, Mode inMode,
                             std::unique_ptr<RegistryConnection>& outConnection) {
    const int checked =
        inMode == Mode::Create ? CreateRegistryFile(inRoot, inFile) : CheckRegistryFile(inRoot, inFile);
    if (checked < 0) {
        return checked;
    }
    std::string file;
    RegistryFileIdentity identity;
    const int resolved = ResolveRegistryFile(inFile, file, identity);
    if (resolved < 0) {
        return resolved;
    }
    const bool canWrite = inMode != Mode::ReadOnly;
    std::unique_ptr<RegistryConnection> connection(new RegistryConnection(inFile, canWrite));
    connection->mDevice = identity.device;
    connection->mInode = identity.inode;
    const int flags = (canWrite ? SQLITE_OPEN_READWRITE : SQLITE_OPEN_READONLY) | SQLITE_OPEN_NOMUTEX |
                      SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_PRIVATECACHE | SQLITE_OPEN_EXRESCODE;
    const int code = sqlite3_open_v2(file.c_str(), &connection->mDatabase, flags, nullptr);
    int result = ResultOfCode(code);
    if (result == kResultSuccess) {
        result = connection->Configure(inRoot);
    }
    if (result == kResultSuccess) {
        outConnection = std::move(connection);
    }
    return result;
}

int RegistryConnection::Configure(RegistryRoot inRoot) {
    sqlite3_busy_handler(mDatabase, &RegistryConnection::OnBusy, this);
    sqlite3_limit(mDatabase, SQLITE_LIMIT_LENGTH, 16 * 1024 * 1024);
    sqlite3_db_config(mDatabase, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
    sqlite3_db_config(mDatabase, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
    sqlite3_db_config(mDatabase, SQLITE_DBCONFIG_ENABLE_TRIGGER, 0, nullptr);
    sqlite3_db_config(mDatabase, SQLITE_DBCONFIG_ENABLE_VIEW, 0, nullptr);
    int result = CheckIdentity(inRoot);
    if (result == kResultSuccess && mCanWrite) {
        // A killed process loses nothing in this mode; a power cut can lose the last moments, not the file.
        // Deleted text is overwritten, since it can be a token.
        result = Execute("PRAGMA synchronous=NORMAL; PRAGMA secure_delete=ON");
    }
    return result;
}

int RegistryConnection::CheckIdentity(RegistryRoot inRoot) {
    std::int64_t application = 0;
    std::int64_t version = 0;
    std::int64_t tables = 0;
    int result = ReadNumber(*this, "PRAGMA application_id", application);
    if (result == kResultSuccess) {
        result = ReadNumber(*this, "PRAGMA user_version", version);
    }
    if (result == kResultSuccess) {
        result = ReadNumber(*this, "SELECT count(*) FROM sqlite_schema", tables);
    }
    // The reads are no one snapshot: another process may have set the file up between them.
    if (result == kResultSuccess && application == 0 && (version != 0 || tables != 0)) {
        result = ReadNumber(*this, "PRAGMA application_id", application);
        if (result == kResultSuccess) {
            result = ReadNumber(*this, "PRAGMA user_version", version);
        }
    }
    if (result < 0) {
        return result;
    }
    if (application == kApplicationID) {
        return version == kVersion ? kResultSuccess : kResultRegistryDamaged;
    }
    if (application != 0 || version != 0 || tables != 0) {
        return kResultRegistryDamaged;
    }
    return mCanWrite ? SetUp(inRoot) : kResultRegistryMissing;
}

int RegistryConnection::SetUp(RegistryRoot inRoot) {
    const int journal = SetJournalMode(inRoot);
    if (journal < 0) {
        return journal;
    }
    RegistryTransaction transaction(*this);
    int result = transaction.Begin();
    if (result < 0) {
        return result;
    }
    // Somebody else may have been faster.
    std::int64_t application = 0;
    result = ReadNumber(*this, "PRAGMA application_id", application);
    if (result < 0 || application == kApplicationID) {
        return result;
    }
    result = Execute(kSchema);
    return result == kResultSuccess ? transaction.Commit() : result;
}

int RegistryConnection::SetJournalMode(RegistryRoot inRoot) {
    if (inRoot == RegistryRoot::Machine) {
        // Readers who may not write its directory could not open a write-ahead log.
        return kResultSuccess;
    }
    for (int attempt = 0;; ++attempt) {
        int result = kResultRegistryBusy;
        {
            RegistryStatement statement = Prepare("PRAGMA journal_mode=WAL");
            result = statement.Step();
            if (result == kResultSuccess && statement.Text(0) == "wal") {
                return kResultSuccess;
            }
        }
        if (result < 0 && result != kResultRegistryBusy) {
            return result;
        }
        // SQLite does not always ask the busy handler when it changes the mode.
        if (OnBusy(this, attempt) == 0) {
            return kResultRegistryBusy;
        }
    }
}

RegistryStatement RegistryConnection::Prepare(const char* inSQL) {
    sqlite3_stmt*& statement = mStatements->byText[inSQL];
    if (statement) {
        return RegistryStatement(statement, kResultSuccess);
    }
    const int code = sqlite3_prepare_v3(mDatabase, inSQL, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    // Our own statements are sound, so it is the tables that are not ours.
    const int failure = (code & 0xFF) == SQLITE_ERROR ? kResultRegistryDamaged : ResultOfCode(code);
    return RegistryStatement(statement, failure);
}

int RegistryConnection::Execute(const char* inSQL) {
    return ResultOfCode(sqlite3_exec(mDatabase, inSQL, nullptr, nullptr, nullptr));
}

void RegistryConnection::StartClock() {
    mDeadline = Clock::now() + RegistryTimeLimit();
}

std::int64_t RegistryConnection::DataVersion() {
    std::int64_t version = -1;
    return ReadNumber(*this, "PRAGMA data_version", version) == kResultSuccess ? version : -1;
}

int RegistryConnection::EmptyLog() {
    return ResultOfCode(
        sqlite3_wal_checkpoint_v2(mDatabase, nullptr, SQLITE_CHECKPOINT_TRUNCATE, nullptr, nullptr));
}

bool RegistryConnection::IsStillTheFile() const {
    RegistryFileIdentity identity;
    return IdentifyRegistryFile(mFile, identity) && identity.device == mDevice && identity.inode == mInode;
}

int RegistryConnection::OnBusy(void* inConnection, int inCount) {
    const auto* connection = static_cast<const RegistryConnection*>(inConnection);
    if (Clock::now() >= connection->mDeadline) {
        return 0;
    }
    std::this_thread::sleep_for(Backoff(inCount));
    return 1;
}

// ---- LentConnection

LentConnection::~LentConnection() {
    if (mConnection) {
        IdleConnections::Get().Give(mFile, std::move(mConnection));
    }
}

int LentConnection::Acquire(RegistryRoot inRoot, RegistryConnection::Mode inMode) {
    mFile = RegistryFile(inRoot);
    const bool mustWrite = inMode != RegistryConnection::Mode::ReadOnly;
    mConnection = IdleConnections::Get().Take(mFile, mustWrite);
    if (mConnection && !mConnection->IsStillTheFile()) {
        mConnection.reset();
    }
    if (mConnection) {
        mConnection->StartClock();
        return kResultSuccess;
    }
    return RegistryConnection::Open(inRoot, mFile, inMode, mConnection);
}

// ---- RegistryTransaction

RegistryTransaction::~RegistryTransaction() {
    if (mIsOpen) {
        mConnection.Execute("ROLLBACK");
    }
}

int RegistryTransaction::Begin() {
    const int result = mConnection.Prepare("BEGIN IMMEDIATE").Run();
    mIsOpen = result == kResultSuccess;
    return result;
}

int RegistryTransaction::Commit() {
    const int result = mConnection.Prepare("COMMIT").Run();
    mIsOpen = result != kResultSuccess;
    return result;
}

std::chrono::milliseconds RegistryTimeLimit() noexcept {
    return std::chrono::milliseconds(gTimeLimitMilliseconds.load(std::memory_order_relaxed));
}

void SetRegistryTimeLimit(std::chrono::milliseconds inLimit) noexcept {
    gTimeLimitMilliseconds.store(std::max<std::int64_t>(0, inLimit.count()), std::memory_order_relaxed);
}

void CloseRegistry() {
    IdleConnections::Get().Clear();
}

}  // namespace RFL
