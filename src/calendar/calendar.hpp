// Day arithmetic of the proleptic Gregorian calendar, years 1 to 9999.
//
// Day number 1 is 0001-01-01, a Monday; 9999-12-31 is day 3652059.  Every
// function takes a date that a parser has already validated (or a day
// number of those years) and needs no range checks.  No intermediate value
// comes near 32 bits but the one product that CLI_dateOfDayNumber takes
// in 64 bits.
#pragma once

#include <cstdint>

namespace cli {

// Month lengths by leap flag (0 common, 1 leap) and month 1 to 12.
inline constexpr std::int32_t CLI_monthLengthTable[2][13] = {
    {0, 31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31},
    {0, 31, 29, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31},
};

// Ordinal day of (month, day) in a common year, at (day - 1) * 12 + (month - 1).
// 29 February holds 60, like 1 March: the leap correction tells them apart.
// Dates that exist in no year hold 0.
// clang-format off
inline constexpr std::int32_t CLI_dayOfYearTable[31 * 12] = {
     1, 32, 60, 91,121,152,182,213,244,274,305,335,
     2, 33, 61, 92,122,153,183,214,245,275,306,336,
     3, 34, 62, 93,123,154,184,215,246,276,307,337,
     4, 35, 63, 94,124,155,185,216,247,277,308,338,
     5, 36, 64, 95,125,156,186,217,248,278,309,339,
     6, 37, 65, 96,126,157,187,218,249,279,310,340,
     7, 38, 66, 97,127,158,188,219,250,280,311,341,
     8, 39, 67, 98,128,159,189,220,251,281,312,342,
     9, 40, 68, 99,129,160,190,221,252,282,313,343,
    10, 41, 69,100,130,161,191,222,253,283,314,344,
    11, 42, 70,101,131,162,192,223,254,284,315,345,
    12, 43, 71,102,132,163,193,224,255,285,316,346,
    13, 44, 72,103,133,164,194,225,256,286,317,347,
    14, 45, 73,104,134,165,195,226,257,287,318,348,
    15, 46, 74,105,135,166,196,227,258,288,319,349,
    16, 47, 75,106,136,167,197,228,259,289,320,350,
    17, 48, 76,107,137,168,198,229,260,290,321,351,
    18, 49, 77,108,138,169,199,230,261,291,322,352,
    19, 50, 78,109,139,170,200,231,262,292,323,353,
    20, 51, 79,110,140,171,201,232,263,293,324,354,
    21, 52, 80,111,141,172,202,233,264,294,325,355,
    22, 53, 81,112,142,173,203,234,265,295,326,356,
    23, 54, 82,113,143,174,204,235,266,296,327,357,
    24, 55, 83,114,144,175,205,236,267,297,328,358,
    25, 56, 84,115,145,176,206,237,268,298,329,359,
    26, 57, 85,116,146,177,207,238,269,299,330,360,
    27, 58, 86,117,147,178,208,239,270,300,331,361,
    28, 59, 87,118,148,179,209,240,271,301,332,362,
    29, 60, 88,119,149,180,210,241,272,302,333,363,
    30,  0, 89,120,150,181,211,242,273,303,334,364,
    31,  0, 90,  0,151,  0,212,243,  0,304,  0,365,
};
// clang-format on

// Julian day number of day number 0.
inline constexpr std::int32_t kJulianDayOfDayZero = 1721425;

// Written with bitwise operators so that it compiles to no branch: the
// years of a column of dates vary, and a mispredicted branch costs more
// than the three tests.
constexpr std::int32_t CLI_isLeapYear(std::int32_t year) {
  return static_cast<std::int32_t>((year % 4 == 0) & ((year % 100 != 0) | (year % 400 == 0)));
}

// Days from the start of year 1 to the start of `year` (1 or later): 365
// for each year gone by and one more for each leap year among them.  The
// three divisions are independent of each other, so they run side by side.
constexpr std::int32_t CLI_daysBeforeYear(std::int32_t year) {
  const auto y = static_cast<std::uint32_t>(year - 1);
  return static_cast<std::int32_t>(y * 365 + y / 4 - y / 100 + y / 400);
}

// The same count in whole blocks: 400 years have 146097 days, 100 years
// ending in a common century year 36524, 4 years ending in a leap year
// 1461.  Years left over after the last block of 4 are common years.
consteval bool daysBeforeYearCountsBlocks() {
  for (std::int32_t year = 1; year <= 10000; ++year) {
    const std::int32_t y = year - 1;
    const std::int32_t q = y / 400, r = y % 400;
    const std::int32_t c = r / 100, s = r % 100;
    const std::int32_t f = s / 4, t = s % 4;
    if (CLI_daysBeforeYear(year) != q * 146097 + c * 36524 + f * 1461 + t * 365) return false;
  }
  return true;
}
static_assert(daysBeforeYearCountsBlocks());

// Ordinal day in the year, 1 to 366.
constexpr std::int32_t CLI_dayOfYear(std::int32_t year, std::int32_t month, std::int32_t day) {
  const std::int32_t common = CLI_dayOfYearTable[(day - 1) * 12 + (month - 1)];
  return common + (CLI_isLeapYear(year) & static_cast<std::int32_t>(month > 2));
}

constexpr std::int32_t CLI_dayNumber(std::int32_t year, std::int32_t month, std::int32_t day) {
  return CLI_daysBeforeYear(year) + CLI_dayOfYear(year, month, day);
}

// A date by its fields.
struct CLI_date {
  std::int32_t year, month, day;
  friend constexpr bool operator==(const CLI_date &, const CLI_date &) = default;
};

// The date of a day number, 1 to 3652059: the inverse of CLI_dayNumber.
// Counted from 0000-03-01 (day number -305), so that a year runs from
// March and its leap day comes last, Neri and Schneider's Euclidean affine
// functions find the century, the year in it and the day in the year with
// a product and a shift where a division by 1461 or 153 would stand.  The
// count stays below 2^22, so all of it is unsigned 32-bit arithmetic but
// the one 64-bit product.
constexpr CLI_date CLI_dateOfDayNumber(std::int32_t dayNumber) {
  const auto n = static_cast<std::uint32_t>(dayNumber + 305);
  const std::uint32_t n1 = 4 * n + 3;
  const std::uint32_t century = n1 / 146097;
  const std::uint32_t n2 = n1 % 146097 | 3;
  const std::uint64_t p2 = std::uint64_t{2939745} * n2;
  const auto yearOfCentury = static_cast<std::uint32_t>(p2 >> 32);
  const std::uint32_t dayOfYear = static_cast<std::uint32_t>(p2) / 2939745 / 4;
  const std::uint32_t n3 = 2141 * dayOfYear + 197913;
  const bool january = dayOfYear >= 306;  // January or February: the next year
  return {static_cast<std::int32_t>(100 * century + yearOfCentury + (january ? 1 : 0)),
          static_cast<std::int32_t>((n3 >> 16) - (january ? 12 : 0)),
          static_cast<std::int32_t>((n3 & 0xffff) / 2141 + 1)};
}

// The first and the last day of every month of the first 400 years, which
// the later ones repeat day for day, and of the last year come back from
// their day numbers.
consteval bool dateOfDayNumberInvertsDayNumber() {
  for (std::int32_t y = 1; y <= 401; ++y) {
    const std::int32_t year = y == 401 ? 9999 : y;
    for (std::int32_t m = 1; m <= 12; ++m) {
      const std::int32_t last = CLI_monthLengthTable[CLI_isLeapYear(year)][m];
      if (CLI_dateOfDayNumber(CLI_dayNumber(year, m, 1)) != CLI_date{year, m, 1} ||
          CLI_dateOfDayNumber(CLI_dayNumber(year, m, last)) != CLI_date{year, m, last}) {
        return false;
      }
    }
  }
  return true;
}
static_assert(dateOfDayNumberInvertsDayNumber());

// The table holds what its rule says: the months before m, plus d, with 0
// for days that no year has.
consteval bool dayOfYearTableFollowsItsRule() {
  std::int32_t before = 0;
  for (std::int32_t m = 1; m <= 12; ++m) {
    for (std::int32_t d = 1; d <= 31; ++d) {
      const std::int32_t longest = m == 2 ? 29 : CLI_monthLengthTable[0][m];
      const std::int32_t expected = d > longest ? 0 : (m == 2 && d == 29) ? 60 : before + d;
      if (CLI_dayOfYearTable[(d - 1) * 12 + (m - 1)] != expected) return false;
    }
    before += CLI_monthLengthTable[0][m];
  }
  return true;
}
static_assert(dayOfYearTableFollowsItsRule());

static_assert(CLI_daysBeforeYear(1) == 0);
static_assert(CLI_daysBeforeYear(400) == 145731 && CLI_daysBeforeYear(401) == 146097);
static_assert(CLI_isLeapYear(2000) == 1 && CLI_isLeapYear(1900) == 0 && CLI_isLeapYear(2004) == 1);
static_assert(CLI_dayNumber(1, 1, 1) == 1);
static_assert(CLI_dayNumber(1, 12, 31) == 365);
static_assert(CLI_dayNumber(4, 2, 29) == 1155 && CLI_dayNumber(4, 3, 1) == 1156);
static_assert(CLI_dayNumber(100, 12, 31) == 36524);
static_assert(CLI_dayNumber(400, 12, 31) == 146097);
static_assert(CLI_dayNumber(1970, 1, 1) == 719163);
static_assert(CLI_dayNumber(2000, 1, 1) == 730120);
static_assert(CLI_dayNumber(2000, 2, 29) == 730179 && CLI_dayNumber(2000, 3, 1) == 730180);
static_assert(CLI_dayNumber(9999, 12, 31) == 3652059);
static_assert(CLI_dayNumber(9999, 12, 31) + kJulianDayOfDayZero == 5373484);
static_assert(CLI_dayOfYear(2000, 12, 31) == 366 && CLI_dayOfYear(2001, 12, 31) == 365);
static_assert(CLI_dateOfDayNumber(1) == CLI_date{1, 1, 1});
static_assert(CLI_dateOfDayNumber(1155) == CLI_date{4, 2, 29});
static_assert(CLI_dateOfDayNumber(719163) == CLI_date{1970, 1, 1});
static_assert(CLI_dateOfDayNumber(730179) == CLI_date{2000, 2, 29});
static_assert(CLI_dateOfDayNumber(730180) == CLI_date{2000, 3, 1});
static_assert(CLI_dateOfDayNumber(3652059) == CLI_date{9999, 12, 31});

}  // namespace cli
