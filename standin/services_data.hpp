// What the stand-ins know about code pages, names of months and days and
// collations.  On Linux ICU knows it (icu.cpp); on Windows, where the build
// has no ICU, a few tables written by hand do (tables.cpp), as
// standin/README.md lists.
#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace orv::standin {

// Encoding classes, as sqlnls_Encoding2 reports them.
enum EncodingClass : std::int32_t {
  kUnknown = 0,
  kSingleByte = 2,  // one byte a character, ASCII-based
  kMultiByte = 3,   // up to several bytes a character: EUC, Shift-JIS, GB, Big5
  kUtf8 = 4,
  kUtf16 = 5,
  kUtf32 = 6,
  kSingleByteEbcdic = 9,  // one byte a character, EBCDIC
};

EncodingClass encodingClassOf(std::uint32_t codePage);

// Converts `length` bytes at `source` from one code page into another,
// writing at most `space` bytes at `target` and lowering `space` by what it
// wrote.  0 on success; -1 for an unknown code page, -2 when the target is
// too small, -3 for bytes not valid in the source or characters that the
// target cannot hold.  Nothing is substituted.
std::int32_t convert(const unsigned char *source, std::uint32_t length,
                     std::uint32_t sourceCodePage, std::uint32_t targetCodePage,
                     unsigned char *target, std::uint32_t &space);

// The full names of the months and weekdays of one locale, as UTF-8.
struct Names {
  std::array<std::string, 12> months;
  std::array<std::string, 7> days;  // Sunday first
};

// The names of `locale`; false when they are not known.
bool namesOf(const char *locale, Names &names);

// The locale of collation number `index`; false when there is none.
bool collationLocale(std::int32_t index, std::string &locale);

}  // namespace orv::standin
