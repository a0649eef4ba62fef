// Where each argument of an export stands in its frame.
//
// The frame of a routine with N inputs and M results is, in this order:
// the N input values, the M results, the N input indicators, the M result
// indicators, the SQLSTATE buffer, the function name, the specific name,
// the diagnostic message buffer, and then the extras of its variant.  This
// is the one place that counts those positions: the exports' shim, the
// frame caller and the generator of the exports all ask a Positions.
#pragma once

#include <cstddef>

namespace cli::frame {

// The extras that may follow the diagnostic message buffer, as bits; the
// bits run in the order in which the extras stand.
enum : unsigned { kDbinfo = 1u, kScratchpad = 2u, kCallType = 4u, kCallback = 8u };

// The position of an argument that a frame does not have.
inline constexpr std::size_t kAbsent = ~std::size_t{0};

// The 0-based positions of one frame's arguments.
struct Positions {
  std::size_t inputs = 0, results = 0;  // N and M
  std::size_t firstInput = 0, firstResult = 0, firstInputIndicator = 0, firstResultIndicator = 0;
  std::size_t sqlstate = 0, functionName = 0, specificName = 0, message = 0;
  std::size_t dbinfo = kAbsent, scratchpad = kAbsent, callType = kAbsent, callback = kAbsent;
  std::size_t count = 0;  // the number of arguments

  [[nodiscard]] constexpr std::size_t input(std::size_t i) const { return firstInput + i; }
  [[nodiscard]] constexpr std::size_t result(std::size_t j) const { return firstResult + j; }
  [[nodiscard]] constexpr std::size_t inputIndicator(std::size_t i) const {
    return firstInputIndicator + i;
  }
  [[nodiscard]] constexpr std::size_t resultIndicator(std::size_t j) const {
    return firstResultIndicator + j;
  }
};

constexpr bool present(std::size_t position) { return position != kAbsent; }

// The positions of a frame of `inputs` values, `results` results and the
// extras in `extras`, laid out one group after the other.
constexpr Positions positionsOf(std::size_t inputs, std::size_t results, unsigned extras) {
  Positions p;
  std::size_t next = 0;
  const auto take = [&next](std::size_t count) {
    const std::size_t at = next;
    next += count;
    return at;
  };
  const auto extra = [&](unsigned bit) { return (extras & bit) != 0 ? take(1) : kAbsent; };
  p.inputs = inputs;
  p.results = results;
  p.firstInput = take(inputs);
  p.firstResult = take(results);
  p.firstInputIndicator = take(inputs);
  p.firstResultIndicator = take(results);
  p.sqlstate = take(1);
  p.functionName = take(1);
  p.specificName = take(1);
  p.message = take(1);
  p.dbinfo = extra(kDbinfo);
  p.scratchpad = extra(kScratchpad);
  p.callType = extra(kCallType);
  p.callback = extra(kCallback);
  p.count = next;
  return p;
}

// The plain frames of one to four inputs and one result.
static_assert(positionsOf(1, 1, 0).sqlstate == 4 && positionsOf(1, 1, 0).message == 7 &&
              positionsOf(1, 1, 0).count == 8);
static_assert(positionsOf(2, 1, 0).sqlstate == 6 && positionsOf(2, 1, 0).message == 9 &&
              positionsOf(2, 1, 0).count == 10);
static_assert(positionsOf(3, 1, 0).sqlstate == 8 && positionsOf(3, 1, 0).message == 11);
static_assert(positionsOf(4, 1, 0).sqlstate == 10 && positionsOf(4, 1, 0).message == 13);
static_assert(positionsOf(2, 1, 0).result(0) == 2 && positionsOf(2, 1, 0).inputIndicator(1) == 4 &&
              positionsOf(2, 1, 0).resultIndicator(0) == 5);
// No inputs: the result first, its indicator behind it.
static_assert(positionsOf(0, 1, 0).result(0) == 0 && positionsOf(0, 1, 0).resultIndicator(0) == 1 &&
              positionsOf(0, 1, 0).sqlstate == 2 && positionsOf(0, 1, 0).count == 6);
// The extras stand behind the message, in their order; the others are absent.
static_assert(positionsOf(1, 1, kDbinfo).dbinfo == 8 &&
              !present(positionsOf(1, 1, kDbinfo).scratchpad) &&
              positionsOf(1, 1, kDbinfo).count == 9);
static_assert(positionsOf(1, 6, kScratchpad | kCallType | kCallback).callback == 20 &&
              !present(positionsOf(0, 18, kScratchpad | kCallType).callback));

}  // namespace cli::frame
