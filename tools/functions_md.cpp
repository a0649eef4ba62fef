// Writes the function reference, docs/functions.md, from the catalogue and
// the SQLite host's naming rules.  Usage: functions_md [output-file]
#include <sqlite3.h>

#include <cstdio>
#include <fstream>
#include <iostream>
#include <set>
#include <sstream>
#include <string>
#include <string_view>

#include "builtin_names.hpp"
#include "frame/cliudf.h"
#include "registry.hpp"

namespace {

using cli::catalogue::kRoutines;
using cli::catalogue::Routine;
using orv::sqlite::describe;

std::string arguments(const Routine &r) {
  std::string out;
  for (std::size_t i = 0; i < inputCount(r); ++i) {
    if (i != 0) out += ", ";
    out += std::string(r.inputs[i].name) + ": " + describe(r.inputs[i], false);
  }
  return out.empty() ? "none" : out;
}

std::string results(const Routine &r) {
  std::string out;
  for (std::size_t i = 0; i < resultCount(r); ++i) {
    if (i != 0) out += ", ";
    out += describe(r.results[i], true);
  }
  return out;
}

std::string codes(const Routine &r) { return r.raises.empty() ? "none" : r.raises.digits(); }

// The example: the call and its result, or a condition on a result that
// changes from call to call.
std::string example(const Routine &r) {
  const std::string_view result = r.example.result;
  std::string out = "`";
  out += r.example.call;
  out += "` gives ";
  if (result.starts_with("LIKE ") || result.starts_with("BETWEEN ")) out += "a result ";
  out += "`";
  out += result;
  out += "`";
  return out;
}

constexpr const char *kIntroduction = R"(# Function reference

Written from the library's catalogue by `tools/functions_md.cpp`
(`cmake --build --preset release --target docs`); do not edit by hand.

Every routine is an export of `liborvclifn.so` that an engine calls by
name through the routine frame (see `src/frame/cliudf.h`). Strings are
bytes: lengths and positions count bytes, positions count from 1.
Terminated text is limited to @TEXT@ bytes; `CLI_udfLob` strings, a 32-bit
length followed by the data, to @LOB@ bytes. A failure is reported as
SQLSTATE 38552 with the message `SYSFUN:` and a two-digit code:

| Code | Condition |
|---|---|
@CODES@
## In SQLite

The extension `orvclifn_sqlite` registers every routine of the library:

- each SQL function as `sysfun_<name>`, for each number of arguments it has;
- also under its plain name, where SQLite has no function of that name
  taking that many arguments (checked on the connection when the extension
  loads; the names below are those of SQLite )";

constexpr const char *kPicking = R"();
- each export also under `sysfun_` and its own name without `CLI_udf`
  (`sysfun_left2`), which reaches that export and no other.

Where a function has several exports with the same number of arguments, the
extension picks one per call: integers go to the widest integer form, reals
to the double form, text of up to 4000 bytes without NUL bytes to the
terminated-text form, and longer text, text holding NUL bytes and BLOBs to
the `CLI_udfLob` form, which returns a BLOB when its first string argument
was one. Where no form takes a string, the call is an error. An integer
outside the width of the export is an error, and so is a real that is not
a whole number where an integer is wanted; nothing is cut to fit. A NULL
argument gives NULL unless the routine handles NULL itself. A SYSFUN error
becomes an SQLite error such as `LEFT: SQLSTATE 38552, SYSFUN:01: an argument
lies outside what the function accepts`.

The form also follows what fits: a call that the terminated-text form refuses
only because its result would pass 4000 bytes (SYSFUN:10) is made again with
the `CLI_udfLob` form, which builds up to 1048576 bytes, so `REPEAT('ab', 3000)`
gives 6000 bytes of text; a call that both refuse reports the error of the
`CLI_udfLob` form. By its own name (`sysfun_repeat1`) an export takes its own
form only. `LEFT`, `RIGHT` and `INSERT` are keywords of SQLite's grammar:
call them quoted, as `"LEFT"(s, n)`, or as `sysfun_left`, `sysfun_right` and
`sysfun_insert`.

## Functions in this build

Each export's example is a call written with the function's SQL name and
literals, and its result. The tests make every example through both the
SQLite and the PostgreSQL extension by the export's own name
(`sysfun_abs3(-7)`, `sysfun.abs3(-7::int2)`), which reaches that export and
no other. Where the result changes from call to call (today's date, RAND),
the example gives a condition on it instead, in which `_` stands for any
one character. Blanks in a quoted result are part of it, and a double
result is held to 12 digits.
)";

// The introduction with the limits and the SYSFUN codes filled in from the
// frame's header, where they are stated once.
std::string introduction() {
  std::string text = kIntroduction;
  const auto fill = [&](const std::string &mark, const std::string &with) {
    text.replace(text.find(mark), mark.size(), with);
  };
  std::string table;
#define ORV_CODE_ROW(number, name, digits, words) table += "| " digits " | " words " |\n";
  CLI_SYSFUN_CODES(ORV_CODE_ROW)
#undef ORV_CODE_ROW
  fill("@TEXT@", std::to_string(CLI_TEXT_LIMIT));
  fill("@LOB@", std::to_string(CLI_LOB_LIMIT));
  fill("@CODES@", table);
  return text;
}

// When the function's names reach export `row`, by the extension's own
// choice rule (chooseForm) over every kind of the arguments.
std::string reachedWhen(const orv::sqlite::Group &g, std::size_t row) {
  unsigned strings = 0;
  for (int i = 0; i < g.argumentCount; ++i) {
    if (!orv::sqlite::isNumber(kRoutines[row].inputs[i].layout)) strings |= 1u << i;
  }
  bool plain = false, longStrings = false, reals = false;
  for (orv::sqlite::KindMask m = 0; m < (1u << g.argumentCount); ++m) {
    if (orv::sqlite::chooseForm(g, m) != static_cast<int>(row)) continue;
    plain = plain || m == 0;
    longStrings = longStrings || (m & strings) != 0;
    reals = reals || (m & ~strings) != 0;
  }
  if (plain) return "by default";
  if (longStrings) {
    return "for strings over " + std::to_string(CLI_TEXT_LIMIT) +
           " bytes, holding NUL bytes or BLOBs, and for results that would pass " +
           std::to_string(CLI_TEXT_LIMIT) + " bytes";
  }
  if (reals) return "for REAL arguments";
  return "only by its own name";
}

}  // namespace

