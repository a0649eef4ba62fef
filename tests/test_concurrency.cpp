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
#include <array>
#include <atomic>
#include <bit>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "support/platform.hpp"

namespace {

namespace cat = cli::catalogue;
namespace frame = cli::call;
using Bytes = std::vector<unsigned char>;

constexpr std::size_t kThreads = 8;
// The frame's message buffer and a guard behind it, both compared.
constexpr std::size_t kMessageBytes = CLI_MESSAGE_SIZE + 42;

Bytes textBytes(std::string_view s, bool lob) {
  // A CLI_udfLob is its length word and the data; terminated text the data
  // and a NUL.
  const std::size_t head = lob ? 4 : 0;
  Bytes out(head + s.size() + (lob ? 0 : 1), 0);
  if (lob) {
    const auto n = static_cast<std::uint32_t>(s.size());
    std::memcpy(out.data(), &n, 4);
  }
  if (!s.empty()) std::memcpy(out.data() + head, s.data(), s.size());
  return out;
}

template <typename T>
Bytes numberBytes(T v) {
  Bytes out(sizeof v);
  std::memcpy(out.data(), &v, sizeof v);
  return out;
}

// The values an input slot takes, by its layout and the name it has in
// the catalogue, so that date slots get dates, durations get durations and
// so on: each pool mixes valid values with ones that fail.
std::vector<Bytes> poolFor(const cat::Slot &slot) {
  const std::string_view name = slot.name;
  std::vector<std::string_view> texts;
  if (name == "date" || name == "value") {
    texts = {"2001-09-27", "2000-02-29-23.59.59.999999", "1999-12-31   ",       "2001-9-7",
             "2001-02-29", "9999-12-31-24.00.00",        "0001-01-01 00:00:00", "not a date"};
  }
  if (name == "time" || name == "value") {
    texts.insert(texts.end(), {"13:30:15", "24:00:00", "1:2:3", "25:00:00", "13.30.15 "});
  }
  if (name == "duration") {
    texts = {"00000100000000.000000", "99991231235959.999999", "123.5", "-1", "1x", ""};
  }
  if (name == "text") texts = {"1.5", "-2e10", "  42  ", "1e999", "abc", ""};
  if (texts.empty()) {
    texts = {"",
             "Hello World",
             "  padded \t ",
             "aaaabaaabaab",
             "Robert",
             "Tymczak",
             "ab",
             "The quick brown fox jumps over the lazy dog, and again, and again, and again"};
  }
  std::vector<Bytes> pool;
  switch (slot.layout) {
    case cat::Layout::text:
    case cat::Layout::lob:
      for (std::string_view t : texts)
        pool.push_back(textBytes(t, slot.layout == cat::Layout::lob));
      break;
    case cat::Layout::int16:
      for (std::int16_t v : {std::int16_t{-32768}, std::int16_t{-7}, std::int16_t{0},
                             std::int16_t{3}, std::int16_t{32767}}) {
        pool.push_back(numberBytes(v));
      }
      break;
    case cat::Layout::int32:
      if (name == "interval") {
        for (std::int32_t v : {1, 2, 4, 8, 16, 32, 64, 128, 256, 3}) pool.push_back(numberBytes(v));
      } else if (name.find("code page") != std::string_view::npos) {
        for (std::int32_t v : {1208, 819, 1200, 37, 5}) pool.push_back(numberBytes(v));
      } else {
        for (std::int32_t v : {-1, 0, 1, 2, 3, 7, 30, 4000, 4001, 2147483647}) {
          pool.push_back(numberBytes(v));
        }
      }
      break;
    case cat::Layout::int64:
      for (std::int64_t v : {std::numeric_limits<std::int64_t>::min(), std::int64_t{-7},
                             std::int64_t{0}, std::int64_t{3}, std::int64_t{123456789012},
                             std::numeric_limits<std::int64_t>::max()}) {
        pool.push_back(numberBytes(v));
      }
      break;
    case cat::Layout::real:
      for (double v : {-0.0, 0.5, -2.25, 3.0, 1e308, 7.125e-3, std::nan(""), HUGE_VAL}) {
        pool.push_back(numberBytes(v));
      }
      break;
    case cat::Layout::fixedBytes:
      pool.push_back(Bytes(slot.size, 0xFF));
      pool.push_back(Bytes(slot.size, 0));
      pool.push_back(textBytes("\x01\x02\x03\x04\x05\x06\x07", false));
      break;
    default:
      break;
  }
  return pool;
}

// What a call left: the used part of the result area and both status
// buffers.  For a CLI_udfLob result the length word says how much is used.
struct Outcome {
  Bytes result;
  std::array<char, 6> sqlstate{};
  std::array<char, kMessageBytes> message{};
  bool operator==(const Outcome &) const = default;
};

struct Case {
  const cat::Routine *routine;
  void *fn;
  std::vector<Bytes> inputs;
  std::size_t dateBytesToIgnore;  // today's date at the head of the result
};

// One thread's buffers, reused from call to call.
class Caller {
 public:
  Outcome call(const Case &c) {
    const cat::Routine &r = *c.routine;
    inputs_ = c.inputs;  // the date routines trim their input in place
    const cat::Slot &slot = r.results[0];
    const std::size_t area = frame::areaSize(slot);
    if (result_.size() < area) result_.resize(area);
    std::fill_n(result_.begin(), area, 0xCD);
    if (slot.layout == cat::Layout::lob) frame::prepareLobResult(result_.data(), slot.size);
    std::fill(indicators_.begin(), indicators_.end(), std::int16_t{0});
    Outcome out;
    std::fill(out.sqlstate.begin(), out.sqlstate.end(), 'S');
    std::fill(out.message.begin(), out.message.end(), 'M');
    std::array<unsigned char, 512> dbinfo{};
    const std::int32_t utf8 = 1208;
    std::memcpy(dbinfo.data() + CLI_DBINFO_CODEPAGE_OFFSET, &utf8, sizeof utf8);

    std::array<void *, cat::kMaxInputs> inputs{};
    std::array<std::int16_t *, cat::kMaxInputs> inputIndicators{};
    for (std::size_t i = 0; i < inputs_.size(); ++i) {
      inputs[i] = inputs_[i].data();
      inputIndicators[i] = &indicators_.at(i);
    }
    void *const results[] = {result_.data()};
    std::int16_t *const resultIndicators[] = {&indicators_.at(inputs_.size())};
    frame::Frame f;
    f.inputs = inputs.data();
    f.results = results;
    f.inputIndicators = inputIndicators.data();
    f.resultIndicators = resultIndicators;
    f.sqlstate = out.sqlstate.data();
    f.functionName = "FUNCTION";
    f.specificName = "SPECIFIC";
    f.message = out.message.data();
    f.dbinfo = dbinfo.data();
    frame::call(r, c.fn, f);

    std::size_t used = area;
    if (slot.layout == cat::Layout::lob) {
      std::uint32_t length = 0;
      std::memcpy(&length, result_.data(), 4);
      used = CLI_LOB_AREA_SIZE(std::min<std::size_t>(length, slot.size));
    }
    const std::size_t from = std::min(c.dateBytesToIgnore, used);
    out.result.assign(result_.begin() + static_cast<std::ptrdiff_t>(from),
                      result_.begin() + static_cast<std::ptrdiff_t>(used));
    return out;
  }

