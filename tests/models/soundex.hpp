// SOUNDEX as its steps tell it, with the letter groups looked up by name:
// the reference that the unit tests compare SOUNDEX and DIFFERENCE with.
#pragma once

#include <cctype>
#include <string>
#include <string_view>

namespace orv::model {

// The code before it is filled up with zeros: four characters once it is
// complete, empty for a text without a letter.
inline std::string soundexSoFar(std::string_view text) {
  const auto value = [](char c) -> int {
    const auto u = static_cast<unsigned char>(c);
    if (!((u >= 'A' && u <= 'Z') || (u >= 'a' && u <= 'z'))) return -1;
    const std::string_view groups[] = {"AEHIOUWY", "BFPV", "CGJKQSXZ", "DT", "L", "MN", "R"};
    for (int g = 0; g < 7; ++g) {
      if (groups[g].find(static_cast<char>(std::toupper(u))) != std::string_view::npos) return g;
    }
    return -1;
  };
  std::size_t i = 0;
  while (i < text.size() && value(text[i]) < 0) ++i;
  if (i == text.size()) return "";
  std::string code(1, static_cast<char>(std::toupper(static_cast<unsigned char>(text[i]))));
  int last = value(text[i]);
  for (++i; i < text.size() && code.size() < 4; ++i) {
    const int v = value(text[i]);
    if (v < 0 || v == last) continue;
    last = v;
    if (v != 0) code += static_cast<char>('0' + v);
  }
  return code;
}

inline std::string soundex(std::string_view text) {
  const std::string code = soundexSoFar(text);
  return code.empty() ? "Z000" : code + std::string(4 - code.size(), '0');
}

// DIFFERENCE: how many of the four characters of the two codes agree.
inline int difference(std::string_view a, std::string_view b) {
  const std::string x = soundex(a), y = soundex(b);
  int same = 0;
  for (std::size_t k = 0; k < 4; ++k) same += x[k] == y[k] ? 1 : 0;
  return same;
}

}  // namespace orv::model
