// The SQLite loadable extension: every routine of the library as an SQL
// function, registered from the catalogue.
//
// The extension plays the engine's part.  It finds each export by its name
// in the library, lays the SQL arguments out in the export's value layouts,
// calls it through the routine frame and turns the result, or the status,
// into an SQLite result or error.  It knows layouts and the catalogue, never
// what a routine does: one call path, instantiated per catalogue row from
// the row's layouts, serves every routine.
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT1

#include <dlfcn.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "builtin_names.hpp"
#include "frame/cliudf.h"
#include "registry.hpp"
#include "tables.hpp"

namespace {

using cli::catalogue::Frame;
using cli::catalogue::kMaxInputs;
using cli::catalogue::kRoutineCount;
using cli::catalogue::kRoutines;
using cli::catalogue::Layout;
using cli::catalogue::Routine;
using orv::host::KindMask;

constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;
constexpr std::size_t kMessageSize = 72;

// A buffer that grows to the largest size asked of it and is kept for the
// connection's life, so that long strings cost no allocation per row.
class Area {
 public:
  unsigned char *get(std::size_t size) {
    if (size > capacity_) {
      data_ = std::make_unique_for_overwrite<unsigned char[]>(size);
      capacity_ = size;
    }
    return data_.get();
  }

 private:
  std::unique_ptr<unsigned char[]> data_;
  std::size_t capacity_ = 0;
};

// What one connection holds: the exports found in the library and the
// areas for CLI_udfLob arguments and results.  Shared by all of the
// connection's functions and freed with the last of them.
struct Connection {
  std::array<void *, kRoutineCount> exports{};
  std::array<Area, kMaxInputs> lobInputs;
  Area lobResult;
  int functions = 0;
};

// One registered SQL function.
struct Function {
  Connection *connection;
  std::string label;
  unsigned stringArguments;  // bit i set when argument i is a string
  bool handlesNull;
  std::array<int, 16> formFor;  // row to call for each KindMask
};

// One SQL argument as the dispatcher has read it, so that no value is asked
// twice: its type (after numeric affinity, for a number argument) and, for
// a string, its bytes and whether terminated text can carry them.
// Only the arguments that a call has are set, and only what their kind
// uses: a row costs what it reads.
struct Argument {
  int type;
  const unsigned char *bytes;
  std::size_t size;
  bool fitsText;
};

// Everything that one call of a row needs.
struct Call {
  Call(sqlite3_context *c, sqlite3_value **v, Connection &n, const Function &f)
      : context(c), argv(v), connection(n), function(f) {}
  sqlite3_context *context;
  sqlite3_value **argv;
  std::array<Argument, kMaxInputs> arguments;  // the first argc are set
  Connection &connection;
  const Function &function;
  bool blobResult = false;  // the first string argument was a BLOB
};

// Most SQL strings are short: these read and write them in at most four
// overlapping words each way, never outside [from, from + size), and call
// the C library only for longer ones.
std::uint64_t word(const unsigned char *p) {
  std::uint64_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
std::uint32_t halfWord(const unsigned char *p) {
  std::uint32_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
constexpr bool hasZeroByte(std::uint64_t w) {
  return ((w - 0x0101010101010101u) & ~w & 0x8080808080808080u) != 0;
}

bool holdsNul(const unsigned char *p, std::size_t size) {
  if (size >= 8 && size <= 16) return hasZeroByte(word(p)) || hasZeroByte(word(p + size - 8));
  if (size > 16 && size <= 32) {
    return hasZeroByte(word(p)) || hasZeroByte(word(p + 8)) || hasZeroByte(word(p + size - 16)) ||
           hasZeroByte(word(p + size - 8));
  }
  if (size >= 4 && size < 8) {
    return hasZeroByte(halfWord(p) | (std::uint64_t{0xFFFFFFFF} << 32)) ||
           hasZeroByte(halfWord(p + size - 4) | (std::uint64_t{0xFFFFFFFF} << 32));
  }
  return size != 0 && std::memchr(p, 0, size) != nullptr;
}

void copyShort(char *to, const unsigned char *from, std::size_t size) {
  if (size >= 8 && size <= 16) {
    const std::uint64_t head = word(from), tail = word(from + size - 8);
    std::memcpy(to, &head, 8);
    std::memcpy(to + size - 8, &tail, 8);
  } else if (size > 16 && size <= 32) {
    const std::uint64_t a = word(from), b = word(from + 8), c = word(from + size - 16),
                        d = word(from + size - 8);
    std::memcpy(to, &a, 8);
    std::memcpy(to + 8, &b, 8);
    std::memcpy(to + size - 16, &c, 8);
    std::memcpy(to + size - 8, &d, 8);
  } else if (size != 0) {
    std::memcpy(to, from, size);
  }
}

template <typename... Args>
void fail(sqlite3_context *context, const char *format, Args... args) {
  char *text = sqlite3_mprintf(format, args...);
  if (text == nullptr) {
    sqlite3_result_error_nomem(context);
    return;
  }
  sqlite3_result_error(context, text, -1);
  sqlite3_free(text);
}

// The SYSFUN codes in words, for error messages.
const char *sysfunWords(const char *code) {
  static constexpr std::pair<const char *, const char *> kWords[] = {
      {"01", "an argument lies outside what the function accepts"},
      {"02", "division by zero"},
      {"03", "the result cannot be represented"},
      {"04", "the date is not valid"},
      {"05", "the time is not valid"},
      {"06", "the time of the timestamp is not valid, or the text has no form that is taken"},
      {"07", "the duration holds a character that is not allowed"},
      {"08", "the interval code is not a known one"},
      {"10", "a string would be longer than the function allows"},
      {"11", "the text is not a number"},
  };
  for (const auto &[c, words] : kWords) {
    if (std::memcmp(c, code, 2) == 0) return words;
  }
  return "unknown condition";
}

// Turns the status that a routine stored into an SQLite error.
void reportStatus(const Call &c, const char *sqlstate, const char *message) {
  const char *label = c.function.label.c_str();
  if (std::memcmp(sqlstate, CLI_SQLSTATE_SYSFUN, sizeof CLI_SQLSTATE_SYSFUN) == 0 &&
      std::memcmp(message, CLI_MESSAGE_SYSFUN, 7) == 0) {
    fail(c.context, "%s: SQLSTATE 38552, SYSFUN:%.2s: %s", label, message + 7,
         sysfunWords(message + 7));
  } else {
    fail(c.context, "%s: SQLSTATE %.5s: %.*s", label, sqlstate, static_cast<int>(kMessageSize - 1),
         message);
  }
}

const char *argumentName(std::size_t row, int i) {
  const char *name = kRoutines[row].inputs[i].name;
  return name != nullptr ? name : "";
}

// Integers of the export's width: from an INTEGER in range, or from a REAL
// with a whole value in range; never cut to fit.
template <typename T>
bool loadInteger(const Call &c, std::size_t row, int i, T &out) {
  sqlite3_value *v = c.argv[i];
  const int type = c.arguments[static_cast<std::size_t>(i)].type;
  constexpr auto lo = std::numeric_limits<T>::min();
  constexpr auto hi = std::numeric_limits<T>::max();
  constexpr int bits = std::numeric_limits<T>::digits + 1;
  if (type == SQLITE_INTEGER) {
    const sqlite3_int64 x = sqlite3_value_int64(v);
    if (x >= lo && x <= hi) {
      out = static_cast<T>(x);
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %lld, outside the %d-bit range of %s",
         c.function.label.c_str(), i + 1, argumentName(row, i), x, bits, kRoutines[row].symbol);
    return false;
  }
  if (type == SQLITE_FLOAT) {
    const double d = sqlite3_value_double(v);
    // 2^(bits-1) is exact in a double; hi itself may not be.
    const double limit = std::ldexp(1.0, bits - 1);
    if (d == std::trunc(d) && d >= -limit && d < limit) {
      out = static_cast<T>(d);
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %!.17g, not a whole number in the %d-bit range of %s",
         c.function.label.c_str(), i + 1, argumentName(row, i), d, bits, kRoutines[row].symbol);
    return false;
  }
  fail(c.context, "%s: argument %d (%s) is not a number", c.function.label.c_str(), i + 1,
       argumentName(row, i));
  return false;
}

// An input in the layout L; Size is the byte count of fixed layouts.
template <Layout L, std::uint32_t Size>
struct Input;

template <typename T>
struct IntegerInput {
  T value{};
  bool load(const Call &c, std::size_t row, int i) { return loadInteger(c, row, i, value); }
  void *pointer() { return &value; }
};
template <std::uint32_t S>
struct Input<Layout::int16, S> : IntegerInput<std::int16_t> {};
template <std::uint32_t S>
struct Input<Layout::int32, S> : IntegerInput<std::int32_t> {};
template <std::uint32_t S>
struct Input<Layout::int64, S> : IntegerInput<std::int64_t> {};

template <std::uint32_t S>
struct Input<Layout::real, S> {
  double value = 0.0;
  bool load(const Call &c, std::size_t row, int i) {
    const int type = c.arguments[static_cast<std::size_t>(i)].type;
    if (type != SQLITE_INTEGER && type != SQLITE_FLOAT) {
      fail(c.context, "%s: argument %d (%s) is not a number", c.function.label.c_str(), i + 1,
           argumentName(row, i));
      return false;
    }
    value = sqlite3_value_double(c.argv[i]);
    return true;
  }
  void *pointer() { return &value; }
};

// Terminated text, copied: the routines may write into their inputs.
template <std::uint32_t S>
struct Input<Layout::text, S> {
  // Left uninitialised but for the terminator: a row costs what it copies.
  Input() { text[0] = '\0'; }
  std::array<char, kTextLimit + 1> text;
  bool load(const Call &c, std::size_t row, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    if (!a.fitsText) {
      fail(c.context,
           "%s: argument %d (%s) is a BLOB, holds a NUL byte or is longer than %d bytes, "
           "which %s does not take",
           c.function.label.c_str(), i + 1, argumentName(row, i), static_cast<int>(kTextLimit),
           kRoutines[row].symbol);
      return false;
    }
    copyShort(text.data(), a.bytes, a.size);
    text[a.size] = '\0';
    return true;
  }
  void *pointer() { return text.data(); }
};

template <std::uint32_t S>
struct Input<Layout::lob, S> {
  unsigned char *value = empty.data();
  std::array<unsigned char, 4> empty{};  // a NULL handed to a routine that reads indicators
  bool load(const Call &c, std::size_t row, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    const std::size_t size = a.size;
    if (size > kLobLimit) {
      fail(c.context, "%s: argument %d (%s) is %lld bytes long; strings are at most %d bytes",
           c.function.label.c_str(), i + 1, argumentName(row, i), static_cast<long long>(size),
           static_cast<int>(kLobLimit));
      return false;
    }
    value = c.connection.lobInputs[static_cast<std::size_t>(i)].get(CLI_LOB_AREA_SIZE(size));
    const auto length = static_cast<std::uint32_t>(size);
    std::memcpy(value, &length, sizeof length);
    if (size != 0) std::memcpy(value + CLI_LOB_DATA_OFFSET, a.bytes, size);
    return true;
  }
  void *pointer() { return value; }
};

template <std::uint32_t Size>
struct Input<Layout::fixedBytes, Size> {
  std::array<unsigned char, Size> value{};
  bool load(const Call &c, std::size_t row, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    if (a.size != Size) {
      fail(c.context, "%s: argument %d (%s) must be exactly %d bytes", c.function.label.c_str(),
           i + 1, argumentName(row, i), static_cast<int>(Size));
      return false;
    }
    std::memcpy(value.data(), a.bytes, Size);
    return true;
  }
  void *pointer() { return value.data(); }
};

// A result in the layout L; Size is the longest text, the capacity of a
// CLI_udfLob or the byte count of fixed text.
template <Layout L, std::uint32_t Size>
struct Result;

template <typename T>
struct IntegerResult {
  T value{};
  bool prepare(const Call &) { return true; }
  void *pointer() { return &value; }
  void deliver(const Call &c) { sqlite3_result_int64(c.context, value); }
};
template <std::uint32_t S>
struct Result<Layout::int16, S> : IntegerResult<std::int16_t> {};
template <std::uint32_t S>
struct Result<Layout::int32, S> : IntegerResult<std::int32_t> {};
template <std::uint32_t S>
struct Result<Layout::int64, S> : IntegerResult<std::int64_t> {};

template <std::uint32_t S>
struct Result<Layout::real, S> {
  double value = 0.0;
  bool prepare(const Call &) { return true; }
  void *pointer() { return &value; }
  void deliver(const Call &c) { sqlite3_result_double(c.context, value); }
};

template <std::uint32_t Longest>
struct Result<Layout::text, Longest> {
  Result() { text[Longest] = '\0'; }
  std::array<char, Longest + 1> text;
  bool prepare(const Call &) { return true; }
  void *pointer() { return text.data(); }
  void deliver(const Call &c) {
    sqlite3_result_text(c.context, text.data(), static_cast<int>(length()), SQLITE_TRANSIENT);
  }
  // A short area is measured inline; a call to strnlen costs more.
  [[nodiscard]] std::size_t length() const {
    if constexpr (Longest <= 32) {
      std::size_t n = 0;
      while (n < Longest && text[n] != '\0') ++n;
      return n;
    } else {
      return ::strnlen(text.data(), Longest);
    }
  }
};

template <std::uint32_t Capacity>
struct Result<Layout::lob, Capacity> {
  unsigned char *value = nullptr;
  bool prepare(const Call &c) {
    value = c.connection.lobResult.get(CLI_LOB_AREA_SIZE(std::size_t{Capacity}));
    const std::uint32_t capacity = Capacity;
    std::memcpy(value, &capacity, sizeof capacity);
    return true;
  }
  void *pointer() { return value; }
  void deliver(const Call &c) {
    std::uint32_t length = 0;
    std::memcpy(&length, value, sizeof length);
    if (length > Capacity) {
      fail(c.context, "%s: the routine reported %u bytes in an area of %u",
           c.function.label.c_str(), length, Capacity);
      return;
    }
    const unsigned char *data = value + CLI_LOB_DATA_OFFSET;
    if (c.blobResult) {
      sqlite3_result_blob(c.context, data, static_cast<int>(length), SQLITE_TRANSIENT);
    } else {
      sqlite3_result_text(c.context, reinterpret_cast<const char *>(data), static_cast<int>(length),
                          SQLITE_TRANSIENT);
    }
  }
};

template <std::uint32_t Size>
struct Result<Layout::fixedText, Size> {
  std::array<char, Size> text{};
  bool prepare(const Call &) { return true; }
  void *pointer() { return text.data(); }
  void deliver(const Call &c) {
    sqlite3_result_text(c.context, text.data(), static_cast<int>(Size), SQLITE_TRANSIENT);
  }
};

// The scratchpad of a statement: zero-filled before its first call and
// handed back unchanged on each later one.  SQLite keeps per-statement data
// only as auxiliary data of an argument, and keeps it across rows only
// while that argument is a constant; with a varying argument each row gets
// a fresh scratchpad.
constexpr std::size_t kScratchpadSize = 4 + 100;

unsigned char *statementScratchpad(sqlite3_context *context) {
  if (auto *kept = static_cast<unsigned char *>(sqlite3_get_auxdata(context, 0))) return kept;
  auto *fresh = static_cast<unsigned char *>(sqlite3_malloc(kScratchpadSize));
  if (fresh == nullptr) return nullptr;
  std::memset(fresh, 0, kScratchpadSize);
  sqlite3_set_auxdata(context, 0, fresh, sqlite3_free);
  // set_auxdata frees the block at once when it cannot keep it; ask again.
  return static_cast<unsigned char *>(sqlite3_get_auxdata(context, 0));
}

// The database information block that the extension hands to the routines
// that read one: SQLite text is UTF-8, so the database's code page is 1208.
// The routines only read it.
alignas(8) std::array<unsigned char, 512> kDatabaseInfo = [] {
  std::array<unsigned char, 512> block{};
  const std::uint32_t utf8 = 1208;
  std::memcpy(block.data() + CLI_DBINFO_CODEPAGE_OFFSET, &utf8, sizeof utf8);
  return block;
}();

// Calls an export that takes sizeof...(Is) pointers.  Every argument of the
// frame is a pointer, so one pointer type serves every signature.
template <std::size_t... Is>
void invoke(void *symbol, void *const *args, std::index_sequence<Is...>) {
  using Export = void (*)(decltype(Is, static_cast<void *>(nullptr))...);
  reinterpret_cast<Export>(symbol)(args[Is]...);
}

template <std::size_t Row, std::size_t... Is>
void callRow(const Call &c, std::index_sequence<Is...>) {
  constexpr const Routine &r = kRoutines[Row];
  constexpr std::size_t n = sizeof...(Is);
  std::tuple<Input<r.inputs[Is].layout, r.inputs[Is].size>...> inputs;
  Result<r.results[0].layout, r.results[0].size> result;
  std::array<std::int16_t, n + 1> inputIndicators{};
  std::int16_t resultIndicator = 0;

  // NULL reaches the routine only when it reads its indicators itself.
  [[maybe_unused]] const auto load = [&](auto &input, int i) {
    if (c.arguments[static_cast<std::size_t>(i)].type == SQLITE_NULL) {
      inputIndicators[static_cast<std::size_t>(i)] = -1;
      return true;
    }
    return input.load(c, Row, i);
  };
  if (!(load(std::get<Is>(inputs), static_cast<int>(Is)) && ...)) return;
  if (!result.prepare(c)) return;

  char sqlstate[CLI_SQLSTATE_SIZE] = {};
  char message[kMessageSize] = {};
  void *args[] = {std::get<Is>(inputs).pointer()...,
                  result.pointer(),
                  &inputIndicators[Is]...,
                  &resultIndicator,
                  sqlstate,
                  const_cast<char *>(r.sqlName),
                  const_cast<char *>(r.symbol),
                  message};
  if constexpr (r.frame == Frame::scratchpad || r.frame == Frame::dbinfo) {
    void *extra = kDatabaseInfo.data();
    if constexpr (r.frame == Frame::scratchpad) {
      extra = statementScratchpad(c.context);
      if (extra == nullptr) return sqlite3_result_error_nomem(c.context);
    }
    void *withExtra[std::size(args) + 1];
    std::copy(std::begin(args), std::end(args), withExtra);
    withExtra[std::size(args)] = extra;
    invoke(c.connection.exports[Row], withExtra, std::make_index_sequence<std::size(withExtra)>{});
  } else {
    invoke(c.connection.exports[Row], args, std::make_index_sequence<std::size(args)>{});
  }

  if (sqlstate[0] != '\0') {
    reportStatus(c, sqlstate, message);
  } else if (resultIndicator < 0) {
    sqlite3_result_null(c.context);
  } else {
    result.deliver(c);
  }
}

using RowCall = void (*)(const Call &);

template <std::size_t Row>
void callRow(const Call &c) {
  if constexpr (orv::host::hostable(kRoutines[Row])) {
    callRow<Row>(c, std::make_index_sequence<inputCount(kRoutines[Row])>{});
  }
}

template <std::size_t... Rows>
constexpr std::array<RowCall, sizeof...(Rows)> rowCalls(std::index_sequence<Rows...>) {
  return {&callRow<Rows>...};
}
constexpr auto kRowCalls = rowCalls(std::make_index_sequence<kRoutineCount>{});

// The SQL function itself: classifies the arguments, picks the export and
// calls it.
void dispatch(sqlite3_context *context, int argc, sqlite3_value **argv) {
  const auto &f = *static_cast<const Function *>(sqlite3_user_data(context));
  Call call(context, argv, *f.connection, f);
  KindMask mask = 0;
  bool firstString = true;
  for (int i = 0; i < argc; ++i) {
    sqlite3_value *v = argv[i];
    Argument &a = call.arguments[static_cast<std::size_t>(i)];
    a.type = sqlite3_value_type(v);
    const KindMask bit = 1u << i;
    if (a.type == SQLITE_NULL) {
      if (!f.handlesNull) return sqlite3_result_null(context);
      continue;
    }
    if ((f.stringArguments & bit) == 0) {
      // Only text and BLOBs need converting to find their number type.
      if (a.type == SQLITE_TEXT || a.type == SQLITE_BLOB) a.type = sqlite3_value_numeric_type(v);
      if (a.type == SQLITE_FLOAT) mask |= bit;
      continue;
    }
    if (a.type == SQLITE_BLOB) {
      a.bytes = static_cast<const unsigned char *>(sqlite3_value_blob(v));
      call.blobResult = call.blobResult || firstString;
    } else {
      a.bytes = sqlite3_value_text(v);
    }
    a.size = static_cast<std::size_t>(sqlite3_value_bytes(v));
    a.fitsText = a.type != SQLITE_BLOB && a.size <= kTextLimit && !holdsNul(a.bytes, a.size);
    if (!a.fitsText) mask |= bit;
    firstString = false;
  }
  const int row = f.formFor[mask];
  if (row == orv::host::kNoForm) {
    return fail(context,
                "%s: a string argument is a BLOB, holds a NUL byte or is longer than %d bytes, "
                "and the function has no form for such strings",
                f.label.c_str(), static_cast<int>(kTextLimit));
  }
  try {
    kRowCalls[static_cast<std::size_t>(row)](call);
  } catch (const std::bad_alloc &) {
    sqlite3_result_error_nomem(context);
  }
}

void release(void *p) {
  const auto *f = static_cast<Function *>(p);
  Connection *connection = f->connection;
  delete f;
  if (--connection->functions == 0) delete connection;
}

// The library that defines the data export: the one this extension was
// linked with.  Opened again by its path so that exports are found by
// name, as an engine finds them.
void *openLibrary(char **error) {
  Dl_info info{};
  if (dladdr(&sqlzThisIsAORVLibrary, &info) == 0 || info.dli_fname == nullptr) {
    *error = sqlite3_mprintf("orvclifn: cannot tell where the library was loaded from");
    return nullptr;
  }
  void *library = dlopen(info.dli_fname, RTLD_NOW | RTLD_LOCAL);
  if (library == nullptr) *error = sqlite3_mprintf("orvclifn: %s", dlerror());
  return library;
}

int registerFunction(sqlite3 *db, const std::string &name, const orv::host::Group &g,
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
  for (KindMask m = 0; m < f->formFor.size(); ++m) f->formFor[m] = orv::host::chooseForm(g, m);

  int flags = SQLITE_UTF8;
  if (properties & cli::catalogue::kDeterministic) flags |= SQLITE_DETERMINISTIC;
  flags |= (properties & cli::catalogue::kInnocuous) ? SQLITE_INNOCUOUS : SQLITE_DIRECTONLY;
  ++connection->functions;
  return sqlite3_create_function_v2(db, name.c_str(), g.argumentCount, flags, f.release(), dispatch,
                                    nullptr, nullptr, release);
}

int initialise(sqlite3 *db, char **error) {
  void *library = openLibrary(error);
  if (library == nullptr) return SQLITE_ERROR;

  auto connection = std::make_unique<Connection>();
  for (std::size_t row = 0; row < kRoutineCount; ++row) {
    if (!orv::host::hostable(kRoutines[row])) continue;
    connection->exports[row] = dlsym(library, kRoutines[row].symbol);
    if (connection->exports[row] == nullptr) {
      *error = sqlite3_mprintf("orvclifn: the library has no export %s", kRoutines[row].symbol);
      return SQLITE_ERROR;
    }
  }

  // Decide on the plain names before registering anything, so that our own
  // functions don't hide a name from the check.
  static const std::vector<orv::host::Group> groups = orv::host::groups();
  std::vector<bool> plain(groups.size());
  for (std::size_t g = 0; g < groups.size(); ++g) {
    plain[g] =
        !groups[g].plainName.empty() &&
        !orv::host::sqliteHasFunction(db, groups[g].plainName.c_str(), groups[g].argumentCount);
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
  if (rc != SQLITE_OK) {
    *error = sqlite3_mprintf("orvclifn: %s", sqlite3_errmsg(db));
    return rc;
  }
  return orv::host::registerTables(db, library, error);
}

}  // namespace

// Entry points: the one SQLite derives from the file name, and the default.
extern "C" __attribute__((visibility("default"))) int sqlite3_orvclifnsqlite_init(
    sqlite3 *db, char **error, const sqlite3_api_routines *api) {
  SQLITE_EXTENSION_INIT2(api);
  try {
    return initialise(db, error);
  } catch (const std::bad_alloc &) {
    return SQLITE_NOMEM;
  }
}

extern "C" __attribute__((visibility("default"))) int sqlite3_extension_init(
    sqlite3 *db, char **error, const sqlite3_api_routines *api) {
  return sqlite3_orvclifnsqlite_init(db, error, api);
}
