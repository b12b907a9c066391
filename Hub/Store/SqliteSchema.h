// The tables of the database, and the way from those of earlier versions to the present ones.
#pragma once

#include <string>

#include "Store/SqliteConnection.h"

namespace zohub {

/// Makes the tables, or brings those of an earlier version up to date with all that is in them. Several
/// processes may do it at the same time. Throws std::runtime_error for data of a later version; inPath names
/// the file in the text.
void PrepareSchema(SqliteConnection& inConnection, std::string const& inPath);

}  // namespace zohub
