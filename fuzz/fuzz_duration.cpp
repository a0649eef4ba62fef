// TIMESTAMPDIFF: a duration text and an interval code.
//
// Input: four bytes of interval code (the low four bits of the first byte
// pick one of the nine known codes unless they are 15), then the duration
// text up to its first NUL.  The result is checked against the routine's
// arithmetic done here in 64 bits, and the text must stay as it was.
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;

struct Expected {
  std::string code;
  std::int64_t value = 0;
};

Expected durationIn(std::int32_t interval, std::string_view text) {
  std::size_t length = text.size();
  while (length > 1 && text[length - 1] == ' ') --length;
  std::size_t at = 0;
  bool negative = false;
  if (length > 0 && (text[0] == '-' || text[0] == '+')) {
    negative = text[0] == '-';
    at = 1;
  }
  std::size_t point = std::string_view::npos;
  for (std::size_t i = at; i < length; ++i) {
    if (text[i] >= '0' && text[i] <= '9') continue;
    if (text[i] == '.' && point == std::string_view::npos) {
      point = i;
      continue;
    }
    return {"07"};
  }
  const std::size_t k = point == std::string_view::npos ? length : point;
  if (k - at > 14) return {"10"};
  if (point != std::string_view::npos && length - point - 1 > 6) return {"10"};
  std::string digits(14 - (k - at), '0');
  digits.append(text.substr(at, k - at));
  std::string fraction(
      point == std::string_view::npos ? "" : text.substr(point + 1, length - point - 1));
  fraction.resize(6, '0');
  const auto field = [&](std::size_t from, std::size_t n) {
    return std::stoll(digits.substr(from, n));
  };
  const std::int64_t y = field(0, 4), mo = field(4, 2), d = field(6, 2), h = field(8, 2),
                     mi = field(10, 2), s = field(12, 2), f = std::stoll(fraction);
  const std::int64_t minutes = y * 525600 + mo * 43200 + d * 1440 + h * 60 + mi;
  std::int64_t v = 0;
  switch (interval) {
    case 1:
    case 2:
      if (minutes > (2147483647 - s) / 60) return {"03"};
      v = s + minutes * 60;
      if (interval == 1) {
        if (v > (2147483647 - f) / 1000000) return {"03"};
        v = f + v * 1000000;
      }
      break;
    case 4:
      // No overflow test: the exact total kept in 32 bits, two's complement.
      v = static_cast<std::int32_t>(static_cast<std::uint32_t>(minutes));
      break;
    case 8:
      v = y * 8760 + mo * 720 + d * 24 + h;
      break;
    case 16:
      v = y * 365 + mo * 30 + d;
      break;
    case 32:
      v = y * 52 + (mo * 30 + d) / 7;
      break;
    case 64:
      v = y * 12 + mo;
      break;
    case 128:
      v = y * 4 + mo / 3;
      break;
    case 256:
      v = y;
      break;
    default:
      return {"08"};
  }
  if (interval == 4) {
    // Negated in 32 bits as well.
    return {"", negative ? static_cast<std::int32_t>(0u - static_cast<std::uint32_t>(v)) : v};
  }
  return {"", negative ? -v : v};
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  if (size < 4) return 0;
  std::int32_t interval = 0;
  std::memcpy(&interval, data, 4);
  if ((data[0] & 15u) != 15u) interval = std::int32_t{1} << ((data[0] & 15u) % 9u);
  const std::string_view text =
      upToNul(std::string_view(reinterpret_cast<const char *>(data) + 4, size - 4));

  Call c("CLI_udfTIMESTAMPDIFF");
  c.input(numberBlock(interval)).input(textBlock(text)).result(Block(4));
  const std::string code = c.run();
  const Expected want = durationIn(interval, text);
  ORV_CHECK(c.name(), code == want.code);
  if (code.empty()) ORV_CHECK(c.name(), numberIn<std::int32_t>(c.out()) == want.value);
  return 0;
}
