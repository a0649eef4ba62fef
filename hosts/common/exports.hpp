// The library and its exports, as a host finds them: the library that
// defines the data export, which is the one the host was linked with,
// opened again by its path, and every export looked up by its name in it,
// as an engine finds them.  What went wrong is told, not reported: each
// host reports it in its own engine's way.
#pragma once

#include <array>

#include "catalogue/catalogue.hpp"

namespace orv::host {

// The export of each catalogue row, by the row's index; null where the
// library has none.
using Exports = std::array<void *, cli::catalogue::kRoutineCount>;

struct Library {
  enum class Failure : unsigned char {
    none,
    whereabouts,  // the file that defines the data export cannot be told
    open,         // it could not be opened: `error` says why
  };
  Failure failure = Failure::none;
  const char *path = nullptr;   // the library's file
  const char *error = nullptr;  // the loader's words, for Failure::open
  void *handle = nullptr;       // open, for Failure::none
};

// Opens the library again by its path.  It stays open for the life of the
// process.
Library openLibrary() noexcept;

// Looks up the export of every row in `library`, which is open.
void findExports(const Library &library, Exports &exports) noexcept;

// The first row, in catalogue order, that `needed` takes (every row when
// `needed` is null) and that has no export; null when there is none.
const cli::catalogue::Routine *firstMissing(
    const Exports &exports, bool (*needed)(const cli::catalogue::Routine &) = nullptr) noexcept;

}  // namespace orv::host