int main(int argc, char **argv) {
  sqlite3 *db = nullptr;
  if (sqlite3_open(":memory:", &db) != SQLITE_OK) return 1;

  std::ostringstream out;
  out << introduction() << sqlite3_libversion() << kPicking;
  const auto groups = orv::sqlite::groups();
  const orv::sqlite::KnownFunctions known(db);
  for (const auto &g : groups) {
    if (g.plainName.empty()) continue;
    // The summary of the export that plain arguments reach.
    const int preferred = orv::sqlite::chooseForm(g, 0);
    const Routine &first =
        kRoutines[preferred >= 0 ? static_cast<std::size_t>(preferred) : g.rows.front()];
    out << "\n### " << g.label << " (" << g.argumentCount
        << (g.argumentCount == 1 ? " argument" : " arguments") << ")\n\n"
        << first.summary << "\n\nIn SQLite: `" << g.sysfunName << "`";
    if (!known.has(g.plainName.c_str(), g.argumentCount)) {
      out << ", `" << g.label << "`";
    }
    out << "\n\n| Export | Reached | Own name | Arguments | Result | SYSFUN errors | What it "
           "gives | Example |\n"
        << "|---|---|---|---|---|---|---|---|\n";
    for (std::size_t row : g.rows) {
      const Routine &r = kRoutines[row];
      out << "| `" << r.symbol << "` | " << reachedWhen(g, row) << " | `" << orv::sqlite::ownName(r)
          << "` | " << arguments(r) << " | " << results(r) << " | " << codes(r) << " | "
          << r.summary << " | " << example(r) << " |\n";
    }
  }

  out << "\n## Table functions\n\n"
      << "Table functions are table-valued functions in SQLite, one row per fetch: "
      << "`SELECT * FROM sqlcache_snapshot`, `SELECT * FROM fmpthreads(0)`. Their "
      << "columns are `column1` and on, in the order of the results; an argument is "
      << "the hidden column that follows them. Their rows are the engine's data, so they have no "
      << "example.\n\n"
      << "| Export | In SQLite | Argument | Columns | What it gives |\n"
      << "|---|---|---|---|---|\n";
  for (const Routine &r : kRoutines) {
    const bool table =
        r.frame == cli::catalogue::Frame::table || r.frame == cli::catalogue::Frame::tableCallback;
    if (!table) continue;
    const std::string plain = orv::sqlite::lowerCase(r.sqlName);
    out << "| `" << r.symbol << "` | `" << orv::sqlite::kPrefix << plain << "`, `" << plain
        << "` | " << arguments(r) << " | " << results(r) << " | " << r.summary << " |\n";
  }

  sqlite3_close(db);

  if (argc < 2) {
    std::cout << out.str();
    return 0;
  }
  std::ofstream file(argv[1], std::ios::binary);
  file << out.str();
  return file ? 0 : 1;
}
