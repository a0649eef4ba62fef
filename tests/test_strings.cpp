// SPACE's siblings: LCASE, RTRIM, LTRIM, LEFT, RIGHT, REPEAT, CHAR, ASCII,
// in both string layouts, against small models on random inputs; SOUNDEX
// and DIFFERENCE against a model (tests/models/soundex.hpp) on random
// bytes, and no byte read past the one that completes the code.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "models/soundex.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;
using namespace std::string_literals;

// What random inputs don't reach: text of 4000 bytes and more, counts at
// the terminated-text limit, and every code that CHAR and SPACE take.
TEST(BasicStrings, KeepTheTerminatedTextLimits) {
  const std::string k4000(4000, 'x');
  const struct {
    const char *routine;
    std::string input;
    std::int32_t n;
    Outcome expected;
  } cases[] = {
      {"CLI_udfLEFT1", "abc", 4000, ok("abc" + std::string(3997, ' '))},
      {"CLI_udfLEFT1", "abc", 4001, fails("01")},
      {"CLI_udfRIGHT1", k4000, 4000, ok(k4000)},
      {"CLI_udfRIGHT1", "abc", 4001, fails("01")},
      {"CLI_udfREPEAT1", k4000, 1, ok(k4000)},
      {"CLI_udfREPEAT1", k4000, 2, fails("10")},
      {"CLI_udfREPEAT1", k4000 + "y", 0, ok("")},
  };
  for (const auto &c : cases) {
    EXPECT_EQ(call(c.routine, {text(c.input), i32(c.n)}), c.expected)
        << c.routine << " of " << c.input.size() << " bytes, " << c.n;
  }
  for (std::int32_t v = -2; v <= 257; ++v) {
    const char expected = v == 0 ? ' ' : (v < 0 || v > 255) ? '\xFF' : static_cast<char>(v);
    EXPECT_EQ(call("CLI_udfCHAR", {i32(v)}), ok(std::string(1, expected))) << v;
  }
  EXPECT_EQ(call("CLI_udfCHAR", {i32(INT32_MIN)}), ok("\xFF"));
  for (const std::int32_t n : {0, 3, 4000, 4001, -1, INT32_MAX, INT32_MIN}) {
    EXPECT_EQ(call("CLI_udfSPACE", {i32(n)}),
              n >= 0 && n <= 4000 ? ok(std::string(static_cast<std::size_t>(n), ' ')) : fails("01"))
        << n;
  }
}

// Each routine written out: its result for the string s and the count n,
// in the terminated-text form or the CLI_udfLob form, whose LEFT and RIGHT
// go by a result area of `capacity` bytes.
Outcome model(const std::string &routine, bool lobForm, std::string s, std::int32_t n,
              std::uint32_t capacity) {
  const auto is = [&](const char *family) { return routine.starts_with(family); };
  if (is("LCASE")) {
    for (char &c : s) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return ok(s);
  }
  if (is("RTRIM")) return ok(s.erase(s.find_last_not_of(" \t") + 1));
  if (is("LTRIM")) return ok(s.erase(0, s.find_first_not_of(" \t")));
  if (is("ASCII")) return ok(std::int64_t{s.empty() ? 0 : static_cast<unsigned char>(s[0])});
  if (is("REPEAT")) {
    if (s.empty()) return ok("");
    if (n < 0 || static_cast<std::size_t>(n) * s.size() > (lobForm ? 1048576u : 4000u)) {
      return fails("10");
    }
    std::string out;
    while (n-- > 0) out += s;
    return ok(out);
  }
  // LEFT and RIGHT: n from 0 to 4000, or to the capacity (LEFT2 one less).
  const std::int64_t highest = !lobForm ? 4000 : std::int64_t{capacity} - (is("LEFT") ? 1 : 0);
  if (n < 0 || n > highest) return fails("01");
  const auto width = static_cast<std::size_t>(n);
  if (is("RIGHT") && width < s.size()) s.erase(0, s.size() - width);
  s.resize(width, ' ');
  return ok(s);
}

