// Two exports of the catalogue, written as the generator writes them, each
// running the logic that a case gives it.  Each case gives one a logic that
// disagrees with its row, and its test passes when that does not compile;
// the control gives each the logic that its row implies.  A case is built
// on its own, with ORV_CASE_<its name> defined; the linters read the file
// with no case defined.
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

// A case's logic, and its export taking it.
#if defined(ORV_CASE_control)
// The logic that each row implies compiles: without this, the cases
// below would pass for any fault of the harness.
cli::Answer<std::int32_t> abs(std::int32_t x) noexcept;
cli::Report spaces(std::int32_t count, cli::TextOut result) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
[[maybe_unused]] auto *const kSpace = &space<spaces>;
#elif defined(ORV_CASE_double_input)
// A 32-bit input is not handed to a double, although every value would
// convert to one.
cli::Answer<std::int32_t> abs(double x) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#elif defined(ORV_CASE_text_input)
// A 32-bit input is not read as text.
cli::Answer<std::int32_t> abs(cli::TextIn x) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#elif defined(ORV_CASE_missing_result)
// A routine whose result is a text must take the view of its result.
cli::Report spaces(std::int32_t count) noexcept;
[[maybe_unused]] auto *const kSpace = &space<spaces>;
#elif defined(ORV_CASE_extra_input)
// A logic may not take more inputs than its row has.
cli::Answer<std::int32_t> abs(std::int32_t x, std::int32_t y) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#elif defined(ORV_CASE_report_for_answer)
// A routine whose result is a number gives it back in an Answer, not a
// Report.
cli::Report abs(std::int32_t x) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#elif defined(ORV_CASE_narrower_answer)
// A 32-bit result is not given back in a 16-bit Answer, although every
// value would widen into it.
cli::Answer<std::int16_t> abs(std::int32_t x) noexcept;
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#elif defined(ORV_CASE_may_throw)
// The logic of a routine is noexcept: nothing may leave an export by an
// exception.
cli::Answer<std::int32_t> abs(std::int32_t x);
[[maybe_unused]] auto *const kAbs = &abs2<abs>;
#endif

}  // namespace probe
