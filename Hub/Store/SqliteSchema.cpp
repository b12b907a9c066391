// The tables of the database, step by step from the first version to the present one.
#include "Store/SqliteSchema.h"

#include <stdexcept>

namespace zohub {

namespace {

constexpr char kFirstVersion[] = R"(
CREATE TABLE users(
  name TEXT PRIMARY KEY, password TEXT NOT NULL, first TEXT NOT NULL, last TEXT NOT NULL,
  email TEXT NOT NULL, admin INTEGER NOT NULL, created INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE tokens(
  hash TEXT PRIMARY KEY, user TEXT NOT NULL, address TEXT NOT NULL, agent TEXT NOT NULL,
  created INTEGER NOT NULL, expires INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX tokens_by_user ON tokens(user);
CREATE INDEX tokens_by_expiry ON tokens(expires);
CREATE TABLE lines(
  id TEXT PRIMARY KEY, kind TEXT NOT NULL, parent TEXT NOT NULL, production TEXT NOT NULL,
  owner TEXT NOT NULL, base TEXT NOT NULL, head TEXT NOT NULL, metadata TEXT NOT NULL,
  temporary INTEGER NOT NULL, created INTEGER NOT NULL, modified INTEGER NOT NULL) WITHOUT ROWID;
CREATE INDEX lines_by_kind ON lines(kind, created);
CREATE INDEX lines_by_parent ON lines(parent);
CREATE TABLE access(
  production TEXT NOT NULL, user TEXT NOT NULL, PRIMARY KEY(production, user)) WITHOUT ROWID;
CREATE TABLE commits(
  id TEXT PRIMARY KEY, production TEXT NOT NULL, parent TEXT NOT NULL, tree TEXT NOT NULL,
  title TEXT NOT NULL, committer TEXT NOT NULL, time INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE objects(hash TEXT PRIMARY KEY, data BLOB NOT NULL) WITHOUT ROWID;
CREATE TABLE content(id INTEGER PRIMARY KEY, hash TEXT NOT NULL UNIQUE, data BLOB NOT NULL);
CREATE TABLE refs(
  production TEXT NOT NULL, kind TEXT NOT NULL, key TEXT NOT NULL, item TEXT NOT NULL,
  name TEXT NOT NULL, type TEXT NOT NULL, PRIMARY KEY(production, kind, key)) WITHOUT ROWID;
CREATE INDEX refs_by_key ON refs(kind, key);
CREATE TABLE locators(
  id TEXT PRIMARY KEY, owner TEXT NOT NULL, properties TEXT NOT NULL,
  created INTEGER NOT NULL, modified INTEGER NOT NULL) WITHOUT ROWID;
CREATE TABLE answers(
  user TEXT NOT NULL, key TEXT NOT NULL, fingerprint TEXT NOT NULL, status INTEGER NOT NULL,
  headers TEXT NOT NULL, body BLOB NOT NULL, created INTEGER NOT NULL, PRIMARY KEY(user, key)) WITHOUT ROWID;
CREATE INDEX answers_by_age ON answers(created);
)";

// Sessions and transactions: commits know the line on which they were made, and how far along it they are.
constexpr char kSecondVersion[] = R"(
ALTER TABLE lines ADD COLUMN ended INTEGER NOT NULL DEFAULT 0;
DROP INDEX lines_by_parent;
CREATE INDEX lines_on_parent ON lines(parent, kind, ended, owner);
ALTER TABLE commits ADD COLUMN line TEXT NOT NULL DEFAULT '';
ALTER TABLE commits ADD COLUMN number INTEGER NOT NULL DEFAULT 0;
CREATE INDEX commits_by_parent ON commits(parent);
CREATE TEMP TABLE chain(id TEXT PRIMARY KEY, number INTEGER NOT NULL) WITHOUT ROWID;
INSERT INTO chain
  WITH RECURSIVE walk(id, number) AS (
    SELECT id, 1 FROM commits WHERE parent=''
    UNION ALL SELECT commits.id, walk.number+1 FROM walk JOIN commits ON commits.parent=walk.id)
  SELECT id, number FROM walk;
UPDATE commits SET line=production,
  number=COALESCE((SELECT chain.number FROM chain WHERE chain.id=commits.id), 0);
DROP TABLE chain;
DROP INDEX commits_by_parent;
CREATE INDEX commits_by_line ON commits(line);
CREATE TABLE conflicts(
  session TEXT NOT NULL, kind TEXT NOT NULL, item TEXT NOT NULL, name TEXT NOT NULL,
  theirs TEXT NOT NULL, base TEXT NOT NULL, PRIMARY KEY(session, kind, item, name)) WITHOUT ROWID;
CREATE TABLE notes(
  session TEXT NOT NULL, id TEXT NOT NULL, name TEXT NOT NULL, type TEXT NOT NULL,
  content TEXT NOT NULL, size INTEGER NOT NULL, PRIMARY KEY(session, id)) WITHOUT ROWID;
)";

struct Step {
    char const* change;
    char const* mark;
};

// What leads from version i to i + 1. The mark goes into the same transaction as the change.
constexpr Step kSteps[] = {{kFirstVersion, "PRAGMA user_version=1"},
                           {kSecondVersion, "PRAGMA user_version=2"}};
constexpr std::int64_t kPresentVersion = std::size(kSteps);

std::int64_t VersionOf(SqliteConnection& inConnection) {
    auto statement = inConnection.Prepare("PRAGMA user_version");
    return statement.Step() ? statement.Number(0) : 0;
}

}  // namespace

void PrepareSchema(SqliteConnection& inConnection, std::string const& inPath) {
    if (VersionOf(inConnection) == kPresentVersion)
        return;
    inConnection.Execute("BEGIN IMMEDIATE");
    try {
        // Another process may have been here meanwhile.
        std::int64_t const version = VersionOf(inConnection);
        if (version > kPresentVersion)
            throw std::runtime_error("the data in " + inPath +
                                     " was written by a newer zohub; start that one instead");
        for (std::int64_t at = version; at < kPresentVersion; ++at) {
            inConnection.Execute(kSteps[at].change);
            inConnection.Execute(kSteps[at].mark);
        }
        inConnection.Execute("COMMIT");
    } catch (...) {
        inConnection.Execute("ROLLBACK");
        throw;
    }
}

}  // namespace zohub
