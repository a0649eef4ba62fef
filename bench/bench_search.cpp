// Searching and rebuilding.  The 1 MiB rows report bytes of the searched
// string per second, and their time as a ratio to two rivals measured in
// the same run: `x memmove`, to a memmove of 1 MiB (the cost of touching
// the data at all), and `x memmem`, to the C library's memmem on the same
// search string and text.  The shapes are those that make searches slow:
// needles of 'a' with one 'b' (quadratic when searched naively), periodic
// text with a needle that breaks the period at one end or in the middle,
// small alphabets, needles of 64 and 128 KiB, where what the needle costs
// to prepare counts, and text made to defeat the filter.
#include <chrono>
#include <cstdint>
#include <cstring>
#include <string>
#include <utility>

#include "bench_support.hpp"

namespace orv::bench {

namespace {

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

void memmoveMiB(benchmark::State &state) {
  std::vector<char> from(kMiB, 'a'), to(kMiB);
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    std::memmove(to.data(), from.data(), kMiB);
    benchmark::DoNotOptimize(to.data());
    benchmark::ClobberMemory();
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  setReferenceTime("memmove", spent.count() / static_cast<double>(state.iterations()));
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kMiB));
}

std::string randomBytes(std::size_t size, unsigned seed) {  // every byte, NUL too
  std::uint64_t state = seed;
  std::string out(size, ' ');
  for (char &c : out) {
    state = state * 6364136223846793005ULL + 1442695040888963407ULL;
    c = static_cast<char>(state >> 56);
  }
  return out;
}
// `unit` repeated to `size` bytes with one byte just past the middle
// changed to '!', a place that no fixed sample of offsets needs to hit.
std::string brokenInTheMiddle(const std::string &unit, std::size_t size) {
  std::string out = repeated(unit, size);
  out[size / 2 + 1] = '!';
  return out;
}
// A needle whose first half stands in the text every 70 bytes and whose
// second half is other words of the same letters.
std::string commonPrefix(std::size_t size) {
  return words(size / 2) +
         repeated("a lazy dog naps by the quick brown fox, then jumps. ", size / 2);
}
// The needle with its last byte changed, and one byte more: the text is only
// one byte longer than the needle, and the first place fails at its end.
std::string oneLonger(const std::string &needle) {
  std::string out = needle + "x";
  out[needle.size() - 1] = static_cast<char>(out[needle.size() - 1] ^ 1);
  return out;
}

constexpr std::size_t k64 = std::size_t{1} << 16, k128 = std::size_t{1} << 17;

// Text made to defeat the filter: copies of a random period of `unit` bytes
// over a and b, one copy in `every` with a byte at a random place changed to
// c; the needle is the period repeated to 64 KiB, which nearly matches at
// every copy.  The search string first, then the text.
std::pair<std::string, std::string> nearCopies(std::size_t unit, std::size_t every) {
  std::uint64_t state = unit * 31 + every;
  const auto next = [&state] {
    state = state * 6364136223846793005ULL + 1442695040888963407ULL;
    return static_cast<std::size_t>(state >> 33);
  };
  std::string period(unit, 'a');
  for (char &c : period) c = "ab"[next() % 2];
  std::string text = repeated(period, kMiB);
  for (std::size_t copy = 0; copy < kMiB / unit; copy += every)
    text[copy * unit + next() % unit] = 'c';
  return {repeated(period, k64), text};
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
    // Long needles, where preparing the needle could cost more than the scan.
    {"a, 65535 a and a b", std::string(k64 - 1, 'a') + "b", std::string(kMiB, 'a')},
    {"a, a b and 65535 a", "b" + std::string(k64 - 1, 'a'), std::string(kMiB, 'a')},
    {"a, 131072 a and a b", std::string(k128, 'a') + "b", std::string(kMiB, 'a')},
    {"abab, 65536 ab and a b", repeated("ab", 2 * k64) + "b", repeated("ab", kMiB)},
    {"random bytes, 64 KiB", randomBytes(k64, 11), randomBytes(kMiB, 12)},
    {"random bytes, 128 KiB", randomBytes(k128, 13), randomBytes(kMiB, 12)},
    {"random ab, 64 KiB", randomOver("ab", k64, 14), randomOver("ab", kMiB, 8)},
    {"random ab, 128 KiB", randomOver("ab", k128, 15), randomOver("ab", kMiB, 8)},
    {"abcabc, 64 KiB abc..!..abc", brokenInTheMiddle("abc", k64), repeated("abc", kMiB)},
    {"abcabc, 128 KiB abc..!..abc", brokenInTheMiddle("abc", k128), repeated("abc", kMiB)},
    {"text, 64 KiB, its first half common", commonPrefix(k64), words(kMiB)},
    {"text, 128 KiB, its first half common", commonPrefix(k128), words(kMiB)},
    {"53-byte copies, 1 in 64 changed, 64 KiB", nearCopies(53, 64).first,
     nearCopies(53, 64).second},
    {"20-byte copies, 1 in 2 changed, 64 KiB", nearCopies(20, 2).first, nearCopies(20, 2).second},
};
// The text one byte longer than a 128 KiB needle of random bytes: nearly
// all the time goes into what the needle costs to prepare.
const SearchShape kShortText = {"128 KiB and a byte, random bytes", randomBytes(k128, 16),
                                oneLonger(randomBytes(k128, 16))};

