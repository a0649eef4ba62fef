// Finding the library and its exports, with the dynamic loader.
#include "common/exports.hpp"

#include <dlfcn.h>

#include <cstddef>

#include "frame/cliudf.h"

namespace orv::host {

Library openLibrary() noexcept {
  Library library;
  Dl_info info{};
  if (dladdr(&sqlzThisIsAORVLibrary, &info) == 0 || info.dli_fname == nullptr) {
    library.failure = Library::Failure::whereabouts;
    return library;
  }
  library.path = info.dli_fname;
  library.handle = dlopen(info.dli_fname, RTLD_NOW | RTLD_LOCAL);
  if (library.handle == nullptr) {
    library.failure = Library::Failure::open;
    library.error = dlerror();
  }
  return library;
}

void findExports(const Library &library, Exports &exports) noexcept {
  for (std::size_t row = 0; row < exports.size(); ++row) {
    exports[row] = dlsym(library.handle, cli::catalogue::kRoutines[row].symbol);
  }
}

const cli::catalogue::Routine *firstMissing(
    const Exports &exports, bool (*needed)(const cli::catalogue::Routine &)) noexcept {
  for (std::size_t row = 0; row < exports.size(); ++row) {
    const cli::catalogue::Routine &r = cli::catalogue::kRoutines[row];
    if (exports[row] == nullptr && (needed == nullptr || needed(r))) return &r;
  }
  return nullptr;
}

}  // namespace orv::host
