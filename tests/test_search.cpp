// LOCATE, REPLACE and INSERT: every form against naive left-to-right
// models (tests/models/search.hpp) on small alphabets, where matches and
// near-matches are frequent, and the limits that random inputs don't reach.
#include <gtest/gtest.h>
#include <pthread.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "models/search.hpp"
#include "string/search.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;

Outcome n(std::int64_t v) { return ok(v); }

// What the random inputs below don't reach: starts, lengths and results at
// the limits of each layout, and a search string longer than 4000 bytes.
TEST(LocateReplaceInsert, KeepTheirLimits) {
  const std::string a3999b = std::string(3999, 'a') + "b";
  // clang-format off
  const struct {
    const char *routine;
    std::vector<Value> in;
    Value result;
    Outcome want;
  } cases[] = {
      {"CLI_udfLOCATE1", {text("b"), text("abcb"), i32(4001)}, intArea(), fails("01")},
      {"CLI_udfLOCATE1", {text("b"), text("abcb"), i32(4000)}, intArea(), n(0)},
      {"CLI_udfLOCATE2", {lob("b"), lob("abcb"), i32(1048577)}, intArea(), fails("01")},
      {"CLI_udfLOCATE3", {text(a3999b), text(std::string(5000, 'a') + "b")}, intArea(), n(1002)},
      {"CLI_udfREPLACE1", {text(std::string(4000, 'x')), text("x"), text("y")}, textArea(), ok(std::string(4000, 'y'))},
      // A failure leaves the pieces so far as terminated text, for a one-byte search string too.
      {"CLI_udfREPLACE1", {text("ab" + std::string(3998, 'x')), text("x"), text("yy")}, textArea(), failsLeaving("10", "ab" + std::string(3998, 'y'))},
      {"CLI_udfREPLACE1", {text("ab" + std::string(3998, 'x')), text("a"), text("cc")}, textArea(), failsLeaving("10", "cc")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(2), text("XY")}, textArea(), ok("abXYef")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(0), text("XY")}, textArea(), ok("abXYcdef")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(6), i32(5), text("XY")}, textArea(), ok("abcdeXY")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(7), i32(0), text("XY")}, textArea(), fails("10")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(0), i32(0), text("XY")}, textArea(), fails("01")},
      {"CLI_udfINSERT1", {text(""), i32(1), i32(0), text("XY")}, textArea(), fails("10")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(-1), text("XY")}, textArea(), fails("01")},
      // A deletion longer than source and new string: only the CLI_udfLob form's check wraps.
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(100), text("XY")}, textArea(), ok("abXY")},
      {"CLI_udfINSERT2", {lob("abcdef"), i32(3), i32(100), lob("XY")}, lobArea(200), fails("10")},
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(-5000), text("XY")}, textArea(), fails("10")},
      // A length that would wrap p + l.
      {"CLI_udfINSERT1", {text("abcdef"), i32(3), i32(2147483647), text("XY")}, textArea(), fails("01")},
      // Past the end from a start below 1: the result length's 10 wins over the start's 01.
      {"CLI_udfINSERT1", {text("abcdef"), i32(0), i32(8), text(std::string(4002, 'n'))}, textArea(), fails("10")},
      {"CLI_udfINSERT2", {lob("abcdef"), i32(0), i32(8), lob("0123456789abcd")}, lobArea(12), fails("10")},
  };
  // clang-format on
  for (const auto &c : cases) EXPECT_EQ(call(c.routine, c.in, c.result), c.want) << c.routine;
  // Past the limit with nothing written: the length word holds the source's.
  EXPECT_EQ(
      call("CLI_udfREPLACE2", {lob(std::string(1048577, 'x')), lob(""), lob("y")}, lobArea()).error,
      "10");
}

Outcome inserted(bool lobForm, const std::string &in, std::int64_t p, std::int64_t l,
                 const std::string &add, std::int64_t limit) {
  const orv::model::Inserted r = orv::model::insert(lobForm, in, p, l, add, limit);
  return r.code.empty() ? ok(r.bytes) : fails(r.code);
}

