// The Soundex code shared by SOUNDEX and DIFFERENCE.
//
// This form differs from others in three ways: H and W count as vowels, so
// they separate two consonants of one group; bytes that are no letters
// are passed over without any effect; and a text without a letter has the
// code Z000.  Letters are the ASCII letters by value; every other byte,
// 0x80 and up included, is no letter.
#pragma once

#include <array>
#include <cstdint>

namespace cli::str {

// The value of each byte: 0 to 6 for a letter, kNoLetter for any other.
inline constexpr std::uint8_t kNoLetter = 0xFF;
inline constexpr std::array<std::uint8_t, 256> kSoundexValues = [] {
  std::array<std::uint8_t, 256> v{};
  v.fill(kNoLetter);
  const char *groups[] = {"AEHIOUWY", "BFPV", "CGJKQSXZ", "DT", "L", "MN", "R"};
  for (std::uint8_t value = 0; value < 7; ++value) {
    for (const char *c = groups[value]; *c != '\0'; ++c) {
      v[static_cast<unsigned char>(*c)] = value;
      v[static_cast<unsigned char>(*c - 'A' + 'a')] = value;
    }
  }
  return v;
}();

// Fills the four bytes of `code` from the terminated `text`.
inline void CLI_soundexCode(const char *text, char *code) noexcept {
  code[0] = 'Z';
  code[1] = code[2] = code[3] = '0';
  const auto *p = reinterpret_cast<const unsigned char *>(text);
  while (*p != 0 && kSoundexValues[*p] == kNoLetter) ++p;
  if (*p == 0) return;
  code[0] = static_cast<char>(*p & ~0x20);  // upper case by the ASCII rule
  std::uint8_t last = kSoundexValues[*p];
  int n = 1;
  // The count is tested before the byte: once the code is complete,
  // nothing behind the byte that completed it is read.
  for (++p; n < 4 && *p != 0; ++p) {
    const std::uint8_t value = kSoundexValues[*p];
    if (value == kNoLetter || value == last) continue;
    last = value;
    if (value != 0) code[n++] = static_cast<char>('0' + value);
  }
}

}  // namespace cli::str
