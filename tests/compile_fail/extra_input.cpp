// A logic may not take more inputs than its row has.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int32_t> abs(std::int32_t x, std::int32_t y) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
