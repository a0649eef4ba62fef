// Date, time and timestamp texts through every date routine.
//
// Input: one option byte, then the text (up to its first NUL).  Option
// bit 0 hands DAYNAME and MONTHNAME a null database information block.
//
// Beyond the frame's checks: JULIAN_DAY and MIDNIGHT_SECONDS give what the
// unit tests' grammar model gives (tests/models/date_text.hpp), code or
// value; each export that reads only the date at the head of the text fails
// as JULIAN_DAY1 does, its whole-text twin as JULIAN_DAY2 does, with the
// same result; every result agrees with that calendar date, by the unit
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
  c.input(textBlock(text)).result(Block(4));
  code = c.run();
  return numberIn<std::int32_t>(c.out());
}

// A text result in its area, terminated inside it, or nothing after a
// failure or where the area was left alone.  DAYNAME and MONTHNAME get a
// database information block of UTF-8, or none.
std::string callText(const char *name, std::string_view text, std::string &code,
                     bool nullBlock = false, bool *written = nullptr) {
  std::string dbinfo(272, '\0');
  dbinfo.replace(CLI_DBINFO_CODEPAGE_OFFSET, 4, bytesOf(std::int32_t{1208}));
  const Block info(dbinfo);
  Call c(name);
  c.input(textBlock(text)).result(Block(cli::catalogue::find(name)->results[0].size + 1));
  c.dbinfo(nullBlock ? nullptr : info.data());
  code = c.run();
  ORV_CHECK(name, info.view() == dbinfo);
  if (written != nullptr) *written = !c.resultUntouched();
  if (!code.empty() || c.resultUntouched()) return {};
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

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  if (size == 0) return 0;
  const bool nullBlock = (data[0] & 1u) != 0;
  const std::string_view text =
      upToNul(std::string_view(reinterpret_cast<const char *>(data) + 1, size - 1));

  // The date at the head and the whole text as the grammar model reads
  // them: each head-only export fails as JULIAN_DAY1 does, and each
  // whole-text export as JULIAN_DAY2 does, with the same result as its twin.
  namespace grammar = orv::model::date_text;
  const grammar::Answer head = grammar::julianDayOfHead(text),
                        whole = grammar::julianDayOfText(text);
  const auto jd = static_cast<std::int32_t>(head.value);
  for (const auto &[wholeName, headName] : kPairs) {
    std::string wholeCode, headCode;
    const std::int32_t w = callInt(wholeName, text, wholeCode),
                       h = callInt(headName, text, headCode);
    ORV_CHECK(headName,
              headCode == head.code && (!headCode.empty() || h == expected(headName, jd)));
    ORV_CHECK(wholeName, wholeCode == whole.code && (!wholeCode.empty() || w == h));
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
    const std::string w = callText(n.whole, text, wholeCode, nullBlock, &wholeWritten);
    const std::string h = callText(n.head, text, headCode, nullBlock, &headWritten);
    ORV_CHECK(n.head, headCode == head.code);
    ORV_CHECK(n.whole, wholeCode == whole.code && (!wholeCode.empty() || w == h));
    if (!headCode.empty()) continue;
    // Without an information block nothing is fetched nor written.
    ORV_CHECK(n.head, headWritten == !nullBlock);
    if (wholeCode.empty()) ORV_CHECK(n.whole, wholeWritten == !nullBlock);
    if (nullBlock) continue;
    const auto day = orv::model::dayOfJulian(jd);
    const unsigned month = static_cast<unsigned>(std::chrono::year_month_day{day}.month());
    ORV_CHECK(n.head, h == (n.day ? orv::model::kDayNames[std::chrono::weekday{day}.c_encoding()]
                                  : orv::model::kMonthNames[month - 1]));
  }

  // MIDNIGHT_SECONDS: a time alone, or also the time of a timestamp.
  const grammar::Answer time = grammar::secondsOfTime(text);
  for (const auto &[name, want] :
       {std::pair{"CLI_udfMIDNIGHT_SECONDS1", time},
        std::pair{"CLI_udfMIDNIGHT_SECONDS2", grammar::secondsOfAny(text)}}) {
    std::string code;
    const std::int32_t got = callInt(name, text, code);
    ORV_CHECK(name, code == want.code && (!code.empty() || got == want.value));
  }

  // Timestamps.
  std::string stampCode, dateCode, timeStampCode;
  const std::string stamp = callText("CLI_udfTIMESTAMP", text, stampCode);
  const std::string fromDate = callText("CLI_udfTIMESTAMPDATE", text, dateCode);
  const std::string fromTime = callText("CLI_udfTIMESTAMPTIME", text, timeStampCode);
  // TIMESTAMP does what TIMESTAMPDATE does for a text of at most 10 bytes
  // that holds a hyphen, and what TIMESTAMPTIME does for one of exactly 8
  // bytes without a hyphen.
  std::string_view trimmed = text;
  while (!trimmed.empty() && trimmed.back() == ' ') trimmed.remove_suffix(1);
  const bool hyphen = trimmed.find('-') != std::string_view::npos;
  if (dateCode.empty()) ORV_CHECK("CLI_udfTIMESTAMPDATE", head.code.empty());
  if (dateCode.empty() && hyphen && trimmed.size() <= 10) {
    ORV_CHECK("CLI_udfTIMESTAMP", stampCode.empty() && stamp == fromDate);
  }
  if (timeStampCode.empty()) ORV_CHECK("CLI_udfTIMESTAMPTIME", time.code.empty());
  if (timeStampCode.empty() && !hyphen && trimmed.size() == 8) {
    // Today's date is read on each call: compare behind it.
    ORV_CHECK("CLI_udfTIMESTAMP", stampCode.empty() && stamp.size() == fromTime.size() &&
                                      stamp.substr(10) == fromTime.substr(10));
  }
  return 0;
}
