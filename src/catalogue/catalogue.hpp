// The catalogue: one row for every export of the library.
//
// A row names the export and gives its SQL name, frame variant, the
// layouts of its inputs and results, its properties, the SYSFUN codes it
// can raise and a one-line summary.  Everything that names an export is
// made from this table: the exports themselves and the declarations of
// their logic (written by orv_generate, see generate.cpp), the linker's
// export lists, the public header, the SQLite host's registrations, the
// function reference in docs/functions.md and the test that the library
// exports exactly what the table says.  Adding a routine is one row here
// and one logic function with the signature that the row declares.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "frame/cliudf.h"
#include "frame/positions.hpp"

namespace cli::catalogue {

// Value layouts of the frame.
enum class Layout : std::uint8_t {
  none,        // an unused slot
  int16,       // 16-bit signed integer
  int32,       // 32-bit signed integer
  int64,       // 64-bit signed integer
  real,        // 64-bit IEEE 754 double
  text,        // terminated text
  lob,         // CLI_udfLob: 32-bit length, then the data
  fixedText,   // exactly `size` bytes, filled up with blanks, no terminator
  fixedBytes,  // exactly `size` opaque bytes
};

// One input or result.  `size` is, for a text result, the longest text the
// routine can write (its area holds one byte more); for a CLI_udfLob result,
// the capacity of the area's data; for fixed layouts, the byte count.
struct Slot {
  Layout layout = Layout::none;
  std::uint32_t size = 0;
  const char *name = nullptr;
};

// The extras behind the diagnostic message buffer.
enum class Frame : std::uint8_t {
  plain,          // none
  dbinfo,         // database information block
  scratchpad,     // scratchpad
  table,          // scratchpad, call type
  tableCallback,  // scratchpad, call type, table-function callback
};

// Properties, as bits.
enum : unsigned {
  kDeterministic = 1u,  // the same inputs always give the same result
  kInnocuous = 2u,      // no side effects and no access to outside state
  kHandlesNull = 4u,    // reads its input indicators itself
  // Reads less of its text than the function's other export of the same
  // layouts (the date at the head only, or a time only); hosts prefer the
  // other one and reach this one by its own name.
  kNarrowerForm = 8u,
  // Its one numeric result is written by a service of the engine that the
  // routine hands the result's address to, so the logic gets the address
  // rather than giving back an Answer.
  kResultByAddress = 16u,
  // Uses state that the whole process shares (the standard library's
  // random number state), so calls on other threads or in other processes
  // of one query do not see the same sequence.
  kSharedState = 32u,
  // May write into its text inputs: it cuts trailing blanks off them in
  // place.  A host must hand such a routine a copy it may write; any other
  // routine only reads its inputs.
  kWritesInputs = 64u,
};
inline constexpr unsigned kPure = kDeterministic | kInnocuous;

inline constexpr std::size_t kMaxInputs = 4;
inline constexpr std::size_t kMaxResults = 18;

struct Routine {
  const char *symbol;
  const char *sqlName;
  Frame frame;
  Slot inputs[kMaxInputs];
  Slot results[kMaxResults];
  unsigned properties;
  const char *sysfunCodes;  // the SYSFUN codes it can raise, "" for none
  const char *summary;
};

// Slot makers.  Inputs carry a name for the reference; results a size.
constexpr Slot int16(const char *name = "") { return {Layout::int16, 0, name}; }
constexpr Slot int32(const char *name = "") { return {Layout::int32, 0, name}; }
constexpr Slot int64(const char *name = "") { return {Layout::int64, 0, name}; }
constexpr Slot real(const char *name = "") { return {Layout::real, 0, name}; }
constexpr Slot text(const char *name) { return {Layout::text, 0, name}; }
constexpr Slot lob(const char *name) { return {Layout::lob, 0, name}; }
constexpr Slot bytes(std::uint32_t size, const char *name) {
  return {Layout::fixedBytes, size, name};
}
constexpr Slot textOf(std::uint32_t longest) { return {Layout::text, longest, ""}; }
constexpr Slot lobOf(std::uint32_t capacity) { return {Layout::lob, capacity, ""}; }
constexpr Slot fixedText(std::uint32_t size) { return {Layout::fixedText, size, ""}; }

inline constexpr std::uint32_t kText = CLI_TEXT_LIMIT;  // longest terminated text built
inline constexpr std::uint32_t kLob = CLI_LOB_LIMIT;    // longest CLI_udfLob string
inline constexpr std::uint32_t kStamp = 26;             // a timestamp text
inline constexpr std::uint32_t kName = 101;             // a day or month name

// clang-format off
inline constexpr Routine kRoutines[] = {
  // Day and second counts
  {"CLI_udfJULIAN_DAY1", "JULIAN_DAY", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Julian day number of the date at the head of the text; what stands behind the date is not read."},
  {"CLI_udfJULIAN_DAY2", "JULIAN_DAY", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Julian day number of a date or timestamp, validated to its end."},
  {"CLI_udfMIDNIGHT_SECONDS1", "MIDNIGHT_SECONDS", Frame::plain, {text("time")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "05", "Seconds since midnight of a time."},
  {"CLI_udfMIDNIGHT_SECONDS2", "MIDNIGHT_SECONDS", Frame::plain, {text("value")}, {int32()}, kPure | kWritesInputs, "04 05 06", "Seconds since midnight of a time, or of the time of day of a timestamp."},
  // Timestamps
  {"CLI_udfTIMESTAMP", "TIMESTAMP", Frame::plain, {text("value")}, {textOf(kStamp)}, kInnocuous | kWritesInputs, "04 05 06", "Timestamp text from a date, a time (on today's UTC date) or a timestamp."},
  {"CLI_udfTIMESTAMPDATE", "TIMESTAMPDATE", Frame::plain, {text("date")}, {textOf(kStamp)}, kPure | kWritesInputs, "04", "Timestamp text of a date at midnight."},
  {"CLI_udfTIMESTAMPTIME", "TIMESTAMPTIME", Frame::plain, {text("time")}, {textOf(kStamp)}, kInnocuous | kWritesInputs, "05", "Timestamp text of a time on today's UTC date."},
  // Timestamp durations
  {"CLI_udfTIMESTAMPDIFF", "TIMESTAMPDIFF", Frame::plain, {int32("interval"), text("duration")}, {int32()}, kPure, "03 07 08 10", "A timestamp duration as a number of the unit that the interval code names."},
  // Weeks
  {"CLI_udfWEEK1", "WEEK", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Week of the year, weeks starting on Sunday, of the date at the head of the text."},
  {"CLI_udfWEEK2", "WEEK", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Week of the year, weeks starting on Sunday, of a date or timestamp."},
  {"CLI_udfWEEK_ISO1", "WEEK_ISO", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "ISO 8601 week number of the date at the head of the text."},
  {"CLI_udfWEEK_ISO2", "WEEK_ISO", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "ISO 8601 week number of a date or timestamp."},
  // Numbers in a date
  {"CLI_udfQUARTER1", "QUARTER", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Quarter of the year of the date at the head of the text."},
  {"CLI_udfQUARTER2", "QUARTER", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Quarter of the year of a date or timestamp."},
  {"CLI_udfDAYOFYEAR1", "DAYOFYEAR", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Ordinal day in the year of the date at the head of the text."},
  {"CLI_udfDAYOFYEAR2", "DAYOFYEAR", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Ordinal day in the year of a date or timestamp."},
  {"CLI_udfDAYOFWEEK1", "DAYOFWEEK", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Day of the week, Sunday = 1, of a date or timestamp."},
  {"CLI_udfDAYOFWEEK2", "DAYOFWEEK", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Day of the week, Sunday = 1, of the date at the head of the text."},
  {"CLI_udfDAYOFWEEK_ISO1", "DAYOFWEEK_ISO", Frame::plain, {text("date")}, {int32()}, kPure | kWritesInputs, "04 06", "Day of the week, Monday = 1, of a date or timestamp."},
  {"CLI_udfDAYOFWEEK_ISO2", "DAYOFWEEK_ISO", Frame::plain, {text("date")}, {int32()}, kPure | kNarrowerForm | kWritesInputs, "04", "Day of the week, Monday = 1, of the date at the head of the text."},
  // Names in a date
  {"CLI_udfDAYNAME1", "DAYNAME", Frame::dbinfo, {text("date")}, {textOf(kName)}, kInnocuous | kWritesInputs, "03 04 06", "Name of the day of the week of a date or timestamp, in the server's language."},
  {"CLI_udfDAYNAME2", "DAYNAME", Frame::dbinfo, {text("date")}, {textOf(kName)}, kInnocuous | kNarrowerForm | kWritesInputs, "03 04", "Name of the day of the week of the date at the head of the text."},
  {"CLI_udfMONTHNAME1", "MONTHNAME", Frame::dbinfo, {text("date")}, {textOf(kName)}, kInnocuous | kNarrowerForm | kWritesInputs, "03 04", "Name of the month of the date at the head of the text, in the server's language."},
  {"CLI_udfMONTHNAME2", "MONTHNAME", Frame::dbinfo, {text("date")}, {textOf(kName)}, kInnocuous | kWritesInputs, "03 04 06", "Name of the month of a date or timestamp."},
  // Integer and sign
  {"CLI_udfABS1", "ABS", Frame::plain, {real("x")}, {real()}, kPure, "", "Absolute value of a double: its sign bit cleared."},
  {"CLI_udfABS2", "ABS", Frame::plain, {int32("x")}, {int32()}, kPure, "01", "Absolute value of a 32-bit integer."},
  {"CLI_udfABS3", "ABS", Frame::plain, {int16("x")}, {int16()}, kPure, "01", "Absolute value of a 16-bit integer."},
  {"CLI_udfABS4", "ABS", Frame::plain, {int64("x")}, {int64()}, kPure, "01", "Absolute value of a 64-bit integer."},
  {"CLI_udfSIGN1", "SIGN", Frame::plain, {real("x")}, {real()}, kPure, "", "Sign of a double: -1.0, 0.0 or 1.0."},
  {"CLI_udfSIGN2", "SIGN", Frame::plain, {int32("x")}, {int32()}, kPure, "", "Sign of a 32-bit integer."},
  {"CLI_udfSIGN3", "SIGN", Frame::plain, {int16("x")}, {int16()}, kPure, "", "Sign of a 16-bit integer."},
  {"CLI_udfSIGN4", "SIGN", Frame::plain, {int64("x")}, {int64()}, kPure, "", "Sign of a 64-bit integer."},
  {"CLI_udfMOD1", "MOD", Frame::plain, {int32("x"), int32("y")}, {int32()}, kPure, "02", "Remainder of 32-bit integers, with the sign of the dividend."},
  {"CLI_udfMOD2", "MOD", Frame::plain, {int16("x"), int16("y")}, {int16()}, kPure, "03", "Remainder of 16-bit integers, with the sign of the dividend."},
  {"CLI_udfMOD3", "MOD", Frame::plain, {int64("x"), int64("y")}, {int64()}, kPure, "03", "Remainder of 64-bit integers, with the sign of the dividend."},
  {"CLI_udfCEILING1", "CEILING", Frame::plain, {real("x")}, {real()}, kPure, "", "Smallest whole double not below x."},
  {"CLI_udfCEILING2", "CEILING", Frame::plain, {int32("x")}, {int32()}, kPure, "", "A 32-bit integer, unchanged."},
  {"CLI_udfCEILING3", "CEILING", Frame::plain, {int16("x")}, {int16()}, kPure, "", "A 16-bit integer, unchanged."},
  {"CLI_udfCEILING4", "CEILING", Frame::plain, {int64("x")}, {int64()}, kPure, "", "A 64-bit integer, unchanged."},
  {"CLI_udfFLOOR1", "FLOOR", Frame::plain, {real("x")}, {real()}, kPure, "", "Largest whole double not above x."},
  {"CLI_udfFLOOR2", "FLOOR", Frame::plain, {int32("x")}, {int32()}, kPure, "", "A 32-bit integer, unchanged."},
  {"CLI_udfFLOOR3", "FLOOR", Frame::plain, {int16("x")}, {int16()}, kPure, "", "A 16-bit integer, unchanged."},
  {"CLI_udfFLOOR4", "FLOOR", Frame::plain, {int64("x")}, {int64()}, kPure, "", "A 64-bit integer, unchanged."},
  // Cutting digits
  {"CLI_udfROUND1", "ROUND", Frame::plain, {real("x"), int32("n")}, {real()}, kPure, "03", "A double rounded to n decimal places (n < 0: left of the point)."},
  {"CLI_udfROUND2", "ROUND", Frame::plain, {int32("x"), int32("n")}, {int32()}, kPure, "03", "A 32-bit integer rounded to n decimal places."},
  {"CLI_udfROUND5", "ROUND", Frame::plain, {int64("x"), int32("n")}, {int64()}, kPure, "03", "A 64-bit integer rounded to n decimal places, without floating point."},
  {"CLI_udfTRUNCATE1", "TRUNCATE", Frame::plain, {real("x"), int32("n")}, {real()}, kPure, "03", "A double cut to n decimal places."},
  {"CLI_udfTRUNCATE2", "TRUNCATE", Frame::plain, {int32("x"), int32("n")}, {int32()}, kPure, "03", "A 32-bit integer cut to n decimal places."},
  {"CLI_udfTRUNCATE5", "TRUNCATE", Frame::plain, {int64("x"), int32("n")}, {int64()}, kPure, "", "A 64-bit integer cut to n decimal places, without floating point."},
  // Powers
  {"CLI_udfPOWER1", "POWER", Frame::plain, {real("x"), real("y")}, {real()}, kPure, "01 03", "x to the power y, in doubles."},
  {"CLI_udfPOWER2", "POWER", Frame::plain, {real("x"), int32("y")}, {real()}, kPure, "01 03", "A double to a whole power."},
  {"CLI_udfPOWER3", "POWER", Frame::plain, {int32("x"), int32("y")}, {int32()}, kPure, "01 03", "A 32-bit integer to a whole power, rounded to 32 bits."},
  {"CLI_udfPOWER4", "POWER", Frame::plain, {int64("x"), int64("y")}, {int64()}, kPure, "01 03", "A 64-bit integer to a whole power, by exact multiplication."},
  // Elementary
  {"CLI_udfSIN", "SIN", Frame::plain, {real("x")}, {real()}, kPure, "", "Sine of x radians."},
  {"CLI_udfCOS", "COS", Frame::plain, {real("x")}, {real()}, kPure, "", "Cosine of x radians."},
  {"CLI_udfTAN", "TAN", Frame::plain, {real("x")}, {real()}, kPure, "01", "Tangent of x radians."},
  {"CLI_udfCOT", "COT", Frame::plain, {real("x")}, {real()}, kPure, "02", "Cotangent of x radians."},
  {"CLI_udfASIN", "ASIN", Frame::plain, {real("x")}, {real()}, kPure, "01", "Arc sine in radians."},
  {"CLI_udfACOS", "ACOS", Frame::plain, {real("x")}, {real()}, kPure, "01", "Arc cosine in radians."},
  {"CLI_udfATAN", "ATAN", Frame::plain, {real("x")}, {real()}, kPure, "", "Arc tangent in radians."},
  {"CLI_udfATAN2", "ATAN2", Frame::plain, {real("a"), real("b")}, {real()}, kPure, "02", "Arc tangent of a / b in radians, by quadrant."},
  {"CLI_udfLOG", "LOG", Frame::plain, {real("x")}, {real()}, kPure, "01", "Natural logarithm."},
  {"CLI_udfLOG10", "LOG10", Frame::plain, {real("x")}, {real()}, kPure, "01", "Logarithm to base 10."},
  {"CLI_udfEXP", "EXP", Frame::plain, {real("x")}, {real()}, kPure, "03", "e to the power x."},
  {"CLI_udfSQRT", "SQRT", Frame::plain, {real("x")}, {real()}, kPure, "01", "Square root."},
  {"CLI_udfDEGREES1", "DEGREES", Frame::plain, {real("x")}, {real()}, kPure, "", "Radians in degrees."},
  {"CLI_udfRADIANS1", "RADIANS", Frame::plain, {real("x")}, {real()}, kPure, "", "Degrees in radians."},
  // Random
  {"CLI_udfRAND1", "RAND", Frame::plain, {}, {real()}, kInnocuous | kSharedState, "", "A pseudo-random double from 0.0 to 1.0."},
  {"CLI_udfRAND2", "RAND", Frame::scratchpad, {int32("seed")}, {real()}, kInnocuous | kSharedState, "", "A pseudo-random double from 0.0 to 1.0; the first call of a statement seeds the generator."},
  // Number text
  {"CLI_udfCHARTODOUBLE", "CHARTODOUBLE", Frame::plain, {text("text")}, {real()}, kPure | kResultByAddress | kWritesInputs, "11", "The number that a text spells, as a double."},
  {"CLI_udfDOUBLETOCHAR", "DOUBLETOCHAR", Frame::plain, {real("x")}, {fixedText(24)}, kPure, "", "A double in short scientific notation, 24 bytes filled up with blanks."},
  // Basic strings
  {"CLI_udfSPACE", "SPACE", Frame::plain, {int32("count")}, {textOf(kText)}, kPure, "01", "A text of count blanks, count from 0 to 4000."},
  {"CLI_udfLCASE1", "LCASE", Frame::plain, {text("string")}, {textOf(kText)}, kPure, "", "The string with each byte lowered by the process's locale."},
  {"CLI_udfLCASE2", "LCASE", Frame::plain, {lob("string")}, {lobOf(kLob)}, kPure, "", "The string with each byte lowered by the process's locale; NUL bytes are data."},
  {"CLI_udfRTRIM1", "RTRIM", Frame::plain, {text("string")}, {textOf(kText)}, kPure, "", "The string without trailing blanks and tabs."},
  {"CLI_udfRTRIM2", "RTRIM", Frame::plain, {lob("string")}, {lobOf(kLob)}, kPure, "", "The string without trailing blanks and tabs."},
  {"CLI_udfLTRIM1", "LTRIM", Frame::plain, {text("string")}, {textOf(kText)}, kPure, "", "The string without leading blanks and tabs."},
  {"CLI_udfLTRIM2", "LTRIM", Frame::plain, {lob("string")}, {lobOf(kLob)}, kPure, "", "The string without leading blanks and tabs."},
  {"CLI_udfLEFT1", "LEFT", Frame::plain, {text("string"), int32("n")}, {textOf(kText)}, kPure, "01", "The first n bytes, filled up with blanks; n from 0 to 4000."},
  {"CLI_udfLEFT2", "LEFT", Frame::plain, {lob("string"), int32("n")}, {lobOf(kLob)}, kPure, "01", "The first n bytes, filled up with blanks; n from 0 to the capacity minus 1."},
  {"CLI_udfRIGHT1", "RIGHT", Frame::plain, {text("string"), int32("n")}, {textOf(kText)}, kPure, "01", "The last n bytes, or the string followed by blanks up to n; n from 0 to 4000."},
  {"CLI_udfRIGHT2", "RIGHT", Frame::plain, {lob("string"), int32("n")}, {lobOf(kLob)}, kPure, "01", "The last n bytes, or the string followed by blanks up to n; n from 0 to the capacity."},
  {"CLI_udfREPEAT1", "REPEAT", Frame::plain, {text("string"), int32("count")}, {textOf(kText)}, kPure, "10", "The string count times; the result at most 4000 bytes."},
  {"CLI_udfREPEAT2", "REPEAT", Frame::plain, {lob("string"), int32("count")}, {lobOf(kLob)}, kPure, "10", "The string count times; the result at most 1048576 bytes."},
  {"CLI_udfCHAR", "CHAR", Frame::plain, {int32("code")}, {textOf(1)}, kPure, "", "The byte of a code 1 to 255; 0 gives a blank, anything else 0xFF."},
  {"CLI_udfASCII1", "ASCII", Frame::plain, {text("string")}, {int32()}, kPure, "", "The first byte as a number 0 to 255; 0 for empty text."},
  {"CLI_udfASCII2", "ASCII", Frame::plain, {text("string")}, {int32()}, kPure, "", "The first byte as a number 0 to 255; 0 for empty text."},
  {"CLI_udfASCII3", "ASCII", Frame::plain, {lob("string")}, {int32()}, kPure, "", "The first byte as a number 0 to 255; 0 for an empty string."},
  // Searching
  {"CLI_udfLOCATE1", "LOCATE", Frame::plain, {text("search"), text("string"), int32("start")}, {int32()}, kPure, "01", "Position of the first match at or after start, counted from 1; 0 for none."},
  {"CLI_udfLOCATE2", "LOCATE", Frame::plain, {lob("search"), lob("string"), int32("start")}, {int32()}, kPure, "01", "Position of the first match at or after start, counted from 1; 0 for none."},
  {"CLI_udfLOCATE3", "LOCATE", Frame::plain, {text("search"), text("string")}, {int32()}, kPure, "", "Position of the first match, counted from 1; 0 for none."},
  {"CLI_udfLOCATE4", "LOCATE", Frame::plain, {lob("search"), lob("string")}, {int32()}, kPure, "", "Position of the first match, counted from 1; 0 for none."},
  // Rebuilding
  {"CLI_udfREPLACE1", "REPLACE", Frame::plain, {text("source"), text("search"), text("replacement")}, {textOf(kText)}, kPure, "10", "The source with every match of search, left to right, replaced."},
  {"CLI_udfREPLACE2", "REPLACE", Frame::plain, {lob("source"), lob("search"), lob("replacement")}, {lobOf(kLob)}, kPure, "10", "The source with every match of search, left to right, replaced."},
  {"CLI_udfINSERT1", "INSERT", Frame::plain, {text("source"), int32("start"), int32("length"), text("insert")}, {textOf(kText)}, kPure, "01 10", "The source with length bytes from start replaced by the new string."},
  {"CLI_udfINSERT2", "INSERT", Frame::plain, {lob("source"), int32("start"), int32("length"), lob("insert")}, {lobOf(kLob)}, kPure, "01 10", "The source with length bytes from start replaced by the new string."},
  // Phonetic
  {"CLI_udfSOUNDEX", "SOUNDEX", Frame::plain, {text("string")}, {textOf(4)}, kPure, "", "Four-character Soundex code; Z000 for a text without a letter."},
  {"CLI_udfDIFFERENCE", "DIFFERENCE", Frame::plain, {text("a"), text("b")}, {int32()}, kPure, "", "How many of the four Soundex positions agree, 0 to 4."},
  // Table functions
  {"CLI_udfFmpThreads", "FmpThreads", Frame::tableCallback, {int32("selector")}, {int32(), int32(), int32(), int32(), int32(), int32()}, 0, "", "The engine's table of Fmp threads."},
  {"CLI_udfFmpRows", "FmpRows", Frame::tableCallback, {}, {int32(), int32(), int16(), int16(), int16(), int16()}, 0, "", "The engine's table of Fmp rows."},
  // Cache snapshot
  {"SQLCACHE_SNAPSHOT", "SQLCACHE_SNAPSHOT", Frame::table, {}, {int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), textOf(8), lobOf(kLob)}, 0, "", "One row per statement of the SQL statement cache snapshot."},
  // Object copy
  {"CLI_udfVEBLOB_CP_LARGE", "VEBLOB_CP_LARGE", Frame::plain, {lob("object"), int32("source code page"), int32("target code page"), int32("byte order")}, {lobOf(1000000)}, kPure | kHandlesNull, "", "A record-chain object copied into another code page, up to 1000000 bytes."},
  {"CLI_udfVEBLOB_CP_SMALL", "VEBLOB_CP_SMALL", Frame::plain, {lob("object"), int32("source code page"), int32("target code page"), int32("byte order")}, {lobOf(500000)}, kPure | kHandlesNull, "", "A record-chain object copied into another code page, up to 500000 bytes."},
  // Collation
  {"CLI_udfCOLLATIONNAME", "COLLATIONNAME", Frame::plain, {bytes(8, "collation id")}, {textOf(128)}, kPure | kHandlesNull, "", "Name of a collation identifier; INVALID for NULL or an unknown one."},
};
// clang-format on

inline constexpr std::size_t kRoutineCount = sizeof kRoutines / sizeof kRoutines[0];

// The data export, which is no routine and has no row.
inline constexpr const char *kDataExport = "sqlzThisIsAORVLibrary";

template <std::size_t N>
constexpr std::size_t countSlots(const Slot (&slots)[N]) {
  std::size_t n = 0;
  while (n < N && slots[n].layout != Layout::none) ++n;
  return n;
}
constexpr std::size_t inputCount(const Routine &r) { return countSlots(r.inputs); }
constexpr std::size_t resultCount(const Routine &r) { return countSlots(r.results); }

// The extras that a frame variant has, as the bits of frame/positions.hpp.
using frame::kCallback;
using frame::kCallType;
using frame::kDbinfo;
using frame::kScratchpad;

constexpr unsigned extrasOf(Frame f) {
  switch (f) {
    case Frame::plain:
      return 0;
    case Frame::dbinfo:
      return kDbinfo;
    case Frame::scratchpad:
      return kScratchpad;
    case Frame::table:
      return kScratchpad | kCallType;
    case Frame::tableCallback:
      return kScratchpad | kCallType | kCallback;
  }
  return 0;
}

constexpr std::size_t extraCount(Frame f) {
  return static_cast<std::size_t>(std::popcount(extrasOf(f)));
}

// Where each argument of the row's export stands, and how many there are.
constexpr frame::Positions positionsOf(const Routine &r) {
  return frame::positionsOf(inputCount(r), resultCount(r), extrasOf(r.frame));
}
template <std::size_t Row>
inline constexpr frame::Positions kPositions = positionsOf(kRoutines[Row]);
constexpr std::size_t argumentCount(const Routine &r) { return positionsOf(r).count; }

constexpr const Routine *find(std::string_view symbol) {
  for (const Routine &r : kRoutines) {
    if (symbol == r.symbol) return &r;
  }
  return nullptr;
}

static_assert(positionsOf(*find("CLI_udfFmpThreads")).count == 21 &&
              positionsOf(*find("CLI_udfFmpThreads")).callback == 20);
static_assert(positionsOf(*find("CLI_udfFmpRows")).count == 19 &&
              positionsOf(*find("CLI_udfFmpRows")).scratchpad == 16);
static_assert(positionsOf(*find("SQLCACHE_SNAPSHOT")).count == 42 &&
              positionsOf(*find("SQLCACHE_SNAPSHOT")).callType == 41 &&
              !frame::present(positionsOf(*find("SQLCACHE_SNAPSHOT")).callback));
static_assert(positionsOf(*find("CLI_udfRAND1")).resultIndicator(0) == 1 &&
              positionsOf(*find("CLI_udfRAND1")).count == 6);
static_assert(positionsOf(*find("CLI_udfRAND2")).scratchpad == 8 &&
              positionsOf(*find("CLI_udfDAYNAME1")).dbinfo == 8);
static_assert(positionsOf(*find("CLI_udfSPACE")).sqlstate == 4 &&
              positionsOf(*find("CLI_udfSPACE")).message == 7);
static_assert(positionsOf(*find("CLI_udfMOD1")).sqlstate == 6 &&
              positionsOf(*find("CLI_udfMOD1")).message == 9);

}  // namespace cli::catalogue
