// sysfun_version() and the table sysfun_functions: what the extension
// offers, from the catalogue.
#pragma once

#include <vector>

#include "registry.hpp"

struct sqlite3;

namespace orv::sqlite {

// Registers both; `plain[g]` tells whether group g also has its plain
// name on this connection.  SQLite result code.
int registerAbout(sqlite3 *db, const std::vector<Group> &groups, const std::vector<bool> &plain);

}  // namespace orv::sqlite
