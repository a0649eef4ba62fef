// The SQLite extension, driven through SQL as a user drives it.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "snapshot.hpp"

namespace {

// A connection of its own with the extension loaded: "", or why not.
std::string connect(sqlite3 *&db) {
  char *error = nullptr;
  const bool loaded =
      sqlite3_open(":memory:", &db) == SQLITE_OK &&
      sqlite3_enable_load_extension(db, 1) == SQLITE_OK &&
      sqlite3_load_extension(db, ORV_SQLITE_HOST_PATH, nullptr, &error) == SQLITE_OK;
  std::string why = loaded ? "" : error != nullptr ? error : "not loaded";
  sqlite3_free(error);
  return why;
}

class SqliteHost : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_EQ(connect(db_), ""); }
  void TearDown() override { sqlite3_close(db_); }

  // The first column of the first row as text ("NULL" for NULL), or
  // "error: " and SQLite's message.
  std::string eval(const std::string &sql) {
    sqlite3_stmt *statement = nullptr;
    if (sqlite3_prepare_v2(db_, sql.c_str(), -1, &statement, nullptr) != SQLITE_OK) {
      return "error: " + std::string(sqlite3_errmsg(db_));
    }
    std::string out;
    if (sqlite3_step(statement) == SQLITE_ROW) {
      const auto *text = sqlite3_column_text(statement, 0);
      out = text == nullptr
                ? "NULL"
                : std::string(reinterpret_cast<const char *>(text),
                              static_cast<std::size_t>(sqlite3_column_bytes(statement, 0)));
    } else {
      out = "error: " + std::string(sqlite3_errmsg(db_));
    }
    sqlite3_finalize(statement);
    return out;
  }

  sqlite3 *db_ = nullptr;
};

