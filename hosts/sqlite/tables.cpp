// Table functions through SQLite's virtual tables.
//
// Each table function of the catalogue becomes an eponymous virtual table:
// `SELECT * FROM sqlcache_snapshot`, `SELECT * FROM fmpthreads(0)`.  A
// cursor is one open, fetch and close of the routine, through the frame
// caller's TableCall, which owns the scratchpad and the result areas; one
// fetch is one row, until the routine stores "02000".
//
// FmpThreads and FmpRows take their rows from the engine through a
// callback, which the engine-side stand-in supplies (fmp_tables.hpp).
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT3

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "catalogue/catalogue.hpp"
#include "common/layouts.hpp"
#include "common/names.hpp"
#include "fmp_tables.hpp"
#include "frame/table_call.hpp"
#include "module.hpp"
#include "registry.hpp"
#include "tables.hpp"

namespace orv::sqlite {
namespace {

using cli::catalogue::Frame;
using cli::catalogue::kRoutines;
using cli::catalogue::Layout;
using cli::catalogue::Routine;

// What a module of one table function knows: its catalogue row and the
// export found in the library.  Each registration owns its own, freed with
// the module, so that no connection writes what another one reads.
struct Module {
  std::size_t row;
  void *routine;
};

struct Table : sqlite3_vtab {
  std::size_t row = 0;  // catalogue row
  void *routine = nullptr;
};

// A cursor is one life of the routine: open, fetches, close.
struct Cursor : sqlite3_vtab_cursor {
  Cursor(const Routine &r, void *routine)
      : call(r, routine, r.frame == Frame::tableCallback ? orv::standin::fmpCallback : nullptr) {}
  cli::call::TableCall call;
  std::int32_t input = 0;
  bool opened = false, atEnd = true;
  sqlite3_int64 rowid = 0;
};

void fetch(Cursor &c) {
  c.atEnd = !c.call.fetch();
  ++c.rowid;
}

void closeRoutine(Cursor &c) {
  if (c.opened) c.call.close();
  c.opened = false;
}

int connect(sqlite3 *db, void *aux, int, const char *const *, sqlite3_vtab **out, char **) {
  const Module &module = *static_cast<const Module *>(aux);
  const Routine &r = kRoutines[module.row];
  std::string schema = "CREATE TABLE x(";
  for (std::size_t i = 0; i < resultCount(r); ++i) {
    const Layout l = r.results[i].layout;
    schema += (i == 0 ? "column" : ", column") + std::to_string(i + 1) +
              (l == Layout::text || l == Layout::lob ? " TEXT" : " INTEGER");
  }
  if (inputCount(r) == 1) schema += std::string(", ") + r.inputs[0].name + " HIDDEN";
  schema += ")";
  const int rc = sqlite3_declare_vtab(db, schema.c_str());
  if (rc != SQLITE_OK) return rc;
  auto table = std::make_unique<Table>();
  table->row = module.row;
  table->routine = module.routine;
  *out = table.release();
  return SQLITE_OK;
}

int disconnect(sqlite3_vtab *v) {
  delete static_cast<Table *>(v);
  return SQLITE_OK;
}

// The hidden input column, when given, is the routine's argument.
int bestIndex(sqlite3_vtab *v, sqlite3_index_info *info) {
  const Routine &r = kRoutines[static_cast<Table *>(v)->row];
  const int hidden = static_cast<int>(resultCount(r));
  for (int i = 0; i < info->nConstraint; ++i) {
    const auto &k = info->aConstraint[i];
    if (k.iColumn == hidden && k.op == SQLITE_INDEX_CONSTRAINT_EQ && k.usable) {
      info->aConstraintUsage[i].argvIndex = 1;
      info->aConstraintUsage[i].omit = 1;
      info->idxNum = 1;
    }
  }
  info->estimatedCost = 1000;
  return SQLITE_OK;
}

int open(sqlite3_vtab *v, sqlite3_vtab_cursor **out) {
  const auto *table = static_cast<Table *>(v);
  *out = new Cursor(kRoutines[table->row], table->routine);
  return SQLITE_OK;
}

int close(sqlite3_vtab_cursor *cur) {
  auto *c = static_cast<Cursor *>(cur);
  closeRoutine(*c);
  delete c;
  return SQLITE_OK;
}

// The hidden input column's value, checked as a scalar argument is: a
// whole number in the 32-bit range of the routine's input.  NULL matches no
// row, as `selector = NULL` is never true.
enum class Hidden : unsigned char { value, null, bad };

Hidden hiddenInput(sqlite3_vtab_cursor *cur, sqlite3_value *v, std::int32_t &out) {
  const Routine &r = static_cast<Cursor *>(cur)->call.row();
  const char *name = r.inputs[0].name;
  switch (sqlite3_value_numeric_type(v)) {
    case SQLITE_NULL:
      return Hidden::null;
    case SQLITE_INTEGER: {
      const sqlite3_int64 x = sqlite3_value_int64(v);
      if (host::fitsInteger<std::int32_t>(x)) {
        out = static_cast<std::int32_t>(x);
        return Hidden::value;
      }
      cur->pVtab->zErrMsg = sqlite3_mprintf("%s: argument 1 (%s) is %lld, outside the 32-bit range",
                                            r.sqlName, name, x);
      return Hidden::bad;
    }
    case SQLITE_FLOAT: {
      const double d = sqlite3_value_double(v);
      if (host::wholeInteger<std::int32_t>(d)) {
        out = static_cast<std::int32_t>(d);
        return Hidden::value;
      }
      cur->pVtab->zErrMsg =
          sqlite3_mprintf("%s: argument 1 (%s) is %!.17g, not a whole number in the 32-bit range",
                          r.sqlName, name, d);
      return Hidden::bad;
    }
    default:
      cur->pVtab->zErrMsg = sqlite3_mprintf("%s: argument 1 (%s) is not a number", r.sqlName, name);
      return Hidden::bad;
  }
}

int filter(sqlite3_vtab_cursor *cur, int idxNum, const char *, int argc, sqlite3_value **argv) {
  auto *c = static_cast<Cursor *>(cur);
  closeRoutine(*c);
  c->input = 0;
  c->atEnd = false;
  if (idxNum == 1 && argc > 0) {
    switch (hiddenInput(cur, argv[0], c->input)) {
      case Hidden::value:
        break;
      case Hidden::null:
        c->atEnd = true;
        return SQLITE_OK;
      case Hidden::bad:
        return SQLITE_ERROR;
    }
  }
  if (inputCount(c->call.row()) == 1) c->call.setInput(0, &c->input);
  c->rowid = 0;
  const bool opened = c->call.open();
  c->opened = true;
  const cli::call::StatusBuffers &status = c->call.status();
  if (!opened) {
    cur->pVtab->zErrMsg =
        sqlite3_mprintf("%s: SQLSTATE %.5s: %.*s", c->call.row().sqlName, status.sqlstate,
                        static_cast<int>(sizeof status.message), status.message);
    return SQLITE_ERROR;
  }
  if (c->call.ended()) {
    c->atEnd = true;
    return SQLITE_OK;
  }
  fetch(*c);
  return SQLITE_OK;
}

int next(sqlite3_vtab_cursor *cur) {
  fetch(*static_cast<Cursor *>(cur));
  return SQLITE_OK;
}

int eof(sqlite3_vtab_cursor *cur) { return static_cast<Cursor *>(cur)->atEnd ? 1 : 0; }

int column(sqlite3_vtab_cursor *cur, sqlite3_context *context, int i) {
  auto *c = static_cast<Cursor *>(cur);
  const Routine &r = c->call.row();
  const auto n = static_cast<std::size_t>(i);
  if (n >= resultCount(r)) {
    sqlite3_result_int(context, c->input);
    return SQLITE_OK;
  }
  // A column that the routine left alone is NULL; a text column, which it
  // always writes without its indicator, is not.
  const Layout layout = r.results[n].layout;
  if (c->call.indicator(n) < 0 && layout != Layout::text) return SQLITE_OK;
  if (layout == Layout::text || layout == Layout::lob) {
    const std::string_view text = c->call.text(n);
    sqlite3_result_text(context, text.data(), static_cast<int>(text.size()), SQLITE_TRANSIENT);
  } else {
    sqlite3_result_int64(context, c->call.number(n));
  }
  return SQLITE_OK;
}

int rowid(sqlite3_vtab_cursor *cur, sqlite3_int64 *out) {
  *out = static_cast<Cursor *>(cur)->rowid;
  return SQLITE_OK;
}

const sqlite3_module kModule =
    readOnlyModule(connect, bestIndex, disconnect, open, close, filter, next, eof, column, rowid);

bool hasModule(sqlite3 *db, const std::string &name) {
  sqlite3_stmt *s = nullptr;
  if (sqlite3_prepare_v2(db, "SELECT 1 FROM pragma_module_list WHERE name = ?1 COLLATE NOCASE", -1,
                         &s, nullptr) != SQLITE_OK) {
    sqlite3_finalize(s);
    return true;
  }
  sqlite3_bind_text(s, 1, name.c_str(), -1, SQLITE_TRANSIENT);
  const bool found = sqlite3_step(s) == SQLITE_ROW;
  sqlite3_finalize(s);
  return found;
}

void releaseModule(void *module) { delete static_cast<Module *>(module); }

}  // namespace

int registerTables(sqlite3 *db, const host::Exports &exports, char **error) {
  for (std::size_t row = 0; row < std::size(kRoutines); ++row) {
    const Routine &r = kRoutines[row];
    const bool table = r.frame == Frame::table || r.frame == Frame::tableCallback;
    if (!table) continue;
    void *routine = exports[row];
    if (routine == nullptr) {
      *error = sqlite3_mprintf("orvclifn: the library has no export %s", r.symbol);
      return SQLITE_ERROR;
    }
    const std::string plain = lowerCase(r.sqlName);
    for (const std::string &name : {std::string(kPrefix) + plain, plain}) {
      if (name == plain && hasModule(db, name)) continue;
      // SQLite frees the module's data with the module, or at once if it
      // can't register it.
      auto *aux = new Module{row, routine};
      const int rc = sqlite3_create_module_v2(db, name.c_str(), &kModule, aux, releaseModule);
      if (rc != SQLITE_OK) {
        *error = sqlite3_mprintf("orvclifn: %s", sqlite3_errmsg(db));
        return rc;
      }
    }
  }
  return SQLITE_OK;
}

}  // namespace orv::sqlite
