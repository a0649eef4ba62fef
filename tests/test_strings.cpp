// SPACE's siblings: LCASE, RTRIM, LTRIM, LEFT, RIGHT, REPEAT, CHAR, ASCII,
// in both string layouts, against small models on random inputs.
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

std::string times(const std::string &s, std::int32_t count) {
  std::string out;
  for (std::int32_t i = 0; i < count; ++i) out += s;
  return out;
}

// What random inputs don't reach: text of 4000 bytes and more, counts at
// the terminated-text limit, and every code that CHAR takes.
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
    EXPECT_EQ(call(c.routine, {text(c.input), i32(c.n)}, textArea()), c.expected)
        << c.routine << " of " << c.input.size() << " bytes, " << c.n;
  }
  for (std::int32_t v = -2; v <= 257; ++v) {
    const char expected = v == 0 ? ' ' : (v < 0 || v > 255) ? '\xFF' : static_cast<char>(v);
    EXPECT_EQ(call("CLI_udfCHAR", {i32(v)}, textArea(2)), ok(std::string(1, expected))) << v;
  }
  EXPECT_EQ(call("CLI_udfCHAR", {i32(INT32_MIN)}, textArea(2)), ok("\xFF"));
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
  for (const Subject &s : subjects()) {
    SCOPED_TRACE(std::string(s.routine) + ", seed " + std::to_string(kSeed));
    const std::string alphabet = s.lobForm ? " \t\n\r\v\fAaZz@[\xC4\0"s : " \t\n\r\v\fAaZz@[\xC4"s;
    for (int round = 0; round < 300; ++round) {
      std::string input(static_cast<std::size_t>(pick(0, 12)), ' ');
      for (char &c : input)
        c = alphabet[static_cast<std::size_t>(pick(0, int(alphabet.size()) - 1))];
      const int len = static_cast<int>(input.size());
      std::int32_t n = pick(-2, len + 3);
      const bool repeat = std::string(s.routine).starts_with("CLI_udfREPEAT");
      if (repeat && len > 0 && pick(0, 3) == 0)
        n = (s.lobForm ? 1048576 : 4000) / len + pick(-1, 1);
      // LEFT2 and RIGHT2 go by their area's capacity; the others by a fixed
      // limit, and only REPEAT2's results need the whole area.
      const auto capacity = s.lobForm && s.takesN && !repeat
                                ? static_cast<std::uint32_t>(pick(0, 16))
                            : repeat ? 1048576u
                                     : 64u;
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