// Random strings over a small alphabet of the two blanks, the other white
// space (which no trim cuts), the first and last letters of both cases and
// their neighbours, a byte above 127 and, in CLI_udfLob strings, NUL;
// counts around lengths and limits.
TEST(BasicStrings, AgreeWithSmallModelsOnRandomInputs) {
  constexpr unsigned kSeed = 20261122;
  std::mt19937 random(kSeed);
  const auto pick = [&](int lo, int hi) {
    return std::uniform_int_distribution<int>(lo, hi)(random);
  };
  for (const std::string routine :
       {"LCASE1", "LCASE2", "RTRIM1", "RTRIM2", "LTRIM1", "LTRIM2", "LEFT1", "LEFT2", "RIGHT1",
        "RIGHT2", "REPEAT1", "REPEAT2", "ASCII1", "ASCII2", "ASCII3"}) {
    const bool lobForm = routine.back() == (routine.starts_with("ASCII") ? '3' : '2');
    SCOPED_TRACE(routine + ", seed " + std::to_string(kSeed));
    const bool repeat = routine.starts_with("REPEAT");
    const bool takesN = repeat || routine.starts_with("LEFT") || routine.starts_with("RIGHT");
    const std::string alphabet = lobForm ? " \t\n\r\v\fAaZz@[\xC4\0"s : " \t\n\r\v\fAaZz@[\xC4"s;
    for (int round = 0; round < 300; ++round) {
      std::string input(static_cast<std::size_t>(pick(0, 12)), ' ');
      for (char &c : input)
        c = alphabet[static_cast<std::size_t>(pick(0, int(alphabet.size()) - 1))];
      const int len = static_cast<int>(input.size());
      std::int32_t n = pick(-2, len + 3);
      if (repeat && len > 0 && pick(0, 3) == 0) n = (lobForm ? 1048576 : 4000) / len + pick(-1, 1);
      // LEFT2 and RIGHT2 go by their area's capacity; the others by a fixed
      // limit, and only REPEAT2's results need the whole area.
      const auto capacity = lobForm && takesN && !repeat ? static_cast<std::uint32_t>(pick(0, 16))
                            : repeat                     ? 1048576u
                                                         : 64u;
      const bool integer = routine.starts_with("ASCII");
      const Value shape = integer ? intArea() : lobForm ? lobArea(capacity) : textArea();
      std::vector<Value> inputs = {lobForm ? lob(input) : text(input)};
      if (takesN) inputs.push_back(i32(n));
      EXPECT_EQ(call(("CLI_udf" + routine).c_str(), inputs, shape),
                model(routine, lobForm, input, n, capacity))
          << ::testing::PrintToString(input) << " n=" << n << " capacity=" << capacity;
    }
  }
}

using orv::model::soundex;

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
    EXPECT_EQ(call("CLI_udfSOUNDEX", {text(in)}), ok(code)) << in;
    EXPECT_EQ(soundex(in), code) << in;
  }
  EXPECT_EQ(call("CLI_udfDIFFERENCE", {text("Smith"), text("Jones")}), ok(2));
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
    ASSERT_EQ(call("CLI_udfSOUNDEX", {text(s)}), ok(soundex(s))) << testing::PrintToString(s);
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(s), text(other)}),
              ok(orv::model::difference(s, other)));
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
    ASSERT_EQ(call("CLI_udfSOUNDEX", {placedAt(first.place(head))}), ok(soundex(name))) << name;
    const Outcome same = ok(orv::model::difference(name, other));
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {placedAt(first.place(head)), text(other)}), same);
    ASSERT_EQ(call("CLI_udfDIFFERENCE", {text(other), placedAt(second.place(head))}), same);
  }
  EXPECT_GT(placed, 1000);
}

}  // namespace
