// One SQLite connection with its prepared statements, and a statement as a small typed value.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <string_view>

namespace zohub {

/// A prepared statement in use. Binds in order, steps, and hands its columns out; resets itself at its end.
class Statement {
public:
    explicit Statement(sqlite3_stmt* inStatement) : mStatement(inStatement) {}
    ~Statement();
    Statement(Statement const&) = delete;
    Statement& operator=(Statement const&) = delete;

    Statement& Bind(std::string_view inText);
    Statement& Bind(std::int64_t inNumber);
    Statement& BindBytes(std::string_view inBytes);

    /// True while there is a row.
    bool Step();
    void Run() { Step(); }

    std::string Text(int inColumn) const;
    std::string_view View(int inColumn) const;
    std::int64_t Number(int inColumn) const;

private:
    sqlite3_stmt* mStatement;
    int mNext = 1;
};

class SqliteConnection {
public:
    explicit SqliteConnection(std::string const& inPath);
    ~SqliteConnection();
    SqliteConnection(SqliteConnection const&) = delete;
    SqliteConnection& operator=(SqliteConnection const&) = delete;

    void Execute(char const* inSql);
    /// The literal is the key of the statement cache: always pass a string literal.
    Statement Prepare(char const* inSql);

private:
    sqlite3* mDatabase = nullptr;
    std::map<char const*, sqlite3_stmt*> mStatements;
};

}  // namespace zohub
