// A routine whose result is a number gives it back in an Answer, not a
// Report.
#include "probe.hpp"

namespace probe {
cli::Report abs(std::int32_t x) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
