// What differs between the platforms for the stand-ins, in one place: how
// a file is opened for reading and how its position is moved by 64 bits.
// (The stand-ins' exports are marked in src/engine/services.h; their code
// pages, names and collations come from ICU or from tables, as
// services_data.hpp says.)
#pragma once

#include <cstdint>
#include <cstdio>

namespace orv::standin {

// Binary reading; on Linux also closed on exec ("e"), which the Windows C
// library does not know.
#if defined(_WIN32)
inline constexpr const char *kReadBinary = "rb";
#else
inline constexpr const char *kReadBinary = "rbe";
#endif

// fseek with a 64-bit offset; 0 on success.
inline int seek(std::FILE *file, std::int64_t offset, int whence) {
#if defined(_WIN32)
  return ::_fseeki64(file, offset, whence);
#else
  return ::fseeko(file, static_cast<off_t>(offset), whence);
#endif
}

}  // namespace orv::standin
