// Payloads as blobs of a SQLite database in WAL mode, one transaction each.
#pragma once

#include <sqlite3.h>

#include <string>
#include <string_view>

class SqliteBlobs {
public:
    explicit SqliteBlobs(const std::string& inFile);
    ~SqliteBlobs();
    SqliteBlobs(const SqliteBlobs&) = delete;
    SqliteBlobs& operator=(const SqliteBlobs&) = delete;

    bool Write(std::string_view inKey, std::string_view inPayload);
    bool Read(std::string_view inKey, std::string& outPayload);

private:
    bool Run(const char* inSQL);

    sqlite3* mDatabase = nullptr;
    sqlite3_stmt* mInsert = nullptr;
    sqlite3_stmt* mSelect = nullptr;
};
