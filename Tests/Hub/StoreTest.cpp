// What lies in the database: data of the first version is brought up to date, and check finds what is wrong
// with sessions, transactions and conflicts.
#include <sqlite3.h>

#include "Commands/Checker.h"
#include "SessionFixture.h"

namespace zohub::test {

namespace fs = std::filesystem;

namespace {

void RunSql(fs::path const& inDirectory, std::string const& inSql) {
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open((inDirectory / "hub.sqlite").c_str(), &database), SQLITE_OK);
    char* error = nullptr;
    sqlite3_exec(database, inSql.c_str(), nullptr, nullptr, &error);
    EXPECT_EQ(error, nullptr) << inSql << ": " << error;
    sqlite3_free(error);
    sqlite3_close(database);
}

// A copy of the hub's data, in a directory of its own, after the statements were run on it.
class ChangedCopy {
public:
    ChangedCopy(fs::path const& inSource, std::string const& inSql) {
        RunSql(inSource, "VACUUM INTO '" + (mDirectory.Path() / "hub.sqlite").string() + "'");
        RunSql(mDirectory.Path(), inSql);
    }

    std::unique_ptr<Storage> Open() const { return OpenSqliteStorage(mDirectory.Path().string()); }

private:
    TemporaryDirectory mDirectory;
};

constexpr char kBackToFirstVersion[] = R"(
DROP TABLE conflicts;
DROP TABLE notes;
DROP INDEX commits_by_line;
DROP INDEX lines_on_parent;
ALTER TABLE commits DROP COLUMN line;
ALTER TABLE commits DROP COLUMN number;
ALTER TABLE lines DROP COLUMN ended;
CREATE INDEX lines_by_parent ON lines(parent);
PRAGMA user_version=1;
)";

}  // namespace

class StoreTest : public SessionTest {};

TEST_F(StoreTest, DataOfTheFirstVersionIsBroughtUpToDate) {
    Json const production = MakeSharedProduction();
    for (char const* id : {"a", "b", "c"})
        AddAsset(mAnna, production, id, "first");
    MakeProduction(mAnna, "Other");
    ChangedCopy const old(mHub.DataPath(), kBackToFirstVersion);
    auto const storage = old.Open();
    EXPECT_EQ(CheckStorage(*storage).problems, std::vector<std::string>());
    auto const transaction = storage->BeginRead();
    Repository repository(*transaction);
    View const view = repository.Open(production["zo:productionId"].get<std::string>(), "", {"anna", false});
    EXPECT_EQ(view.commit.number, 4);
    EXPECT_EQ(view.commit.line, view.line.id);
    EXPECT_EQ(view.tree.assetCount, 3u);
    EXPECT_EQ(CheckStorage(*old.Open()).problems, std::vector<std::string>()) << "a second time";
}

TEST_F(StoreTest, DataOfALaterVersionIsLeftAlone) {
    ChangedCopy const later(mHub.DataPath(), "PRAGMA user_version=99");
    EXPECT_THROW(later.Open(), std::runtime_error);
}

TEST_F(StoreTest, CheckFindsWhatIsWrongWithSessions) {
    Json const production = MakeSharedProduction();
    AddAsset(mAnna, production, "a", "first");
    Json const mine = MakeSession(mAnna, production);
    Client const ben = mHub.SignedIn("ben");
    Json const his = MakeSession(ben, production);
    RenameInSession(ben, his, "a", "his");
    ASSERT_EQ(Push(ben, his, "his").status, 200);
    RenameInSession(mAnna, mine, "a", "mine");
    ASSERT_EQ(Pull(mAnna, mine, "interactive").status, 200);
    AddAsset(mAnna, MakeTransaction(mAnna, mine), "b", "open");
    Json const ended = MakeTransaction(mAnna, mine);
    AddAsset(mAnna, ended, "c", "ended");
    Commit(mAnna, ended);
    mAnna.SendForm("POST", LinkOf(mine, "/enclosures"), Form().Add(":name", "n").Add(":enclosure", "note"));
    ASSERT_EQ(Problems(), std::vector<std::string>());

    for (std::string const sql :
         {"UPDATE lines SET head='x' WHERE kind='session'",
          "UPDATE lines SET base='x' WHERE kind='session'",
          "UPDATE lines SET base=(SELECT id FROM commits WHERE number=1) WHERE kind='session'",
          "UPDATE lines SET head=(SELECT id FROM commits WHERE number=1) WHERE kind='session'",
          "UPDATE lines SET parent='x' WHERE kind='session'",
          "UPDATE lines SET owner='nobody'",
          "UPDATE lines SET parent='x' WHERE kind='transaction'",
          "UPDATE lines SET base='x' WHERE kind='transaction'",
          "UPDATE lines SET owner='ben' WHERE kind='transaction'",
          "UPDATE lines SET ended=1 WHERE kind='transaction'",
          "UPDATE lines SET head=base WHERE kind='production'",
          "UPDATE lines SET head=(SELECT parent FROM commits WHERE id=head) WHERE kind='production'",
          "DELETE FROM lines WHERE kind='session'",
          "UPDATE commits SET number=number+1 WHERE number>1",
          "UPDATE commits SET line='x' WHERE title='renamed a'",
          "DELETE FROM commits WHERE title='his'",
          "UPDATE conflicts SET session='x'",
          "UPDATE conflicts SET item='x'",
          "UPDATE conflicts SET theirs='x'",
          "UPDATE conflicts SET base='x'",
          "UPDATE conflicts SET kind='enclosure', name='x'",
          "UPDATE notes SET session='x'",
          "DELETE FROM refs WHERE kind='asset'",
          "DELETE FROM refs WHERE production IN (SELECT id FROM lines WHERE kind='session')",
          "DELETE FROM content"}) {
        ChangedCopy const damaged(mHub.DataPath(), sql);
        EXPECT_NE(CheckStorage(*damaged.Open()).problems, std::vector<std::string>()) << sql;
    }
}

}  // namespace zohub::test
