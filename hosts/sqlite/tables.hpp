// The library's table functions as SQLite table-valued functions.
#pragma once

#include "common/exports.hpp"

struct sqlite3;

namespace orv::sqlite {

// Registers every table function of the catalogue with its export, as
// sysfun_<name> and, where the connection has no module of that name, as
// its plain name.  SQLite result code; *error is set on failure, also when
// the library has no such export.
int registerTables(sqlite3 *db, const host::Exports &exports, char **error);

}  // namespace orv::sqlite
