#include "SqliteBlobs.h"

#include <stdexcept>

bool SqliteBlobs::Run(const char* inSQL) {
    return sqlite3_exec(mDatabase, inSQL, nullptr, nullptr, nullptr) == SQLITE_OK;
}

SqliteBlobs::SqliteBlobs(const std::string& inFile) {
    if (sqlite3_open(inFile.c_str(), &mDatabase) != SQLITE_OK || !Run("PRAGMA journal_mode=WAL") ||
        !Run("PRAGMA synchronous=NORMAL") || !Run("CREATE TABLE blobs(key TEXT PRIMARY KEY, payload BLOB)") ||
        sqlite3_prepare_v2(mDatabase, "INSERT OR REPLACE INTO blobs VALUES(?,?)", -1, &mInsert, nullptr) !=
            SQLITE_OK ||
        sqlite3_prepare_v2(mDatabase, "SELECT payload FROM blobs WHERE key=?", -1, &mSelect, nullptr) !=
            SQLITE_OK) {
        throw std::runtime_error("no database");
    }
}

SqliteBlobs::~SqliteBlobs() {
    sqlite3_finalize(mInsert);
    sqlite3_finalize(mSelect);
    sqlite3_close(mDatabase);
}

bool SqliteBlobs::Write(std::string_view inKey, std::string_view inPayload) {
    sqlite3_bind_text(mInsert, 1, inKey.data(), static_cast<int>(inKey.size()), SQLITE_STATIC);
    sqlite3_bind_blob(mInsert, 2, inPayload.data(), static_cast<int>(inPayload.size()), SQLITE_STATIC);
    const bool isDone = sqlite3_step(mInsert) == SQLITE_DONE;
    sqlite3_reset(mInsert);
    return isDone;
}

bool SqliteBlobs::Read(std::string_view inKey, std::string& outPayload) {
    sqlite3_bind_text(mSelect, 1, inKey.data(), static_cast<int>(inKey.size()), SQLITE_STATIC);
    const bool isFound = sqlite3_step(mSelect) == SQLITE_ROW;
    if (isFound) {
        const auto* const bytes = static_cast<const char*>(sqlite3_column_blob(mSelect, 0));
        outPayload.assign(bytes, static_cast<std::size_t>(sqlite3_column_bytes(mSelect, 0)));
    }
    sqlite3_reset(mSelect);
    return isFound;
}
