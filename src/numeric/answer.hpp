// What a numeric routine gives back, and the export shims that deliver it.
//
// Each routine's logic is a pure function from its input values to an
// Answer: a value to store, or a SYSFUN code, or both where the routine
// stores its value before it tests it.  The shims read the inputs through
// their pointers and turn the Answer into the frame's result and status.
#pragma once

#include <cmath>
#include <cstdint>

#include "frame/frame.hpp"

namespace cli {

template <typename T>
struct Answer {
  T value{};
  Sysfun code{};        // Sysfun{} (0): success
  bool stored = false;  // on failure: the value was stored before the test
};

template <typename T>
constexpr Answer<T> success(T value) {
  return {value, Sysfun{}, false};
}
template <typename T>
constexpr Answer<T> failure(Sysfun code) {
  return {T{}, code, false};
}
// A failure that leaves `value` in the result area.
template <typename T>
constexpr Answer<T> failureAfterStoring(T value, Sysfun code) {
  return {value, code, true};
}

template <typename T>
void deliver(const Answer<T> &a, T *result, Status status) noexcept {
  if (a.code == Sysfun{} || a.stored) *result = a.value;
  if (a.code != Sysfun{}) status.raise(a.code);
}

// A result r is out of range when it equals HUGE_VAL or 0.0 minus HUGE_VAL,
// by IEEE equality: a NaN never is.
inline bool CLI_isOutOfRange(double r) noexcept { return r == HUGE_VAL || r == 0.0 - HUGE_VAL; }

}  // namespace cli

// One input and one result, or two inputs and one result, in the plain
// frame; `compute` maps the input values to an Answer.  The value types
// stand as types in the signatures, where parentheses cannot go.
// NOLINTBEGIN(bugprone-macro-parentheses)
#define CLI_NUMERIC_EXPORT1(name, X, R, compute)                                                \
  CLI_EXPORT void name(const X *x, R *result, cli::Ind, cli::Ind, char *sqlstate, cli::NameArg, \
                       cli::NameArg, char *message) noexcept {                                  \
    cli::deliver(compute(*x), result, cli::Status{sqlstate, message});                          \
  }

#define CLI_NUMERIC_EXPORT2(name, X, Y, R, compute)                                          \
  CLI_EXPORT void name(const X *x, const Y *y, R *result, cli::Ind, cli::Ind, cli::Ind,      \
                       char *sqlstate, cli::NameArg, cli::NameArg, char *message) noexcept { \
    cli::deliver(compute(*x, *y), result, cli::Status{sqlstate, message});                   \
  }
// NOLINTEND(bugprone-macro-parentheses)
