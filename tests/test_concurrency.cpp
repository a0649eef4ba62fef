// Many threads at once: every scalar routine, called from 8 threads with
// their own buffers, gives what it gives when called alone.
//
// The routines keep no state of their own, so any difference here is a
// shared buffer, a static or a service that is not safe to call from
// several threads.  The cases come from the catalogue: each input slot takes
// values from a pool chosen by its layout and name, so a routine added to
// the catalogue is covered without a new line here.  RAND is left out: its
// generator is the C library's, shared by the process by design.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "support/frame_call.hpp"

namespace {

namespace cat = cli::catalogue;
using namespace orv::test;

constexpr std::size_t kThreads = 8;

// The values an input slot takes, by its layout and the name it has in
// the catalogue, so that date slots get dates, durations get durations and
// so on: each pool mixes valid values with ones that fail.
std::vector<Value> poolFor(const cat::Slot &slot) {
  const std::string_view name = slot.name;
  const std::string fox =
      "The quick brown fox jumps over the lazy dog, and again, and again, and again";
  std::vector<std::string> texts = {"",       "Hello World", "  padded \t ", "aaaabaaabaab",
                                    "Robert", "Tymczak",     "ab",           fox};
  if (name == "date" || name == "value") {
    texts = {"2001-09-27", "2000-02-29-23.59.59.999999", "1999-12-31   ",       "2001-9-7",
             "2001-02-29", "9999-12-31-24.00.00",        "0001-01-01 00:00:00", "not a date"};
  }
  if (name == "time") texts.clear();
  if (name == "time" || name == "value") {
    texts.insert(texts.end(), {"13:30:15", "24:00:00", "1:2:3", "25:00:00", "13.30.15 "});
  }
  if (name == "duration") {
    texts = {"00000100000000.000000", "99991231235959.999999", "123.5", "-1", "1x", ""};
  }
  if (name == "text") texts = {"1.5", "-2e10", "  42  ", "1e999", "abc", ""};
  // Integers of every width take these, cut to their width.
  std::vector<std::int64_t> numbers = {
      INT64_MIN, -32768, -7,         -1,           0,        1, 2, 3, 7, 30, 4000,
      4001,      32767,  2147483647, 123456789012, INT64_MAX};
  if (name == "interval") numbers = {1, 2, 4, 8, 16, 32, 64, 128, 256, 3};
  if (name.find("code page") != std::string_view::npos) numbers = {1208, 819, 1200, 37, 5};
  const cat::Layout layout = slot.layout;
  std::vector<Value> pool;
  for (const std::string &t : texts) {
    if (layout == cat::Layout::text || layout == cat::Layout::lob) {
      pool.push_back(layout == cat::Layout::lob ? lob(t) : text(t));
    }
  }
  for (const std::int64_t v : numbers) {
    if (layout == cat::Layout::int16) pool.push_back(i16(static_cast<std::int16_t>(v)));
    if (layout == cat::Layout::int32) pool.push_back(i32(static_cast<std::int32_t>(v)));
    if (layout == cat::Layout::int64) pool.push_back(i64(v));
  }
  if (layout == cat::Layout::real) {
    for (const double v : {-0.0, 0.5, -2.25, 3.0, 1e308, 7.125e-3, std::nan(""), HUGE_VAL}) {
      pool.push_back(f64(v));
    }
  }
  if (layout == cat::Layout::fixedBytes) {
    pool = {fixed(std::string(slot.size, '\xFF')), fixed(std::string(slot.size, '\0')),
            fixed(std::string("\x01\x02\x03\x04\x05\x06\x07\0", 8))};
  }
  return pool;
}

// The area of a result slot, as the catalogue sizes it.
Value areaFor(const cat::Slot &slot) {
  const cat::Layout layout = slot.layout;
  if (layout == cat::Layout::text) return textArea(slot.size + 1);
  if (layout == cat::Layout::lob) return lobArea(slot.size);
  if (layout == cat::Layout::int16) return numberArea(Value::Layout::int16);
  if (layout == cat::Layout::int32) return intArea();
  if (layout == cat::Layout::int64) return numberArea(Value::Layout::int64);
  if (layout == cat::Layout::real) return numberArea(Value::Layout::real);
  return fixedArea(slot.size);
}

// The block of a UTF-8 database, which the routines only read.
DatabaseInfo utf8(1208);

struct Case {
  const cat::Routine *routine;
  std::vector<Value> inputs;
  std::vector<void *> extras;     // the database information block, if the frame has one
  std::size_t dateBytesToIgnore;  // today's date at the head of the result

