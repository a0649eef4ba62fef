// What the numeric routines share: the routines' declarations, the Answer
// that each gives back (a value to store, or a SYSFUN code, or both where
// the routine stores its value before it tests it) and the range test on
// a double.
#pragma once

#include <cmath>
#include <cstdint>

#include "frame/frame.hpp"
#include "routines.hpp"

namespace cli {

// A result r is out of range when it equals HUGE_VAL or 0.0 minus HUGE_VAL,
// by IEEE equality: a NaN never is.
inline bool CLI_isOutOfRange(double r) noexcept { return r == HUGE_VAL || r == 0.0 - HUGE_VAL; }

}  // namespace cli
