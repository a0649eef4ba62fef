// What the tests do differently by platform, in one place: loading the
// library and finding its exports by name (dlopen and dlsym, or
// LoadLibraryA and GetProcAddress on Windows), the environment, the
// process id, devices and FIFOs, and memory before a guard page.
#pragma once

#include <cstddef>
#include <string>

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

void setEnvironment(const char *name, const char *value);
void unsetEnvironment(const char *name);

int processId();

// A device that opens like a file: /dev/null, or NUL on Windows.
const char *aDevice();

// Makes a FIFO at `path`; false where the system has none (Windows).
bool makeFifo(const std::string &path);

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

}  // namespace orv::test