TEST_F(SqliteHost, AnswersQueries) {
  const struct {
    const char *sql, *expected;
  } cases[] = {
      // Under sysfun_ names, plain names and each export's own name.
      {"SELECT sysfun_repeat('ab', 3) || SPACE(2) || 'x' || LCASE('ABC')", "ababab  xabc"},
      {R"(SELECT "LEFT"('abcdef', 3) || "RIGHT"('abc', 5) || '|')", "abcabc  |"},
      {"SELECT hex(sysfun_char(0) || sysfun_char(-1))", "20FF"},
      {"SELECT sysfun_left2('abc', 2) || sysfun_ascii3('B') || sysfun_lcase1('Q')", "ab66q"},
      // Text longer than 4000 bytes, BLOBs and text holding NUL go to the long form.
      {"SELECT length(LCASE(printf('%5000c', 'A')))", "5000"},
      {"SELECT typeof(LCASE(x'41')) || typeof(LCASE('A'))", "blobtext"},
      {"SELECT hex(LCASE('A' || char(0) || 'B'))", "610062"},
      {"SELECT length(sysfun_repeat2('ab', 524288))", "1048576"},
      {"SELECT length(sysfun_left2('a', 1048575))", "1048575"},
      // Integers are not cut, reals must be whole, text must be a number.
      {"SELECT SPACE(2.0) || '|' || SPACE('1') || '|'", "  | |"},
      {"SELECT sysfun_left('abc', 2147483648)",
       "error: LEFT: argument 2 (n) is 2147483648, outside the 32-bit range"},
      {"SELECT SPACE(2.5)",
       "error: SPACE: argument 1 (count) is 2.5, not a whole number in the 32-bit range"},
      {"SELECT SPACE('two')", "error: SPACE: argument 1 (count) is not a number"},
      {"SELECT sysfun_mod(1, 0.5)",
       "error: MOD: argument 2 (y) is 0.5, not a whole number in the 64-bit range"},
      // No form for long strings.
      {"SELECT sysfun_lcase1(x'41') IS NULL",
       "error: sysfun_lcase1: argument 1 (string) is a BLOB, and the function takes text only; "
       "sysfun_lcase2 takes such strings"},
      {"SELECT DIFFERENCE('Robert', 'a' || char(0))",
       "error: DIFFERENCE: argument 2 (b) holds a NUL byte, and the function takes text without "
       "NUL bytes"},
      {"SELECT sysfun_soundex(printf('%5000c', 'A'))",
       "error: SOUNDEX: argument 1 (string) is 5000 bytes long, and the function takes text of "
       "at most 4000 bytes"},
      {"SELECT length(LCASE(zeroblob(1048577)))",
       "error: LCASE: argument 1 (string) is 1048577 bytes long; strings are at most 1048576 "
       "bytes"},
      // NULL in gives NULL out.
      {"SELECT sysfun_left(NULL, 2) IS NULL AND REPEAT('a', NULL) IS NULL", "1"},
      // A call that the terminated-text form refuses only because its result
      // would pass 4000 bytes is served by the CLI_udfLob form, with a TEXT
      // result for TEXT arguments; by its own name an export takes its own
      // form only.
      {"SELECT typeof(REPEAT('a', 100000)) || length(REPEAT('a', 100000))", "text100000"},
      {"SELECT length(\"INSERT\"(printf('%.3000c', 'a'), 1, 0, printf('%.3000c', 'b')))", "6000"},
      {"SELECT typeof(REPEAT(x'61', 5000))", "blob"},
      {"SELECT sysfun_repeat1('ab', 2001)",
       "error: sysfun_repeat1: SQLSTATE 38552, SYSFUN:10: a string would be longer than the "
       "function allows; sysfun_repeat2 takes longer strings"},
      // SYSFUN errors name the SQL function called; refused by both forms,
      // the CLI_udfLob form's error.
      {"SELECT sysfun_left2('abc', 1048576)",
       "error: sysfun_left2: SQLSTATE 38552, SYSFUN:01: an argument lies outside what the "
       "function accepts"},
      {"SELECT REPEAT('a', 1048577)",
       "error: REPEAT: SQLSTATE 38552, SYSFUN:10: a string would be longer than the function "
       "allows"},
      {"SELECT sysfun_left('abc', 2147483647)",
       "error: LEFT: SQLSTATE 38552, SYSFUN:01: an argument lies outside what the function "
       "accepts"},
      // The plain name validates the time to its last digit; the narrower
      // export reads only the date.
      {"SELECT JULIAN_DAY('2001-09-27-13.30.15.123456') || ' ' || "
       "MIDNIGHT_SECONDS('2001-09-27-13.30.15.123456') || ' ' || "
       "sysfun_julian_day1('2001-09-27-99.99.99')",
       "2452180 48615 2452180"},
      {"SELECT JULIAN_DAY('2001-09-27-99.99.99')",
       "error: JULIAN_DAY: SQLSTATE 38552, SYSFUN:06: the time of the timestamp is not valid, or "
       "the text has no form that is taken"},
      // SQLite's log is base 10; ours stays reachable under its own name.
      {"SELECT sysfun_log(1) || ' ' || log(100)", "0.0 2.0"},
      // Integers reach the 64-bit form, reals the double form, by each argument.
      {"SELECT typeof(sysfun_power(2, 10)) || sysfun_power(2, 10)", "integer1024"},
      {"SELECT sysfun_power(2.0, 3) || ' ' || sysfun_power(4, 0.5)", "8.0 2.0"},
      {"SELECT sysfun_abs(-9223372036854775808)",
       "error: ABS: SQLSTATE 38552, SYSFUN:01: an argument lies outside what the function "
       "accepts"},
      {"SELECT LOCATE('b', 'abcb', 3) || \"INSERT\"('abcdef', 3, 2, 'XY') || DIFFERENCE('a', 'b')",
       "4abXYef3"},
      {"SELECT sysfun_soundex('Ashcraft') || length(sysfun_replace(printf('%5000c', 'a'), 'a', "
       "'bb'))",
       "A2265001"},
      {"SELECT DAYNAME('2001-01-07') || MONTHNAME('2001-03-01') || sysfun_dayname2('2001-01-07 x')",
       "SundayMarchSunday"},
      {"SELECT CHARTODOUBLE('1.5e3 ') || '|' || DOUBLETOCHAR(-1234.5) || '|'",
       "1500.0|-1.2345E3               |"},
      // Routines that cut blanks off their text in place get a copy; the
      // others read SQLite's own buffer: the column keeps its blanks either way.
      {"SELECT n || CHARTODOUBLE(n) || n || '|' FROM (SELECT '15  ' AS n)", "15  15.015  |"},
      {"SELECT d || '|' || DAYOFYEAR(d) || sysfun_rtrim(d) || d || '|' "
       "FROM (SELECT '2001-02-03  ' AS d)",
       "2001-02-03  |342001-02-032001-02-03  |"},
      {"SELECT COLLATIONNAME(zeroblob(8)) || COLLATIONNAME(NULL) || COLLATIONNAME(x'FF')",
       "error: COLLATIONNAME: argument 1 (collation id) must be exactly 8 bytes"},
      {"SELECT COLLATIONNAME(zeroblob(8)) || COLLATIONNAME(NULL)", "IDENTITYINVALID"},
      // FmpRows lists the catalogue: every routine with its property bits,
      // among them the three that handle NULL themselves.  Table functions
      // are table-valued functions, whose hidden selector is checked as a
      // scalar argument is.
      {"SELECT count(*) || '/' || sum(column6 & 4 != 0) FROM fmprows", "104/3"},
      {"SELECT column2 FROM fmprows WHERE column1 = 0", "8"},  // SPACE: 8 arguments
      {"SELECT count(*) FROM fmpthreads(-5)", "0"},
      {"SELECT count(*) FROM fmpthreads WHERE selector = NULL", "0"},
      {"SELECT count(*) FROM fmpthreads(4294967296)",
       "error: FmpThreads: argument 1 (selector) is 4294967296, outside the 32-bit range"},
      {"SELECT count(*) FROM fmpthreads(-1.5)",
       "error: FmpThreads: argument 1 (selector) is -1.5, not a whole number in the 32-bit range"},
      {"SELECT count(*) FROM fmpthreads('x')",
       "error: FmpThreads: argument 1 (selector) is not a number"},
      // RAND with a constant seed seeds once per statement, in each place
      // it is called: the same sequence in each, going on from row to row.
      {"WITH r(i) AS (VALUES (1), (2), (3)) SELECT (SELECT group_concat(RAND(42)) FROM r) = "
       "(SELECT group_concat(RAND(42)) FROM r) AND (SELECT group_concat(RAND(42)) FROM r) <> "
       "(SELECT group_concat(RAND(43)) FROM r) AND (SELECT count(DISTINCT RAND(42)) FROM r) = 3",
       "1"},
      // The version, and what each name reaches.
      {"SELECT sysfun_version() NOT GLOB '*[^0-9.]*' AND sysfun_version() GLOB '[0-9]*'", "1"},
      {"SELECT exports || ' / ' || arguments || ' / ' || sysfun_codes || ' / ' || plain_name "
       "FROM sysfun_functions WHERE name = 'sysfun_left'",
       "CLI_udfLEFT1, CLI_udfLEFT2 / string: text | CLI_udfLob, n: 32-bit integer / 01 / left"},
      {"SELECT exports FROM sysfun_functions WHERE name = 'sysfun_julian_day1'",
       "CLI_udfJULIAN_DAY1"},
      {"SELECT summary FROM sysfun_functions WHERE name = 'sysfun_julian_day'",
       "Julian day number of a date or timestamp, validated to its end."},
      // Every row names a function that SQLite has with that argument count,
      // under both names where a plain name is given, and every registered
      // sysfun_ function has its row.
      {"SELECT count(*) FROM sysfun_functions f WHERE NOT EXISTS (SELECT 1 FROM "
       "pragma_function_list p WHERE p.name = f.name AND p.narg = f.argument_count) "
       "OR (f.plain_name IS NOT NULL AND NOT EXISTS (SELECT 1 FROM pragma_function_list "
       "p WHERE p.name = f.plain_name AND p.narg = f.argument_count))",
       "0"},
      {"SELECT count(*) FROM pragma_function_list p WHERE substr(p.name, 1, 7) = "
       "'sysfun_' AND p.name <> 'sysfun_version' AND NOT EXISTS (SELECT 1 FROM "
       "sysfun_functions f WHERE f.name = p.name AND f.argument_count = p.narg)",
       "0"},
      // Deterministic and innocuous, and no built-in function hidden.
      {"SELECT count(*) FROM pragma_function_list WHERE name IN ('sysfun_space', 'lcase', "
       "'sysfun_ascii3') AND flags & 0x200800 = 0x200800",
       "3"},
      {"SELECT count(*) FROM pragma_function_list WHERE name IN ('rtrim', 'ltrim', 'char') "
       "AND builtin = 0",
       "0"},
  };
  for (const auto &c : cases) EXPECT_EQ(eval(c.sql), c.expected) << c.sql;
  // FmpThreads holds this thread, running ('R', 82), among all of the
  // process's; a whole REAL selects it alone.
  const std::string self = std::to_string(::gettid());
  EXPECT_EQ(eval("SELECT count(*) || column2 FROM fmpthreads(0) WHERE column1 = " + self), "182");
  EXPECT_EQ(eval("SELECT count(*) || column1 FROM fmpthreads(" + self + ".0)"), "1" + self);
}