std::string randomText(std::mt19937 &rng, const char *alphabet, std::size_t maxLength) {
  std::string s(std::uniform_int_distribution<std::size_t>(0, maxLength)(rng), ' ');
  const std::size_t k = std::char_traits<char>::length(alphabet);
  for (char &c : s) c = alphabet[std::uniform_int_distribution<std::size_t>(0, k - 1)(rng)];
  return s;
}

TEST(LocateReplaceInsert, AgreeWithNaiveModelsOnSmallAlphabets) {
  std::mt19937 rng(5150);
  int failures = 0;
  const auto check = [&](const Outcome &got, const Outcome &want, const std::string &what) {
    if (got != want && ++failures <= 10) {
      ADD_FAILURE() << what << ": got " << testing::PrintToString(got) << ", want "
                    << testing::PrintToString(want);
    }
  };
  for (int round = 0; round < 6000; ++round) {
    const char *alphabet = round % 3 == 0 ? "ab" : round % 3 == 1 ? "aab" : "abc";
    // Short needles, and long ones cut from the haystack with a byte
    // changed now and then, so that long partial matches are frequent.
    const bool longer = round % 2 == 1;
    const std::string hay = randomText(rng, alphabet, longer ? 90 : 24);
    std::string needle = randomText(rng, alphabet, 4);
    if (longer && hay.size() > 2) {
      const std::size_t from = rng() % (hay.size() - 1);
      needle = hay.substr(from, 1 + rng() % 24);
      if (rng() % 2 == 0) needle[rng() % needle.size()] ^= 3;
    }
    const std::string by = randomText(rng, "xy", 3);
    std::string lobHay = hay, lobNeedle = needle;  // NUL bytes for the CLI_udfLob forms
    if (round % 4 == 0 && !lobHay.empty()) lobHay[rng() % lobHay.size()] = '\0';
    if (round % 8 == 0 && !lobNeedle.empty()) lobNeedle[0] = '\0';
    const auto start = static_cast<std::int32_t>(rng() % 30) - 2;
    const std::int32_t p = static_cast<std::int32_t>(rng() % 30) - 2;
    const std::int32_t l = static_cast<std::int32_t>(rng() % 34) - 4;
    const auto capacity = static_cast<std::uint32_t>(rng() % 40);
    const std::string what = testing::PrintToString(std::tuple{needle, hay, start, p, l, capacity});
    check(call("CLI_udfLOCATE3", {text(needle), text(hay)}, intArea()),
          n(orv::model::locate(needle, hay, 1)), what);
    check(call("CLI_udfLOCATE4", {lob(lobNeedle), lob(lobHay)}, intArea()),
          n(orv::model::locate(lobNeedle, lobHay, 1)), what);
    const Outcome fromStart =
        start < 1 ? fails("01")
                  : n(orv::model::locate(needle, hay, static_cast<std::size_t>(start)));
    check(call("CLI_udfLOCATE1", {text(needle), text(hay), i32(start)}, intArea()), fromStart,
          what);
    check(call("CLI_udfLOCATE2", {lob(needle), lob(hay), i32(start)}, intArea()), fromStart, what);
    check(call("CLI_udfREPLACE1", {text(hay), text(needle), text(by)}, textArea()),
          ok(orv::model::replace(hay, needle, by)), what);
    // REPLACE2 goes by a fixed limit, not its area's capacity.
    check(call("CLI_udfREPLACE2", {lob(lobHay), lob(lobNeedle), lob(by)}, lobArea(512)),
          ok(orv::model::replace(lobHay, lobNeedle, by)), what);
    check(call("CLI_udfINSERT1", {text(hay), i32(p), i32(l), text(by)}, textArea()),
          inserted(false, hay, p, l, by, 4000), what);
    check(call("CLI_udfINSERT2", {lob(lobHay), i32(p), i32(l), lob(by)}, lobArea(capacity)),
          inserted(true, lobHay, p, l, by, capacity), what);
  }
  EXPECT_EQ(failures, 0);
}

