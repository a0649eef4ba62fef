// Table functions through SQLite's virtual tables.
//
// Each table function of the catalogue becomes an eponymous virtual table:
// `SELECT * FROM sqlcache_snapshot`, `SELECT * FROM fmpthreads(0)`.  A
// cursor is one open, fetch and close of the routine: it owns the
// scratchpad and the result areas, and one fetch is one row, until the
// routine stores "02000".
//
// FmpThreads and FmpRows take their rows from the engine through a
// callback, which the host supplies here: FmpRows lists the routines of the
// catalogue, FmpThreads the threads of this process (Linux only).
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT3

#include <dirent.h>
#include <dlfcn.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/cliudf.h"
#include "registry.hpp"
#include "tables.hpp"

namespace orv::host {
namespace {

using cli::catalogue::Frame;
using cli::catalogue::kRoutines;
using cli::catalogue::Layout;
using cli::catalogue::Routine;

// ---- The engine's side of the Fmp callback --------------------------------

// Rows of 16 bytes: index, frame argument count, inputs, results, frame
// variant and the property bits, for every catalogue routine.
std::vector<unsigned char> routineRows() {
  std::vector<unsigned char> out;
  std::int32_t index = 0;
  for (const Routine &r : kRoutines) {
    unsigned char row[16] = {};
    const auto arguments = static_cast<std::int32_t>(argumentCount(r));
    const auto inputs = static_cast<std::int16_t>(inputCount(r));
    const auto results = static_cast<std::int16_t>(resultCount(r));
    std::memcpy(row, &index, 4);
    std::memcpy(row + 4, &arguments, 4);
    std::memcpy(row + 8, &inputs, 2);
    std::memcpy(row + 10, &results, 2);
    row[12] = static_cast<unsigned char>(r.frame);
    row[13] = static_cast<unsigned char>(r.properties);
    out.insert(out.end(), row, row + 16);
    ++index;
  }
  return out;
}

// Rows of 28 bytes for the threads of this process: thread id, state (as
// its letter), user and system time in clock ticks, priority and nice
// value, from /proc.  `selector` 0 gives all threads, any other value the
// thread with that id.
std::vector<unsigned char> threadRows(std::int32_t selector) {
  std::vector<unsigned char> out;
  DIR *tasks = opendir("/proc/self/task");
  if (tasks == nullptr) return out;
  while (const dirent *entry = readdir(tasks)) {
    const auto tid = static_cast<std::int32_t>(std::strtol(entry->d_name, nullptr, 10));
    if (tid <= 0 || (selector != 0 && tid != selector)) continue;
    char path[64], line[1024] = {};
    static_cast<void>(std::snprintf(path, sizeof path, "/proc/self/task/%d/stat", tid));
    std::FILE *stat = std::fopen(path, "r");
    if (stat == nullptr) continue;
    const bool read = std::fgets(line, sizeof line, stat) != nullptr;
    static_cast<void>(std::fclose(stat));
    const char *close = read ? std::strrchr(line, ')') : nullptr;
    char state = '?';
    unsigned long utime = 0, stime = 0;
    long priority = 0, nice = 0;
    // From the state on: state, 10 fields, utime, stime, 2 fields, priority,
    // nice; the count of fields read is checked.
    constexpr const char *kFields =
        "%c %*d %*d %*d %*d %*d %*u %*u %*u %*u %*u %lu %lu %*d %*d %ld %ld";
    if (close == nullptr ||
        std::sscanf(close + 2, kFields, &state, &utime, &stime, &priority,  // NOLINT(cert-err34-c)
                    &nice) != 5) {
      continue;
    }
    const std::int32_t values[7] = {0,
                                    tid,
                                    static_cast<unsigned char>(state),
                                    static_cast<std::int32_t>(utime),
                                    static_cast<std::int32_t>(stime),
                                    static_cast<std::int32_t>(priority),
                                    static_cast<std::int32_t>(nice)};
    const auto *bytes = reinterpret_cast<const unsigned char *>(values);
    out.insert(out.end(), bytes, bytes + sizeof values);
  }
  closedir(tasks);
  return out;
}

std::int32_t *slotPointer(std::uint64_t slot) {
  std::int32_t *p = nullptr;
  std::memcpy(&p, &slot, sizeof p);
  return p;
}

// Open requests hand out a table in a block of its own; close takes it back.
extern "C" std::int32_t fmpCallback(std::int32_t, void *request) {
  auto *slot = static_cast<std::uint64_t *>(request);
  const std::int32_t code = *slotPointer(slot[0]);
  if (code == 1) {
    std::free(slotPointer(slot[1]));
    return 0;
  }
  if (code != 2 && code != 3) return -1;
  const bool threads = code == 3;
  const std::vector<unsigned char> rows =
      threads ? threadRows(*slotPointer(slot[1])) : routineRows();
  const std::size_t rowSize = threads ? 28 : 16;
  void *table = std::malloc(rows.empty() ? 1 : rows.size());
  if (table == nullptr) return -2;
  if (!rows.empty()) std::memcpy(table, rows.data(), rows.size());
  *slotPointer(slot[threads ? 2 : 1]) = static_cast<std::int32_t>(rows.size() / rowSize);
  std::memcpy(&slot[threads ? 3 : 2], &table, sizeof table);
  return threads && rows.empty() ? -3 : 0;
}

// ---- The virtual table ------------------------------------------------------

// The table functions found in the library, by catalogue row; every
// connection loads the same library, so one table serves all.
std::array<void *, std::size(kRoutines)> tableRoutines{};
// Each module's aux data points at its catalogue row.
std::array<std::size_t, std::size(kRoutines)> tableRows = [] {
  std::array<std::size_t, std::size(kRoutines)> rows{};
  for (std::size_t i = 0; i < rows.size(); ++i) rows[i] = i;
  return rows;
}();

struct Table : sqlite3_vtab {
  std::size_t row = 0;  // catalogue row
  void *routine = nullptr;
};

struct Cursor : sqlite3_vtab_cursor {
  std::size_t row = 0;
  void *routine = nullptr;
  std::array<unsigned char, 256> scratchpad{};
  std::vector<std::vector<unsigned char>> results;
  std::array<std::int16_t, 18> indicators{};
  std::int32_t input = 0;
  std::int16_t inputIndicator = 0;
  char sqlstate[CLI_SQLSTATE_SIZE] = {};
  char message[72] = {};
  bool opened = false, atEnd = true;
  sqlite3_int64 rowid = 0;
};

template <std::size_t... Is>
void invoke(void *fn, void *const *args, std::index_sequence<Is...>) {
  using Export = void (*)(decltype(Is, static_cast<void *>(nullptr))...);
  reinterpret_cast<Export>(fn)(args[Is]...);
}

std::size_t areaSize(const cli::catalogue::Slot &s) {
  switch (s.layout) {
    case Layout::int16:
      return 2;
    case Layout::int32:
      return 4;
    case Layout::text:
      return s.size + 1;
    case Layout::lob:
      return CLI_LOB_AREA_SIZE(std::size_t{s.size});
    default:
      return 8;
  }
}

// One call of the routine with the given call type.
void callRoutine(Cursor &c, std::int32_t callType) {
  const Routine &r = kRoutines[c.row];
  const std::size_t inputs = inputCount(r), results = resultCount(r);
  std::memset(c.sqlstate, 0, sizeof c.sqlstate);
  std::vector<void *> args;
  if (inputs == 1) args.push_back(&c.input);
  for (std::size_t i = 0; i < results; ++i) {
    if (r.results[i].layout == Layout::lob) {
      const std::uint32_t capacity = r.results[i].size;
      std::memcpy(c.results[i].data(), &capacity, sizeof capacity);
    }
    // Columns that the routine leaves alone are NULL; a text column that it
    // always writes without its indicator is not.
    c.indicators[i] = r.results[i].layout == Layout::text ? 0 : -1;
    args.push_back(c.results[i].data());
  }
  if (inputs == 1) args.push_back(&c.inputIndicator);
  for (std::size_t i = 0; i < results; ++i) args.push_back(&c.indicators[i]);
  args.insert(args.end(), {c.sqlstate, const_cast<char *>(r.sqlName), const_cast<char *>(r.symbol),
                           c.message, c.scratchpad.data(), &callType});
  if (r.frame == Frame::tableCallback) {
    void *callback = nullptr;
    const auto fn = &fmpCallback;
    std::memcpy(&callback, &fn, sizeof callback);
    args.push_back(callback);
  }
  switch (args.size()) {
    case 19:
      return invoke(c.routine, args.data(), std::make_index_sequence<19>{});
    case 21:
      return invoke(c.routine, args.data(), std::make_index_sequence<21>{});
    case 42:
      return invoke(c.routine, args.data(), std::make_index_sequence<42>{});
    default:
      return;
  }
}

void fetch(Cursor &c) {
  callRoutine(c, CLI_CALL_FETCH);
  c.atEnd = c.sqlstate[0] != '\0';
  ++c.rowid;
}

void closeRoutine(Cursor &c) {
  if (c.opened) callRoutine(c, CLI_CALL_CLOSE);
  c.opened = false;
}

int connect(sqlite3 *db, void *aux, int, const char *const *, sqlite3_vtab **out, char **) {
  const std::size_t row = *static_cast<const std::size_t *>(aux);
  const Routine &r = kRoutines[row];
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
  table->row = row;
  table->routine = tableRoutines[row];
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
  auto *table = static_cast<Table *>(v);
  auto c = std::make_unique<Cursor>();
  c->row = table->row;
  c->routine = table->routine;
  const Routine &r = kRoutines[c->row];
  for (std::size_t i = 0; i < resultCount(r); ++i) c->results.emplace_back(areaSize(r.results[i]));
  *out = c.release();
  return SQLITE_OK;
}

int close(sqlite3_vtab_cursor *cur) {
  auto *c = static_cast<Cursor *>(cur);
  closeRoutine(*c);
  delete c;
  return SQLITE_OK;
}

int filter(sqlite3_vtab_cursor *cur, int idxNum, const char *, int argc, sqlite3_value **argv) {
  auto *c = static_cast<Cursor *>(cur);
  closeRoutine(*c);
  c->scratchpad.fill(0);
  c->input = idxNum == 1 && argc > 0 ? sqlite3_value_int(argv[0]) : 0;
  c->rowid = 0;
  callRoutine(*c, CLI_CALL_OPEN);
  c->opened = true;
  if (c->sqlstate[0] != '\0' && std::strncmp(c->sqlstate, CLI_SQLSTATE_NO_MORE_ROWS, 5) != 0) {
    cur->pVtab->zErrMsg = sqlite3_mprintf("%s: SQLSTATE %.5s: %.*s", kRoutines[c->row].sqlName,
                                          c->sqlstate, 70, c->message);
    return SQLITE_ERROR;
  }
  if (c->sqlstate[0] != '\0') {
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
  const auto *c = static_cast<Cursor *>(cur);
  const Routine &r = kRoutines[c->row];
  const auto n = static_cast<std::size_t>(i);
  if (n >= resultCount(r)) {
    sqlite3_result_int(context, c->input);
    return SQLITE_OK;
  }
  if (c->indicators[n] < 0) return SQLITE_OK;  // NULL
  const unsigned char *area = c->results[n].data();
  switch (r.results[n].layout) {
    case Layout::int16: {
      std::int16_t v = 0;
      std::memcpy(&v, area, 2);
      sqlite3_result_int(context, v);
      break;
    }
    case Layout::int32: {
      std::int32_t v = 0;
      std::memcpy(&v, area, 4);
      sqlite3_result_int(context, v);
      break;
    }
    case Layout::text:
      sqlite3_result_text(
          context, reinterpret_cast<const char *>(area),
          static_cast<int>(::strnlen(reinterpret_cast<const char *>(area), r.results[n].size)),
          SQLITE_TRANSIENT);
      break;
    case Layout::lob: {
      std::uint32_t length = 0;
      std::memcpy(&length, area, 4);
      if (length > r.results[n].size) length = r.results[n].size;
      sqlite3_result_text(context, reinterpret_cast<const char *>(area + CLI_LOB_DATA_OFFSET),
                          static_cast<int>(length), SQLITE_TRANSIENT);
      break;
    }
    default:
      break;
  }
  return SQLITE_OK;
}

int rowid(sqlite3_vtab_cursor *cur, sqlite3_int64 *out) {
  *out = static_cast<Cursor *>(cur)->rowid;
  return SQLITE_OK;
}

sqlite3_module makeModule() {
  sqlite3_module m{};
  m.iVersion = 0;
  m.xConnect = connect;
  m.xBestIndex = bestIndex;
  m.xDisconnect = disconnect;
  m.xOpen = open;
  m.xClose = close;
  m.xFilter = filter;
  m.xNext = next;
  m.xEof = eof;
  m.xColumn = column;
  m.xRowid = rowid;
  return m;
}
const sqlite3_module kModule = makeModule();

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

}  // namespace

int registerTables(sqlite3 *db, void *library, char **error) {
  for (std::size_t row = 0; row < std::size(kRoutines); ++row) {
    const Routine &r = kRoutines[row];
    const bool table = r.frame == Frame::table || r.frame == Frame::tableCallback;
    if (!table) continue;
    void *routine = dlsym(library, r.symbol);
    if (routine == nullptr) {
      *error = sqlite3_mprintf("orvclifn: the library has no export %s", r.symbol);
      return SQLITE_ERROR;
    }
    tableRoutines[row] = routine;
    const std::string plain = lowerCase(r.sqlName);
    for (const std::string &name : {std::string(kPrefix) + plain, plain}) {
      if (name == plain && hasModule(db, name)) continue;
      void *aux = &tableRows[row];
      const int rc = sqlite3_create_module_v2(db, name.c_str(), &kModule, aux, nullptr);
      if (rc != SQLITE_OK) {
        *error = sqlite3_mprintf("orvclifn: %s", sqlite3_errmsg(db));
        return rc;
      }
    }
  }
  return SQLITE_OK;
}

}  // namespace orv::host
