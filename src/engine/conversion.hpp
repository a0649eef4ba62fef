// The call of the engine's code page conversion service, shared by the
// day and month names and by VEBLOB_CP: the record with its fixed values,
// and the seven arguments.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "engine/services.h"

namespace cli {

static_assert(sizeof(CLI_conversionRecord) == 32);
static_assert(offsetof(CLI_conversionRecord, target) == 8);
static_assert(offsetof(CLI_conversionRecord, space) == 16);
static_assert(offsetof(CLI_conversionRecord, fixed20) == 20);
static_assert(offsetof(CLI_conversionRecord, fixed24) == 24);
static_assert(offsetof(CLI_conversionRecord, fixed30) == 30);

struct Converted {
  std::int32_t status;   // the service's status
  std::uint32_t length;  // bytes written at the target
};

// Converts `length` bytes at `source` from one code page to another into
// `target`, which has room for `space` bytes.
inline Converted CLI_convertCodePage(const unsigned char *source, std::uint32_t length,
                                     std::uint32_t sourceCodePage, std::uint32_t targetCodePage,
                                     unsigned char *target, std::uint32_t space) noexcept {
  CLI_conversionRecord record;  // bytes 0 to 7 and 22 to 23 are not written
  record.target = target;
  record.space = space;
  record.fixed20 = 0;
  record.fixed24 = 0;
  record.fixed25 = 0;
  record.fixed26 = 1;
  record.fixed27 = 1;
  record.fixed28 = 1;
  record.fixed29 = 0;
  record.fixed30 = 0xFFFF;
  const unsigned char *start = source;
  std::int32_t work = 0;
  const std::int32_t status =
      sqlocpcv(&start, length, sourceCodePage, targetCodePage, 0, &record, &work);
  return {status, space - record.space};
}

}  // namespace cli
