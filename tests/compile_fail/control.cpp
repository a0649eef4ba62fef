// The logic that each row implies compiles: without this, the cases
// below would pass for any fault of the harness.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int32_t> abs(std::int32_t x) noexcept;
cli::Report spaces(std::int32_t count, cli::TextOut result) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
[[maybe_unused]] auto *const kSpace = &probe::space<probe::spaces>;
#endif
