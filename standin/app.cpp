// ORVAPP64 stand-in: monitor element services.
#include "elements.hpp"
#include "engine/services.h"

extern "C" {

// Paths need no cleaning here: an ordinary path is left as it is.
void sqlm_filter_file_name(char *) {}

const sqlm_header_info *sqlm_find_element(uint32_t element, const sqlm_header_info *parent) {
  return orv::standin::findElement(element, parent);
}

}  // extern "C"
