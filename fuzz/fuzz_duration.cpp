// TIMESTAMPDIFF: a duration text and an interval code.
//
// Input: four bytes of interval code (the low four bits of the first byte
// pick one of the nine known codes unless they are 15), then the duration
// text up to its first NUL.  The result is checked against the routine's
// arithmetic done again with exact integers, and the text must stay as it
// was.
#include <cstdint>
#include <string>
#include <string_view>

#include "harness.hpp"
#include "models/duration.hpp"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  using namespace orv::fuzz;
  keepLastInput(data, size);
  if (size < 4) return 0;
  auto interval = numberAt<std::int32_t>(data);
  if ((data[0] & 15u) != 15u) interval = std::int32_t{1} << ((data[0] & 15u) % 9u);
  const std::string_view text =
      upToNul(std::string_view(reinterpret_cast<const char *>(data) + 4, size - 4));

  Call c("CLI_udfTIMESTAMPDIFF");
  c.input(numberBlock(interval)).input(textBlock(text)).result(Block(4));
  const std::string code = c.run();
  const orv::model::Duration want = orv::model::timestampDiff(interval, text);
  ORV_CHECK(c.name(),
            code == want.code && (!code.empty() || numberIn<std::int32_t>(c.out()) == want.value));
  return 0;
}
