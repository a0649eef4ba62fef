// Cost of one call of each routine, called as an engine calls it: found by
// name in the built library, handed a frame of pointers to ready buffers.
//
// Rows: <ROUTINE>/<input>.  String rows over 1 MiB report bytes per second.
#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "frame/cliudf.h"
#include "snapshot.hpp"

namespace {

void *exportNamed(const char *name) {
  static void *library = dlopen(ORV_LIBRARY_PATH, RTLD_NOW | RTLD_LOCAL);
  void *fn = library != nullptr ? dlsym(library, name) : nullptr;
  if (fn == nullptr) {
    static_cast<void>(std::fprintf(stderr, "no export %s in %s\n", name, ORV_LIBRARY_PATH));
    std::exit(1);
  }
  return fn;
}

// A value laid out for the frame: terminated text, CLI_udfLob, or a 32-bit
// integer; result areas are sized for the largest result.
std::vector<unsigned char> text(const std::string &s) {
  std::vector<unsigned char> v(s.begin(), s.end());
  v.push_back(0);
  return v;
}
std::vector<unsigned char> lob(const std::string &s) {
  const auto n = static_cast<std::uint32_t>(s.size());
  std::vector<unsigned char> v(4 + s.size());
  for (std::size_t i = 0; i < 4; ++i) v[i] = reinterpret_cast<const unsigned char *>(&n)[i];
  std::copy(s.begin(), s.end(), v.begin() + 4);
  return v;
}
std::vector<unsigned char> int32(std::int32_t x) {
  std::vector<unsigned char> v(4);
  std::memcpy(v.data(), &x, 4);
  return v;
}
template <typename T>
std::vector<unsigned char> number(T x) {
  std::vector<unsigned char> v(sizeof x);
  std::memcpy(v.data(), &x, sizeof x);
  return v;
}
std::vector<unsigned char> textArea() { return std::vector<unsigned char>(4001); }
std::vector<unsigned char> lobArea(std::uint32_t capacity = 1048576) {
  std::vector<unsigned char> v(4 + std::size_t{capacity});
  std::memcpy(v.data(), &capacity, 4);
  return v;
}

template <std::size_t... Is>
void invoke(void *fn, void *const *args, std::index_sequence<Is...>) {
  using Export = void (*)(decltype(Is, static_cast<void *>(nullptr))...);
  reinterpret_cast<Export>(fn)(args[Is]...);
}

// Calls `name` with the inputs and one result in a loop.  A CLI_udfLob
// result's length word is set to its capacity before each call, as an
// engine hands it.
// Returns the time of one call in nanoseconds, by the wall clock.
double run(benchmark::State &state, const char *name,
           std::vector<std::vector<unsigned char>> inputs, std::vector<unsigned char> result,
           std::int64_t bytesPerCall = 0) {
  void *fn = exportNamed(name);
  std::int16_t indicators[5] = {};
  char sqlstate[6] = {};
  char message[70] = {};
  std::vector<void *> args;
  args.reserve(2 * inputs.size() + 6);
  for (auto &in : inputs) args.push_back(in.data());
  args.push_back(result.data());
  for (std::size_t i = 0; i <= inputs.size(); ++i) args.push_back(&indicators[i]);
  args.insert(args.end(), {sqlstate, nullptr, nullptr, message});
  // Text and integer areas start zeroed, so only a CLI_udfLob has one.
  std::uint32_t capacity = 0;
  std::memcpy(&capacity, result.data(), 4);
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    if (capacity != 0) std::memcpy(result.data(), &capacity, 4);
    switch (args.size()) {
      case 6:
        invoke(fn, args.data(), std::make_index_sequence<6>{});
        break;
      case 8:
        invoke(fn, args.data(), std::make_index_sequence<8>{});
        break;
      case 10:
        invoke(fn, args.data(), std::make_index_sequence<10>{});
        break;
      case 12:
        invoke(fn, args.data(), std::make_index_sequence<12>{});
        break;
      default:
        invoke(fn, args.data(), std::make_index_sequence<14>{});
    }
    benchmark::DoNotOptimize(result.data());
    benchmark::ClobberMemory();
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  if (sqlstate[0] != '\0') state.SkipWithError("the routine reported a status");
  if (bytesPerCall != 0) state.SetBytesProcessed(state.iterations() * bytesPerCall);
  return spent.count() / static_cast<double>(state.iterations());
}

const std::string k20 = "  Mixed Case Text   ";  // 20 bytes, blanks at both ends
const std::string kMiBOfQ(1 << 20, 'Q');

void space(benchmark::State &s) { run(s, "CLI_udfSPACE", {int32(20)}, textArea()); }
void lcase1(benchmark::State &s) { run(s, "CLI_udfLCASE1", {text(k20)}, textArea()); }
void rtrim1(benchmark::State &s) { run(s, "CLI_udfRTRIM1", {text(k20)}, textArea()); }
void ltrim1(benchmark::State &s) { run(s, "CLI_udfLTRIM1", {text(k20)}, textArea()); }
void left1(benchmark::State &s) { run(s, "CLI_udfLEFT1", {text(k20), int32(10)}, textArea()); }
void right1(benchmark::State &s) { run(s, "CLI_udfRIGHT1", {text(k20), int32(10)}, textArea()); }
void lcase2(benchmark::State &s) { run(s, "CLI_udfLCASE2", {lob(k20)}, lobArea(64)); }
void rtrim2(benchmark::State &s) { run(s, "CLI_udfRTRIM2", {lob(k20)}, lobArea(64)); }
void charCode(benchmark::State &s) { run(s, "CLI_udfCHAR", {int32(65)}, textArea()); }
void ascii1(benchmark::State &s) { run(s, "CLI_udfASCII1", {text(k20)}, int32(0)); }

void lcase2MiB(benchmark::State &s) { run(s, "CLI_udfLCASE2", {lob(kMiBOfQ)}, lobArea(), 1 << 20); }
void repeat2MiB(benchmark::State &s) {
  run(s, "CLI_udfREPEAT2", {lob("0123456789abcdef"), int32(65536)}, lobArea(), 1 << 20);
}
void repeat2MiBOneByte(benchmark::State &s) {
  run(s, "CLI_udfREPEAT2", {lob("z"), int32(1 << 20)}, lobArea(), 1 << 20);
}
void repeat1OneByte(benchmark::State &s) {
  run(s, "CLI_udfREPEAT1", {text("z"), int32(4000)}, textArea(), 4000);
}
void repeat1ThreeBytes(benchmark::State &s) {
  run(s, "CLI_udfREPEAT1", {text("abc"), int32(1333)}, textArea(), 3999);
}
// What REPEAT1 of 4000 bytes is measured against: copying 4000 bytes.
void memcpy4000(benchmark::State &s) {
  std::vector<char> from(4000, 'z');
  std::vector<char> to(4001);
  for (auto _ : s) {
    std::memcpy(to.data(), from.data(), from.size());
    benchmark::DoNotOptimize(to.data());
    benchmark::ClobberMemory();
  }
  s.SetBytesProcessed(s.iterations() * 4000);
}

void timestampRow(benchmark::State &s) {
  run(s, "CLI_udfTIMESTAMP", {text("2001-09-27-13.30.15.123456")}, textArea());
}
void timestampDiffRow(benchmark::State &s) {
  run(s, "CLI_udfTIMESTAMPDIFF", {int32(2), text("00000123123030.123456")}, int32(0));
}

// Date routines trim their input in place, so each call gets a fresh copy
// of the text, as an engine hands each row's value.
void dateRoutine(benchmark::State &state, const char *name, const char *value) {
  void *fn = exportNamed(name);
  const std::size_t size = std::strlen(value) + 1;
  char text[40];
  std::int32_t result = 0;
  std::int16_t indicators[2] = {};
  char sqlstate[6] = {};
  char message[70] = {};
  void *args[] = {text,     &result, &indicators[0], &indicators[1],
                  sqlstate, nullptr, nullptr,        message};
  for (auto _ : state) {
    std::memcpy(text, value, size);
    invoke(fn, args, std::make_index_sequence<8>{});
    benchmark::DoNotOptimize(result);
  }
  if (sqlstate[0] != '\0') state.SkipWithError("the routine reported a status");
}

constexpr const char *kDate = "2001-09-27";
constexpr const char *kTimestamp = "2001-09-27-13.30.15.123456";

// Date rows: name, export, text.
struct DateRow {
  const char *name, *routine, *value;
};
constexpr DateRow kDateRows[] = {
    {"JULIAN_DAY2/10-byte date", "CLI_udfJULIAN_DAY2", kDate},
    {"JULIAN_DAY2/26-byte timestamp", "CLI_udfJULIAN_DAY2", kTimestamp},
    {"JULIAN_DAY1/26-byte timestamp", "CLI_udfJULIAN_DAY1", kTimestamp},
    {"WEEK2/26-byte timestamp", "CLI_udfWEEK2", kTimestamp},
    {"WEEK_ISO2/10-byte date", "CLI_udfWEEK_ISO2", kDate},
    {"WEEK_ISO2/26-byte timestamp", "CLI_udfWEEK_ISO2", kTimestamp},
    {"QUARTER2/26-byte timestamp", "CLI_udfQUARTER2", kTimestamp},
    {"DAYOFYEAR2/10-byte date", "CLI_udfDAYOFYEAR2", kDate},
    {"DAYOFWEEK1/26-byte timestamp", "CLI_udfDAYOFWEEK1", kTimestamp},
    {"DAYOFWEEK_ISO1/10-byte date", "CLI_udfDAYOFWEEK_ISO1", kDate},
    {"MIDNIGHT_SECONDS1/8-byte time", "CLI_udfMIDNIGHT_SECONDS1", "13.30.15"},
    {"MIDNIGHT_SECONDS2/26-byte timestamp", "CLI_udfMIDNIGHT_SECONDS2", kTimestamp},
};

const bool kDateRowsRegistered = [] {
  for (const DateRow &r : kDateRows) {
    benchmark::RegisterBenchmark(r.name, dateRoutine, r.routine, r.value);
  }
  return true;
}();

// Numeric rows: name, export, inputs, result bytes.  Each family's rows
// sit next to the C library call that the routine makes, where it makes
// one, since the target is 5 ns plus that call.
struct NumericRow {
  const char *name, *routine;
  std::vector<std::vector<unsigned char>> inputs;
};
const NumericRow kNumericRows[] = {
    {"ABS1/-2.5", "CLI_udfABS1", {number(-2.5)}},
    {"ABS4/-12345", "CLI_udfABS4", {number(std::int64_t{-12345})}},
    {"SIGN1/-2.5", "CLI_udfSIGN1", {number(-2.5)}},
    {"CEILING1/2.5", "CLI_udfCEILING1", {number(2.5)}},
    {"FLOOR4/12345", "CLI_udfFLOOR4", {number(std::int64_t{12345})}},
    {"MOD3/1000003, 97", "CLI_udfMOD3", {number(std::int64_t{1000003}), number(std::int64_t{97})}},
    {"MOD1/1000003, 97", "CLI_udfMOD1", {number(1000003), number(97)}},
    {"ROUND1/1234.5678, 2", "CLI_udfROUND1", {number(1234.5678), number(2)}},
    {"TRUNCATE1/1234.5678, 2", "CLI_udfTRUNCATE1", {number(1234.5678), number(2)}},
    {"ROUND2/1234567, -2", "CLI_udfROUND2", {number(1234567), number(-2)}},
    {"ROUND5/1234567890123, -4",
     "CLI_udfROUND5",
     {number(std::int64_t{1234567890123}), number(-4)}},
    {"TRUNCATE5/1234567890123, -4",
     "CLI_udfTRUNCATE5",
     {number(std::int64_t{1234567890123}), number(-4)}},
    {"POWER1/2.5, 3.5", "CLI_udfPOWER1", {number(2.5), number(3.5)}},
    {"POWER3/7, 5", "CLI_udfPOWER3", {number(7), number(5)}},
    {"POWER4/7, 5", "CLI_udfPOWER4", {number(std::int64_t{7}), number(std::int64_t{5})}},
    {"POWER4/3, 39 (longest loop)",
     "CLI_udfPOWER4",
     {number(std::int64_t{3}), number(std::int64_t{39})}},
    {"SIN/0.7", "CLI_udfSIN", {number(0.7)}},
    {"SQRT/2.0", "CLI_udfSQRT", {number(2.0)}},
    {"EXP/0.7", "CLI_udfEXP", {number(0.7)}},
    {"LOG/0.7", "CLI_udfLOG", {number(0.7)}},
    {"ATAN2/0.7, 0.3", "CLI_udfATAN2", {number(0.7), number(0.3)}},
    {"DEGREES1/0.7", "CLI_udfDEGREES1", {number(0.7)}},
    {"RAND1", "CLI_udfRAND1", {}},
};

const bool kNumericRowsRegistered = [] {
  for (const NumericRow &r : kNumericRows) {
    benchmark::RegisterBenchmark(r.name, [&r](benchmark::State &s) {
      run(s, r.routine, r.inputs, std::vector<unsigned char>(8));
    });
  }
  return true;
}();

// The C library's maths calls alone, for the targets "5 ns plus the call".
template <double (*F)(double, double)>
void mathCall2(benchmark::State &state, double x, double y) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(x);
    benchmark::DoNotOptimize(y);
    benchmark::DoNotOptimize(F(x, y));
  }
}
template <double (*F)(double)>
void mathCall1(benchmark::State &state, double x) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(x);
    benchmark::DoNotOptimize(F(x));
  }
}
double powCall(double x, double y) { return std::pow(x, y); }
double fmodCall(double x, double y) { return std::fmod(x, y); }
double sinCall(double x) { return std::sin(x); }
double expCall(double x) { return std::exp(x); }
double logCall(double x) { return std::log(x); }
double sqrtCall(double x) { return std::sqrt(x); }

