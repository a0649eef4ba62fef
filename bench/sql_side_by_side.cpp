// Our SQL functions next to SQLite's built-ins that do the same job, over
// one generated table, in one process.  Usage: bench_sql [rows [label]],
// where only the rows whose label holds `label` are run.
//
// For each row of kRows, both expressions are first checked to agree on
// every row of the table, then each is timed in full scans (best of five,
// the two taken in turns) and the ratio ours / built-in is printed.
#include <sqlite3.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <utility>

namespace {

struct Row {
  const char *label;
  const char *ours;     // an expression over the table's columns
  const char *builtin;  // an expression that does the same job
};

// Columns: s, about 20 bytes of ASCII letters in mixed case with blanks at
// both ends; n, an integer from 1 to 127; d, a date from 1900 to 2099 as
// yyyy-mm-dd; x, a double from 0 to 1000 with three decimal places.
constexpr Row kRows[] = {
    {"LCASE vs lower", "LCASE(s)", "lower(s)"},
    {"RTRIM vs rtrim", "sysfun_rtrim(s)", "rtrim(s)"},
    {"LTRIM vs ltrim", "sysfun_ltrim(s)", "ltrim(s)"},
    {"LEFT vs substr", "\"LEFT\"(s, 5)", "substr(s, 1, 5)"},
    {"RIGHT vs substr", "\"RIGHT\"(s, 5)", "substr(s, -5)"},
    {"REPEAT vs printf+replace", "REPEAT(s, 3)", "replace(printf('%.*c', 3, 'x'), 'x', s)"},
    {"SPACE vs printf", "SPACE(n % 20)", "printf('%*s', n % 20, '')"},
    {"CHAR vs char", "sysfun_char(n)", "char(n)"},
    {"ASCII vs unicode", "ASCII(s)", "unicode(s)"},
    {"DAYOFYEAR vs strftime %j", "DAYOFYEAR(d)", "CAST(strftime('%j', d) AS INTEGER)"},
    {"DAYOFWEEK vs strftime %w", "DAYOFWEEK(d)", "CAST(strftime('%w', d) AS INTEGER) + 1"},
    {"JULIAN_DAY vs julianday", "JULIAN_DAY(d)", "CAST(julianday(d) + 0.5 AS INTEGER)"},
    {"ABS vs abs", "sysfun_abs(n - 64)", "abs(n - 64)"},
    {"ROUND vs round", "sysfun_round(x, 2)", "round(x, 2)"},
    {"POWER vs power", "sysfun_power(x, 1.5)", "power(x, 1.5)"},
    {"SQRT vs sqrt", "sysfun_sqrt(x)", "sqrt(x)"},
    {"LOCATE vs instr", "LOCATE('ab', s)", "instr(s, 'ab')"},
    {"REPLACE vs replace", "sysfun_replace(s, 'a', 'xy')", "replace(s, 'a', 'xy')"},
    {"SOUNDEX vs soundex", "sysfun_soundex(s)", "soundex(s)"},
};

void check(sqlite3 *db, int rc, const char *what) {
  if (rc != SQLITE_OK && rc != SQLITE_DONE && rc != SQLITE_ROW) {
    static_cast<void>(std::fprintf(stderr, "%s: %s\n", what, sqlite3_errmsg(db)));
    std::exit(1);
  }
}

// Runs a query that returns one integer.
std::int64_t scalar(sqlite3 *db, const std::string &sql) {
  sqlite3_stmt *statement = nullptr;
  check(db, sqlite3_prepare_v2(db, sql.c_str(), -1, &statement, nullptr), sql.c_str());
  check(db, sqlite3_step(statement), sql.c_str());
  const std::int64_t value = sqlite3_column_int64(statement, 0);
  sqlite3_finalize(statement);
  return value;
}

// One full scan, in milliseconds.
double timeScan(sqlite3 *db, const std::string &expression) {
  const std::string sql = "SELECT count(" + expression + ") FROM t";
  const auto start = std::chrono::steady_clock::now();
  scalar(db, sql);
  const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - start;
  return took.count();
}

constexpr int kRuns = 5;

// The best of kRuns scans of each expression, taken in turns so that a
// slow spell of a shared machine hits both alike.
std::pair<double, double> timePair(sqlite3 *db, const Row &r) {
  double ours = 1e300, builtin = 1e300;
  for (int run = 0; run < kRuns; ++run) {
    ours = std::min(ours, timeScan(db, r.ours));
    builtin = std::min(builtin, timeScan(db, r.builtin));
  }
  return {ours, builtin};
}

void fill(sqlite3 *db, long rows) {
  check(db,
        sqlite3_exec(db, "CREATE TABLE t(s TEXT, n INTEGER, d TEXT, x REAL)", nullptr, nullptr,
                     nullptr),
        "create");
  check(db, sqlite3_exec(db, "BEGIN", nullptr, nullptr, nullptr), "begin");
  sqlite3_stmt *insert = nullptr;
  check(db,
        sqlite3_prepare_v2(db, "INSERT INTO t VALUES (?1, ?2, date(?3), ?4)", -1, &insert, nullptr),
        "insert");
  std::uint64_t state = 20261122;  // a fixed seed: the same table every run
  const auto next = [&] {
    state = state * 6364136223846793005u + 1442695040888963407u;
    return static_cast<unsigned>(state >> 33);
  };
  for (long i = 0; i < rows; ++i) {
    std::string s(next() % 3, ' ');
    const unsigned letters = 12 + next() % 10;
    for (unsigned k = 0; k < letters; ++k) {
      const unsigned r = next();
      s += static_cast<char>((r & 1 ? 'A' : 'a') + static_cast<char>((r >> 1) % 26));
    }
    s.append(next() % 3, ' ');
    sqlite3_bind_text(insert, 1, s.data(), static_cast<int>(s.size()), SQLITE_TRANSIENT);
    sqlite3_bind_int(insert, 2, static_cast<int>(1 + next() % 127));
    sqlite3_bind_double(insert, 3, 2415020.5 + static_cast<double>(next() % 73049));
    sqlite3_bind_double(insert, 4, static_cast<double>(next() % 1000000) / 1000.0);
    check(db, sqlite3_step(insert), "insert");
    sqlite3_reset(insert);
  }
  sqlite3_finalize(insert);
  check(db, sqlite3_exec(db, "COMMIT", nullptr, nullptr, nullptr), "commit");
}

}  // namespace

