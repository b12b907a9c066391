// The operations of a transaction, one statement each.
#include "Store/SqliteTransaction.h"

#include "Store/SqliteLines.h"

namespace zohub {

namespace {

TokenRecord ReadToken(Statement const& inRow) {
    return {inRow.Text(0), inRow.Text(1), inRow.Text(2), inRow.Text(3), inRow.Number(4), inRow.Number(5)};
}

class SqliteTransaction : public SqliteLines {
public:
    using ReturnFunction = std::function<void(std::unique_ptr<SqliteConnection>)>;

    SqliteTransaction(std::unique_ptr<SqliteConnection> inConnection, ReturnFunction inReturn)
        : SqliteLines(std::move(inConnection)), mReturn(std::move(inReturn)) {}

    ~SqliteTransaction() override {
        try {
            if (!mDone)
                mConnection->Execute("ROLLBACK");
            mReturn(std::move(mConnection));
        } catch (std::exception const&) {
            mConnection.reset();
        }
    }

    void Commit() override {
        mConnection->Execute("COMMIT");
        mDone = true;
    }

    std::optional<UserRecord> FindUser(std::string const& inName) override {
        auto row = mConnection->Prepare(
            "SELECT name,password,first,last,email,admin,created FROM users WHERE name=?");
        if (!row.Bind(inName).Step())
            return std::nullopt;
        return UserRecord{row.Text(0), row.Text(1),        row.Text(2),  row.Text(3),
                          row.Text(4), row.Number(5) != 0, row.Number(6)};
    }

    void PutUser(UserRecord const& inUser) override {
        mConnection->Prepare("INSERT OR REPLACE INTO users VALUES(?,?,?,?,?,?,?)")
            .Bind(inUser.name)
            .Bind(inUser.passwordHash)
            .Bind(inUser.firstName)
            .Bind(inUser.lastName)
            .Bind(inUser.email)
            .Bind(std::int64_t{inUser.isAdmin})
            .Bind(inUser.created)
            .Run();
    }

    void AddToken(TokenRecord const& inToken) override {
        mConnection->Prepare("INSERT INTO tokens VALUES(?,?,?,?,?,?)")
            .Bind(inToken.tokenHash)
            .Bind(inToken.user)
            .Bind(inToken.address)
            .Bind(inToken.userAgent)
            .Bind(inToken.created)
            .Bind(inToken.expires)
            .Run();
    }

    std::optional<TokenRecord> FindToken(std::string const& inTokenHash) override {
        auto row =
            mConnection->Prepare("SELECT hash,user,address,agent,created,expires FROM tokens WHERE hash=?");
        if (!row.Bind(inTokenHash).Step())
            return std::nullopt;
        return ReadToken(row);
    }

    std::vector<TokenRecord> ListTokens(std::string const& inUser, Micros inNow) override {
        auto row = mConnection->Prepare(
            "SELECT hash,user,address,agent,created,expires FROM tokens WHERE user=? AND expires>? "
            "ORDER BY created LIMIT 1000");
        row.Bind(inUser).Bind(inNow);
        std::vector<TokenRecord> tokens;
        while (row.Step())
            tokens.push_back(ReadToken(row));
        return tokens;
    }

    void RemoveToken(std::string const& inTokenHash) override {
        mConnection->Prepare("DELETE FROM tokens WHERE hash=?").Bind(inTokenHash).Run();
    }

    void RemoveTokensExpiredBefore(Micros inTime) override {
        mConnection->Prepare("DELETE FROM tokens WHERE expires<=?").Bind(inTime).Run();
    }

    bool HasGrant(std::string const& inProduction, std::string const& inUser) override {
        return mConnection->Prepare("SELECT 1 FROM access WHERE production=? AND user=?")
            .Bind(inProduction)
            .Bind(inUser)
            .Step();
    }

    void Grant(std::string const& inProduction, std::string const& inUser) override {
        mConnection->Prepare("INSERT OR IGNORE INTO access VALUES(?,?)")
            .Bind(inProduction)
            .Bind(inUser)
            .Run();
    }

    std::optional<std::string> FindObject(std::string const& inHash) override {
        auto row = mConnection->Prepare("SELECT data FROM objects WHERE hash=?");
        return row.Bind(inHash).Step() ? std::optional(row.Text(0)) : std::nullopt;
    }

    void AddObject(std::string const& inHash, std::string_view inText) override {
        mConnection->Prepare("INSERT OR IGNORE INTO objects VALUES(?,?)")
            .Bind(inHash)
            .BindBytes(inText)
            .Run();
    }

    std::optional<std::string> FindContent(std::string const& inHash) override {
        auto row = mConnection->Prepare("SELECT data FROM content WHERE hash=?");
        return row.Bind(inHash).Step() ? std::optional(row.Text(0)) : std::nullopt;
    }

    bool HasContent(std::string const& inHash) override {
        return mConnection->Prepare("SELECT 1 FROM content WHERE hash=?").Bind(inHash).Step();
    }

    void AddContent(std::string const& inHash, std::string_view inBytes) override {
        mConnection->Prepare("INSERT OR IGNORE INTO content(hash,data) VALUES(?,?)")
            .Bind(inHash)
            .BindBytes(inBytes)
            .Run();
    }

