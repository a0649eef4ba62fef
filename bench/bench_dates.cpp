// Date and time rows: the routines that read a date, time or timestamp
// text, TIMESTAMP and TIMESTAMPDIFF, and DAYNAME and MONTHNAME.
#include <array>
#include <cstdlib>
#include <cstring>

#include "bench_support.hpp"

namespace orv::bench {

namespace {

// Every date row's routine takes one text and gives one 32-bit integer, and
// DAYNAME and MONTHNAME add the database information block: the argument
// counts are fixed, so those rows call as directly as an engine that knows
// the routine does.
constexpr std::size_t kDateArguments = cat::argumentCount(*cat::find("CLI_udfJULIAN_DAY2"));
constexpr std::size_t kNameArguments = cat::argumentCount(*cat::find("CLI_udfDAYNAME1"));

// Whether `row` takes one text and gives one result of `layout`, in a frame
// of `arguments` arguments.
bool textToOne(const cat::Routine &row, cat::Layout layout, std::size_t arguments) {
  return cat::inputCount(row) == 1 && row.inputs[0].layout == cat::Layout::text &&
         cat::resultCount(row) == 1 && row.results[0].layout == layout &&
         cat::argumentCount(row) == arguments;
}

// Date routines trim their input in place, so each call gets a fresh copy
// of the text, as an engine hands each row's value.
void dateRoutine(benchmark::State &state, const char *symbol, const char *value) {
  const cat::Routine &row = routineNamed(symbol);
  void *fn = exportNamed(symbol);
  if (!textToOne(row, cat::Layout::int32, kDateArguments)) {
    state.SkipWithError("the routine is not one of a text and a 32-bit integer");
    return;
  }
  const std::size_t size = std::strlen(value) + 1;
  char text[40];
  std::int32_t result = 0;
  const void *inputs[] = {text};
  PreparedCall call(row, inputs, &result);
  for (auto _ : state) {
    std::memcpy(text, value, size);
    cli::call::invokeWith<kDateArguments>(fn, call.args());
    benchmark::DoNotOptimize(result);
  }
  if (call.status().stored()) state.SkipWithError("the routine reported a status");
}

constexpr const char *kDate = "2001-09-27";
constexpr const char *kTimestamp = "2001-09-27-13.30.15.123456";

// Date rows: name, export, text.
struct DateRow {
  const char *name, *routine, *value;
};
constexpr DateRow kDateRows[] = {
    {"JULIAN_DAY2/10-byte date", "CLI_udfJULIAN_DAY2", kDate},
    {"JULIAN_DAY2/26-byte timestamp", "CLI_udfJULIAN_DAY2", kTimestamp},
    {"JULIAN_DAY1/26-byte timestamp", "CLI_udfJULIAN_DAY1", kTimestamp},
    {"WEEK2/26-byte timestamp", "CLI_udfWEEK2", kTimestamp},
    {"WEEK_ISO2/10-byte date", "CLI_udfWEEK_ISO2", kDate},
    {"WEEK_ISO2/26-byte timestamp", "CLI_udfWEEK_ISO2", kTimestamp},
    {"QUARTER2/26-byte timestamp", "CLI_udfQUARTER2", kTimestamp},
    {"DAYOFYEAR2/10-byte date", "CLI_udfDAYOFYEAR2", kDate},
    {"DAYOFWEEK1/26-byte timestamp", "CLI_udfDAYOFWEEK1", kTimestamp},
    {"DAYOFWEEK_ISO1/10-byte date", "CLI_udfDAYOFWEEK_ISO1", kDate},
    {"MIDNIGHT_SECONDS1/8-byte time", "CLI_udfMIDNIGHT_SECONDS1", "13.30.15"},
    {"MIDNIGHT_SECONDS2/26-byte timestamp", "CLI_udfMIDNIGHT_SECONDS2", kTimestamp},
};

// DAYNAME and MONTHNAME with the names in the database's code page (UTF-8),
// so that no conversion takes place.
void nameRow(benchmark::State &state, const char *symbol, const char *date) {
  const cat::Routine &row = routineNamed(symbol);
  void *fn = exportNamed(symbol);
  if (!textToOne(row, cat::Layout::text, kNameArguments) || row.frame != cat::Frame::dbinfo) {
    state.SkipWithError("the routine is not one of a text, a name and the database block");
    return;
  }
  setenv("ORVENGINE_LOCALE", "en_US", 1);
  unsigned char dbinfo[512] = {};
  const std::uint32_t utf8 = 1208;
  std::memcpy(dbinfo + CLI_DBINFO_CODEPAGE_OFFSET, &utf8, 4);
  char text[40];
  std::array<char, cli::call::areaSize(cat::textOf(cat::kName))> result{};
  const void *inputs[] = {text};
  PreparedCall call(row, inputs, result.data(), dbinfo);
  const std::size_t size = std::strlen(date) + 1;
  for (auto _ : state) {
    std::memcpy(text, date, size);
    cli::call::invokeWith<kNameArguments>(fn, call.args());
    benchmark::DoNotOptimize(result);
  }
  if (call.status().stored()) state.SkipWithError("the routine reported a status");
}

void timestampRow(benchmark::State &s) {
  run(s, "CLI_udfTIMESTAMP", {text("2001-09-27-13.30.15.123456")}, textArea());
}
void timestampDiffRow(benchmark::State &s) {
  run(s, "CLI_udfTIMESTAMPDIFF", {int32(2), text("00000123123030.123456")}, int32(0));
}

}  // namespace

void registerDateRows() {
  for (const DateRow &r : kDateRows) {
    benchmark::RegisterBenchmark(r.name, dateRoutine, r.routine, r.value);
  }
}

void registerNameRows() {
  benchmark::RegisterBenchmark("DAYNAME1/10-byte date, no conversion", nameRow, "CLI_udfDAYNAME1",
                               "2001-09-27");
  benchmark::RegisterBenchmark("MONTHNAME2/26-byte timestamp, no conversion", nameRow,
                               "CLI_udfMONTHNAME2", "2001-09-27-13.30.15.123456");
}

void registerTimestampRows() {
  benchmark::RegisterBenchmark("TIMESTAMP/26-byte timestamp", timestampRow);
  benchmark::RegisterBenchmark("TIMESTAMPDIFF/2, 20-byte duration", timestampDiffRow);
}

}  // namespace orv::bench
