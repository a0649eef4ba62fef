// TIMESTAMPDIFF worked out again with exact integers from the duration's
// fields: the reference that the unit tests and the fuzz target compare
// the routine with.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace orv::model {

struct Duration {
  std::string code;  // the SYSFUN code, empty on success
  std::int64_t value = 0;
};

// `interval` is the routine's interval code, `text` the duration as the
// caller passed it, without its terminator.
inline Duration timestampDiff(std::int32_t interval, std::string_view text) {
  std::string s(text);
  while (s.size() > 1 && s.back() == ' ') s.pop_back();
  const bool negative = !s.empty() && s[0] == '-';
  if (!s.empty() && (s[0] == '-' || s[0] == '+')) s.erase(0, 1);
  const auto point = s.find('.');
  const std::string whole = s.substr(0, point);
  const std::string fraction = point == std::string::npos ? "" : s.substr(point + 1);
  for (const std::string &part : {whole, fraction}) {
    if (part.find_first_not_of("0123456789") != std::string::npos) return {"07"};
  }
  if (whole.size() > 14 || fraction.size() > 6) return {"10"};
  const std::string digits = std::string(14 - whole.size(), '0') + whole;
  const auto at = [&](std::size_t from, std::size_t n) {
    return std::int64_t{std::stoll(digits.substr(from, n))};
  };
  const std::int64_t y = at(0, 4), mo = at(4, 2), d = at(6, 2), h = at(8, 2), mi = at(10, 2),
                     sec = at(12, 2), f = std::stoll((fraction + "000000").substr(0, 6));
  // At most 9999 years of 525600 minutes, so no sum below leaves 64 bits.
  const std::int64_t minutes = ((y * 365 + mo * 30 + d) * 24 + h) * 60 + mi;
  std::int64_t value = 0;
  switch (interval) {
    case 1:
      value = (minutes * 60 + sec) * 1000000 + f;
      break;
    case 2:
      value = minutes * 60 + sec;
      break;
    case 4:
      value = minutes;
      break;
    case 8:
      value = (y * 365 + mo * 30 + d) * 24 + h;
      break;
    case 16:
      value = y * 365 + mo * 30 + d;
      break;
    case 32:
      value = y * 52 + (mo * 30 + d) / 7;
      break;
    case 64:
      value = y * 12 + mo;
      break;
    case 128:
      value = y * 4 + mo / 3;
      break;
    case 256:
      value = y;
      break;
    default:
      return {"08"};
  }
  // Minutes have no overflow test: their sum is kept in 32 bits.
  if (interval != 4 && value > 2147483647) return {"03"};
  const std::int64_t signedValue = negative ? -value : value;
  return {"", std::int64_t{static_cast<std::int32_t>(static_cast<std::uint32_t>(signedValue))}};
}

}  // namespace orv::model
