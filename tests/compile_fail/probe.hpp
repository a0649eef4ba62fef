// Two exports of the catalogue, written as the generator writes them, each
// running whatever logic a case gives it.  A case gives one a logic that
// disagrees with its row, and its test passes when that does not compile;
// the control gives each the logic that its row implies.
//
// The cases are built on their own, with ORV_COMPILE_PROBES defined; the
// linters read them without it, and so only the logic's declaration.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "frame/shim.hpp"

namespace probe {

constexpr std::size_t rowOf(std::string_view symbol) {
  return static_cast<std::size_t>(cli::catalogue::find(symbol) - cli::catalogue::kRoutines.data());
}

// ABS2: a 32-bit integer in, and out in an Answer<std::int32_t>.
template <auto Logic>
void abs2(const std::int32_t *x, std::int32_t *result, const std::int16_t *x_null,
          std::int16_t *result_null, char *sqlstate, const char *function_name,
          const char *specific_name, char *message) noexcept {
  cli::shim::run<rowOf("CLI_udfABS2"), Logic>(x, result, x_null, result_null, sqlstate,
                                              function_name, specific_name, message);
}

// SPACE: a 32-bit integer in, a terminated text out through a TextOut.
template <auto Logic>
void space(const std::int32_t *count, char *result, const std::int16_t *count_null,
           std::int16_t *result_null, char *sqlstate, const char *function_name,
           const char *specific_name, char *message) noexcept {
  cli::shim::run<rowOf("CLI_udfSPACE"), Logic>(count, result, count_null, result_null, sqlstate,
                                               function_name, specific_name, message);
}

}  // namespace probe
