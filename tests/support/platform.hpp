// What the tests do differently by platform, in one place: loading the
// library and finding its exports by name (dlopen and dlsym, or
// LoadLibraryA and GetProcAddress on Windows), the environment, the
// process id, and the raw file calls of the fake services.
#pragma once

#include <fcntl.h>

#include <cstdint>
#include <string>
#if defined(_WIN32)
#include <io.h>
#else
#include <unistd.h>
#endif

namespace orv::test {

// Opens a shared library by path (on Windows also by file name, found
// beside the test program); null on failure, with the reason in
// loaderError().
void *openLibrary(const char *path);

// The address of an export of an opened library, or null.
void *findExport(void *library, const char *name);

// Lets go of a library opened with openLibrary.
void closeLibrary(void *library);

// Why the last openLibrary failed.
std::string loaderError();

// The path of the file an opened library was loaded from.
std::string libraryFile(void *library);

void setEnvironment(const char *name, const char *value);
void unsetEnvironment(const char *name);

int processId();

// A device that opens like a file: /dev/null, or NUL on Windows.
const char *aDevice();

// Makes a FIFO at `path`; false where the system has none (Windows).
bool makeFifo(const std::string &path);

// Opens the FIFO at `path` for writing without waiting and closes it again,
// which lets a reader that waits in its open go on.
void letAWriterIn(const std::string &path);

// Bytes placed so that their last one is the last readable byte before a
// page that can't be read: a routine that reads one byte too many dies.
class BytesBeforeAGuardPage {
 public:
  BytesBeforeAGuardPage();
  ~BytesBeforeAGuardPage();
  BytesBeforeAGuardPage(const BytesBeforeAGuardPage &) = delete;
  BytesBeforeAGuardPage &operator=(const BytesBeforeAGuardPage &) = delete;

  // Copies `bytes` (at most a page) to end at the guard; returns their start.
  const char *place(const std::string &bytes);

 private:
  unsigned char *pages_;
  std::size_t page_;
};

// The raw file calls of the fake services, header-only since they link
// nothing of the tests: open for binary reading (-1 on failure), read
// exactly `count` bytes, move the position by `offset` from where it is,
// close.
#if defined(_WIN32)
inline int openForReading(const char *path) { return ::_open(path, _O_RDONLY | _O_BINARY); }
inline bool readExactly(int fd, void *out, std::uint32_t count) {
  return ::_read(fd, out, count) == static_cast<int>(count);
}
inline bool seekBy(int fd, std::int64_t offset) { return ::_lseeki64(fd, offset, SEEK_CUR) >= 0; }
inline int closeFile(int fd) { return ::_close(fd); }
#else
inline int openForReading(const char *path) { return ::open(path, O_RDONLY | O_CLOEXEC); }
inline bool readExactly(int fd, void *out, std::uint32_t count) {
  return ::read(fd, out, count) == static_cast<ssize_t>(count);
}
inline bool seekBy(int fd, std::int64_t offset) {
  return ::lseek(fd, static_cast<off_t>(offset), SEEK_CUR) >= 0;
}
inline int closeFile(int fd) { return ::close(fd); }
#endif

}  // namespace orv::test