const bool kMathRowsRegistered = [] {
  benchmark::RegisterBenchmark("libm pow/10, -2", mathCall2<powCall>, 10.0, -2.0);
  benchmark::RegisterBenchmark("libm pow/2.5, 3.5", mathCall2<powCall>, 2.5, 3.5);
  benchmark::RegisterBenchmark("libm fmod/1234.5678, 0.01", mathCall2<fmodCall>, 1234.5678, 0.01);
  benchmark::RegisterBenchmark("libm sin/0.7", mathCall1<sinCall>, 0.7);
  benchmark::RegisterBenchmark("libm exp/0.7", mathCall1<expCall>, 0.7);
  benchmark::RegisterBenchmark("libm log/0.7", mathCall1<logCall>, 0.7);
  benchmark::RegisterBenchmark("libm sqrt/2.0", mathCall1<sqrtCall>, 2.0);
  return true;
}();

// Searching and rebuilding.  The 1 MiB rows report bytes of the searched
// string per second, and their time as a ratio to two rivals measured in
// the same run: `x memmove`, to a memmove of 1 MiB (the cost of touching
// the data at all), and `x memmem`, to the C library's memmem on the same
// search string and text.  The shapes are those that make searches slow:
// needles of 'a' with one 'b' (quadratic when searched naively), periodic
// text with a needle that breaks the period at one end, and small
// alphabets.
std::string repeated(const std::string &unit, std::size_t size) {
  std::string out;
  while (out.size() < size) out += unit;
  out.resize(size);
  return out;
}
std::string words(std::size_t size) {
  return repeated("the quick brown fox jumps over the lazy dog, then naps by the river. ", size);
}
std::string everyHundred(std::size_t size) {  // "x" once in every 100 bytes
  std::string out = words(size);
  for (std::size_t i = 50; i < size; i += 100) out[i] = 'x';
  return out;
}
std::string randomOver(const char *alphabet, std::size_t size, unsigned seed) {
  std::uint64_t state = seed;  // a fixed generator, so every run has the same text
  std::string out(size, ' ');
  const std::size_t k = std::strlen(alphabet);
  for (char &c : out) {
    state = state * 6364136223846793005ULL + 1442695040888963407ULL;
    c = alphabet[(state >> 33) % k];
  }
  return out;
}
constexpr std::size_t kMiB = 1 << 20;

