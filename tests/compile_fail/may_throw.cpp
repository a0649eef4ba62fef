// The logic of a routine is noexcept: nothing may leave an export by an
// exception.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int32_t> abs(std::int32_t x);
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