    void AddReference(ReferenceRecord const& inReference) override {
        mConnection->Prepare("INSERT OR IGNORE INTO refs VALUES(?,?,?,?,?,?)")
            .Bind(inReference.production)
            .Bind(inReference.kind)
            .Bind(inReference.key)
            .Bind(inReference.item)
            .Bind(inReference.name)
            .Bind(inReference.type)
            .Run();
    }

    std::optional<ReferenceRecord> FindReference(std::string const& inProduction, std::string const& inKind,
                                                 std::string const& inKey) override {
        auto row = mConnection->Prepare(
            "SELECT production,kind,key,item,name,type FROM refs WHERE production=? AND kind=? AND key=?");
        if (!row.Bind(inProduction).Bind(inKind).Bind(inKey).Step())
            return std::nullopt;
        return ReferenceRecord{row.Text(0), row.Text(1), row.Text(2), row.Text(3), row.Text(4), row.Text(5)};
    }

    void CopyReferences(std::string const& inFrom, std::string const& inTo) override {
        mConnection
            ->Prepare(
                "INSERT OR IGNORE INTO refs SELECT ?,kind,key,item,name,type FROM refs "
                "WHERE production=?")
            .Bind(inTo)
            .Bind(inFrom)
            .Run();
    }

    bool IsLocatorVisibleTo(std::string const& inUser, std::string const& inLocator) override {
        return mConnection
            ->Prepare(
                "SELECT 1 FROM refs JOIN lines ON lines.id=refs.production "
                "WHERE refs.kind='locator' AND refs.key=?1 AND (lines.owner=?2 OR "
                "lines.kind='template' OR EXISTS(SELECT 1 FROM access WHERE "
                "access.production=refs.production AND access.user=?2)) LIMIT 1")
            .Bind(inLocator)
            .Bind(inUser)
            .Step();
    }

    std::optional<LocatorRecord> FindLocator(std::string const& inId) override {
        auto row =
            mConnection->Prepare("SELECT id,owner,properties,created,modified FROM locators WHERE id=?");
        if (!row.Bind(inId).Step())
            return std::nullopt;
        return LocatorRecord{row.Text(0), row.Text(1), row.Text(2), row.Number(3), row.Number(4)};
    }

    void PutLocator(LocatorRecord const& inLocator) override {
        mConnection->Prepare("INSERT OR REPLACE INTO locators VALUES(?,?,?,?,?)")
            .Bind(inLocator.id)
            .Bind(inLocator.owner)
            .Bind(inLocator.properties)
            .Bind(inLocator.created)
            .Bind(inLocator.modified)
            .Run();
    }

    std::optional<AnswerRecord> FindAnswer(std::string const& inUser, std::string const& inKey,
                                           Micros inNotBefore) override {
        auto row = mConnection->Prepare(
            "SELECT user,key,fingerprint,status,headers,body,created FROM answers "
            "WHERE user=? AND key=? AND created>=?");
        if (!row.Bind(inUser).Bind(inKey).Bind(inNotBefore).Step())
            return std::nullopt;
        return AnswerRecord{row.Text(0), row.Text(1), row.Text(2),  static_cast<int>(row.Number(3)),
                            row.Text(4), row.Text(5), row.Number(6)};
    }

    void AddAnswer(AnswerRecord const& inAnswer) override {
        mConnection->Prepare("INSERT OR REPLACE INTO answers VALUES(?,?,?,?,?,?,?)")
            .Bind(inAnswer.user)
            .Bind(inAnswer.key)
            .Bind(inAnswer.fingerprint)
            .Bind(std::int64_t{inAnswer.status})
            .Bind(inAnswer.headers)
            .BindBytes(inAnswer.body)
            .Bind(inAnswer.created)
            .Run();
    }

    void RemoveAnswersBefore(Micros inTime) override {
        mConnection->Prepare("DELETE FROM answers WHERE created<?").Bind(inTime).Run();
    }

    void KeepNewestAnswers(std::int64_t inCount) override {
        mConnection
            ->Prepare(
                "DELETE FROM answers WHERE created<(SELECT created FROM answers ORDER BY created DESC LIMIT "
                "1 "
                "OFFSET ?)")
            .Bind(inCount - 1)
            .Run();
    }

    void VisitObjects(Visitor const& inVisitor) override {
        auto row = mConnection->Prepare("SELECT hash,data FROM objects");
        while (row.Step())
            inVisitor(row.Text(0), row.View(1));
    }

    void VisitContent(Visitor const& inVisitor) override {
        auto row = mConnection->Prepare("SELECT hash,data FROM content ORDER BY id");
        while (row.Step())
            inVisitor(row.Text(0), row.View(1));
    }

    std::string CheckIntegrity() override {
        auto row = mConnection->Prepare("PRAGMA integrity_check(20)");
        std::string findings;
        while (row.Step())
            if (row.View(0) != "ok")
                findings += (findings.empty() ? "" : "; ") + row.Text(0);
        return findings;
    }

private:
    ReturnFunction mReturn;
    bool mDone = false;
};

}  // namespace

std::unique_ptr<Transaction> MakeSqliteTransaction(
    std::unique_ptr<SqliteConnection> inConnection,
    std::function<void(std::unique_ptr<SqliteConnection>)> inReturn) {
    return std::make_unique<SqliteTransaction>(std::move(inConnection), std::move(inReturn));
}

}  // namespace zohub