// The reference times of this run, in nanoseconds, by row.
std::map<std::string, double> &referenceTimes() {
  static std::map<std::string, double> times;
  return times;
}

// Reports `ns` as a ratio to a reference row, where that row has run (a
// filter may leave it out).
void setRatio(benchmark::State &state, const char *counter, double ns,
              const std::string &reference) {
  const auto found = referenceTimes().find(reference);
  if (found != referenceTimes().end()) state.counters[counter] = ns / found->second;
}

void memmoveMiB(benchmark::State &state) {
  std::vector<char> from(kMiB, 'a'), to(kMiB);
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    std::memmove(to.data(), from.data(), kMiB);
    benchmark::DoNotOptimize(to.data());
    benchmark::ClobberMemory();
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  referenceTimes()["memmove"] = spent.count() / static_cast<double>(state.iterations());
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kMiB));
}

struct SearchShape {
  const char *name;
  std::string needle, text;
};
const SearchShape kShapes[] = {
    {"text, no match", "quartz", words(kMiB)},
    {"text, no match, 40-byte needle", "the quick brown fox jumps over the cat!!", words(kMiB)},
    {"a, 3999 a and a b", std::string(3999, 'a') + "b", std::string(kMiB, 'a')},
    {"a, a b and 3999 a", "b" + std::string(3999, 'a'), std::string(kMiB, 'a')},
    {"a, aab", "aab", std::string(kMiB, 'a')},
    {"a, b and 15 a", "b" + std::string(15, 'a'), std::string(kMiB, 'a')},
    {"abab, ab..abb", repeated("ab", 14) + "b", repeated("ab", kMiB)},
    {"aabaab, aab..aaa", repeated("aab", 15) + "aaa", repeated("aab", kMiB)},
    {"abcabc, abc..abd..abc", repeated("abc", 24) + "abd" + repeated("abc", 24),
     repeated("abc", kMiB)},
    {"random ab, 32 bytes", randomOver("ab", 32, 7), randomOver("ab", kMiB, 8)},
    {"random acgt, 20 bytes", randomOver("acgt", 20, 9), randomOver("acgt", kMiB, 10)},
};