  // The outcome, checked by the frame's rules (canaries, null indicators,
  // status forms) on every call.
  [[nodiscard]] Outcome run() const {
    const cat::Routine &r = *routine;
    const Value area = areaFor(r.results[0]);
    Outcome o = (r.properties & cat::kHandlesNull) != 0 ? callNullable(r.symbol, inputs, area)
                                                        : call(r.symbol, inputs, area, extras);
    o.bytes.erase(0, std::min(dateBytesToIgnore, o.bytes.size()));
    return o;
  }
};

// The scalar routines of the catalogue with their cases: for a routine of
// k inputs, case i takes value i * (j + 1) + j of input j's pool, so the
// inputs don't move in step.
std::vector<Case> allCases() {
  std::vector<Case> cases;
  for (const cat::Routine &r : cat::kRoutines) {
    const bool scalar = r.frame == cat::Frame::plain || r.frame == cat::Frame::dbinfo;
    if (!scalar || std::string_view(r.sqlName) == "RAND") continue;
    std::vector<std::vector<Value>> pools;
    std::size_t widest = 1;
    for (std::size_t j = 0; j < cat::inputCount(r); ++j) {
      pools.push_back(poolFor(r.inputs[j]));
      widest = std::max(widest, pools.back().size());
    }
    // TIMESTAMP and TIMESTAMPTIME put today's date in front of a time.
    const std::size_t ignore = (r.properties & cat::kDeterministic) == 0 &&
                                       std::string_view(r.sqlName).starts_with("TIMESTAMP")
                                   ? 10
                                   : 0;
    for (std::size_t i = 0; i < 2 * widest; ++i) {
      Case c{&r, {}, {}, ignore};
      if (r.frame == cat::Frame::dbinfo) c.extras = {utf8.block};
      for (std::size_t j = 0; j < pools.size(); ++j) {
        c.inputs.push_back(pools[j][(i * (j + 1) + j) % pools[j].size()]);
      }
      cases.push_back(std::move(c));
    }
  }
  return cases;
}

TEST(Concurrency, EightThreadsGiveWhatOneThreadGives) {
  const std::vector<Case> cases = allCases();
  ASSERT_GT(cases.size(), 500U);

  std::vector<Outcome> expected;
  expected.reserve(cases.size());
  std::size_t failures = 0;
  for (const Case &c : cases) {
    expected.push_back(c.run());
    if (!expected.back().error.empty()) ++failures;
  }
  // The pools give both results and errors, in good number.
  EXPECT_GT(failures, cases.size() / 10);
  EXPECT_LT(failures, cases.size() / 2);

  // Each thread walks the cases from its own starting point for about two
  // seconds, and at least twice over, so that different routines overlap.
  const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  std::vector<std::string> firstMismatch(kThreads);
  std::vector<std::thread> threads;
  for (std::size_t t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      for (std::size_t pass = 0; pass < 2 || std::chrono::steady_clock::now() < until; ++pass) {
        for (std::size_t k = 0; k < cases.size(); ++k) {
          const std::size_t i = (k + t * cases.size() / kThreads) % cases.size();
          const bool same = cases[i].run() == expected[i];
          if (!same && firstMismatch[t].empty()) {
            firstMismatch[t] = std::string(cases[i].routine->symbol) + " case " + std::to_string(i);
          }
        }
      }
    });
  }
  for (std::thread &th : threads) th.join();
  for (std::size_t t = 0; t < kThreads; ++t) EXPECT_EQ(firstMismatch[t], "") << "thread " << t;
}

}  // namespace