int main(int argc, char **argv) {
  const long rows = argc > 1 ? std::strtol(argv[1], nullptr, 10) : 1000000;
  sqlite3 *db = nullptr;
  check(db, sqlite3_open(":memory:", &db), "open");
  sqlite3_enable_load_extension(db, 1);
  char *error = nullptr;
  if (sqlite3_load_extension(db, ORV_SQLITE_HOST_PATH, nullptr, &error) != SQLITE_OK) {
    static_cast<void>(std::fprintf(stderr, "cannot load %s: %s\n", ORV_SQLITE_HOST_PATH, error));
    return 1;
  }
  fill(db, rows);

  std::printf("%ld rows, SQLite %s; times are the best of %d full scans, taken in turns\n\n", rows,
              sqlite3_libversion(), kRuns);
  std::printf("%-26s %10s %12s %8s  %s\n", "function", "ours ms", "built-in ms", "ratio",
              "same results");
  const char *only = argc > 2 ? argv[2] : "";
  for (const Row &r : kRows) {
    if (std::strstr(r.label, only) == nullptr) continue;
    const std::int64_t differing = scalar(db, std::string("SELECT count(*) FROM t WHERE (") +
                                                  r.ours + ") IS NOT (" + r.builtin + ")");
    const auto [ours, builtin] = timePair(db, r);
    std::printf("%-26s %10.1f %12.1f %8.2f  %s\n", r.label, ours, builtin, ours / builtin,
                differing == 0 ? "yes" : (std::to_string(differing) + " rows differ").c_str());
  }
  sqlite3_close(db);
  return 0;
}
