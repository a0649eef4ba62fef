// COLLATIONNAME: the name of a collation identifier, from the engine's
// national-language service.  It never fails and is never NULL: a NULL
// input or an identifier without a name gives INVALID.
#include <cstdint>
#include <cstring>

#include "engine/services.h"
#include "frame/frame.hpp"

using cli::Ind;
using cli::NameArg;

CLI_EXPORT void CLI_udfCOLLATIONNAME(const unsigned char *identifier, char *result,
                                     const std::int16_t *inputNull, Ind resultNull, char *, NameArg,
                                     NameArg, char *) noexcept {
  constexpr std::uint32_t kArea = 129;
  if (*inputNull >= 0) {
    unsigned char copy[8];
    std::memcpy(copy, identifier, sizeof copy);
    const std::int32_t length = sqlnlsCollIDMapIDToName(result, kArea, copy, 0);
    if (length > 0 && length < static_cast<std::int32_t>(kArea)) {
      result[length] = '\0';
      *resultNull = 0;
      return;
    }
  }
  std::memcpy(result, "INVALID", sizeof "INVALID");
  *resultNull = 0;
}
