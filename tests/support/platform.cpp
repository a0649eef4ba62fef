#include "support/platform.hpp"

#if defined(_WIN32)
#include <io.h>
#include <process.h>
#include <windows.h>
#else
#include <dlfcn.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>
#endif

#include <algorithm>
#include <cstdlib>

namespace orv::test {

#if defined(_WIN32)

void *openLibrary(const char *path) { return ::LoadLibraryA(path); }

void *findExport(void *library, const char *name) {
  return reinterpret_cast<void *>(::GetProcAddress(static_cast<HMODULE>(library), name));
}

void closeLibrary(void *library) { ::FreeLibrary(static_cast<HMODULE>(library)); }

std::string loaderError() {
  return "LoadLibraryA failed with error " + std::to_string(::GetLastError());
}

void setEnvironment(const char *name, const char *value) { ::_putenv_s(name, value); }

// An empty value removes the variable.
void unsetEnvironment(const char *name) { ::_putenv_s(name, ""); }

int processId() { return ::_getpid(); }

const char *aDevice() { return "NUL"; }

bool makeFifo(const std::string &) { return false; }

BytesBeforeAGuardPage::BytesBeforeAGuardPage() {
  SYSTEM_INFO info;
  ::GetSystemInfo(&info);
  page_ = info.dwPageSize;
  pages_ = static_cast<unsigned char *>(
      ::VirtualAlloc(nullptr, 2 * page_, MEM_RESERVE | MEM_COMMIT, PAGE_READWRITE));
  DWORD was = 0;
  if (pages_ == nullptr || !::VirtualProtect(pages_ + page_, page_, PAGE_NOACCESS, &was)) {
    std::abort();
  }
}

BytesBeforeAGuardPage::~BytesBeforeAGuardPage() { ::VirtualFree(pages_, 0, MEM_RELEASE); }

#else

void *openLibrary(const char *path) { return ::dlopen(path, RTLD_NOW | RTLD_LOCAL); }

void *findExport(void *library, const char *name) { return ::dlsym(library, name); }

void closeLibrary(void *library) { ::dlclose(library); }

std::string loaderError() {
  const char *why = ::dlerror();
  return why == nullptr ? "" : why;
}

void setEnvironment(const char *name, const char *value) { ::setenv(name, value, 1); }

void unsetEnvironment(const char *name) { ::unsetenv(name); }

int processId() { return static_cast<int>(::getpid()); }

const char *aDevice() { return "/dev/null"; }

bool makeFifo(const std::string &path) { return ::mkfifo(path.c_str(), 0600) == 0; }

BytesBeforeAGuardPage::BytesBeforeAGuardPage()
    : page_(static_cast<std::size_t>(::sysconf(_SC_PAGESIZE))) {
  void *at = ::mmap(nullptr, 2 * page_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (at == MAP_FAILED || ::mprotect(static_cast<char *>(at) + page_, page_, PROT_NONE) != 0) {
    std::abort();
  }
  pages_ = static_cast<unsigned char *>(at);
}

BytesBeforeAGuardPage::~BytesBeforeAGuardPage() { ::munmap(pages_, 2 * page_); }

#endif

const char *BytesBeforeAGuardPage::place(const std::string &bytes) {
  unsigned char *at = pages_ + page_ - bytes.size();
  std::copy(bytes.begin(), bytes.end(), at);
  return reinterpret_cast<const char *>(at);
}

}  // namespace orv::test
