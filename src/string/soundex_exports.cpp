// Exports of SOUNDEX and DIFFERENCE, over the one shared Soundex code.
// Neither can fail, and neither writes a status.
#include <cstdint>

#include "frame/frame.hpp"
#include "string/soundex.hpp"

using cli::Ind;
using cli::NameArg;

CLI_EXPORT void CLI_udfSOUNDEX(const char *text, char *result, Ind, Ind, char *, NameArg, NameArg,
                               char *) noexcept {
  cli::str::CLI_soundexCode(text, result);
  result[4] = '\0';
}

// How many of the four positions hold the same byte, each counting 1.
CLI_EXPORT void CLI_udfDIFFERENCE(const char *a, const char *b, std::int32_t *result, Ind, Ind, Ind,
                                  char *, NameArg, NameArg, char *) noexcept {
  char first[4], second[4];
  cli::str::CLI_soundexCode(a, first);
  cli::str::CLI_soundexCode(b, second);
  std::int32_t same = 0;
  for (int i = 0; i < 4; ++i) same += first[i] == second[i] ? 1 : 0;
  *result = same;
}
