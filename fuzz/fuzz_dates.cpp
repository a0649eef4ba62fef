// Date, time and timestamp texts through every date routine.
//
// Input: one option byte, then the text (up to its first NUL).  Option
// bit 0 hands DAYNAME and MONTHNAME a null database information block.
//
// Beyond the frame's checks: each export that reads only the date at the
// head of the text succeeds wherever its whole-text twin does, with the
// same result; every result agrees with the calendar date that JULIAN_DAY
// gives (quarter, day of year, both days of the week, both week numbers,
// the English names of the stand-in's default locale); MIDNIGHT_SECONDS
// lies within a day, and TIMESTAMP agrees with TIMESTAMPDATE and
// TIMESTAMPTIME where they succeed.
#include <array>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;

// A calendar date from a Julian day number, proleptic Gregorian.
struct Date {
  std::int64_t year, month, day;
};

Date fromJulianDay(std::int64_t jd) {
  const std::int64_t z = jd - 2440588 + 719468;  // days since 0000-03-01
  const std::int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const std::int64_t doe = z - era * 146097;
  const std::int64_t yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const std::int64_t doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const std::int64_t mp = (5 * doy + 2) / 153;
  const std::int64_t d = doy - (153 * mp + 2) / 5 + 1;
  const std::int64_t m = mp < 10 ? mp + 3 : mp - 9;
  return {yoe + era * 400 + (m <= 2 ? 1 : 0), m, d};
}

std::int64_t julianDay(std::int64_t y, std::int64_t m, std::int64_t d) {
  y -= m <= 2 ? 1 : 0;
  const std::int64_t era = (y >= 0 ? y : y - 399) / 400;
  const std::int64_t yoe = y - era * 400;
  const std::int64_t doy = (153 * (m > 2 ? m - 3 : m + 9) + 2) / 5 + d - 1;
  const std::int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + doe - 719468 + 2440588;
}

// Monday = 0 .. Sunday = 6.
std::int64_t weekdayFromMonday(std::int64_t jd) { return jd % 7; }

// ISO 8601 week number.
std::int64_t isoWeek(std::int64_t jd) {
  // The Thursday of the date's week decides the year.
  const std::int64_t thursday = jd - weekdayFromMonday(jd) + 3;
  const Date t = fromJulianDay(thursday);
  const std::int64_t firstThursdayYearStart = julianDay(t.year, 1, 1);
  return (thursday - firstThursdayYearStart) / 7 + 1;
}

std::int32_t callInt(const char *name, std::string_view text, std::string &code) {
  Call c(name);
  c.input(textBlock(text), Trim::blanks).result(Block(4));
  code = c.run();
  return numberIn<std::int32_t>(c.out());
}

// The name routines: area of 102 bytes (101 and a terminator).
std::string callName(const char *name, std::string_view text, bool nullBlock, std::string &code,
                     bool &written) {
  std::array<unsigned char, 272> dbinfo{};
  const std::int32_t codepage = 1208;
  std::memcpy(dbinfo.data() + CLI_DBINFO_CODEPAGE_OFFSET, &codepage, 4);
  Block info(dbinfo.size());
  std::memcpy(info.data(), dbinfo.data(), dbinfo.size());
  Call c(name);
  c.input(textBlock(text), Trim::blanks).result(Block(cli::catalogue::kName + 1));
  c.dbinfo(nullBlock ? nullptr : info.data());
  code = c.run();
  ORV_CHECK(name, info.view() == std::string_view(reinterpret_cast<const char *>(dbinfo.data()),
                                                  dbinfo.size()));
  written = !c.resultUntouched();
  if (!code.empty() || !written) return {};
  return std::string(textIn(name, c.out()));
}

std::string callStamp(const char *name, std::string_view text, std::string &code) {
  Call c(name);
  c.input(textBlock(text), Trim::blanks).result(Block(cli::catalogue::kStamp + 1));
  code = c.run();
  if (!code.empty()) return {};
  // The text and its terminator lie within the 27 bytes of the area.
  return std::string(textIn(name, c.out()));
}

constexpr const char *kDays[] = {"Monday", "Tuesday",  "Wednesday", "Thursday",
                                 "Friday", "Saturday", "Sunday"};
