// What differs between the platforms for the stand-ins, in one place: how
// a regular file is opened for reading and how its position is moved by 64
// bits.
// (The stand-ins' exports are marked in src/engine/services.h; their code
// pages, names and collations come from ICU or from tables, as
// services_data.hpp says.)
#pragma once

#include <cstdint>
#include <cstdio>

#if defined(_WIN32)
#include <sys/stat.h>
#include <sys/types.h>
#else
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#endif

namespace orv::standin {

// Opens `path` for binary reading if it is a regular file, and only then:
// a FIFO, a device or a folder gives null, at once.  An ordinary open of a
// FIFO waits for a writer, for ever if none comes, so on Linux the file is
// opened without waiting and looked at before it is read.
inline std::FILE *openRegularFile(const char *path) {
#if defined(_WIN32)
  std::FILE *file = std::fopen(path, "rb");
  struct _stat64 status {};
  if (file != nullptr &&
      (::_fstat64(::_fileno(file), &status) != 0 || (status.st_mode & _S_IFMT) != _S_IFREG)) {
    std::fclose(file);
    return nullptr;
  }
  return file;
#else
  const int fd = ::open(path, O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
  if (fd < 0) return nullptr;
  struct stat status {};
  const int flags = ::fcntl(fd, F_GETFL);
  std::FILE *file = nullptr;
  if (::fstat(fd, &status) == 0 && S_ISREG(status.st_mode) && flags != -1 &&
      ::fcntl(fd, F_SETFL, flags & ~O_NONBLOCK) == 0) {
    file = ::fdopen(fd, "rb");
  }
  if (file == nullptr) ::close(fd);
  return file;
#endif
}

// fseek with a 64-bit offset; 0 on success.
inline int seek(std::FILE *file, std::int64_t offset, int whence) {
#if defined(_WIN32)
  return ::_fseeki64(file, offset, whence);
#else
  return ::fseeko(file, static_cast<off_t>(offset), whence);
#endif
}

}  // namespace orv::standin