// Every row's example gives its result through the export's own name: each
// line of the script that tools/examples_sql.cpp writes gives 'ok', or what
// the export gave instead.
TEST_F(SqliteHost, GivesEveryExampleItsResult) {
  std::ifstream script(ORV_EXAMPLES_SCRIPT);
  int examples = 0;
  for (std::string line; std::getline(script, line); ++examples) {
    EXPECT_EQ(eval(line), "ok") << line;
  }
  EXPECT_GT(examples, 0) << "no examples in " << ORV_EXAMPLES_SCRIPT;
}

// The snapshot is read where the instance path says, one row per fetch.
TEST_F(SqliteHost, ReadsTheSnapshotAsATable) {
  namespace fs = std::filesystem;
  const fs::path dir = fs::temp_directory_path() / ("orv_host_" + std::to_string(::getpid()));
  fs::create_directories(dir / "tmp");
  orv::snapshot::Statement st;
  st.columns[0] = 7;
  st.text = "SELECT 1";
  std::ofstream(dir / "tmp" / "sqlcache.sql", std::ios::binary)
      << orv::snapshot::section("PKG") + orv::snapshot::statement(st) +
             orv::snapshot::statement(st) +
             orv::snapshot::element(19, orv::snapshot::element(312, "SELECT 2"));
  setenv("ORVENGINE_INSTANCE_PATH", dir.c_str(), 1);
  // A column whose element a statement lacks is NULL.
  EXPECT_EQ(eval("SELECT count(*) || group_concat(ifnull(column1, 'N') || column17 || column18, "
                 "',') FROM sqlcache_snapshot"),
            "37PKGSELECT 1,7PKGSELECT 1,NPKGSELECT 2");
  unsetenv("ORVENGINE_INSTANCE_PATH");
  EXPECT_EQ(eval("SELECT count(*) FROM sysfun_sqlcache_snapshot"), "0");
  fs::remove_all(dir);
}

