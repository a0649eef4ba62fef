// SPACE's siblings: LCASE, RTRIM, LTRIM, LEFT, RIGHT, REPEAT, CHAR, ASCII,
// in both string layouts.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "support/frame_call.hpp"

namespace {

using namespace orv::test;
using namespace std::string_literals;

struct Case {
  const char *routine;
  std::vector<Value> inputs;
  Value result;
  Outcome expected;
};

void check(const std::vector<Case> &cases) {
  for (const Case &c : cases) {
    EXPECT_EQ(call(c.routine, c.inputs, c.result), c.expected)
        << c.routine << " on " << ::testing::PrintToString(c.inputs.front().bytes);
  }
}

const std::string k4000(4000, 'x');

std::string times(const std::string &s, std::int32_t count) {
  std::string out;
  for (std::int32_t i = 0; i < count; ++i) out += s;
  return out;
}

TEST(CaseAndTrim, WorkOnBytesAndOnlySpaceAndTabAreBlanks) {
  check({
      {"CLI_udfLCASE1", {text("ABC xyz \xC4")}, textArea(), ok("abc xyz \xC4")},
      {"CLI_udfLCASE2", {lob("A\0B"s)}, lobArea(), ok("a\0b"s)},
      {"CLI_udfRTRIM1", {text(" a b \t \t")}, textArea(), ok(" a b")},
      {"CLI_udfRTRIM1", {text(" \t ")}, textArea(), ok("")},
      {"CLI_udfRTRIM1", {text("a\n\r\v\f")}, textArea(), ok("a\n\r\v\f")},
      {"CLI_udfRTRIM2", {lob("a\0 \t"s)}, lobArea(), ok("a\0"s)},
      {"CLI_udfRTRIM2", {lob("\0"s)}, lobArea(), ok("\0"s)},
      {"CLI_udfLTRIM1", {text(" \ta \t")}, textArea(), ok("a \t")},
      {"CLI_udfLTRIM1", {text("\r a")}, textArea(), ok("\r a")},
      {"CLI_udfLTRIM2", {lob(" \0 a"s)}, lobArea(), ok("\0 a"s)},
  });
}

TEST(LeftAndRight, GiveExactlyNBytesWithBlanksBehindAndCheckTheirLimits) {
  check({
      {"CLI_udfLEFT1", {text("abc"), i32(5)}, textArea(), ok("abc  ")},
      {"CLI_udfLEFT1", {text("abc"), i32(4000)}, textArea(), ok("abc" + std::string(3997, ' '))},
      {"CLI_udfLEFT1", {text("abc"), i32(4001)}, textArea(), fails("01")},
      {"CLI_udfLEFT1", {text("abc"), i32(-1)}, textArea(), fails("01")},
      {"CLI_udfLEFT2", {lob("a\0c"s), i32(5)}, lobArea(10), ok("a\0c  "s)},
      {"CLI_udfLEFT2", {lob("abc"), i32(9)}, lobArea(10), ok("abc      ")},
      {"CLI_udfLEFT2", {lob("abc"), i32(10)}, lobArea(10), fails("01")},
      {"CLI_udfLEFT2", {lob("abc"), i32(0)}, lobArea(0), fails("01")},
      {"CLI_udfLEFT2", {lob("abc"), i32(-1)}, lobArea(10), fails("01")},
      {"CLI_udfRIGHT1", {text("abc"), i32(5)}, textArea(), ok("abc  ")},
      {"CLI_udfRIGHT1", {text(k4000), i32(4000)}, textArea(), ok(k4000)},
      {"CLI_udfRIGHT1", {text("abc"), i32(4001)}, textArea(), fails("01")},
      {"CLI_udfRIGHT1", {text("abc"), i32(-1)}, textArea(), fails("01")},
      {"CLI_udfRIGHT2", {lob("abc"), i32(5)}, lobArea(5), ok("abc  ")},
      {"CLI_udfRIGHT2", {lob("a\0bc"s), i32(3)}, lobArea(10), ok("\0bc"s)},
      {"CLI_udfRIGHT2", {lob("abc"), i32(10)}, lobArea(10), ok("abc       ")},
      {"CLI_udfRIGHT2", {lob("abc"), i32(11)}, lobArea(10), fails("01")},
      {"CLI_udfRIGHT2", {lob("abc"), i32(0)}, lobArea(0), ok("")},
      {"CLI_udfRIGHT2", {lob("abc"), i32(-1)}, lobArea(10), fails("01")},
  });
}

TEST(Repeat, BuildsUpToItsLimitAndIgnoresTheCountOfEmptyInput) {
  check({
      {"CLI_udfREPEAT1", {text("ab"), i32(3)}, textArea(), ok("ababab")},
      {"CLI_udfREPEAT1", {text("abc"), i32(1333)}, textArea(), ok(times("abc", 1333))},
      {"CLI_udfREPEAT1", {text("abc"), i32(1334)}, textArea(), fails("10")},
      {"CLI_udfREPEAT1", {text(k4000), i32(1)}, textArea(), ok(k4000)},
      {"CLI_udfREPEAT1", {text(k4000), i32(2)}, textArea(), fails("10")},
      {"CLI_udfREPEAT1", {text(""), i32(-1)}, textArea(), ok("")},
      {"CLI_udfREPEAT1", {text("a"), i32(-1)}, textArea(), fails("10")},
      {"CLI_udfREPEAT1", {text(k4000 + "y"), i32(0)}, textArea(), ok("")},
      {"CLI_udfREPEAT2", {lob("a\0"s), i32(2)}, lobArea(), ok("a\0a\0"s)},
      {"CLI_udfREPEAT2", {lob("z"), i32(1048576)}, lobArea(), ok(std::string(1048576, 'z'))},
      {"CLI_udfREPEAT2", {lob("z"), i32(1048577)}, lobArea(), fails("10")},
      {"CLI_udfREPEAT2", {lob(""), i32(-5)}, lobArea(), ok("")},
  });
}

TEST(CharAndAscii, MapBetweenBytesAndCodes) {
  for (std::int32_t v = -2; v <= 257; ++v) {
    const char expected = v == 0 ? ' ' : (v < 0 || v > 255) ? '\xFF' : static_cast<char>(v);
    EXPECT_EQ(call("CLI_udfCHAR", {i32(v)}, textArea(2)), ok(std::string(1, expected))) << v;
  }
  EXPECT_EQ(call("CLI_udfCHAR", {i32(INT32_MIN)}, textArea(2)), ok("\xFF"));
  for (const char *routine : {"CLI_udfASCII1", "CLI_udfASCII2"}) {
    EXPECT_EQ(call(routine, {text("\xC4x")}, intArea()), ok(std::int64_t{196}));
    EXPECT_EQ(call(routine, {text("A")}, intArea()), ok(std::int64_t{65}));
    EXPECT_EQ(call(routine, {text("")}, intArea()), ok(std::int64_t{0}));
  }
  EXPECT_EQ(call("CLI_udfASCII3", {lob("")}, intArea()), ok(std::int64_t{0}));
  EXPECT_EQ(call("CLI_udfASCII3", {lob("\0a"s)}, intArea()), ok(std::int64_t{0}));
  EXPECT_EQ(call("CLI_udfASCII3", {lob("\xFF")}, intArea()), ok(std::int64_t{255}));
}

// Small models of every routine, to compare with on random inputs.
using Model = std::function<Outcome(const std::string &s, std::int32_t n, std::uint32_t capacity)>;

Outcome padded(std::string s, std::size_t n) {
  s.resize(std::max(s.size(), n), ' ');
  return ok(s);
}

Outcome repeated(const std::string &s, std::int32_t count, std::size_t limit) {
  if (s.empty()) return ok("");
  if (count < 0 || static_cast<std::size_t>(count) * s.size() > limit) return fails("10");
  return ok(times(s, count));
}

struct Subject {
  const char *routine;
  bool lobForm;
  bool takesN;
  Model model;
};

const std::vector<Subject> &subjects() {
  static const auto lower = [](const std::string &s, std::int32_t, std::uint32_t) {
    std::string out = s;
    for (char &c : out) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return ok(out);
  };
  static const auto rtrim = [](const std::string &s, std::int32_t, std::uint32_t) {
    const auto end = s.find_last_not_of(" \t");
    return ok(end == std::string::npos ? "" : s.substr(0, end + 1));
  };
  static const auto ltrim = [](const std::string &s, std::int32_t, std::uint32_t) {
    const auto start = s.find_first_not_of(" \t");
    return ok(start == std::string::npos ? "" : s.substr(start));
  };
  // n may run from 0 to `highest`, which is -1 for a capacity of 0.
  static const auto left = [](const std::string &s, std::int32_t n, std::int64_t highest) {
    if (n < 0 || n > highest) return fails("01");
    return padded(s.substr(0, static_cast<std::size_t>(n)), static_cast<std::size_t>(n));
  };
  static const auto right = [](const std::string &s, std::int32_t n, std::int64_t highest) {
    if (n < 0 || n > highest) return fails("01");
    const auto width = static_cast<std::size_t>(n);
    return width <= s.size() ? ok(s.substr(s.size() - width)) : padded(s, width);
  };
  static const auto first = [](const std::string &s, std::int32_t, std::uint32_t) {
    return ok(std::int64_t{s.empty() ? 0 : static_cast<unsigned char>(s[0])});
  };
  static const std::vector<Subject> all = {
      {"CLI_udfLCASE1", false, false, lower},
      {"CLI_udfLCASE2", true, false, lower},
      {"CLI_udfRTRIM1", false, false, rtrim},
      {"CLI_udfRTRIM2", true, false, rtrim},
      {"CLI_udfLTRIM1", false, false, ltrim},
      {"CLI_udfLTRIM2", true, false, ltrim},
      {"CLI_udfLEFT1", false, true, [](auto &s, auto n, auto) { return left(s, n, 4000); }},
      {"CLI_udfLEFT2", true, true,
       [](auto &s, auto n, auto cap) { return left(s, n, std::int64_t{cap} - 1); }},
      {"CLI_udfRIGHT1", false, true, [](auto &s, auto n, auto) { return right(s, n, 4000); }},
      {"CLI_udfRIGHT2", true, true, [](auto &s, auto n, auto cap) { return right(s, n, cap); }},
      {"CLI_udfREPEAT1", false, true, [](auto &s, auto n, auto) { return repeated(s, n, 4000); }},
      {"CLI_udfREPEAT2", true, true, [](auto &s, auto n, auto) { return repeated(s, n, 1048576); }},
      {"CLI_udfASCII1", false, false, first},
      {"CLI_udfASCII2", false, false, first},
      {"CLI_udfASCII3", true, false, first},
  };
  return all;
}

// Random strings over a small alphabet of blanks, letters of both cases,
// a byte above 127 and, in CLI_udfLob strings, NUL; counts around lengths
// and limits.
TEST(BasicStrings, AgreeWithSmallModelsOnRandomInputs) {
  constexpr unsigned kSeed = 20261122;
  std::mt19937 random(kSeed);
  const auto pick = [&](int lo, int hi) {
    return std::uniform_int_distribution<int>(lo, hi)(random);
  };
  for (const Subject &s : subjects()) {
    SCOPED_TRACE(std::string(s.routine) + ", seed " + std::to_string(kSeed));
    const std::string alphabet = s.lobForm ? " \tAaZz\xC4\0"s : " \tAaZz\xC4"s;
    for (int round = 0; round < 300; ++round) {
      std::string input(static_cast<std::size_t>(pick(0, 12)), ' ');
      for (char &c : input)
        c = alphabet[static_cast<std::size_t>(pick(0, int(alphabet.size()) - 1))];
      const int len = static_cast<int>(input.size());
      std::int32_t n = pick(-2, len + 3);
      const bool repeat = std::string(s.routine).starts_with("CLI_udfREPEAT");
      if (repeat && len > 0 && pick(0, 3) == 0)
        n = (s.lobForm ? 1048576 : 4000) / len + pick(-1, 1);
      const auto capacity =
          s.lobForm && s.takesN && !repeat ? static_cast<std::uint32_t>(pick(0, 16)) : 1048576u;
      const bool integer = std::string(s.routine).starts_with("CLI_udfASCII");
      const Value shape = integer ? intArea() : s.lobForm ? lobArea(capacity) : textArea();
      std::vector<Value> inputs = {s.lobForm ? lob(input) : text(input)};
      if (s.takesN) inputs.push_back(i32(n));
      EXPECT_EQ(call(s.routine, inputs, shape), s.model(input, n, capacity))
          << ::testing::PrintToString(input) << " n=" << n << " capacity=" << capacity;
    }
  }
}

}  // namespace
