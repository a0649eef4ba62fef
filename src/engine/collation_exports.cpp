// COLLATIONNAME: the name of a collation identifier, from the engine's
// national-language service.  It never fails and is never NULL: a NULL
// input or an identifier without a name gives INVALID.
#include <cstdint>
#include <cstring>

#include "engine/services.h"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace cli {

Report routine::COLLATIONNAME(Nullable<BytesIn> collation_id, TextOut result,
                              ResultIndicator result_null) noexcept {
  // The service is given the whole area, the terminator's byte included.
  const auto area = static_cast<std::uint32_t>(result.limit() + 1);
  if (!collation_id.null()) {
    unsigned char copy[8];
    std::memcpy(copy, collation_id.value.data(), sizeof copy);
    const std::int32_t length = sqlnlsCollIDMapIDToName(result.chars(), area, copy, 0);
    if (length > 0 && length < static_cast<std::int32_t>(area)) {
      result.finish(static_cast<std::size_t>(length));
      result_null.set(0);
      return {};
    }
  }
  std::memcpy(result.chars(), "INVALID", sizeof "INVALID");
  result_null.set(0);
  return {};
}

}  // namespace cli