 private:
  std::vector<Bytes> inputs_;
  Bytes result_;
  std::array<std::int16_t, cat::kMaxInputs + 1> indicators_{};
};

// The scalar routines of the catalogue with their cases: for a routine of
// k inputs, case i takes value i * (j + 1) + j of input j's pool, so the
// inputs don't move in step.
std::vector<Case> allCases(void *library) {
  std::vector<Case> cases;
  for (const cat::Routine &r : cat::kRoutines) {
    const bool scalar = r.frame == cat::Frame::plain || r.frame == cat::Frame::dbinfo;
    if (!scalar || std::string_view(r.sqlName) == "RAND") continue;
    void *fn = orv::test::findExport(library, r.symbol);
    EXPECT_NE(fn, nullptr) << r.symbol;
    if (fn == nullptr) continue;
    std::vector<std::vector<Bytes>> pools;
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
      Case c{&r, fn, {}, ignore};
      for (std::size_t j = 0; j < pools.size(); ++j) {
        c.inputs.push_back(pools[j][(i * (j + 1) + j) % pools[j].size()]);
      }
      cases.push_back(std::move(c));
    }
  }
  return cases;
}

TEST(Concurrency, EightThreadsGiveWhatOneThreadGives) {
  void *library = orv::test::openLibrary(ORV_LIBRARY_PATH);
  ASSERT_NE(library, nullptr) << orv::test::loaderError();
  const std::vector<Case> cases = allCases(library);
  ASSERT_GT(cases.size(), 500U);

  std::vector<Outcome> expected;
  expected.reserve(cases.size());
  Caller alone;
  std::size_t failures = 0;
  for (const Case &c : cases) {
    expected.push_back(alone.call(c));
    if (expected.back().sqlstate[0] != 'S') ++failures;
  }
  // The pools give both results and errors, in good number.
  EXPECT_GT(failures, cases.size() / 10);
  EXPECT_LT(failures, cases.size() / 2);

  // Each thread walks the cases from its own starting point for about two
  // seconds, and at least twice over, so that different routines overlap.
  const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  std::atomic<std::size_t> mismatches{0};
  std::vector<std::string> firstMismatch(kThreads);
  std::vector<std::thread> threads;
  for (std::size_t t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      Caller caller;
      for (std::size_t pass = 0; pass < 2 || std::chrono::steady_clock::now() < until; ++pass) {
        for (std::size_t k = 0; k < cases.size(); ++k) {
          const std::size_t i = (k + t * cases.size() / kThreads) % cases.size();
          if (caller.call(cases[i]) == expected[i]) continue;
          if (mismatches++ == 0 || firstMismatch[t].empty()) {
            firstMismatch[t] = std::string(cases[i].routine->symbol) + " case " + std::to_string(i);
          }
        }
      }
    });
  }
  for (std::thread &th : threads) th.join();
  EXPECT_EQ(mismatches.load(), 0U) << [&] {
    std::string all;
    for (const std::string &m : firstMismatch) all += m.empty() ? "" : m + "; ";
    return all;
  }();
  orv::test::closeLibrary(library);
}

}  // namespace
