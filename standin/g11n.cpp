// ORVG11N64 stand-in: encoding classes of code pages.
#include <cstdint>

#include "engine/services.h"
#include "services_data.hpp"

extern "C" int32_t sqlnls_Encoding2(uint32_t codePage, int32_t) {
  return orv::standin::encodingClassOf(codePage);
}