constexpr const char *kMonths[] = {"January",   "February", "March",    "April",
                                   "May",       "June",     "July",     "August",
                                   "September", "October",  "November", "December"};

// The value that a routine gives for the date of Julian day `jd`.
std::int64_t expected(std::string_view routine, std::int64_t jd) {
  const Date d = fromJulianDay(jd);
  const std::int64_t ordinal = jd - julianDay(d.year, 1, 1) + 1;
  if (routine.starts_with("CLI_udfJULIAN_DAY")) return jd;
  if (routine.starts_with("CLI_udfQUARTER")) return (d.month - 1) / 3 + 1;
  if (routine.starts_with("CLI_udfDAYOFYEAR")) return ordinal;
  if (routine.starts_with("CLI_udfDAYOFWEEK_ISO")) return weekdayFromMonday(jd) + 1;
  if (routine.starts_with("CLI_udfDAYOFWEEK")) return (weekdayFromMonday(jd) + 1) % 7 + 1;
  if (routine.starts_with("CLI_udfWEEK_ISO")) return isoWeek(jd);
  // WEEK: week 1 runs from 1 January to the first Saturday.
  const std::int64_t jan1Sunday0 = (weekdayFromMonday(julianDay(d.year, 1, 1)) + 1) % 7;
  return (ordinal - 1 + jan1Sunday0) / 7 + 1;
}

struct Range {
  std::int32_t low, high;
};

Range rangeOf(std::string_view routine) {
  if (routine.starts_with("CLI_udfJULIAN_DAY")) return {1721426, 5373484};
  if (routine.starts_with("CLI_udfQUARTER")) return {1, 4};
  if (routine.starts_with("CLI_udfDAYOFYEAR")) return {1, 366};
  if (routine.starts_with("CLI_udfDAYOFWEEK")) return {1, 7};
  if (routine.starts_with("CLI_udfWEEK_ISO")) return {1, 53};
  return {1, 54};
}

// Each pair: the export that validates the whole text, then its twin that
// reads only the date at the head.
constexpr std::array<std::array<const char *, 2>, 7> kPairs = {{
    {"CLI_udfJULIAN_DAY2", "CLI_udfJULIAN_DAY1"},
    {"CLI_udfWEEK2", "CLI_udfWEEK1"},
    {"CLI_udfWEEK_ISO2", "CLI_udfWEEK_ISO1"},
    {"CLI_udfQUARTER2", "CLI_udfQUARTER1"},
    {"CLI_udfDAYOFYEAR2", "CLI_udfDAYOFYEAR1"},
    {"CLI_udfDAYOFWEEK1", "CLI_udfDAYOFWEEK2"},
    {"CLI_udfDAYOFWEEK_ISO1", "CLI_udfDAYOFWEEK_ISO2"},
}};

