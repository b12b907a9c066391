// The hub's data in one SQLite file: WAL, full sync, a small pool of connections.
#include <sys/stat.h>

#include <filesystem>
#include <mutex>
#include <stdexcept>

#include "Store/SqliteConnection.h"
#include "Store/SqliteTransaction.h"
#include "Store/Storage.h"

namespace zohub {

namespace {

constexpr std::int64_t kSchemaVersion = 1;
constexpr std::size_t kIdleConnections = 8;

constexpr char kSchema[] = R"(
CREATE TABLE IF NOT EXISTS users(
  name TEXT PRIMARY KEY, password TEXT NOT NULL, first TEXT NOT NULL, last TEXT NOT NULL,
  email TEXT NOT NULL, admin INTEGER NOT NULL, created INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS tokens(
  hash TEXT PRIMARY KEY, user TEXT NOT NULL, address TEXT NOT NULL, agent TEXT NOT NULL,
  created INTEGER NOT NULL, expires INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX IF NOT EXISTS tokens_by_user ON tokens(user);
CREATE INDEX IF NOT EXISTS tokens_by_expiry ON tokens(expires);
CREATE TABLE IF NOT EXISTS lines(
  id TEXT PRIMARY KEY, kind TEXT NOT NULL, parent TEXT NOT NULL, production TEXT NOT NULL,
  owner TEXT NOT NULL, base TEXT NOT NULL, head TEXT NOT NULL, metadata TEXT NOT NULL,
  temporary INTEGER NOT NULL, created INTEGER NOT NULL, modified INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX IF NOT EXISTS lines_by_kind ON lines(kind, created);
CREATE INDEX IF NOT EXISTS lines_by_parent ON lines(parent);
CREATE TABLE IF NOT EXISTS access(
  production TEXT NOT NULL, user TEXT NOT NULL, PRIMARY KEY(production, user)) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS commits(
  id TEXT PRIMARY KEY, production TEXT NOT NULL, parent TEXT NOT NULL, tree TEXT NOT NULL,
  title TEXT NOT NULL, committer TEXT NOT NULL, time INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS objects(hash TEXT PRIMARY KEY, data BLOB NOT NULL) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS content(id INTEGER PRIMARY KEY, hash TEXT NOT NULL UNIQUE, data BLOB NOT NULL);
CREATE TABLE IF NOT EXISTS refs(
  production TEXT NOT NULL, kind TEXT NOT NULL, key TEXT NOT NULL, item TEXT NOT NULL,
  name TEXT NOT NULL, type TEXT NOT NULL, PRIMARY KEY(production, kind, key)) WITHOUT ROWID;
CREATE INDEX IF NOT EXISTS refs_by_key ON refs(kind, key);
CREATE TABLE IF NOT EXISTS locators(
  id TEXT PRIMARY KEY, owner TEXT NOT NULL, properties TEXT NOT NULL,
  created INTEGER NOT NULL, modified INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS answers(
  user TEXT NOT NULL, key TEXT NOT NULL, fingerprint TEXT NOT NULL, status INTEGER NOT NULL,
  headers TEXT NOT NULL, body BLOB NOT NULL, created INTEGER NOT NULL, PRIMARY KEY(user, key)) WITHOUT ROWID;
CREATE INDEX IF NOT EXISTS answers_by_age ON answers(created);
)";

class SqliteStorage : public Storage {
public:
    explicit SqliteStorage(std::string const& inDirectory) : mPath(inDirectory + "/hub.sqlite") {
        auto connection = std::make_unique<SqliteConnection>(mPath);
        chmod(mPath.c_str(), S_IRUSR | S_IWUSR);
        CreateSchema(*connection);
        Return(std::move(connection));
    }

    std::unique_ptr<Transaction> BeginRead() override { return Begin("BEGIN DEFERRED"); }

    std::unique_ptr<Transaction> BeginWrite() override { return Begin("BEGIN IMMEDIATE"); }

private:
    void CreateSchema(SqliteConnection& inConnection) {
        std::int64_t version = 0;
        {
            auto statement = inConnection.Prepare("PRAGMA user_version");
            if (statement.Step())
                version = statement.Number(0);
        }
        if (version > kSchemaVersion)
            throw std::runtime_error("the data in " + mPath +
                                     " was written by a newer zohub; start that one instead");
        if (version == kSchemaVersion)
            return;
        inConnection.Execute("BEGIN IMMEDIATE");
        inConnection.Execute(kSchema);
        inConnection.Execute("PRAGMA user_version=1");
        inConnection.Execute("COMMIT");
    }

    std::unique_ptr<Transaction> Begin(char const* inCommand) {
        auto connection = Take();
        connection->Execute(inCommand);
        return MakeSqliteTransaction(std::move(connection),
                                     [this](auto inBack) { Return(std::move(inBack)); });
    }

    std::unique_ptr<SqliteConnection> Take() {
        {
            std::lock_guard const lock(mMutex);
            if (!mIdle.empty()) {
                auto connection = std::move(mIdle.back());
                mIdle.pop_back();
                return connection;
            }
        }
        return std::make_unique<SqliteConnection>(mPath);
    }

    void Return(std::unique_ptr<SqliteConnection> inConnection) {
        std::lock_guard const lock(mMutex);
        if (mIdle.size() < kIdleConnections)
            mIdle.push_back(std::move(inConnection));
    }

    std::string const mPath;
    std::mutex mMutex;
    std::vector<std::unique_ptr<SqliteConnection>> mIdle;
};

}  // namespace

std::unique_ptr<Storage> OpenSqliteStorage(std::string const& inDirectory) {
    std::filesystem::create_directories(inDirectory);
    chmod(inDirectory.c_str(), S_IRWXU);
    return std::make_unique<SqliteStorage>(inDirectory);
}

}  // namespace zohub