void memmemRow(benchmark::State &state, const SearchShape *shape) {
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    benchmark::DoNotOptimize(::memmem(shape->text.data(), shape->text.size(), shape->needle.data(),
                                      shape->needle.size()));
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  const double ns = spent.count() / static_cast<double>(state.iterations());
  setReferenceTime(std::string("memmem ") + shape->name, ns);
  setRatio(state, "x memmove", ns, "memmove");
  state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(shape->text.size()));
}

// A 1 MiB row with its ratios; `shape` names the memmem row beside it.
void ratioRow(benchmark::State &state, const char *routine, const std::vector<Value> &inputs,
              const Value &result, const char *shape, std::size_t bytes = kMiB) {
  const double ns = run(state, routine, inputs, result, static_cast<std::int64_t>(bytes));
  setRatio(state, "x memmove", ns, "memmove");
  if (shape != nullptr) setRatio(state, "x memmem", ns, std::string("memmem ") + shape);
}

void registerShapeRows() {
  benchmark::RegisterBenchmark("memmove/1 MiB (reference)", memmoveMiB);
  const auto shapeRows = [](const SearchShape &shape, const std::string &name) {
    const std::size_t size = shape.text.size();
    benchmark::RegisterBenchmark(("memmem/" + name).c_str(), memmemRow, &shape);
    benchmark::RegisterBenchmark(("LOCATE4/" + name).c_str(), [&shape, size](benchmark::State &s) {
      ratioRow(s, "CLI_udfLOCATE4", {lob(shape.needle), lob(shape.text)}, number(0), shape.name,
               size);
    });
    benchmark::RegisterBenchmark(("LOCATE2/" + name).c_str(), [&shape, size](benchmark::State &s) {
      ratioRow(s, "CLI_udfLOCATE2", {lob(shape.needle), lob(shape.text), int32(1)}, number(0),
               shape.name, size);
    });
    benchmark::RegisterBenchmark(("REPLACE2/" + name).c_str(), [&shape, size](benchmark::State &s) {
      ratioRow(s, "CLI_udfREPLACE2", {lob(shape.text), lob(shape.needle), lob("yz")}, lobArea(),
               shape.name, size);
    });
  };
  for (const SearchShape &shape : kShapes) shapeRows(shape, std::string("1 MiB of ") + shape.name);
  shapeRows(kShortText, kShortText.name);
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
}

// Short texts, as SQL hands them row by row.
struct SearchRow {
  const char *name, *routine;
  std::vector<Value> inputs;
  Value result;
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

}  // namespace

void registerSearchRows() {
  registerShapeRows();
  for (const SearchRow &r : kSearchRows) {
    benchmark::RegisterBenchmark(
        r.name, [&r](benchmark::State &s) { run(s, r.routine, r.inputs, r.result); });
  }
}

}  // namespace orv::bench
