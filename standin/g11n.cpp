// ORVG11N64 stand-in: encoding classes of code pages.
#include <cstdint>

#include "codepages.hpp"
#include "engine/services.h"

extern "C" int32_t sqlnls_Encoding2(uint32_t codePage, int32_t) {
  return orv::standin::encodingClassOf(codePage);
}