std::vector<const cli::str::FilterKernel *> kernelsHere() {
  std::vector<const cli::str::FilterKernel *> out = {&cli::str::kPortableKernel};
#if defined(__x86_64__) || defined(_M_X64)
  out.push_back(&cli::str::kSse2Kernel);
  if (&cli::str::bestFilterKernel() == &cli::str::kAvx2Kernel)
    out.push_back(&cli::str::kAvx2Kernel);
#endif
  return out;
}

// A haystack and needle of the shapes that make a search slow or wrong:
// periodic text with a needle that breaks the period somewhere, small
// alphabets, copies of the needle with a byte changed, runs of one byte;
// short, and long enough for the search to change its filter on the way.
std::pair<std::string, std::string> searchCase(std::mt19937 &rng, int round) {
  const auto pick = [&](std::size_t k) { return static_cast<std::size_t>(rng() % k); };
  const std::size_t length = round % 5 == 0 ? 1000 + pick(40000) : pick(300);
  const char *alphabet = round % 2 == 0 ? "ab" : "acgt";
  std::size_t m = 1 + pick(round % 7 == 0 ? 600 : 40);
  std::string hay, needle;
  switch (round % 4) {
    case 0: {  // a period, and a needle cut from it with a byte changed
      const std::string unit = randomText(rng, alphabet, 6) + "a";
      while (hay.size() < length + m + unit.size()) hay += unit;
      const std::size_t from = pick(unit.size());
      needle = hay.substr(from, m);
      hay.resize(length);
      if (pick(4) != 0) needle[pick(m)] = pick(2) == 0 ? 'c' : 'b';
      break;
    }
    case 1:  // random text over a small alphabet
      hay = randomText(rng, alphabet, length);
      needle = hay.size() > m && pick(2) == 0 ? hay.substr(pick(hay.size() - m), m)
                                              : randomText(rng, alphabet, m);
      break;
    case 2: {  // copies of the needle, nearly all with one byte changed
      needle = randomText(rng, alphabet, m) + "b";
      while (hay.size() < length) {
        std::string copy = needle;
        if (pick(10) != 0) copy[pick(copy.size())] ^= 1;
        hay += copy.substr(0, copy.size() - pick(2));
      }
      break;
    }
    default:  // a run of one byte, now and then another
      hay.assign(length, 'a');
      for (std::size_t i = 0; i < length / 97; ++i) hay[pick(length)] = 'b';
      needle.assign(m, 'a');
      if (pick(3) != 0) needle[pick(m)] = 'b';
  }
  return {hay, needle};
}

// Haystacks of up to a page end at a guard page, so that a search that
// reads past the end dies; each kernel also counts a byte as a loop does.
TEST(Search, EveryKernelFindsWhatALeftToRightSearchFinds) {
  std::mt19937 rng(8086);
  orv::test::BytesBeforeAGuardPage guard;
  const auto bytes = [](const char *data, std::size_t size) {
    return cli::Bytes{reinterpret_cast<const cli::Byte *>(data), size};
  };
  for (int round = 0; round < 1500; ++round) {
    const auto [hay, needle] = searchCase(rng, round);
    // Every match of a left-to-right search that starts again behind each.
    std::vector<std::size_t> want;
    for (std::size_t at = 0; (at = hay.find(needle, at)) != std::string::npos;
         at += needle.size()) {
      want.push_back(at);
      if (needle.empty()) break;
    }
    const std::size_t from = rng() % (hay.size() + 2);
    const std::size_t firstFrom = hay.find(needle, from);
    const cli::Bytes h = bytes(hay.size() <= 4096 ? guard.place(hay) : hay.data(), hay.size());
    const char counted = static_cast<char>(rng() % 4 == 0 ? rng() : 'a');
    for (const cli::str::FilterKernel *kernel : kernelsHere()) {
      const cli::str::Searcher searcher(bytes(needle.data(), needle.size()), *kernel);
      cli::str::Searcher::Scan scan(searcher, h);
      std::vector<std::size_t> got;
      for (std::size_t at = 0; (at = scan.next(at)) != cli::str::kNotFound; at += needle.size()) {
        got.push_back(at);
        if (needle.empty()) break;
      }
      ASSERT_EQ(got, want) << "round " << round << ", " << kernel->lanes << " lanes";
      ASSERT_EQ(searcher.find(h, from),
                firstFrom == std::string::npos ? cli::str::kNotFound : firstFrom)
          << "round " << round << " from " << from;
      ASSERT_EQ(kernel->count(h.data, h.size, static_cast<cli::Byte>(counted)),
                static_cast<std::size_t>(std::count(hay.begin(), hay.end(), counted)))
          << "round " << round << ", " << kernel->lanes << " lanes";
    }
  }
}

