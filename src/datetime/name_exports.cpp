// DAYNAME and MONTHNAME: the name of a date's weekday or month, in the
// server's language, from the engine's national-language service.  The
// library holds no names: the service gives the bytes and their code
// page, and the routine hands them on as they are when that is the
// database's code page, or through the conversion service when it is not.
#include <cstdint>
#include <cstring>

#include "calendar/calendar.hpp"
#include "calendar/parse.hpp"
#include "engine/services.h"
#include "frame/conversion.hpp"
#include "frame/frame.hpp"

namespace {

using cli::Ind;
using cli::NameArg;
using cli::Status;
using cli::Sysfun;

constexpr std::uint32_t kSpace = 101;

static_assert(sizeof(CLI_nlsTimeRecord) == 36);
static_assert(offsetof(CLI_nlsTimeRecord, month) == 16);
static_assert(offsetof(CLI_nlsTimeRecord, dayOfWeek) == 24);

enum class Name { day, month };
enum class Reader { wholeText, datePart };

// Parse, fetch the name, store it in the database's code page.  A null
// information block ends the call after the date is validated.
template <Name name, Reader reader>
void nameOf(char *text, char *result, Status status, const unsigned char *dbinfo) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  if constexpr (reader == Reader::wholeText) {
    char code[3];
    if (cli::CLI_parseDateText(text, &y, &m, &d, nullptr, nullptr, nullptr, code) == 0) {
      return status.raise(code);
    }
  } else if (cli::CLI_parseDatePart(text, &y, &m, &d) == 0) {
    return status.raise(Sysfun::badDate);
  }
  CLI_nlsTimeRecord time{};
  if (dbinfo == nullptr) return;
  std::uint32_t databaseCodePage = 0;
  std::memcpy(&databaseCodePage, dbinfo + CLI_DBINFO_CODEPAGE_OFFSET, sizeof databaseCodePage);

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
  if (length == 0 || length > kSpace) return status.raise(Sysfun::overflow);

  if (std::uint32_t{nameCodePage} == databaseCodePage) {
    std::memcpy(result, buffer, length);
    result[length] = '\0';
    return;
  }
  auto *target = reinterpret_cast<unsigned char *>(result);
  const cli::Converted c =
      cli::CLI_convertCodePage(buffer, length, nameCodePage, databaseCodePage, target, kSpace);
  result[c.length <= kSpace ? c.length : kSpace] = '\0';
  if (c.status != 0) status.raise(Sysfun::overflow);
}

}  // namespace

#define CLI_NAME_EXPORT(symbol, name, reader)                                                  \
  CLI_EXPORT void symbol(char *text, char *result, Ind, Ind, char *sqlstate, NameArg, NameArg, \
                         char *message, const unsigned char *dbinfo) noexcept {                \
    nameOf<name, reader>(text, result, Status{sqlstate, message}, dbinfo);                     \
  }

// The digits run the opposite way in the two routines.
CLI_NAME_EXPORT(CLI_udfDAYNAME1, Name::day, Reader::wholeText)
CLI_NAME_EXPORT(CLI_udfDAYNAME2, Name::day, Reader::datePart)
CLI_NAME_EXPORT(CLI_udfMONTHNAME1, Name::month, Reader::datePart)
CLI_NAME_EXPORT(CLI_udfMONTHNAME2, Name::month, Reader::wholeText)
