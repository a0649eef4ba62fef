// What the extension can tell about itself: sysfun_version() and the table
// sysfun_functions, one row per SQL name and argument count, both read off
// the catalogue through the same groups that the registration uses.
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT3

#include <algorithm>
#include <cstddef>
#include <string>
#include <vector>

#include "about.hpp"
#include "module.hpp"

namespace orv::sqlite {
namespace {

// One row of sysfun_functions.
struct Entry {
  std::string name, plainName, exports, arguments, codes, summary;
  int argumentCount = 0;
  bool deterministic = true;
};

Entry entryOf(const Group &g, bool plain) {
  Entry e;
  e.name = g.sysfunName;
  if (plain) e.plainName = g.plainName;
  e.argumentCount = g.argumentCount;
  cli::catalogue::SysfunSet codes;
  for (std::size_t row : g.rows) {
    const Routine &r = kRoutines[row];
    e.exports += (e.exports.empty() ? "" : ", ") + std::string(r.symbol);
    e.deterministic = e.deterministic && (r.properties & cli::catalogue::kDeterministic) != 0;
    codes |= r.raises;
  }
  // The summary of the export that the name prefers: one that reads its
  // whole text.
  const auto wide = std::find_if(g.rows.begin(), g.rows.end(), [](std::size_t row) {
    return (kRoutines[row].properties & cli::catalogue::kNarrowerForm) == 0;
  });
  e.summary = kRoutines[wide != g.rows.end() ? *wide : g.rows[0]].summary;
  for (int i = 0; i < g.argumentCount; ++i) {
    std::vector<std::string> layouts;
    for (std::size_t row : g.rows) {
      const std::string l = describe(kRoutines[row].inputs[i], false);
      if (std::find(layouts.begin(), layouts.end(), l) == layouts.end()) layouts.push_back(l);
    }
    std::string joined;
    for (const std::string &l : layouts) joined += (joined.empty() ? "" : " | ") + l;
    e.arguments +=
        (i == 0 ? "" : ", ") + std::string(kRoutines[g.rows[0]].inputs[i].name) + ": " + joined;
  }
  e.codes = codes.digits();
  return e;
}

struct Table : sqlite3_vtab {
  const std::vector<Entry> *entries = nullptr;
};
struct Cursor : sqlite3_vtab_cursor {
  std::size_t at = 0;
};

int connect(sqlite3 *db, void *aux, int, const char *const *, sqlite3_vtab **out, char **) {
  const int rc = sqlite3_declare_vtab(
      db,
      "CREATE TABLE x(name TEXT, plain_name TEXT, argument_count INTEGER, exports TEXT, "
      "arguments TEXT, deterministic INTEGER, sysfun_codes TEXT, summary TEXT)");
  if (rc != SQLITE_OK) return rc;
  auto *t = new Table();
  t->entries = static_cast<const std::vector<Entry> *>(aux);
  *out = t;
  return SQLITE_OK;
}
int disconnect(sqlite3_vtab *v) {
  delete static_cast<Table *>(v);
  return SQLITE_OK;
}
int bestIndex(sqlite3_vtab *, sqlite3_index_info *info) {
  info->estimatedCost = 100;
  return SQLITE_OK;
}
int open(sqlite3_vtab *, sqlite3_vtab_cursor **out) {
  *out = new Cursor();
  return SQLITE_OK;
}
int close(sqlite3_vtab_cursor *c) {
  delete static_cast<Cursor *>(c);
  return SQLITE_OK;
}
int filter(sqlite3_vtab_cursor *c, int, const char *, int, sqlite3_value **) {
  static_cast<Cursor *>(c)->at = 0;
  return SQLITE_OK;
}
int next(sqlite3_vtab_cursor *c) {
  ++static_cast<Cursor *>(c)->at;
  return SQLITE_OK;
}
const std::vector<Entry> &entriesOf(sqlite3_vtab_cursor *c) {
  return *static_cast<Table *>(c->pVtab)->entries;
}
int eof(sqlite3_vtab_cursor *c) {
  return static_cast<Cursor *>(c)->at >= entriesOf(c).size() ? 1 : 0;
}
void text(sqlite3_context *context, const std::string &s) {
  sqlite3_result_text(context, s.c_str(), static_cast<int>(s.size()), SQLITE_STATIC);
}
int column(sqlite3_vtab_cursor *c, sqlite3_context *context, int i) {
  const Entry &e = entriesOf(c)[static_cast<Cursor *>(c)->at];
  switch (i) {
    case 0:
      text(context, e.name);
      break;
    case 1:
      if (!e.plainName.empty()) text(context, e.plainName);
      break;
    case 2:
      sqlite3_result_int(context, e.argumentCount);
      break;
    case 3:
      text(context, e.exports);
      break;
    case 4:
      text(context, e.arguments);
      break;
    case 5:
      sqlite3_result_int(context, e.deterministic ? 1 : 0);
      break;
    case 6:
      text(context, e.codes);
      break;
    default:
      text(context, e.summary);
      break;
  }
  return SQLITE_OK;
}
int rowid(sqlite3_vtab_cursor *c, sqlite3_int64 *out) {
  *out = static_cast<sqlite3_int64>(static_cast<Cursor *>(c)->at);
  return SQLITE_OK;
}

const sqlite3_module kModule =
    readOnlyModule(connect, bestIndex, disconnect, open, close, filter, next, eof, column, rowid);

void version(sqlite3_context *context, int, sqlite3_value **) {
  sqlite3_result_text(context, ORV_VERSION, -1, SQLITE_STATIC);
}

void releaseEntries(void *p) { delete static_cast<std::vector<Entry> *>(p); }

}  // namespace

int registerAbout(sqlite3 *db, const std::vector<Group> &groups, const std::vector<bool> &plain) {
  auto *entries = new std::vector<Entry>();
  for (std::size_t g = 0; g < groups.size(); ++g) entries->push_back(entryOf(groups[g], plain[g]));
  // Freed by SQLite with the module, also when registering fails.
  const int rc =
      sqlite3_create_module_v2(db, "sysfun_functions", &kModule, entries, releaseEntries);
  if (rc != SQLITE_OK) return rc;
  return sqlite3_create_function_v2(db, "sysfun_version", 0,
                                    SQLITE_UTF8 | SQLITE_DETERMINISTIC | SQLITE_INNOCUOUS, nullptr,
                                    version, nullptr, nullptr, nullptr);
}

}  // namespace orv::sqlite