// A module that the connection has under a table function's plain name is
// kept: the extension adds only its sysfun_ name.
TEST(SqliteHostModules, KeepAModuleOfTheConnectionsOwn) {
  static constexpr sqlite3_module kOwn{};
  bool replaced = false;
  sqlite3 *db = nullptr;
  ASSERT_EQ(sqlite3_open(":memory:", &db), SQLITE_OK);
  sqlite3_create_module_v2(db, "FMPROWS", &kOwn, &replaced,
                           [](void *flag) { *static_cast<bool *>(flag) = true; });
  char *error = nullptr;
  sqlite3_enable_load_extension(db, 1);
  EXPECT_EQ(sqlite3_load_extension(db, ORV_SQLITE_HOST_PATH, nullptr, &error), SQLITE_OK);
  sqlite3_free(error);
  EXPECT_FALSE(replaced);
  sqlite3_close(db);
}

// Connections load the extension while others run its table functions:
// whatever the extension shares between connections is set up once (run
// under the thread sanitizer by ./dev sanitize).
TEST(SqliteHostThreads, LoadOnNewConnectionsWhileOthersRunTableFunctions) {
  std::atomic<int> failures{0};
  const char *const queries =
      "SELECT count(*) FROM fmprows; SELECT count(*) FROM fmpthreads(0); "
      "SELECT count(*) FROM sysfun_functions; SELECT REPEAT('a', 5000);";
  const auto work = [&](bool query) {
    for (int k = 0; k < 20; ++k) {
      sqlite3 *db = nullptr;
      if (!connect(db).empty() ||
          (query && sqlite3_exec(db, queries, nullptr, nullptr, nullptr) != SQLITE_OK)) {
        ++failures;
      }
      sqlite3_close(db);
    }
  };
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int t = 0; t < 4; ++t) threads.emplace_back(work, t % 2 == 0);
  for (std::thread &t : threads) t.join();
  EXPECT_EQ(failures.load(), 0);
}

}  // namespace
