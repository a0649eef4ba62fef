// DAYNAME and MONTHNAME: the name of a date's weekday or month, in the
// server's language, from the engine's national-language service.  The
// library holds no names: the service gives the bytes and their code
// page, and the routine hands them on as they are when that is the
// database's code page, or through the conversion service when it is not.
#include <cstdint>
#include <cstring>

#include "calendar/calendar.hpp"
#include "calendar/parse.hpp"
#include "catalogue/catalogue.hpp"
#include "engine/conversion.hpp"
#include "engine/services.h"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Report;
using cli::Sysfun;

// The room for a name: the longest name result that the catalogue gives.
constexpr std::uint32_t kSpace = cli::catalogue::kName;

static_assert(sizeof(CLI_nlsTimeRecord) == 36);
static_assert(offsetof(CLI_nlsTimeRecord, month) == 16);
static_assert(offsetof(CLI_nlsTimeRecord, dayOfWeek) == 24);

enum class Name { day, month };
enum class Reader { wholeText, datePart };

// Parse, fetch the name, store it in the database's code page.  A null
// information block ends the call after the date is validated.
template <Name name, Reader reader>
Report nameOf(cli::WritableTextIn date, cli::TextOut out, cli::DbInfo dbinfo) noexcept {
  char *text = date.chars();
  char *result = out.chars();
  std::int32_t y = 0, m = 0, d = 0;
  if constexpr (reader == Reader::wholeText) {
    char code[3];
    if (cli::CLI_parseDateText(text, &y, &m, &d, nullptr, nullptr, nullptr, code) == 0) {
      return cli::sysfunOf(code);
    }
  } else if (cli::CLI_parseDatePart(text, &y, &m, &d) == 0) {
    return Sysfun::badDate;
  }
  CLI_nlsTimeRecord time{};
  if (!dbinfo.present()) return {};
  const std::uint32_t databaseCodePage = dbinfo.codePage();

  unsigned char buffer[kSpace + 3];
  std::uint16_t nameCodePage = 0;
  std::uint8_t length = 0;
  if constexpr (name == Name::day) {
    time.dayOfWeek = cli::CLI_dayNumber(y, m, d) % 7;  // 0 for Sunday
    length = sqloNLSGetServerDayName(&time, kSpace, buffer, &nameCodePage);
  } else {
    time.month = m - 1;
    length = sqloNLSGetServerMonthName(&time, kSpace, buffer, &nameCodePage);
  }
  // A length beyond the buffer is no name either: nothing past it is read.
  if (length == 0 || length > kSpace) return Sysfun::overflow;

  if (std::uint32_t{nameCodePage} == databaseCodePage) {
    std::memcpy(result, buffer, length);
    result[length] = '\0';
    return {};
  }
  auto *target = reinterpret_cast<unsigned char *>(result);
  const cli::Converted c =
      cli::CLI_convertCodePage(buffer, length, nameCodePage, databaseCodePage, target, kSpace);
  result[c.length <= kSpace ? c.length : kSpace] = '\0';
  if (c.status != 0) return Sysfun::overflow;
  return {};
}

}  // namespace

namespace cli {

// The digits run the opposite way in the two routines.
Report routine::DAYNAME1(WritableTextIn date, TextOut result, DbInfo dbinfo) noexcept {
  return nameOf<Name::day, Reader::wholeText>(date, result, dbinfo);
}
Report routine::DAYNAME2(WritableTextIn date, TextOut result, DbInfo dbinfo) noexcept {
  return nameOf<Name::day, Reader::datePart>(date, result, dbinfo);
}
Report routine::MONTHNAME1(WritableTextIn date, TextOut result, DbInfo dbinfo) noexcept {
  return nameOf<Name::month, Reader::datePart>(date, result, dbinfo);
}
Report routine::MONTHNAME2(WritableTextIn date, TextOut result, DbInfo dbinfo) noexcept {
  return nameOf<Name::month, Reader::wholeText>(date, result, dbinfo);
}

}  // namespace cli