// REPLACE over large periodic and dense inputs, through the exports: a
// single byte with replacements of every length, and longer search
// strings matching at every place they can.
TEST(LocateReplaceInsert, ReplaceAgreesWithTheModelAtScale) {
  std::mt19937 rng(1999);
  for (int round = 0; round < 60; ++round) {
    auto [hay, needle] = searchCase(rng, round * 5);  // the long ones
    if (round % 3 == 0) needle = needle.substr(0, 1);
    const std::string by = randomText(rng, "xyz", round % 4 == 0 ? 20 : 3);
    const std::string want = orv::model::replace(hay, needle, by);
    EXPECT_EQ(call("CLI_udfREPLACE2", {lob(hay), lob(needle), lob(by)}, lobArea()), ok(want))
        << "round " << round;
    const std::string head = hay.substr(0, 4000);
    const std::string headWant = orv::model::replace(head, needle, by);
    if (headWant.size() <= 4000) {
      EXPECT_EQ(call("CLI_udfREPLACE1", {text(head), text(needle), text(by)}, textArea()),
                ok(headWant));
    }
  }
  // Nothing but matches of one byte, replaced by none, one and two bytes.
  const std::string as(1 << 19, 'a');
  for (const std::string by : {"", "b", "bc"}) {
    EXPECT_EQ(call("CLI_udfREPLACE2", {lob(as), lob("a"), lob(by)}, lobArea()),
              ok(orv::model::replace(as, "a", by)));
  }
}

// A megabyte made to defeat every filter, searched on a thread of 64 KiB of
// stack, where a search whose depth of calls grew with the text would die.
// The text is copies of a random 53-byte period over a and b, every 64th
// with one byte at a random place changed to c; the needle is 1300 copies,
// so that its probes pass at every copy and full comparisons fail far in at
// places that differ from copy to copy.  Its first match starts just behind
// the last changed copy.
TEST(LocateReplaceInsert, TextMadeToDefeatTheFilterNeedsNoDeepStack) {
  static std::string hay, needle;
  static Outcome located, replaced;
  std::mt19937 rng(6502);
  std::string unit(53, 'a');
  for (char &c : unit) c = "ab"[rng() % 2];
  const std::size_t copies = 19784, k = 1300, lastChanged = (copies - k - 1) / 64 * 64;
  for (std::size_t c = 0; c < copies; ++c) {
    hay += unit;
    if (c % 64 == 0 && c <= lastChanged) hay[hay.size() - 1 - rng() % 53] = 'c';
  }
  for (std::size_t c = 0; c < k; ++c) needle += unit;
  const auto work = [](void *) -> void * {
    located = call("CLI_udfLOCATE4", {lob(needle), lob(hay)}, intArea());
    replaced = call("CLI_udfREPLACE2", {lob(hay), lob(needle), lob("X")}, lobArea());
    return nullptr;
  };
  pthread_attr_t attr;
  pthread_t thread;
  ASSERT_EQ(pthread_attr_init(&attr), 0);
  ASSERT_EQ(pthread_attr_setstacksize(&attr, std::size_t{64} << 10), 0);
  ASSERT_EQ(pthread_create(&thread, &attr, work, nullptr), 0);
  ASSERT_EQ(pthread_join(thread, nullptr), 0);
  pthread_attr_destroy(&attr);
  const std::size_t at = (lastChanged + 1) * 53;  // where the match starts, counted from 0
  EXPECT_EQ(located, n(static_cast<std::int64_t>(at + 1)));
  EXPECT_EQ(replaced, ok(hay.substr(0, at) + "X" + hay.substr(at + needle.size())));
}

}  // namespace
