// VEBLOB_CP_LARGE and VEBLOB_CP_SMALL: record-chain objects with code pages
// and byte-order flags from the bytes.
//
// Input: an option byte (bit 0: NULL object; bits 1-2: byte order -1, 0, 1
// or the raw word), two bytes that pick the source and target code pages
// from a list (or take the raw words behind them), two raw code-page
// words, a raw byte-order word, then the object's data.
//
// Beyond the frame's checks: a NULL object hands its indicator on and
// touches nothing else; otherwise the call succeeds with indicator 1 and a
// result that is a well-formed chain of as many records as the object
// holds, or stores 38601, 38602 or 38603 with exactly five bytes and the
// eight bytes "sqlocpcv", leaving the length word and the indicator alone.
#include <cstdint>
#include <cstring>
#include <iterator>
#include <string>
#include <string_view>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;

constexpr std::int32_t kCodePages[] = {
    0,    37,   819,  850,  932,  943,  950,  954,  964,   970,   1200,  1202,  1204,  1208,  1232,
    1234, 1236, 1252, 1386, 1392, 1394, 5039, 5488, 13488, 13490, 17584, 17586, 65535, 12345, -1};

std::uint32_t lengthAt(std::string_view s, std::size_t at, unsigned width, bool swap) {
  if (width == 1) return static_cast<unsigned char>(s[at]);
  if (width == 2) {
    const auto h = numberAt<std::uint16_t>(s.data() + at);
    return swap ? __builtin_bswap16(h) : h;
  }
  const auto v = numberAt<std::uint32_t>(s.data() + at);
  return swap ? __builtin_bswap32(v) : v;
}

// Records of a chain that lies wholly inside `s`, or -1 where one does not.
long records(std::string_view s, bool swap) {
  long n = 0;
  std::size_t t = 22;
  if (s.size() < 23) return 0;
  while (true) {
    const auto tag = static_cast<unsigned char>(s[t]);
    const unsigned width = tag == 0x4B ? 1 : tag == 0x8B ? 2 : tag == 0xCB ? 4 : 0;
    if (width == 0 || t + 1 + width > s.size()) return -1;
    const std::uint32_t length = lengthAt(s, t + 1, width, swap);
    if (t + 1 + width + std::size_t{length} > s.size()) return -1;
    ++n;
    t += 1 + width + length + 22;
    if (t + 1 > s.size()) return n;
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  if (size < 15) return 0;
  const std::uint8_t options = data[0];
  auto source = numberAt<std::int32_t>(data + 3), target = numberAt<std::int32_t>(data + 7),
       order = numberAt<std::int32_t>(data + 11);
  constexpr std::size_t kPages = std::size(kCodePages);
  if (data[1] < 2 * kPages) source = kCodePages[data[1] % kPages];
  if (data[2] < 2 * kPages) target = kCodePages[data[2] % kPages];
  const std::int32_t orders[] = {-1, 0, 1, order};
  order = orders[(options >> 1) & 3u];
  const bool null = (options & 1u) != 0;
  const std::string_view object(reinterpret_cast<const char *>(data) + 15, size - 15);
  // The machine is little-endian: -1 (big-endian) and any value but 0 swap.
  const bool swap = order != 0;

  for (const auto &[name, capacity] : {std::pair{"CLI_udfVEBLOB_CP_LARGE", 1000000u},
                                       std::pair{"CLI_udfVEBLOB_CP_SMALL", 500000u}}) {
    Call c(name);
    c.input(lobBlock(object))
        .input(numberBlock(source))
        .input(numberBlock(target))
        .input(numberBlock(order))
        .result(lobArea(capacity), 4);
    // Reads its first input indicator itself: -1 or 0.
    c.runRaw(null ? std::int16_t{-7} : std::int16_t{0});
    for (std::size_t i = 0; i < 4; ++i) ORV_CHECK(name, c.in(i).view() == c.inputBefore(i));
    ORV_CHECK(name, c.indicator(0) == (null ? -7 : 0));
    for (std::size_t i = 1; i < 4; ++i) ORV_CHECK(name, c.indicator(i) == kIndicator);
    const Block &state = c.sqlstate(), &message = c.message();
    const bool stored = !allAre(state.data(), state.size(), 'S');
    if (null || !stored) ORV_CHECK(name, allAre(message.data(), message.size(), 'M'));
    if (null) {
      ORV_CHECK(name, c.indicator(4) == -7 && c.resultUntouched() && !stored);
    } else if (!stored) {
      ORV_CHECK(name, c.indicator(4) == 1 && numberIn<std::uint32_t>(c.out()) <= capacity);
      const std::string_view result = lobIn(c.out());
      const long in = records(object, swap), out = records(result, swap);
      ORV_CHECK(name, in >= 0 && in == out);
      // Nothing follows the last record's string in the result.
      ORV_CHECK(name, result.empty() || result.size() >= 23);
    } else {
      ORV_CHECK(name,
                state.view() == "38601S" || state.view() == "38602S" || state.view() == "38603S");
      ORV_CHECK(name, message.view().starts_with("sqlocpcv") &&
                          allAre(&message.chars()[8], message.size() - 8, 'M'));
      ORV_CHECK(name, c.indicator(4) == kIndicator && numberIn<std::uint32_t>(c.out()) == capacity);
    }
  }
  return 0;
}
