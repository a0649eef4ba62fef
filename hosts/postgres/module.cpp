// The PostgreSQL extension's module: loading, the reports of statuses and
// bad arguments, the database information block and the date and time
// values in the library's text forms, by the calendar's day numbers.
#include "server.hpp"
// server.hpp first: PostgreSQL's headers want to come before any other.
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "calendar/calendar.hpp"
#include "common/exports.hpp"
#include "frame/cliudf.h"
#include "frame/status.hpp"
#include "module.hpp"
#include "tables.hpp"

extern "C" {
PG_MODULE_MAGIC;
// The name is PostgreSQL's: it calls the function when it loads the module.
// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
PGDLLEXPORT void _PG_init(void);
}

namespace orv::pg {

host::Exports gExports{};

namespace {

// Every export of the catalogue, found by its name in the library that the
// module was linked with; the module cannot be loaded without all of them.
void findExports() {
  const host::Library library = host::openLibrary();
  if (library.failure == host::Library::Failure::whereabouts) {
    ereport(ERROR, (errmsg("orvclifn: cannot tell where the library was loaded from")));
  }
  if (library.failure == host::Library::Failure::open) {
    ereport(ERROR, (errmsg("orvclifn: %s", library.error)));
  }
  host::findExports(library, gExports);
  if (const cli::catalogue::Routine *missing = host::firstMissing(gExports)) {
    ereport(ERROR,
            (errmsg("orvclifn: the library %s has no export %s", library.path, missing->symbol)));
  }
}

const char *functionName(FunctionCallInfo fcinfo) {
  const char *name = get_func_name(fcinfo->flinfo->fn_oid);
  return name != nullptr ? name : "orvclifn";
}

int sqlstateCode(const char *s) { return MAKE_SQLSTATE(s[0], s[1], s[2], s[3], s[4]); }

// PostgreSQL counts microseconds from 2000-01-01 too.
constexpr std::int64_t kDay = USECS_PER_DAY;

void digits(char *out, std::int64_t value, int width) {
  for (int i = width - 1; i >= 0; --i) {
    out[i] = static_cast<char>('0' + value % 10);
    value /= 10;
  }
}

// "00" to "99", to write two digits at a time.
constexpr auto kDigitPairs = [] {
  std::array<char, 200> pairs{};
  for (std::size_t i = 0; i < 100; ++i) {
    pairs[2 * i] = static_cast<char>('0' + i / 10);
    pairs[2 * i + 1] = static_cast<char>('0' + i % 10);
  }
  return pairs;
}();

void twoDigits(char *out, std::uint32_t value) {
  std::memcpy(out, &kDigitPairs[2 * std::size_t{value}], 2);
}

// YYYY-MM-DD for days since 2000-01-01; 0 outside the years 1 to 9999.
// The hot path of every date argument.
std::size_t writeDate(std::int64_t days, char *out) {
  if (days < kFirstDay || days > kLastDay) return 0;
  const cli::CLI_date date =
      cli::CLI_dateOfDayNumber(static_cast<std::int32_t>(days) + kDayNumberOfDayZero);
  const auto year = static_cast<std::uint32_t>(date.year);
  twoDigits(out, year / 100);
  twoDigits(out + 2, year % 100);
  out[4] = '-';
  twoDigits(out + 5, static_cast<std::uint32_t>(date.month));
  out[7] = '-';
  twoDigits(out + 8, static_cast<std::uint32_t>(date.day));
  return 10;
}

// HH.MM.SS for microseconds since midnight, and .FFFFFF behind it when
// `fraction` is set.
std::size_t writeTime(std::int64_t micros, char *out, bool fraction) {
  const std::int64_t seconds = micros / USECS_PER_SEC;
  digits(out, seconds / 3600, 2);
  out[2] = '.';
  digits(out + 3, seconds / 60 % 60, 2);
  out[5] = '.';
  digits(out + 6, seconds % 60, 2);
  if (!fraction) return 8;
  out[8] = '.';
  digits(out + 9, micros % USECS_PER_SEC, 6);
  return 15;
}

// Whether the bytes are ASCII without a NUL, which every server encoding
// takes as it is.  Most results are; for a short one this word-wide test
// costs less than the call of the encoding's verifier, which does the same
// test itself on longer text.
constexpr std::size_t kShortText = 64;
bool plainAscii(const char *data, std::size_t size) {
  constexpr std::uint64_t kOnes = 0x0101010101010101, kHigh = 0x8080808080808080;
  std::size_t i = 0;
  for (; i + 8 <= size; i += 8) {
    std::uint64_t w = 0;
    std::memcpy(&w, data + i, 8);
    // A high bit, or a zero byte: (w - 1) & ~w sets the high bit of the
    // lowest zero byte, and of none when there is none.
    if (((w | ((w - kOnes) & ~w)) & kHigh) != 0) return false;
  }
  for (; i < size; ++i) {
    const auto c = static_cast<unsigned char>(data[i]);
    if (c == 0 || c >= 0x80) return false;
  }
  return true;
}

// The number that the Width digits at `p` spell; `bad` is set when a byte
// among them is no digit.  Without a branch per byte: the text is nearly
// always right.
template <int Width>
std::int64_t digitsAt(const char *p, bool &bad) {
  std::int64_t out = 0;
  for (int i = 0; i < Width; ++i) {
    const unsigned digit = static_cast<unsigned char>(p[i]) - unsigned{'0'};
    bad |= digit > 9;
    out = out * 10 + digit;
  }
  return out;
}

}  // namespace

void reportStatus(FunctionCallInfo fcinfo, const cli::call::StatusBuffers &status) {
  const char *name = functionName(fcinfo);
  if (const cli::Sysfun code = cli::call::sysfunIn(status.sqlstate, status.message);
      code != cli::Sysfun::none) {
    ereport(ERROR,
            (errcode(sqlstateCode(CLI_SQLSTATE_SYSFUN)),
             errmsg("%s: SYSFUN:%s: %s", name, cli::textOf(code).digits, cli::wordsOf(code))));
  }
  // Any other status keeps its own SQLSTATE; some are stored without a
  // terminator, so both buffers are read to their size only.
  char sqlstate[6] = {};
  std::memcpy(sqlstate, status.sqlstate, 5);
  ereport(ERROR,
          (errcode(sqlstateCode(sqlstate)),
           errmsg("%s: %.*s", name, static_cast<int>(sizeof status.message), status.message)));
  pg_unreachable();
}

void reportArgument(FunctionCallInfo fcinfo, int sqlstate, int i, const char *name,
                    const char *what) {
  if (name != nullptr && name[0] != '\0') {
    ereport(ERROR, (errcode(sqlstate),
                    errmsg("%s: argument %d (%s) %s", functionName(fcinfo), i + 1, name, what)));
  }
  ereport(ERROR,
          (errcode(sqlstate), errmsg("%s: argument %d %s", functionName(fcinfo), i + 1, what)));
  pg_unreachable();
}

const void *databaseInfo(FunctionCallInfo fcinfo) {
  // The engine's code pages of the encodings that a database can have.
  struct Known {
    int encoding;
    std::uint32_t codePage;
  };
  static constexpr Known kKnown[] = {
      {PG_UTF8, 1208}, {PG_SQL_ASCII, 1208}, {PG_LATIN1, 819}, {PG_WIN1252, 1252}, {PG_EUC_JP, 954},
  };
  static std::array<unsigned char, 512> block{};
  const int encoding = GetDatabaseEncoding();
  for (const Known &k : kKnown) {
    if (k.encoding == encoding) {
      std::memcpy(block.data() + CLI_DBINFO_CODEPAGE_OFFSET, &k.codePage, sizeof k.codePage);
      return block.data();
    }
  }
  ereport(ERROR, (errcode(ERRCODE_FEATURE_NOT_SUPPORTED),
                  errmsg("%s: the database encoding %s has no code page that the library knows",
                         functionName(fcinfo), GetDatabaseEncodingName())));
  pg_unreachable();
}

std::size_t dateText(DateADT date, char *out) {
  if (DATE_NOT_FINITE(date)) return 0;
  return writeDate(date, out);
}

std::size_t timeText(TimeADT time, char *out) { return writeTime(time, out, false); }

std::size_t timestampText(Timestamp stamp, char *out) {
  if (TIMESTAMP_NOT_FINITE(stamp)) return 0;
  std::int64_t days = stamp / kDay, micros = stamp % kDay;
  if (micros < 0) {
    micros += kDay;
    days -= 1;
  }
  if (writeDate(days, out) == 0) return 0;
  out[10] = '-';
  return 11 + writeTime(micros, out + 11, true);
}

bool timestampOf(const char *text, std::size_t size, Timestamp &out) {
  if (size != 26 || text[4] != '-' || text[7] != '-' || text[10] != '-' || text[13] != '.' ||
      text[16] != '.' || text[19] != '.') [[unlikely]] {
    return false;
  }
  // The text comes from the library, which writes the form it should: the
  // paths that refuse it are the unlikely ones.
  bool bad = false;
  const std::int64_t y = digitsAt<4>(text, bad), mo = digitsAt<2>(text + 5, bad),
                     d = digitsAt<2>(text + 8, bad), mi = digitsAt<2>(text + 14, bad),
                     s = digitsAt<2>(text + 17, bad), f = digitsAt<6>(text + 20, bad);
  std::int64_t h = digitsAt<2>(text + 11, bad);
  if (bad) [[unlikely]]
    return false;
  // The library ends a day at 24.00.00.000000 (TIMESTAMPTIME of 24:00:00,
  // which PostgreSQL's time takes too): the next day's midnight.
  const bool endOfDay = h == 24 && mi == 0 && s == 0 && f == 0;
  if (endOfDay) h = 0;
  if (y < 1 || mo < 1 || mo > 12 || d < 1 || h > 23 || mi > 59 || s > 59) [[unlikely]] {
    return false;
  }
  const auto year = static_cast<std::int32_t>(y), month = static_cast<std::int32_t>(mo),
             day = static_cast<std::int32_t>(d);
  // Every month has 28 days; only the few days beyond look up the month.
  if (day > 28 && day > cli::CLI_monthLengthTable[cli::CLI_isLeapYear(year)][month]) [[unlikely]] {
    return false;
  }
  const std::int64_t days = cli::CLI_dayNumber(year, month, day) - kDayNumberOfDayZero;
  out = (days + (endOfDay ? 1 : 0)) * kDay + ((h * 60 + mi) * 60 + s) * USECS_PER_SEC + f;
  return true;
}

text *resultText(FunctionCallInfo fcinfo, const char *data, std::size_t size) {
  const int length = static_cast<int>(size);
  if (!(size <= kShortText && plainAscii(data, size)) &&
      !pg_verify_mbstr(GetDatabaseEncoding(), data, length, true)) {
    ereport(ERROR,
            (errcode(ERRCODE_CHARACTER_NOT_IN_REPERTOIRE),
             errmsg("%s: the result is not valid %s text", functionName(fcinfo),
                    GetDatabaseEncodingName()),
             errdetail("The library works on bytes; this result cuts or changes a character."),
             errhint("Pass the string as bytea (convert_to(s, 'UTF8')) to get bytes back.")));
  }
  return cstring_to_text_with_len(data, length);
}

bytea *resultBytes(const void *data, std::size_t size) {
  auto *out = static_cast<bytea *>(palloc(VARHDRSZ + size));
  SET_VARSIZE(out, VARHDRSZ + size);
  if (size != 0) std::memcpy(VARDATA(out), data, size);
  return out;
}

}  // namespace orv::pg

void _PG_init(void) {  // NOLINT(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
  orv::pg::findExports();
  orv::pg::defineSettings();
}
