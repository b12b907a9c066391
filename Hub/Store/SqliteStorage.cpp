// The hub's data in one SQLite file: WAL, full sync, a small pool of connections.
#include <sys/stat.h>

#include <filesystem>
#include <mutex>

#include "Store/SqliteConnection.h"
#include "Store/SqliteSchema.h"
#include "Store/SqliteTransaction.h"
#include "Store/Storage.h"

namespace zohub {

namespace {

constexpr std::size_t kIdleConnections = 8;

class SqliteStorage : public Storage {
public:
    explicit SqliteStorage(std::string const& inDirectory)
        : mPath(inDirectory + "/hub.sqlite"), mKeeper(mPath) {
        chmod(mPath.c_str(), S_IRUSR | S_IWUSR);
        PrepareSchema(mKeeper, mPath);
    }

    std::unique_ptr<Transaction> BeginRead() override { return Begin("BEGIN DEFERRED"); }

    std::unique_ptr<Transaction> BeginWrite() override { return Begin("BEGIN IMMEDIATE"); }

private:
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
    /// Does nothing but stay: with the last connection SQLite's shared index would go, and to make it anew
    /// takes room, so that on a full disk even reading would fail.
    SqliteConnection mKeeper;
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
