// The walk through a monitor element's children.  The stand-in exports it
// as it is; the tests' fake services serve it too.
#pragma once

#include <cstdint>
#include <cstring>

#include "engine/services.h"

namespace orv::standin {

// The first inner element with the identifier; the walk stops at the end
// of the parent's data and at a child that claims more than is left.
inline const sqlm_header_info *findElement(uint32_t element, const sqlm_header_info *parent) {
  const auto *data = reinterpret_cast<const unsigned char *>(parent) + sizeof(sqlm_header_info);
  // Elements lie packed at any byte offset: headers are copied out.
  sqlm_header_info head;
  std::memcpy(&head, parent, sizeof head);
  uint64_t left = head.size;
  while (left >= sizeof(sqlm_header_info)) {
    sqlm_header_info child;
    std::memcpy(&child, data, sizeof child);
    const uint64_t whole = sizeof child + uint64_t{child.size};
    if (whole > left) return nullptr;
    if (child.element == element) return reinterpret_cast<const sqlm_header_info *>(data);
    data += whole;
    left -= whole;
  }
  return nullptr;
}

}  // namespace orv::standin
