// RAND: the sequence repeats per seed and is seeded once per statement,
// and its values are multiples of 1/32767 spread evenly over [0, 1].
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdint>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "frame/platform.hpp"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;

// ---- RAND -------------------------------------------------------------------

namespace cat = cli::catalogue;

constexpr auto kRand1 = static_cast<std::size_t>(cat::find("CLI_udfRAND1") - cat::kRoutines);
constexpr auto kRand2 = static_cast<std::size_t>(cat::find("CLI_udfRAND2") - cat::kRoutines);

// Calls of RAND1 and RAND2 through one frame, the status buffers shared,
// so that a status stored by any call shows at the end.  RAND1 reads only
// its result's part of the frame.
struct RandomCalls {
  void *rand1 = exportAddress("CLI_udfRAND1");
  void *rand2 = exportAddress("CLI_udfRAND2");
  std::int32_t seed = 0;
  double r = -1;
  std::int16_t ind[2] = {};
  char sqlstate[6] = {};
  char message[70] = {};
  void *const values[2] = {&seed, &r};
  std::int16_t *const indicators[2] = {&ind[0], &ind[1]};
  cli::call::Frame frame{.inputs = &values[0],
                         .results = &values[1],
                         .inputIndicators = &indicators[0],
                         .resultIndicators = &indicators[1],
                         .sqlstate = sqlstate,
                         .functionName = "",
                         .specificName = "",
                         .message = message};

  double one() {
    r = -1;
    cli::call::call<kRand1>(rand1, frame);
    return r;
  }
  double seeded(std::int32_t value, unsigned char *scratchpad) {
    seed = value;
    r = -1;
    frame.scratchpad = scratchpad;
    cli::call::call<kRand2>(rand2, frame);
    return r;
  }
};

TEST(Rand, RepeatsPerSeedAndSeedsOncePerStatement) {
  RandomCalls c;
  ASSERT_TRUE(c.rand1 != nullptr && c.rand2 != nullptr);
  const auto sequence = [&](std::int32_t seed, std::int32_t later) {
    std::array<unsigned char, 16> scratchpad{};
    std::vector<double> out{c.seeded(seed, scratchpad.data())};
    for (int i = 0; i < 5; ++i) out.push_back(c.seeded(later, scratchpad.data()));
    out.push_back(c.one());
    EXPECT_EQ(scratchpad[CLI_SCRATCHPAD_DATA_OFFSET], 1);
    return out;
  };
  // Later seeds are ignored; RAND1 goes on with the same sequence.
  EXPECT_EQ(sequence(12345, 12345), sequence(12345, 999));
  EXPECT_NE(sequence(0, 0), sequence(-1, -1));
  EXPECT_EQ(sequence(0, 0), sequence(0, 7));
  EXPECT_EQ(c.sqlstate[0], '\0');
}

TEST(Rand, GivesMultiplesOfOneOver32767InTheClosedRangeEvenly) {
  RandomCalls c;
  ASSERT_TRUE(c.rand1 != nullptr);
  std::array<int, 16> buckets{};
  bool sawZero = false, sawOne = false;
  constexpr int kDraws = 400000;
  for (int i = 0; i < kDraws; ++i) {
    const double r = c.one();
    const double steps = r * 32767.0;
    ASSERT_TRUE(r >= 0.0 && r <= 1.0 && steps == std::round(steps)) << r;
    sawZero = sawZero || r == 0.0;
    sawOne = sawOne || r == 1.0;
    ++buckets[std::min<std::size_t>(15, static_cast<std::size_t>(r * 16))];
  }
  EXPECT_TRUE(sawZero && sawOne);
  for (int b : buckets) EXPECT_NEAR(b, kDraws / 16, kDraws / 16 / 20);  // within 5 %
}

}  // namespace
