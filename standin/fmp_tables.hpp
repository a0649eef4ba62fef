// The engine's side of the Fmp table functions: the callback that hands
// FmpThreads and FmpRows their tables.  A host that plays the engine passes
// it to the routines as their table-function callback.
//
// FmpRows lists the routines of the catalogue, FmpThreads the threads of
// this process (read from /proc; none elsewhere).
#pragma once

#include <cstdint>
#include <cstring>

namespace orv::standin {

// The 32-bit field that a slot of a request record points at: the request
// code, the input, or the row count.
inline std::int32_t *requestField(std::uint64_t slot) {
  std::int32_t *p = nullptr;
  std::memcpy(&p, &slot, sizeof p);
  return p;
}

// Answers a request record of the Fmp routines: an open request hands out
// a table in a block of its own, which the close request takes back.
std::int32_t fmpCallback(std::int32_t slots, void *request);

}  // namespace orv::standin
