// The file services on a handle that holds a buffered C stream, so that
// the many small reads of a snapshot cost no system call each.  The
// stand-in exports them as they are; the tests' fake services wrap them
// with their counters and failures.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstring>

#include "engine/services.h"
#include "platform.hpp"

namespace orv::standin {

inline std::FILE *streamOf(const CLI_fileHandle &handle) {
  std::FILE *f = nullptr;
  std::memcpy(&f, handle.bytes, sizeof(std::FILE *));
  return f;
}

// Opens a regular file, and nothing else, for reading; 0 on success.
inline int32_t openFile(const char *path, CLI_fileHandle *handle) {
  std::FILE *f = openRegularFile(path);
  if (f == nullptr) return 1;
  std::memset(handle->bytes, 0, sizeof handle->bytes);
  std::memcpy(handle->bytes, &f, sizeof(std::FILE *));
  return 0;
}

// Reads `count` bytes; 0 when all of them came, with the count read in
// *read where the caller gives a place for it.
inline int32_t readFile(const CLI_fileHandle &handle, void *destination, uint32_t count,
                        uint32_t *read) {
  const std::size_t done = count == 0 ? 0 : std::fread(destination, 1, count, streamOf(handle));
  if (read != nullptr) *read = static_cast<uint32_t>(done);
  return done == count ? 0 : 1;
}

// Moves the position by `offset` from the start (origin 0), the end (2)
// or where it is (any other).
inline int32_t moveIn(const CLI_fileHandle &handle, int64_t offset, int32_t origin) {
  const int whence = origin == 0 ? SEEK_SET : origin == 2 ? SEEK_END : SEEK_CUR;
  return seek(streamOf(handle), offset, whence) != 0 ? 1 : 0;
}

inline int32_t closeFile(const CLI_fileHandle &handle) {
  return std::fclose(streamOf(handle)) == 0 ? 0 : 1;
}

}  // namespace orv::standin