void memmemRow(benchmark::State &state, const SearchShape *shape) {
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    benchmark::DoNotOptimize(::memmem(shape->text.data(), shape->text.size(), shape->needle.data(),
                                      shape->needle.size()));
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  const double ns = spent.count() / static_cast<double>(state.iterations());
  referenceTimes()[std::string("memmem ") + shape->name] = ns;
  setRatio(state, "x memmove", ns, "memmove");
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(shape->text.size()));
}

// A 1 MiB row with its ratios; `shape` names the memmem row beside it.
void ratioRow(benchmark::State &state, const char *routine,
              const std::vector<std::vector<unsigned char>> &inputs,
              const std::vector<unsigned char> &result, const char *shape) {
  const double ns = run(state, routine, inputs, result, kMiB);
  setRatio(state, "x memmove", ns, "memmove");
  if (shape != nullptr) setRatio(state, "x memmem", ns, std::string("memmem ") + shape);
}

const bool kShapeRowsRegistered = [] {
  benchmark::RegisterBenchmark("memmove/1 MiB (reference)", memmoveMiB);
  for (const SearchShape &shape : kShapes) {
    const std::string name = std::string("1 MiB of ") + shape.name;
    benchmark::RegisterBenchmark(("memmem/" + name).c_str(), memmemRow, &shape);
    benchmark::RegisterBenchmark(("LOCATE4/" + name).c_str(), [&shape](benchmark::State &s) {
      ratioRow(s, "CLI_udfLOCATE4", {lob(shape.needle), lob(shape.text)}, number(0), shape.name);
    });
    benchmark::RegisterBenchmark(("REPLACE2/" + name).c_str(), [&shape](benchmark::State &s) {
      ratioRow(s, "CLI_udfREPLACE2", {lob(shape.text), lob(shape.needle), lob("yz")}, lobArea(),
               shape.name);
    });
  }
  // Many matches: one every 100 bytes, and one at every byte, replaced by
  // one byte and by none.
  const std::string as(kMiB, 'a');
  benchmark::RegisterBenchmark("REPLACE2/1 MiB, a match every 100 bytes", [](benchmark::State &s) {
    ratioRow(s, "CLI_udfREPLACE2", {lob(everyHundred(kMiB)), lob("x"), lob("y")}, lobArea(),
             nullptr);
  });
  benchmark::RegisterBenchmark(
      "REPLACE2/1 MiB, a match at every byte, by one byte", [as](benchmark::State &s) {
        ratioRow(s, "CLI_udfREPLACE2", {lob(as), lob("a"), lob("b")}, lobArea(), nullptr);
      });
  benchmark::RegisterBenchmark(
      "REPLACE2/1 MiB, a match at every byte, by none", [as](benchmark::State &s) {
        ratioRow(s, "CLI_udfREPLACE2", {lob(as), lob("a"), lob("")}, lobArea(), nullptr);
      });
  // Here the result is the 1 MiB.
  benchmark::RegisterBenchmark(
      "REPLACE2/512 KiB, a match at every byte, by two bytes", [](benchmark::State &s) {
        ratioRow(s, "CLI_udfREPLACE2", {lob(std::string(kMiB / 2, 'a')), lob("a"), lob("bc")},
                 lobArea(), nullptr);
      });
  return true;
}();

