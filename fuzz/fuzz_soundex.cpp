// SOUNDEX and DIFFERENCE of two texts.
//
// Input: the first text up to the first NUL, the second text behind it up
// to the next.  Both routines are checked against the letter-group
// computation done here; neither may change its inputs or fail.
#include <cstdint>
#include <string>
#include <string_view>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;

bool isLetter(unsigned char c) { return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z'); }

std::string soundex(std::string_view text) {
  static constexpr char kValue[] = "01230120022455012623010202";  // A to Z
  std::string code = "Z000";
  std::size_t i = 0;
  while (i < text.size() && !isLetter(static_cast<unsigned char>(text[i]))) ++i;
  if (i == text.size()) return code;
  const auto upper = [](char c) { return static_cast<char>(c >= 'a' ? c - 32 : c); };
  code[0] = upper(text[i]);
  char last = kValue[code[0] - 'A'];
  std::size_t n = 1;
  for (++i; i < text.size() && n < 4; ++i) {
    if (!isLetter(static_cast<unsigned char>(text[i]))) continue;
    const char value = kValue[upper(text[i]) - 'A'];
    if (value == last) continue;
    last = value;
    if (value != '0') code[n++] = value;
  }
  return code;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  const std::string_view all(reinterpret_cast<const char *>(data), size);
  const std::string_view a = upToNul(all);
  const std::string_view b = a.size() < all.size() ? upToNul(all.substr(a.size() + 1)) : "";

  for (const std::string_view text : {a, b}) {
    Call c("CLI_udfSOUNDEX");
    c.input(textBlock(text)).result(Block(5));
    ORV_CHECK(c.name(), c.run().empty());
    const std::string_view got = textIn(c.name(), c.out());
    ORV_CHECK(c.name(), got == soundex(text));
  }
  Call c("CLI_udfDIFFERENCE");
  c.input(textBlock(a)).input(textBlock(b)).result(Block(4));
  ORV_CHECK(c.name(), c.run().empty());
  const std::string ca = soundex(a), cb = soundex(b);
  std::int32_t same = 0;
  for (std::size_t i = 0; i < 4; ++i) same += ca[i] == cb[i] ? 1 : 0;
  const auto got = numberIn<std::int32_t>(c.out());
  ORV_CHECK(c.name(), got >= 0 && got <= 4 && got == same);
  return 0;
}
