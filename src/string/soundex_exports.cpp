// SOUNDEX and DIFFERENCE, over the one shared Soundex code.  Neither can
// fail, and neither writes a status.
#include <cstdint>

#include "frame/frame.hpp"
#include "routines.hpp"
#include "string/soundex.hpp"

namespace cli {

Report routine::SOUNDEX(TextIn string, TextOut result) noexcept {
  str::CLI_soundexCode(string.chars(), result.chars());
  result.finish(4);
  return {};
}

// How many of the four positions hold the same byte, each counting 1.
Answer<std::int32_t> routine::DIFFERENCE(TextIn a, TextIn b) noexcept {
  char first[4], second[4];
  str::CLI_soundexCode(a.chars(), first);
  str::CLI_soundexCode(b.chars(), second);
  std::int32_t same = 0;
  for (int i = 0; i < 4; ++i) same += first[i] == second[i] ? 1 : 0;
  return success(same);
}

}  // namespace cli