// Short texts, as SQL hands them row by row.
struct SearchRow {
  const char *name, *routine;
  std::vector<std::vector<unsigned char>> inputs;
  std::vector<unsigned char> result;
};
const SearchRow kSearchRows[] = {
    {"LOCATE1/20-byte text",
     "CLI_udfLOCATE1",
     {text("fox"), text(words(20)), number(1)},
     number(0)},
    {"LOCATE3/20-byte text", "CLI_udfLOCATE3", {text("fox"), text(words(20))}, number(0)},
    {"REPLACE1/20-byte text",
     "CLI_udfREPLACE1",
     {text(words(20)), text("o"), text("00")},
     textArea()},
    {"INSERT1/20-byte text",
     "CLI_udfINSERT1",
     {text(words(20)), number(5), number(3), text("XYZ")},
     textArea()},
    {"SOUNDEX/10-byte name", "CLI_udfSOUNDEX", {text("Washington")}, textArea()},
    {"DIFFERENCE/two names", "CLI_udfDIFFERENCE", {text("Ashcraft"), text("Ashcroft")}, number(0)},
};

const bool kSearchRowsRegistered = [] {
  for (const SearchRow &r : kSearchRows) {
    benchmark::RegisterBenchmark(
        r.name, [&r](benchmark::State &s) { run(s, r.routine, r.inputs, r.result); });
  }
  return true;
}();

