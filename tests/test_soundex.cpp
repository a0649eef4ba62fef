// SOUNDEX and DIFFERENCE: names coded as the rules say, the codes against
// a model on random bytes, and no byte read past the one that completes
// the code.
#include <gtest/gtest.h>

#include <cctype>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;

Outcome n(std::int64_t v) { return ok(v); }

// ---- SOUNDEX and DIFFERENCE ---------------------------------------------

// The code as its steps tell it, with the groups looked up by name, before
// it is filled up with zeros: four characters once it is complete.
std::string soundexSoFar(const std::string &text) {
  const auto value = [](unsigned char c) -> int {
    if (!((c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z'))) return -1;
    const std::string groups[] = {"AEHIOUWY", "BFPV", "CGJKQSXZ", "DT", "L", "MN", "R"};
    for (int g = 0; g < 7; ++g) {
      if (groups[g].find(static_cast<char>(std::toupper(c))) != std::string::npos) return g;
    }
    return -1;
  };
  std::size_t i = 0;
  while (i < text.size() && value(static_cast<unsigned char>(text[i])) < 0) ++i;
  if (i == text.size()) return "";
  std::string code(1, static_cast<char>(std::toupper(static_cast<unsigned char>(text[i]))));
  int last = value(static_cast<unsigned char>(text[i]));
  for (++i; i < text.size() && code.size() < 4; ++i) {
    const int v = value(static_cast<unsigned char>(text[i]));
    if (v < 0 || v == last) continue;
    last = v;
    if (v != 0) code += static_cast<char>('0' + v);
  }
  return code;
}

std::string soundexModel(const std::string &text) {
  const std::string code = soundexSoFar(text);
  return code.empty() ? "Z000" : code + std::string(4 - code.size(), '0');
}

TEST(Soundex, CodesNamesAsTheRulesSay) {
  const std::pair<const char *, const char *> cases[] = {
      {"", "Z000"},
      {"123", "Z000"},
      {"Zoe", "Z000"},
      {"  a", "A000"},
      {"A1B2C3", "A120"},
      {"a b c d e", "A123"},
      {"Rupert", "R163"},
      {"Rubin", "R150"},
      {"Ashcroft", "A226"},
      {"Tymczak", "T522"},
      {"Pfister", "P236"},
      {"Honeyman", "H555"},
      {"Lloyd", "L300"},
      {"SMYTHE", "S530"},
      {"Gutierrez", "G362"},
      {"O'Brien", "O165"},
      {"Bhb", "B100"},
      {"B-b", "B000"},
      {"Ab Ab", "A110"},
      {"\xE9"
       "A",
       "A000"},
      {"abcdefghijklmnopqrstuvwxyz", "A123"},
  };
  for (const auto &[in, code] : cases) {
    EXPECT_EQ(call("CLI_udfSOUNDEX", {text(in)}, textArea(5)), ok(code)) << in;
  }
  const std::tuple<const char *, const char *, int> pairs[] = {
      {"Robert", "Rupert", 4}, {"Robert", "Smith", 0}, {"Smith", "Jones", 2}, {"Lee", "Leigh", 3},
      {"bc", "cb", 2},         {"", "Z", 4},           {"Ann", "Andrew", 2},
  };
  for (const auto &[a, b, same] : pairs) {
    EXPECT_EQ(call("CLI_udfDIFFERENCE", {text(a), text(b)}, intArea()), n(same)) << a << "/" << b;
  }
}

TEST(Soundex, AgreesWithTheModelOnRandomBytes) {
  std::mt19937 rng(31337);
  for (int round = 0; round < 20000; ++round) {
    std::string s(rng() % 12, ' ');
    for (char &c : s) c = static_cast<char>(1 + rng() % 255);  // letters, others, 0x80 and up
    if (round % 2 == 0) {
      for (char &c : s) c = "BbFfPpAaHhWwCcDdLlMmRr -"[rng() % 24];
    }
    const std::string other = s.substr(0, s.size() / 2) + "x";
    const std::string a = soundexModel(s), b = soundexModel(other);
    ASSERT_EQ(call("CLI_udfSOUNDEX", {text(s)}, textArea(5)), ok(a)) << testing::PrintToString(s);
    int same = 0;
    for (int i = 0; i < 4; ++i)
      same += a[static_cast<std::size_t>(i)] == b[static_cast<std::size_t>(i)];
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(s), text(other)}, intArea()), n(same));
  }
}

// Once the code has four characters the rest of the text is not read: a
// text cut right behind the byte that completes its code, with no
// terminator, against a page that can't be read, gives the whole text's
// code, alone and in both places of DIFFERENCE.
TEST(Soundex, ReadsNothingBehindTheByteThatCompletesTheCode) {
  orv::test::BytesBeforeAGuardPage first, second;
  std::mt19937 rng(4242);
  std::vector<std::string> texts = {"Robert",    "Rupert",    "Ashcraft",
                                    "Tymczak",   "a b c d e", "abcdefghijklmnopqrstuvwxyz",
                                    "Gutierrez", "McDonald"};
  for (int i = 0; i < 3000; ++i) {
    std::string s(1 + rng() % 14, ' ');
    for (char &c : s) c = "BbFfPpAaHhWwCcDdLlMmRrTt -1\xE9"[rng() % 28];
    texts.push_back(s);
  }
  int placed = 0;
  for (const std::string &name : texts) {
    std::size_t cut = 1;
    while (cut <= name.size() && soundexSoFar(name.substr(0, cut)).size() < 4) ++cut;
    if (cut > name.size()) continue;  // the code is never complete: the terminator is read
    const std::string head = name.substr(0, cut), code = soundexModel(name);
    ++placed;
    ASSERT_EQ(call("CLI_udfSOUNDEX", {placedAt(first.place(head))}, textArea(5)), ok(code)) << name;
    const std::string other = name.substr(cut - 1) + "q";
    int same = 0;
    for (std::size_t k = 0; k < 4; ++k) same += code[k] == soundexModel(other)[k] ? 1 : 0;
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {placedAt(first.place(head)), text(other)}, intArea()),
              n(same));
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(other), placedAt(second.place(head))}, intArea()),
              n(same));
  }
  EXPECT_GT(placed, 1000);
}

}  // namespace
