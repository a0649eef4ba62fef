// TIMESTAMPDIFF worked out again with exact integers from the duration's
// fields: the reference that the unit tests and the fuzz target compare
// the routine with.
#pragma once

#include <bit>
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
  const std::int64_t days = y * 365 + mo * 30 + d, hours = days * 24 + h, minutes = hours * 60 + mi,
                     seconds = minutes * 60 + sec;
  // The interval codes are the powers of two from 1 to 256, for these units.
  const std::int64_t byCode[] = {
      seconds * 1000000 + f,      seconds,     minutes,        hours, days,
      y * 52 + (mo * 30 + d) / 7, y * 12 + mo, y * 4 + mo / 3, y};
  if (interval <= 0 || interval > 256 || (interval & (interval - 1)) != 0) return {"08"};
  const std::int64_t value = byCode[std::countr_zero(static_cast<std::uint32_t>(interval))];
  // Minutes have no overflow test: their sum is kept in 32 bits.
  if (interval != 4 && value > 2147483647) return {"03"};
  const std::int64_t signedValue = negative ? -value : value;
  return {"", std::int64_t{static_cast<std::int32_t>(static_cast<std::uint32_t>(signedValue))}};
}

}  // namespace orv::model
