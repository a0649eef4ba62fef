// Which export of a function serves a call, as far as that does not depend
// on the engine.
//
// A function of the library may have several exports of one argument
// count: one per numeric width, a terminated-text and a CLI_udfLob form of
// a string routine, or two that read different amounts of their text.
// Every host keeps to the same rules, whatever its engine's types:
//
//  - Numbers and strings are told apart by layout: a function's exports
//    agree on which arguments are numbers.
//  - Text that fits terminated text (at most 4000 bytes, no NUL byte) goes
//    to the terminated-text form, anything longer to the CLI_udfLob form.
//    A call that the terminated-text form refuses for a length rule
//    (SYSFUN:10) is served by the CLI_udfLob form, where there is one
//    (see Outcome::refusedForLength in call.hpp).
//  - Of two exports of the same layouts, the one that reads its whole text
//    serves the function; the narrower one is reached by its own name.
#pragma once

#include <cstddef>

#include "catalogue/catalogue.hpp"
#include "common/bytes.hpp"
#include "frame/cliudf.h"

namespace orv::host {

inline constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
inline constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;

constexpr bool isNumber(cli::catalogue::Layout l) {
  using cli::catalogue::Layout;
  return l == Layout::int16 || l == Layout::int32 || l == Layout::int64 || l == Layout::real;
}

// Terminated text, CLI_udfLob and fixed bytes: what an engine gives as a
// string.
constexpr bool isString(cli::catalogue::Layout l) {
  using cli::catalogue::Layout;
  return l == Layout::text || l == Layout::lob || l == Layout::fixedBytes;
}

// Whether the export takes a string argument as a CLI_udfLob.
constexpr bool takesLob(const cli::catalogue::Routine &r) {
  for (std::size_t i = 0; i < cli::catalogue::inputCount(r); ++i) {
    if (r.inputs[i].layout == cli::catalogue::Layout::lob) return true;
  }
  return false;
}

// Whether the export reads less of its text than the function's other
// export of the same layouts, which the function prefers.
constexpr bool narrower(const cli::catalogue::Routine &r) {
  return (r.properties & cli::catalogue::kNarrowerForm) != 0;
}

// Whether a string of these bytes fits terminated text.
[[gnu::always_inline]] inline bool fitsText(const char *bytes, std::size_t size) {
  return size <= kTextLimit && !holdsNul(bytes, size);
}

}  // namespace orv::host
