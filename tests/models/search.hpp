// LOCATE, REPLACE and INSERT as they are defined, by naive left-to-right
// scans: the reference that the unit tests compare the routines with on
// small alphabets, where matches and near-matches are frequent.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string>
#include <string_view>

namespace orv::model {

// LOCATE: the 1-based place of the first match at or after `start` (1 or
// more), 0 for none.
inline std::int64_t locate(std::string_view search, std::string_view in, std::size_t start) {
  for (std::size_t p = start - 1; p + search.size() <= in.size(); ++p) {
    if (in.substr(p, search.size()) == search) return static_cast<std::int64_t>(p + 1);
  }
  return 0;
}

// REPLACE within no limit: every match, left to right, none overlapping.
inline std::string replace(std::string_view in, std::string_view search, std::string_view by) {
  if (search.empty()) return std::string(in);
  std::string out;
  for (std::size_t p = 0; p < in.size();) {
    if (in.substr(p, search.size()) == search) {
      out += by;
      p += search.size();
    } else {
      out += in[p++];
    }
  }
  return out;
}

struct Inserted {
  std::string code;  // the SYSFUN code, empty on success
  std::string bytes;
};

// INSERT of `add` over the l bytes from place p, in the terminated-text
// form (lobForm false, limit 4000) or the CLI_udfLob form (limit its
// capacity): the checks in their order, with s - l + i in the form's
// 32-bit type.
inline Inserted insert(bool lobForm, std::string_view in, std::int64_t p, std::int64_t l,
                       std::string_view add, std::int64_t limit) {
  const auto s = static_cast<std::int64_t>(in.size()), i = static_cast<std::int64_t>(add.size());
  const auto wrapped = static_cast<std::uint32_t>(s - l + i);
  const std::int64_t size = lobForm ? std::int64_t{wrapped} : static_cast<std::int32_t>(wrapped);
  const std::int64_t trueSize = p - 1 + l > s ? p - 1 + i : s - l + i;
  if (size > limit || p > s || (l >= 0 && trueSize > limit)) return {"10", {}};
  if (p < 1 || (!lobForm && p > limit) || l < 0 || p + l > limit) return {"01", {}};
  const auto head = static_cast<std::size_t>(p - 1);
  const auto tail = static_cast<std::size_t>(std::min(p - 1 + l, s));
  std::string out(in.substr(0, head));
  out.append(add).append(in.substr(tail));
  return {"", out};
}

}  // namespace orv::model
