// A routine whose result is a text must take the view of its result.
#include "probe.hpp"

namespace probe {
cli::Report spaces(std::int32_t count) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kSpace = &probe::space<probe::spaces>;
#endif
