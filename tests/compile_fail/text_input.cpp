// A 32-bit input is not read as text.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int32_t> abs(cli::TextIn x) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
