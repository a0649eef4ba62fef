// LOCATE, REPLACE and INSERT as they are defined, by naive left-to-right
// scans: the reference that the unit tests compare the routines with on
// small alphabets, where matches and near-matches are frequent.
#pragma once

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

// INSERT of `add` over the l bytes from place p, step by step as defined:
// the checks that raise 10, then those that raise 01, then the source's
// first p - 1 bytes, `add` and what follows the deleted range.  The length
// check reckons s - l + i modulo 2^32, read as a signed number by the
// terminated-text form (lobForm false, limit 4000) and as an unsigned one
// by the CLI_udfLob form (limit its capacity); a range that runs past the
// source's end counts the result's true length p - 1 + i instead.
inline Inserted insert(bool lobForm, std::string_view in, std::int64_t p, std::int64_t l,
                       std::string_view add, std::int64_t limit) {
  const auto s = static_cast<std::int64_t>(in.size()), i = static_cast<std::int64_t>(add.size());
  constexpr std::int64_t kWord = std::int64_t{1} << 32;
  std::int64_t reckoned = ((s - l + i) % kWord + kWord) % kWord;
  if (!lobForm && reckoned >= kWord / 2) reckoned -= kWord;
  const bool pastTheEnd = l >= 0 && p - 1 + l > s;
  if (reckoned > limit || p > s || (pastTheEnd && p - 1 + i > limit)) return {"10", {}};
  if (p < 1 || (!lobForm && p > limit) || l < 0 || p + l > limit) return {"01", {}};
  std::string out(in.substr(0, static_cast<std::size_t>(p - 1)));
  out.append(add);
  if (!pastTheEnd) out.append(in.substr(static_cast<std::size_t>(p - 1 + l)));
  return {"", out};
}

}  // namespace orv::model
