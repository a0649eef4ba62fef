// The SQLite loadable extension: every routine of the library as an SQL
// function, registered from the catalogue.
//
// The extension plays the engine's part.  It finds each export by its name
// in the library (common/exports.hpp) and registers one SQL function per
// name and argument count (registry.hpp); the call path (forms.cpp) lays
// the SQL arguments out in the export's value layouts, calls it
// (common/call.hpp) and turns the result, or the status, into an SQLite
// result or error.
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT1

#include <memory>
#include <mutex>
#include <new>
#include <string>
#include <system_error>
#include <vector>

#include "about.hpp"
#include "builtin_names.hpp"
#include "common/exports.hpp"
#include "connection.hpp"
#include "registry.hpp"
#include "tables.hpp"

namespace {

using cli::catalogue::kRoutines;
using orv::sqlite::Connection;
using orv::sqlite::Function;
using orv::sqlite::KindMask;

void release(void *p) {
  const auto *f = static_cast<Function *>(p);
  Connection *connection = f->connection;
  delete f;
  if (--connection->functions == 0) delete connection;
}

int registerFunction(sqlite3 *db, const std::string &name, const orv::sqlite::Group &g,
                     Connection *connection) {
  auto f = std::make_unique<Function>();
  f->connection = connection;
  f->label = g.label;
  f->stringArguments = 0;
  f->handlesNull = true;
  unsigned properties = cli::catalogue::kPure;
  for (std::size_t row : g.rows) {
    properties &= kRoutines[row].properties;
    f->handlesNull = f->handlesNull && (kRoutines[row].properties & cli::catalogue::kHandlesNull);
  }
  for (int i = 0; i < g.argumentCount; ++i) {
    if (!orv::host::isNumber(kRoutines[g.rows[0]].inputs[i].layout)) f->stringArguments |= 1u << i;
  }
  for (KindMask m = 0; m < f->formFor.size(); ++m) f->formFor[m] = orv::sqlite::chooseForm(g, m);
  for (int i = 0; i < g.argumentCount; ++i) {
    f->argumentNames[static_cast<std::size_t>(i)] = kRoutines[g.rows[0]].inputs[i].name;
  }
  f->longerForm = orv::sqlite::longerForm(g);

  // Every group takes plain arguments (short text, integers); the row they
  // reach names the SQL function's entry.
  const int usual = f->formFor[0];
  if (usual == orv::sqlite::kNoForm) return SQLITE_INTERNAL;

  int flags = SQLITE_UTF8;
  if (properties & cli::catalogue::kDeterministic) flags |= SQLITE_DETERMINISTIC;
  flags |= (properties & cli::catalogue::kInnocuous) ? SQLITE_INNOCUOUS : SQLITE_DIRECTONLY;
  ++connection->functions;
  return sqlite3_create_function_v2(db, name.c_str(), g.argumentCount, flags, f.release(),
                                    orv::sqlite::kEntries[static_cast<std::size_t>(usual)], nullptr,
                                    nullptr, release);
}

int initialise(sqlite3 *db, char **error) {
  const orv::host::Library library = orv::host::openLibrary();
  if (library.failure == orv::host::Library::Failure::whereabouts) {
    *error = sqlite3_mprintf("orvclifn: cannot tell where the library was loaded from");
    return SQLITE_ERROR;
  }
  if (library.failure == orv::host::Library::Failure::open) {
    *error = sqlite3_mprintf("orvclifn: %s", library.error);
    return SQLITE_ERROR;
  }

  orv::host::Exports exports{};
  orv::host::findExports(library, exports);
  // The scalar functions' exports first; the tables' are asked for when
  // they are registered.
  if (const cli::catalogue::Routine *missing =
          orv::host::firstMissing(exports, orv::sqlite::hostable)) {
    *error = sqlite3_mprintf("orvclifn: the library has no export %s", missing->symbol);
    return SQLITE_ERROR;
  }
  auto connection = std::make_unique<Connection>();
  connection->exports = exports;

  // Decide on the plain names before registering anything, so that our own
  // functions don't hide a name from the check.
  static const std::vector<orv::sqlite::Group> groups = orv::sqlite::groups();
  const orv::sqlite::KnownFunctions known(db);
  std::vector<bool> plain(groups.size());
  for (std::size_t g = 0; g < groups.size(); ++g) {
    plain[g] = !groups[g].plainName.empty() &&
               !known.has(groups[g].plainName.c_str(), groups[g].argumentCount);
  }

  // The connection is freed with its last function from here on.
  Connection *shared = connection.release();
  ++shared->functions;
  int rc = SQLITE_OK;
  for (std::size_t g = 0; g < groups.size() && rc == SQLITE_OK; ++g) {
    rc = registerFunction(db, groups[g].sysfunName, groups[g], shared);
    if (rc == SQLITE_OK && plain[g])
      rc = registerFunction(db, groups[g].plainName, groups[g], shared);
  }
  if (--shared->functions == 0) delete shared;
  if (rc == SQLITE_OK) rc = orv::sqlite::registerAbout(db, groups, plain);
  if (rc != SQLITE_OK) {
    *error = sqlite3_mprintf("orvclifn: %s", sqlite3_errmsg(db));
    return rc;
  }
  return orv::sqlite::registerTables(db, exports, error);
}

}  // namespace

// Entry points: the one SQLite derives from the file name, and the default.
extern "C" __attribute__((visibility("default"))) int sqlite3_orvclifnsqlite_init(
    sqlite3 *db, char **error, const sqlite3_api_routines *api) {
  // The table of SQLite's routines is the extension's one global, the same
  // for every connection of the process: set once, so that a connection
  // loading the extension never writes it while another one reads it.
  static std::once_flag once;
  try {
    std::call_once(once, [api] { SQLITE_EXTENSION_INIT2(api); });
    return initialise(db, error);
  } catch (const std::bad_alloc &) {
    return SQLITE_NOMEM;
  } catch (const std::system_error &) {
    return SQLITE_ERROR;  // the threads library could not run call_once
  }
}

extern "C" __attribute__((visibility("default"))) int sqlite3_extension_init(
    sqlite3 *db, char **error, const sqlite3_api_routines *api) {
  return sqlite3_orvclifnsqlite_init(db, error, api);
}
