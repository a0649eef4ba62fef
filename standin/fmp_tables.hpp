// The engine's side of the Fmp table functions: the callback that hands
// FmpThreads and FmpRows their tables.  A host that plays the engine passes
// it to the routines as their table-function callback.
//
// FmpRows lists the routines of the catalogue, FmpThreads the threads of
// this process (read from /proc; none elsewhere).
#pragma once

#include <cstdint>

namespace orv::standin {

// Answers a request record of the Fmp routines: an open request hands out
// a table in a block of its own, which the close request takes back.
std::int32_t fmpCallback(std::int32_t slots, void *request);

}  // namespace orv::standin
