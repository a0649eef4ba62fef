// The call path of every scalar SQL function: the form that serves the
// arguments, the call of its export through the frame caller, and the
// result or the status turned into an SQLite result or error.  It knows
// layouts and the catalogue, never what a routine does.
#include <sqlite3ext.h>
SQLITE_EXTENSION_INIT3

#include <array>
#include <cstdint>
#include <cstring>
#include <new>
#include <type_traits>
#include <utility>

#include "arguments.hpp"
#include "common/call.hpp"
#include "connection.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "registry.hpp"

namespace orv::sqlite {
namespace {

using cli::catalogue::Frame;
using cli::catalogue::kRoutineCount;
using cli::catalogue::Routine;
using host::Outcome;

// Turns the status that a routine stored into an SQLite error: a SYSFUN
// error with its code in words, any other status with its message.
void reportStatus(const Call &c, const cli::call::StatusBuffers &status) {
  const char *label = c.function.label.c_str();
  if (const cli::Sysfun code = cli::call::sysfunIn(status.sqlstate, status.message);
      code != cli::Sysfun::none) {
    // A result or operand too long for terminated text fits the CLI_udfLob
    // export of the same function, if the caller named this one.
    const bool longer = code == cli::Sysfun::tooLong && !c.function.longerForm.empty();
    fail(c.context, "%s: SQLSTATE 38552, SYSFUN:%s: %s%s%s%s", label, cli::textOf(code).digits,
         cli::wordsOf(code), longer ? "; " : "", longer ? c.function.longerForm.c_str() : "",
         longer ? " takes longer strings" : "");
  } else {
    fail(c.context, "%s: SQLSTATE %.5s: %.*s", label, status.sqlstate,
         static_cast<int>(sizeof status.message - 1), status.message);
  }
}

// The scratchpad of a statement: zero-filled before its first call and
// handed back unchanged on each later one.  SQLite keeps per-statement data
// only as auxiliary data of an argument, and keeps it across rows only
// while that argument is a constant; with a varying argument each row gets
// a fresh scratchpad.
unsigned char *statementScratchpad(sqlite3_context *context) {
  if (auto *kept = static_cast<unsigned char *>(sqlite3_get_auxdata(context, 0))) return kept;
  auto *fresh = static_cast<unsigned char *>(sqlite3_malloc(CLI_SCRATCHPAD_SIZE));
  if (fresh == nullptr) return nullptr;
  std::memset(fresh, 0, CLI_SCRATCHPAD_SIZE);
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

// One call of the export of `Row`, its result or error given to SQLite,
// but nothing yet where it refuses the call for a length rule and the
// call has a long form (Call::longForm).  An argument that cannot be laid
// out is reported, as Outcome::status.
template <std::size_t Row, std::size_t... Is>
[[gnu::always_inline]] inline Outcome callRow(const Call &c, std::index_sequence<Is...>) {
  constexpr const Routine &r = kRoutines[Row];
  host::ScalarCall<Row, true> call;

  // NULL reaches the routine only when it reads its indicators itself.
  [[maybe_unused]] const auto load = [&]<std::size_t I>(std::integral_constant<std::size_t, I>) {
    if (c.arguments[I].type == SQLITE_NULL) {
      call.template setNull<I>();
      return true;
    }
    return orv::sqlite::load(c, Row, static_cast<int>(I), call.template input<I>());
  };
  if (!(load(std::integral_constant<std::size_t, Is>{}) && ...)) return Outcome::status;
  call.result.prepare([&c](std::size_t size) { return c.connection.lobResult.get(size); });

  [[maybe_unused]] const void *dbinfo = nullptr;
  [[maybe_unused]] void *scratchpad = nullptr;
  if constexpr (r.frame == Frame::dbinfo) dbinfo = kDatabaseInfo.data();
  if constexpr (r.frame == Frame::scratchpad) {
    scratchpad = statementScratchpad(c.context);
    if (scratchpad == nullptr) {
      sqlite3_result_error_nomem(c.context);
      return Outcome::status;
    }
  }
  call.run(c.connection.exports[Row], dbinfo, scratchpad);
  // Each case gives back its own Outcome, a constant where it returns.
  switch (call.outcome(c.longForm)) {
    case Outcome::value:
      deliver(c, call.result);
      return Outcome::value;
    case Outcome::null:
      sqlite3_result_null(c.context);
      return Outcome::null;
    case Outcome::status:
      break;
    case Outcome::refusedForLength:
      return Outcome::refusedForLength;  // the caller tries the CLI_udfLob form
  }
  reportStatus(c, call.status);
  return Outcome::status;
}

using RowCall = Outcome (*)(const Call &);

template <std::size_t Row>
[[gnu::always_inline]] inline Outcome callRow(const Call &c) {
  if constexpr (orv::sqlite::hostable(kRoutines[Row])) {
    return callRow<Row>(c, std::make_index_sequence<inputCount(kRoutines[Row])>{});
  } else {
    return Outcome::status;  // never registered
  }
}

template <std::size_t... Rows>
constexpr std::array<RowCall, sizeof...(Rows)> rowCalls(std::index_sequence<Rows...>) {
  return {&callRow<Rows>...};
}
constexpr auto kRowCalls = rowCalls(std::make_index_sequence<kRoutineCount>{});

}  // namespace

namespace {

// Reads SQL argument i of a call as its class asks: a number's type after
// numeric affinity, a string's bytes.  Sets the argument's bit in `mask`
// for a REAL number or for a string that terminated text cannot carry.
// False when the call is over: a NULL to a function that doesn't read its
// indicators, whose result is then NULL.
[[gnu::always_inline]] inline bool classify(Call &call, int i, bool isString, KindMask &mask,
                                            bool &firstString) {
  sqlite3_value *v = call.argv[i];
  Argument &a = call.arguments[static_cast<std::size_t>(i)];
  a.type = sqlite3_value_type(v);
  const KindMask bit = 1u << i;
  if (a.type == SQLITE_NULL) {
    if (!call.function.handlesNull) {
      sqlite3_result_null(call.context);
      return false;
    }
    return true;
  }
  if (!isString) {
    // Only text and BLOBs need converting to find their number type.
    if (a.type == SQLITE_TEXT || a.type == SQLITE_BLOB) a.type = sqlite3_value_numeric_type(v);
    if (a.type == SQLITE_FLOAT) mask |= bit;
    return true;
  }
  if (a.type == SQLITE_BLOB) {
    a.bytes = static_cast<const char *>(sqlite3_value_blob(v));
    call.blobResult = call.blobResult || firstString;
  } else {
    a.bytes = reinterpret_cast<const char *>(sqlite3_value_text(v));
  }
  a.size = static_cast<std::size_t>(sqlite3_value_bytes(v));
  a.fitsText = a.type != SQLITE_BLOB && host::fitsText(a.bytes, a.size);
  if (!a.fitsText) mask |= bit;
  firstString = false;
  return true;
}

// Calls a form through `first`, and, where it refuses the call only for a
// length rule, the CLI_udfLob form `wide`, whose error is the one reported
// if it fails too.
template <class First>
[[gnu::always_inline]] inline void callWithRetry(Call &call, First first, int wide) {
  try {
    host::withLongForm(first, [&call, wide] {
      call.longForm = false;
      return kRowCalls[static_cast<std::size_t>(wide)](call);
    });
  } catch (const std::bad_alloc &) {
    sqlite3_result_error_nomem(call.context);
  }
}

// The rest of a call whose arguments are classified: the form that serves
// them, or the error that says why none does.
void callForm(Call &call, int argc, KindMask mask) {
  const Function &f = call.function;
  const int row = f.formFor[mask];
  if (row == orv::sqlite::kNoForm) {
    // The first string argument that terminated text cannot carry.
    for (int i = 0; i < argc; ++i) {
      const Argument &a = call.arguments[static_cast<std::size_t>(i)];
      if ((f.stringArguments >> i & 1u) != 0 && a.type != SQLITE_NULL && !a.fitsText) {
        return failNotText(call, i);
      }
    }
    return fail(call.context, "%s: the function has no form for these arguments", f.label.c_str());
  }
  // The form follows what fits: see callWithRetry.
  const int wide = f.formFor[mask | f.stringArguments];
  call.longForm = wide != row && wide != orv::sqlite::kNoForm;
  callWithRetry(
      call, [&call, row] { return kRowCalls[static_cast<std::size_t>(row)](call); }, wide);
}

// The SQL function of a name whose plain arguments reach `Row`: the
// argument classes are the row's, known when compiled, and the row's call
// is inlined; arguments that need another form go the general way.
template <std::size_t Row, std::size_t... Is>
void entryWith(sqlite3_context *context, sqlite3_value **argv, std::index_sequence<Is...>) {
  const auto &f = *static_cast<const Function *>(sqlite3_user_data(context));
  Call call(context, argv, *f.connection, f);
  KindMask mask = 0;
  [[maybe_unused]] bool firstString = true;
  if (!(classify(call, static_cast<int>(Is), !isNumber(kRoutines[Row].inputs[Is].layout), mask,
                 firstString) &&
        ...)) {
    return;
  }
  if (f.formFor[mask] != static_cast<int>(Row)) {
    return callForm(call, static_cast<int>(sizeof...(Is)), mask);
  }
  const int wide = f.formFor[mask | f.stringArguments];
  call.longForm = wide != static_cast<int>(Row) && wide != orv::sqlite::kNoForm;
  callWithRetry(
      call, [&call]() __attribute__((always_inline)) { return callRow<Row>(call); }, wide);
}

template <std::size_t Row>
void entry(sqlite3_context *context, int /*argc*/, sqlite3_value **argv) {
  entryWith<Row>(context, argv, std::make_index_sequence<inputCount(kRoutines[Row])>{});
}

template <std::size_t Row>
constexpr Entry entryOf() {
  if constexpr (orv::sqlite::hostable(kRoutines[Row])) {
    return &entry<Row>;
  } else {
    return nullptr;
  }
}

template <std::size_t... Rows>
constexpr std::array<Entry, sizeof...(Rows)> entries(std::index_sequence<Rows...>) {
  return {entryOf<Rows>()...};
}

}  // namespace

const std::array<Entry, kRoutineCount> kEntries =
    entries(std::make_index_sequence<kRoutineCount>{});

}  // namespace orv::sqlite
