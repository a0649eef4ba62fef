// SOUNDEX and DIFFERENCE of two texts.
//
// Input: the first text up to the first NUL, the second text behind it up
// to the next.  Both routines are checked against the unit tests' model
// (tests/models/soundex.hpp); neither may change its inputs or fail.
#include <cstdint>
#include <string>
#include <string_view>

#include "harness.hpp"
#include "models/soundex.hpp"

using namespace orv::fuzz;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  const std::string_view all(reinterpret_cast<const char *>(data), size);
  const std::string_view a = upToNul(all);
  const std::string_view b = a.size() < all.size() ? upToNul(all.substr(a.size() + 1)) : "";

  for (const std::string_view text : {a, b}) {
    Call c("CLI_udfSOUNDEX");
    c.input(textBlock(text)).result(Block(5));
    ORV_CHECK(c.name(), c.run().empty());
    ORV_CHECK(c.name(), textIn(c.name(), c.out()) == orv::model::soundex(text));
  }
  Call c("CLI_udfDIFFERENCE");
  c.input(textBlock(a)).input(textBlock(b)).result(Block(4));
  ORV_CHECK(c.name(), c.run().empty());
  ORV_CHECK(c.name(), numberIn<std::int32_t>(c.out()) == orv::model::difference(a, b));
  return 0;
}
