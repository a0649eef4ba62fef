#include "support/platform.hpp"

#if defined(_WIN32)
#include <process.h>
#include <windows.h>

#include <cstdlib>
#else
#include <dlfcn.h>
#include <link.h>
#include <unistd.h>

#include <cstdlib>
#endif

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

std::string libraryFile(void *library) {
  char path[MAX_PATH + 1] = {};
  const DWORD n = ::GetModuleFileNameA(static_cast<HMODULE>(library), path, MAX_PATH);
  return std::string(path, n);
}

void setEnvironment(const char *name, const char *value) { ::_putenv_s(name, value); }

// An empty value removes the variable.
void unsetEnvironment(const char *name) { ::_putenv_s(name, ""); }

int processId() { return ::_getpid(); }

#else

void *openLibrary(const char *path) { return ::dlopen(path, RTLD_NOW | RTLD_LOCAL); }

void *findExport(void *library, const char *name) { return ::dlsym(library, name); }

void closeLibrary(void *library) { ::dlclose(library); }

std::string loaderError() {
  const char *why = ::dlerror();
  return why == nullptr ? "" : why;
}

std::string libraryFile(void *library) {
  const link_map *map = nullptr;
  if (::dlinfo(library, RTLD_DI_LINKMAP, &map) != 0 || map == nullptr) return {};
  return map->l_name;
}

void setEnvironment(const char *name, const char *value) { ::setenv(name, value, 1); }

void unsetEnvironment(const char *name) { ::unsetenv(name); }

int processId() { return static_cast<int>(::getpid()); }

#endif

}  // namespace orv::test
