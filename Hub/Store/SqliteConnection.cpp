// One SQLite connection with its prepared statements.
#include "Store/SqliteConnection.h"

#include <cerrno>
#include <stdexcept>

#include "Base/Error.h"

namespace zohub {

namespace {

constexpr int kBusyMilliseconds = 15000;

[[noreturn]] void Fail(sqlite3* inDatabase, char const* inWhat) {
    int const code = sqlite3_errcode(inDatabase);
    if (code == SQLITE_BUSY || code == SQLITE_LOCKED)
        throw Failure(503, "database-busy",
                      "The database is in use by another long write; try the request again in a moment.");
    bool const isFull =
        code == SQLITE_FULL || (code == SQLITE_IOERR && sqlite3_system_errno(inDatabase) == ENOSPC);
    if (isFull)
        throw Failure(507, "storage-full",
                      "The hub's disk is full; nothing was changed. Make room and repeat it.");
    throw std::runtime_error(std::string("database: ") + inWhat + ": " + sqlite3_errmsg(inDatabase));
}

}  // namespace

Statement::~Statement() {
    sqlite3_reset(mStatement);
    sqlite3_clear_bindings(mStatement);
}

Statement& Statement::Bind(std::string_view inText) {
    // A null pointer would be bound as NULL; an empty view may carry one.
    char const* const text = inText.data() ? inText.data() : "";
    sqlite3_bind_text64(mStatement, mNext++, text, inText.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
    return *this;
}

Statement& Statement::Bind(std::int64_t inNumber) {
    sqlite3_bind_int64(mStatement, mNext++, inNumber);
    return *this;
}

Statement& Statement::BindBytes(std::string_view inBytes) {
    // The bytes outlive the step: callers bind and run in one expression.
    char const* const bytes = inBytes.data() ? inBytes.data() : "";
    sqlite3_bind_blob64(mStatement, mNext++, bytes, inBytes.size(), SQLITE_STATIC);
    return *this;
}

bool Statement::Step() {
    int const result = sqlite3_step(mStatement);
    if (result == SQLITE_ROW)
        return true;
    if (result != SQLITE_DONE)
        Fail(sqlite3_db_handle(mStatement), "statement");
    return false;
}

std::string_view Statement::View(int inColumn) const {
    auto const* const bytes = static_cast<char const*>(sqlite3_column_blob(mStatement, inColumn));
    auto const size = static_cast<std::size_t>(sqlite3_column_bytes(mStatement, inColumn));
    return bytes ? std::string_view(bytes, size) : std::string_view();
}

std::string Statement::Text(int inColumn) const {
    return std::string(View(inColumn));
}

std::int64_t Statement::Number(int inColumn) const {
    return sqlite3_column_int64(mStatement, inColumn);
}

SqliteConnection::SqliteConnection(std::string const& inPath) {
    int const flags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX;
    if (sqlite3_open_v2(inPath.c_str(), &mDatabase, flags, nullptr) != SQLITE_OK) {
        std::string const reason = sqlite3_errmsg(mDatabase);
        sqlite3_close(mDatabase);
        throw std::runtime_error("cannot open the database " + inPath + ": " + reason +
                                 "; check that the directory can be written by this user");
    }
    try {
        sqlite3_busy_timeout(mDatabase, kBusyMilliseconds);
        Execute("PRAGMA journal_mode=WAL");
        Execute("PRAGMA synchronous=FULL");
        Execute("PRAGMA cache_size=-16384");
        Execute("PRAGMA temp_store=MEMORY");
    } catch (...) {
        sqlite3_close(mDatabase);
        throw;
    }
}

SqliteConnection::~SqliteConnection() {
    for (auto const& [sql, statement] : mStatements)
        sqlite3_finalize(statement);
    sqlite3_close(mDatabase);
}

void SqliteConnection::Execute(char const* inSql) {
    if (sqlite3_exec(mDatabase, inSql, nullptr, nullptr, nullptr) != SQLITE_OK)
        Fail(mDatabase, "command");
}

Statement SqliteConnection::Prepare(char const* inSql) {
    sqlite3_stmt*& statement = mStatements[inSql];
    if (!statement &&
        sqlite3_prepare_v3(mDatabase, inSql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) != SQLITE_OK)
        Fail(mDatabase, "prepare");
    return Statement(statement);
}

}  // namespace zohub