// DAYNAME and MONTHNAME with the names in the database's code page (UTF-8),
// so that no conversion takes place.
void nameRow(benchmark::State &state, const char *name, const char *date) {
  void *fn = exportNamed(name);
  setenv("ORVENGINE_LOCALE", "en_US", 1);
  unsigned char dbinfo[512] = {};
  const std::uint32_t utf8 = 1208;
  std::memcpy(dbinfo + 268, &utf8, 4);
  char text[40], result[102];
  std::int16_t indicators[2] = {};
  char sqlstate[6] = {}, message[70] = {};
  void *args[] = {text,    result,  &indicators[0], &indicators[1], sqlstate,
                  nullptr, nullptr, message,        dbinfo};
  const std::size_t size = std::strlen(date) + 1;
  for (auto _ : state) {
    std::memcpy(text, date, size);
    invoke(fn, args, std::make_index_sequence<9>{});
    benchmark::DoNotOptimize(result);
  }
  if (sqlstate[0] != '\0') state.SkipWithError("the routine reported a status");
}

const bool kNameRowsRegistered = [] {
  benchmark::RegisterBenchmark("DAYNAME1/10-byte date, no conversion", nameRow, "CLI_udfDAYNAME1",
                               "2001-09-27");
  benchmark::RegisterBenchmark("MONTHNAME2/26-byte timestamp, no conversion", nameRow,
                               "CLI_udfMONTHNAME2", "2001-09-27-13.30.15.123456");
  return true;
}();

