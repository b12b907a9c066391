// The storage below registry keys: one SQLite file per root, connections that are lent out, and the mapping
// of its errors to results.
#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "RFL/Registry.h"

struct sqlite3;
struct sqlite3_stmt;

namespace RFL {

/// One prepared statement, lent by its connection for one use.
class RegistryStatement {
public:
    /// Without a statement every step gives inFailure.
    RegistryStatement(sqlite3_stmt* inStatement, int inFailure) noexcept
        : mStatement(inStatement), mFailure(inFailure) {}
    ~RegistryStatement();
    RegistryStatement(RegistryStatement&& inOther) noexcept
        : mStatement(std::exchange(inOther.mStatement, nullptr)), mFailure(inOther.mFailure) {}
    RegistryStatement(const RegistryStatement&) = delete;
    RegistryStatement& operator=(const RegistryStatement&) = delete;

    /// The text must stay valid until the statement has run.
    RegistryStatement& Bind(int inPosition, std::string_view inText);
    RegistryStatement& Bind(int inPosition, std::int64_t inNumber);
    /// kResultSuccess: a row is there; kResultRegistryMissing: no further row; else a failure.
    int Step();
    /// Runs a statement that gives no rows.
    int Run();
    std::int64_t Number(int inColumn) const;
    bool IsNumber(int inColumn) const;
    std::string Text(int inColumn) const;

private:
    sqlite3_stmt* mStatement;
    const int mFailure;
};

/// One connection to a registry file, used by one thread at a time.
class RegistryConnection {
public:
    enum class Mode : std::uint8_t {
        /// The file must exist; it is not written.
        ReadOnly,
        /// The file must exist.
        ReadWrite,
        /// The file and its directory are made when they are missing.
        Create
    };

    /// Opens the file of a root. kResultRegistryMissing when it is not there, or is still empty and the mode
    /// does not allow to set it up.
    static int Open(RegistryRoot inRoot, const std::string& inFile, Mode inMode,
                    std::unique_ptr<RegistryConnection>& outConnection);
    ~RegistryConnection();
    RegistryConnection(const RegistryConnection&) = delete;
    RegistryConnection& operator=(const RegistryConnection&) = delete;

    /// inSQL is a literal; its address is what a prepared statement is kept under.
    RegistryStatement Prepare(const char* inSQL);
    int Execute(const char* inSQL);
    /// The time limit of what follows begins now.
    void StartClock();
    /// Changes each time another connection has changed the file. Negative when it cannot be read.
    std::int64_t DataVersion();
    /// Takes all that was committed into the file itself and empties the log beside it.
    int EmptyLog();
    /// False when the file at the path is no longer the one that was opened.
    bool IsStillTheFile() const;
    bool CanWrite() const noexcept { return mCanWrite; }

private:
    RegistryConnection(std::string inFile, bool inCanWrite);
    int Configure(RegistryRoot inRoot);
    int CheckIdentity(RegistryRoot inRoot);
    int SetUp(RegistryRoot inRoot);
    int SetJournalMode(RegistryRoot inRoot);
    static int OnBusy(void* inConnection, int inCount);

    struct Statements;
    const std::string mFile;
    const bool mCanWrite;
    sqlite3* mDatabase = nullptr;
    std::uint64_t mDevice = 0;
    std::uint64_t mInode = 0;
    std::chrono::steady_clock::time_point mDeadline;
    std::unique_ptr<Statements> mStatements;
};

/// A connection that goes back to the idle ones when it is let go.
class LentConnection {
public:
    LentConnection() = default;
    ~LentConnection();
    LentConnection(const LentConnection&) = delete;
    LentConnection& operator=(const LentConnection&) = delete;

    int Acquire(RegistryRoot inRoot, RegistryConnection::Mode inMode);
    RegistryConnection* operator->() const noexcept { return mConnection.get(); }
    RegistryConnection& operator*() const noexcept { return *mConnection; }

private:
    std::string mFile;
    std::unique_ptr<RegistryConnection> mConnection;
};

/// A write transaction; rolled back unless committed.
class RegistryTransaction {
public:
    explicit RegistryTransaction(RegistryConnection& inConnection) noexcept : mConnection(inConnection) {}
    ~RegistryTransaction();
    RegistryTransaction(const RegistryTransaction&) = delete;
    RegistryTransaction& operator=(const RegistryTransaction&) = delete;
    int Begin();
    int Commit();

private:
    RegistryConnection& mConnection;
    bool mIsOpen = false;
};

/// The file of a root, by the environment as it is now.
std::string RegistryFile(RegistryRoot inRoot);
std::chrono::milliseconds RegistryTimeLimit() noexcept;
/// The one form of a path: UTF-8, parts joined by single backslashes. False when it cannot be.
bool NormaliseRegistryPath(const UString& inPath, std::string& outPath);

}  // namespace RFL
