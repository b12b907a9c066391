// Makes the SQLite form of a transaction on a connection that is already inside BEGIN.
#pragma once

#include <functional>
#include <memory>

#include "Store/SqliteConnection.h"
#include "Store/Storage.h"

namespace zohub {

/// inReturn gets the connection back at the end, outside of any transaction; a connection that could not be
/// brought out of its transaction is closed instead.
std::unique_ptr<Transaction> MakeSqliteTransaction(
    std::unique_ptr<SqliteConnection> inConnection,
    std::function<void(std::unique_ptr<SqliteConnection>)> inReturn);

}  // namespace zohub