// SQLCACHE_SNAPSHOT over a snapshot of 100000 statements: open, every
// fetch, close.  Reports rows per second.
void snapshotScan(benchmark::State &state) {
  const std::string dir = "/tmp/orv_bench_snapshot_" + std::to_string(::getpid());
  std::filesystem::create_directories(dir + "/tmp");
  {
    std::ofstream out(dir + "/tmp/sqlcache.sql", std::ios::binary);
    out << orv::snapshot::section("BENCH");
    for (int i = 0; i < 100000; ++i) {
      orv::snapshot::Statement st;
      st.columns.fill(i);
      st.text = "SELECT C1, C2 FROM T WHERE ID = " + std::to_string(i);
      out << orv::snapshot::statement(st);
    }
  }
  setenv("ORVENGINE_INSTANCE_PATH", dir.c_str(), 1);
  unsetenv("ORVENGINE_SNAPSHOT_NAME");
  void *fn = exportNamed("SQLCACHE_SNAPSHOT");
  std::int32_t numbers[16] = {};
  char text[9] = {};
  std::vector<unsigned char> statement(4 + 1048576);
  std::int16_t indicators[18] = {};
  char sqlstate[6] = {}, message[28] = {};
  unsigned char scratchpad[128] = {};
  std::int32_t callType = 0;
  std::vector<void *> args;
  for (auto &n : numbers) args.push_back(&n);
  args.push_back(text);
  args.push_back(statement.data());
  for (auto &i : indicators) args.push_back(&i);
  args.insert(args.end(), {sqlstate, nullptr, nullptr, message, scratchpad, &callType});
  std::int64_t rows = 0;
  for (auto _ : state) {
    std::memset(scratchpad, 0, sizeof scratchpad);
    callType = CLI_CALL_OPEN;
    invoke(fn, args.data(), std::make_index_sequence<42>{});
    callType = CLI_CALL_FETCH;
    for (sqlstate[0] = '\0'; sqlstate[0] == '\0'; ++rows) {
      invoke(fn, args.data(), std::make_index_sequence<42>{});
    }
    --rows;
    callType = CLI_CALL_CLOSE;
    invoke(fn, args.data(), std::make_index_sequence<42>{});
  }
  state.SetItemsProcessed(rows);
  if (rows != 100000 * static_cast<std::int64_t>(state.iterations())) {
    state.SkipWithError("the snapshot did not give every row");
  }
  std::filesystem::remove_all(dir);
}

}  // namespace

BENCHMARK(snapshotScan)->Name("SQLCACHE_SNAPSHOT/100000 statements")->Unit(benchmark::kMillisecond);

BENCHMARK(timestampRow)->Name("TIMESTAMP/26-byte timestamp");
BENCHMARK(timestampDiffRow)->Name("TIMESTAMPDIFF/2, 20-byte duration");

BENCHMARK(space)->Name("SPACE/20");
BENCHMARK(lcase1)->Name("LCASE1/20-byte text");
BENCHMARK(rtrim1)->Name("RTRIM1/20-byte text");
BENCHMARK(ltrim1)->Name("LTRIM1/20-byte text");
BENCHMARK(left1)->Name("LEFT1/20-byte text, 10");
BENCHMARK(right1)->Name("RIGHT1/20-byte text, 10");
BENCHMARK(lcase2)->Name("LCASE2/20 bytes");
BENCHMARK(rtrim2)->Name("RTRIM2/20 bytes");
BENCHMARK(charCode)->Name("CHAR/65");
BENCHMARK(ascii1)->Name("ASCII1/20-byte text");
BENCHMARK(lcase2MiB)->Name("LCASE2/1 MiB");
BENCHMARK(repeat2MiB)->Name("REPEAT2/16 bytes x 65536 = 1 MiB");
BENCHMARK(repeat2MiBOneByte)->Name("REPEAT2/1 byte x 1048576");
BENCHMARK(repeat1OneByte)->Name("REPEAT1/1 byte x 4000");
BENCHMARK(memcpy4000)->Name("memcpy/4000 bytes (reference for REPEAT1)");
BENCHMARK(repeat1ThreeBytes)->Name("REPEAT1/3 bytes x 1333");

BENCHMARK_MAIN();
