// SOUNDEX and DIFFERENCE: the codes against a model (tests/models/soundex.hpp)
// on random bytes, and no byte read past the one that completes the code.
#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>

#include "models/soundex.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;
using orv::model::soundex;

Outcome n(std::int64_t v) { return ok(v); }

// A few codes worked out by hand, one for each rule that the model
// encodes: H and W separate letters of one group, other bytes don't, the
// first letter's group counts, no letter gives Z000, bytes above 127 are
// no letters.
TEST(Soundex, CodesNamesAsTheRulesSay) {
  const std::pair<const char *, const char *> cases[] = {
      {"", "Z000"},       {"Zoe", "Z000"},     {"Ashcroft", "A226"}, {"Pfister", "P236"},
      {"Bhb", "B100"},    {"B-b", "B000"},     {"Ab Ab", "A110"},    {"A1B2C3", "A120"},
      {"\xE9-A", "A000"}, {"Tymczak", "T522"},
  };
  for (const auto &[in, code] : cases) {
    EXPECT_EQ(call("CLI_udfSOUNDEX", {text(in)}, textArea(5)), ok(code)) << in;
    EXPECT_EQ(soundex(in), code) << in;
  }
  EXPECT_EQ(call("CLI_udfDIFFERENCE", {text("Smith"), text("Jones")}, intArea()), n(2));
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
    ASSERT_EQ(call("CLI_udfSOUNDEX", {text(s)}, textArea(5)), ok(soundex(s)))
        << testing::PrintToString(s);
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(s), text(other)}, intArea()),
              n(orv::model::difference(s, other)));
  }
}

// Once the code has four characters the rest of the text is not read: a
// text cut right behind the byte that completes its code, with no
// terminator, against a page that can't be read, gives the whole text's
// code, alone and in both places of DIFFERENCE.
TEST(Soundex, ReadsNothingBehindTheByteThatCompletesTheCode) {
  orv::test::BytesBeforeAGuardPage first, second;
  std::mt19937 rng(4242);
  int placed = 0;
  for (int i = 0; i < 3000; ++i) {
    std::string name(1 + rng() % 14, ' ');
    for (char &c : name) c = "BbFfPpAaHhWwCcDdLlMmRrTt -1\xE9"[rng() % 28];
    std::size_t cut = 1;
    while (cut <= name.size() && orv::model::soundexSoFar(name.substr(0, cut)).size() < 4) ++cut;
    if (cut > name.size()) continue;  // the code is never complete: the terminator is read
    const std::string head = name.substr(0, cut), other = name.substr(cut - 1) + "q";
    ++placed;
    ASSERT_EQ(call("CLI_udfSOUNDEX", {placedAt(first.place(head))}, textArea(5)), ok(soundex(name)))
        << name;
    const Outcome same = n(orv::model::difference(name, other));
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {placedAt(first.place(head)), text(other)}, intArea()),
              same);
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(other), placedAt(second.place(head))}, intArea()),
              same);
  }
  EXPECT_GT(placed, 1000);
}

}  // namespace
