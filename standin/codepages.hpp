// Code pages by number, as the engine names them, mapped to ICU converters.
#pragma once

#include <unicode/ucnv.h>

#include <cstdint>

namespace orv::standin {

// The ICU converter for an engine code page, opened for this thread and
// kept open; null for a code page that is not known.  A conversion takes
// one converter for its source and another for its target (role 0 and 1),
// also when both are the same code page.
UConverter *converterFor(std::uint32_t codePage, int role = 0);

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

}  // namespace orv::standin