// Whole text fails only with 04 or 06; the head-only twin passes where the
// whole text does, with the same result, and fails only with 04, then the
// whole-text export fails with 04 as well.
void checkPair(const char *whole, const char *head, const std::string &wholeCode,
               const std::string &headCode, bool sameResult) {
  ORV_CHECK(whole, wholeCode.empty() || wholeCode == "04" || wholeCode == "06");
  ORV_CHECK(head, headCode.empty() || headCode == "04");
  if (wholeCode.empty()) ORV_CHECK(head, headCode.empty() && sameResult);
  if (!headCode.empty()) ORV_CHECK(whole, wholeCode == "04");
  if (headCode.empty() && !wholeCode.empty()) ORV_CHECK(whole, wholeCode == "06");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  if (size == 0) return 0;
  const bool nullBlock = (data[0] & 1u) != 0;
  const std::string_view text =
      upToNul(std::string_view(reinterpret_cast<const char *>(data) + 1, size - 1));

  // The day number of the date at the head, when it is valid.
  std::string headJdCode;
  const std::int32_t headJd = callInt("CLI_udfJULIAN_DAY1", text, headJdCode);

  for (const auto &[whole, head] : kPairs) {
    std::string wholeCode, headCode;
    const std::int32_t w = callInt(whole, text, wholeCode);
    const std::int32_t h = callInt(head, text, headCode);
    checkPair(whole, head, wholeCode, headCode, w == h);
    ORV_CHECK(head, headCode == headJdCode);
    if (!headCode.empty()) continue;
    const Range r = rangeOf(head);
    ORV_CHECK(head, h >= r.low && h <= r.high);
    ORV_CHECK(head, h == expected(head, headJd));
  }

  // Names: DAYNAME1 and MONTHNAME2 read the whole text.
  const struct {
    const char *whole, *head;
    bool day;
  } names[] = {{"CLI_udfDAYNAME1", "CLI_udfDAYNAME2", true},
               {"CLI_udfMONTHNAME2", "CLI_udfMONTHNAME1", false}};
  for (const auto &n : names) {
    std::string wholeCode, headCode;
    bool wholeWritten = false, headWritten = false;
    const std::string w = callName(n.whole, text, nullBlock, wholeCode, wholeWritten);
    const std::string h = callName(n.head, text, nullBlock, headCode, headWritten);
    checkPair(n.whole, n.head, wholeCode, headCode, w == h);
    ORV_CHECK(n.head, headCode == headJdCode);
    if (!headCode.empty()) continue;
    // Without an information block nothing is fetched nor written.
    ORV_CHECK(n.head, headWritten == !nullBlock);
    if (wholeCode.empty()) ORV_CHECK(n.whole, wholeWritten == !nullBlock);
    if (nullBlock) continue;
    const Date d = fromJulianDay(headJd);
    const char *want = n.day ? kDays[weekdayFromMonday(headJd)] : kMonths[d.month - 1];
    ORV_CHECK(n.head, h == want);
  }

  // MIDNIGHT_SECONDS: a time alone, or also the time of a timestamp.
  std::string timeCode, valueCode;
  const std::int32_t timeSeconds = callInt("CLI_udfMIDNIGHT_SECONDS1", text, timeCode);
  const std::int32_t valueSeconds = callInt("CLI_udfMIDNIGHT_SECONDS2", text, valueCode);
  ORV_CHECK("CLI_udfMIDNIGHT_SECONDS1", timeCode.empty() || timeCode == "05");
  if (timeCode.empty()) {
    ORV_CHECK("CLI_udfMIDNIGHT_SECONDS1", timeSeconds >= 0 && timeSeconds <= 86400);
    ORV_CHECK("CLI_udfMIDNIGHT_SECONDS2", valueCode.empty() && valueSeconds == timeSeconds);
  }
  if (valueCode.empty()) {
    ORV_CHECK("CLI_udfMIDNIGHT_SECONDS2", valueSeconds >= 0 && valueSeconds <= 86400);
  }

  // Timestamps.
  std::string stampCode, dateCode, timeStampCode;
  const std::string stamp = callStamp("CLI_udfTIMESTAMP", text, stampCode);
  const std::string fromDate = callStamp("CLI_udfTIMESTAMPDATE", text, dateCode);
  const std::string fromTime = callStamp("CLI_udfTIMESTAMPTIME", text, timeStampCode);
  // TIMESTAMP does what TIMESTAMPDATE does for a text of at most 10 bytes
  // that holds a hyphen, and what TIMESTAMPTIME does for one of exactly 8
  // bytes without a hyphen.
  std::string_view trimmed = text;
  while (!trimmed.empty() && trimmed.back() == ' ') trimmed.remove_suffix(1);
  const bool hyphen = trimmed.find('-') != std::string_view::npos;
  if (dateCode.empty()) ORV_CHECK("CLI_udfTIMESTAMPDATE", headJdCode.empty());
  if (dateCode.empty() && hyphen && trimmed.size() <= 10) {
    ORV_CHECK("CLI_udfTIMESTAMP", stampCode.empty() && stamp == fromDate);
  }
  if (timeStampCode.empty()) ORV_CHECK("CLI_udfTIMESTAMPTIME", timeCode.empty());
  if (timeStampCode.empty() && !hyphen && trimmed.size() == 8) {
    // Today's date is read on each call: compare behind it.
    ORV_CHECK("CLI_udfTIMESTAMP", stampCode.empty() && stamp.size() == fromTime.size() &&
                                      stamp.substr(10) == fromTime.substr(10));
  }
  return 0;
}
