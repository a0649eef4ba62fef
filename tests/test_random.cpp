// RAND: the sequence repeats per seed and is seeded once per statement,
// and its values are multiples of 1/32767 spread evenly over [0, 1].
#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cmath>
#include <limits>
#include <vector>

#include "frame/cliudf.h"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;

// A draw of RAND1, or of RAND2 with its seed and the statement's
// scratchpad; NaN if the call fails.
double draw(const std::vector<Value> &seed = {}, void *scratchpad = nullptr) {
  const Outcome o = seed.empty()
                        ? call("CLI_udfRAND1", {}, numberArea(Value::Layout::real))
                        : call("CLI_udfRAND2", seed, numberArea(Value::Layout::real), {scratchpad});
  return o.error.empty() ? std::bit_cast<double>(o.number)
                         : std::numeric_limits<double>::quiet_NaN();
}

TEST(Rand, RepeatsPerSeedAndSeedsOncePerStatement) {
  // A statement's draws: later seeds are ignored, and RAND1 goes on with
  // the same sequence.
  const auto sequence = [](std::int32_t seed, std::int32_t later) {
    std::array<unsigned char, 16> scratchpad{};
    std::vector<double> out{draw({i32(seed)}, scratchpad.data())};
    for (int i = 0; i < 5; ++i) out.push_back(draw({i32(later)}, scratchpad.data()));
    out.push_back(draw());
    EXPECT_EQ(scratchpad[CLI_SCRATCHPAD_DATA_OFFSET], 1);
    return out;
  };
  EXPECT_EQ(sequence(12345, 12345), sequence(12345, 999));
  EXPECT_NE(sequence(0, 0), sequence(-1, -1));
  EXPECT_EQ(sequence(0, 0), sequence(0, 7));
}

TEST(Rand, GivesMultiplesOfOneOver32767InTheClosedRangeEvenly) {
  std::array<int, 16> buckets{};
  bool sawZero = false, sawOne = false;
  constexpr int kDraws = 400000, kEach = kDraws / 16;
  for (int i = 0; i < kDraws; ++i) {
    const double r = draw();
    const double steps = r * 32767.0;
    ASSERT_TRUE(r >= 0.0 && r <= 1.0 && steps == std::round(steps)) << r;
    sawZero = sawZero || r == 0.0;
    sawOne = sawOne || r == 1.0;
    ++buckets[std::min<std::size_t>(15, static_cast<std::size_t>(r * 16))];
  }
  EXPECT_TRUE(sawZero && sawOne);
  for (int b : buckets) EXPECT_NEAR(b, kEach, kEach * 0.05);
}

}  // namespace
