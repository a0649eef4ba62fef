// The library's table functions as SQLite table-valued functions.
#pragma once

struct sqlite3;

namespace orv::host {

// Registers every table function of the catalogue that the library
// exports, as sysfun_<name> and, where the connection has no module of
// that name, as its plain name.  SQLite result code; *error is set on
// failure.
int registerTables(sqlite3 *db, void *library, char **error);

}  // namespace orv::host
