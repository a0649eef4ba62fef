// Whether a connection already has a function of a given name and
// argument count.  Include after sqlite3.h or sqlite3ext.h: the same check
// runs in the extension, through SQLite's routine table, and in the tool
// that writes the function reference, against the linked library.
#pragma once

namespace orv::host {

// A function of variable argument count (narg -1) takes every count.  When
// the connection can't be asked, the answer is yes, so that no built-in is
// ever hidden by one of ours.
inline bool sqliteHasFunction(sqlite3 *db, const char *name, int argumentCount) {
  sqlite3_stmt *statement = nullptr;
  if (sqlite3_prepare_v2(db,
                         "SELECT 1 FROM pragma_function_list "
                         "WHERE name = ?1 COLLATE NOCASE AND narg IN (?2, -1)",
                         -1, &statement, nullptr) != SQLITE_OK) {
    sqlite3_finalize(statement);
    return true;
  }
  sqlite3_bind_text(statement, 1, name, -1, SQLITE_STATIC);
  sqlite3_bind_int(statement, 2, argumentCount);
  const bool found = sqlite3_step(statement) == SQLITE_ROW;
  sqlite3_finalize(statement);
  return found;
}

}  // namespace orv::host
