// Date, time and timestamp texts through every date routine.
//
// Input: one option byte, then the text (up to its first NUL).  Option
// bit 0 hands DAYNAME and MONTHNAME a null database information block.
//
// Beyond the frame's checks: JULIAN_DAY and MIDNIGHT_SECONDS give what the
// unit tests' grammar model gives (tests/models/date_text.hpp), code or
// value; each export that reads only the date at the head of the text
// succeeds wherever its whole-text twin does, with the same result; every
// result agrees with the calendar date that JULIAN_DAY gives, by the unit
// tests' <chrono> model (quarter, day of year, both days of the week, both
// week numbers, the English names of the stand-in's default locale); and
// TIMESTAMP agrees with TIMESTAMPDATE and TIMESTAMPTIME where they succeed.
#include <array>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "harness.hpp"
#include "models/calendar.hpp"
#include "models/date_text.hpp"

namespace {

using namespace orv::fuzz;

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

// The value that a routine gives for the date of Julian day `jd`.
std::int64_t expected(std::string_view routine, std::int32_t jd) {
  const orv::model::DateNumbers n = orv::model::numbersOf(orv::model::dayOfJulian(jd));
  if (routine.starts_with("CLI_udfJULIAN_DAY")) return n.julian;
  if (routine.starts_with("CLI_udfQUARTER")) return n.quarter;
  if (routine.starts_with("CLI_udfDAYOFYEAR")) return n.ordinal;
  if (routine.starts_with("CLI_udfDAYOFWEEK_ISO")) return n.isoDayOfWeek;
  if (routine.starts_with("CLI_udfDAYOFWEEK")) return n.dayOfWeek;
  if (routine.starts_with("CLI_udfWEEK_ISO")) return n.isoWeek;
  return n.week;
}

// Where a routine's outcome is what the grammar model says.
void checkModel(const char *name, const std::string &code, std::int32_t got,
                const orv::model::date_text::Answer &want) {
  ORV_CHECK(name, code == want.code);
  if (code.empty()) ORV_CHECK(name, got == want.value);
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

  // The day number of the date at the head, when it is valid, and of the
  // whole text, as the grammar model reads them.
  namespace grammar = orv::model::date_text;
  std::string headJdCode, wholeJdCode;
  const std::int32_t headJd = callInt("CLI_udfJULIAN_DAY1", text, headJdCode);
  checkModel("CLI_udfJULIAN_DAY1", headJdCode, headJd, grammar::julianDayOfHead(text));
  checkModel("CLI_udfJULIAN_DAY2", wholeJdCode, callInt("CLI_udfJULIAN_DAY2", text, wholeJdCode),
             grammar::julianDayOfText(text));

  for (const auto &[whole, head] : kPairs) {
    std::string wholeCode, headCode;
    const std::int32_t w = callInt(whole, text, wholeCode);
    const std::int32_t h = callInt(head, text, headCode);
    checkPair(whole, head, wholeCode, headCode, w == h);
    ORV_CHECK(head, headCode == headJdCode);
    ORV_CHECK(whole, wholeCode == wholeJdCode);
    if (!headCode.empty()) continue;
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
    const auto day = orv::model::dayOfJulian(headJd);
    const char *want = n.day
                           ? orv::model::kDayNames[std::chrono::weekday{day}.c_encoding()]
                           : orv::model::kMonthNames[static_cast<unsigned>(
                                                         std::chrono::year_month_day{day}.month()) -
                                                     1];
    ORV_CHECK(n.head, h == want);
  }

  // MIDNIGHT_SECONDS: a time alone, or also the time of a timestamp.
  std::string timeCode, valueCode;
  const std::int32_t timeSeconds = callInt("CLI_udfMIDNIGHT_SECONDS1", text, timeCode);
  const std::int32_t valueSeconds = callInt("CLI_udfMIDNIGHT_SECONDS2", text, valueCode);
  checkModel("CLI_udfMIDNIGHT_SECONDS1", timeCode, timeSeconds, grammar::secondsOfTime(text));
  checkModel("CLI_udfMIDNIGHT_SECONDS2", valueCode, valueSeconds, grammar::secondsOfAny(text));

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
