// What every fuzz target shares: calling an export the way an engine does,
// with each argument in a heap block of its own, and the checks that hold
// for every call whatever the routine.
//
// Each value sits at the very end of its own allocation, so a routine that
// writes or reads one byte past a result, an input, an indicator or a
// status buffer is caught by AddressSanitizer.  A broken invariant is
// reported on standard error and ends the run with __builtin_trap, which
// libFuzzer records as a crash with its input.
#pragma once

#include <dlfcn.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/cliudf.h"

namespace orv::fuzz {

// Reports a broken invariant and stops the run.
[[noreturn]] inline void broken(const char *routine, const char *what) {
  static_cast<void>(std::fprintf(stderr, "\n*** %s: %s\n", routine, what));
  __builtin_trap();
}

#define ORV_CHECK(routine, condition)                           \
  do {                                                          \
    if (!(condition)) ::orv::fuzz::broken(routine, #condition); \
  } while (0)

inline constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
inline constexpr std::int16_t kIndicator = 0x5A5A;

// Whether `n` bytes all hold the unwritten fill.  Compared in chunks with
// memcmp: a byte loop would be instrumented for the fuzzer's comparison
// tracing and make a scan of a 1 MiB area slow.
inline bool allUnwritten(const unsigned char *p, std::size_t n) {
  static const std::vector<unsigned char> fill(65536, kUnwritten);
  for (std::size_t at = 0; at < n; at += fill.size()) {
    const std::size_t chunk = std::min(fill.size(), n - at);
    if (std::memcmp(p + at, fill.data(), chunk) != 0) return false;
  }
  return true;
}

// Large blocks are kept for the next call of the same size: a CLI_udfLob
// result area of 1 MiB, mapped and unmapped on every call, would make a
// run slow.  Each kept block is still exactly its size.
class Pool {
 public:
  static constexpr std::size_t kLarge = 65536;
  static unsigned char *take(std::size_t size) {
    auto &kept = blocks();
    for (auto at = kept.begin(); at != kept.end(); ++at) {
      if (at->first == size) {
        unsigned char *p = at->second;
        kept.erase(at);
        return p;
      }
    }
    return new unsigned char[size];
  }
  static void give(unsigned char *p, std::size_t size) {
    auto &kept = blocks();
    if (size < kLarge || kept.size() >= 16) {
      delete[] p;
      return;
    }
    kept.emplace_back(size, p);
  }

 private:
  // Never destroyed, so that the kept blocks stay reachable at exit and
  // the leak check does not count them.
  static std::vector<std::pair<std::size_t, unsigned char *>> &blocks() {
    static auto *kept = new std::vector<std::pair<std::size_t, unsigned char *>>;
    return *kept;
  }
};

// Gives a block back to the pool.
struct Release {
  std::size_t size = 0;
  void operator()(unsigned char *p) const { Pool::give(p, size); }
};

// Bytes on the heap with nothing behind them: the allocation is exactly
// the value's size.
class Block {
 public:
  Block() = default;
  explicit Block(std::size_t size, unsigned char fill = kUnwritten)
      : bytes_(Pool::take(size == 0 ? 1 : size), Release{size == 0 ? 1 : size}), size_(size) {
    std::memset(bytes_.get(), fill, size == 0 ? 1 : size);
  }
  unsigned char *data() const { return bytes_.get(); }
  char *chars() const { return reinterpret_cast<char *>(bytes_.get()); }
  std::size_t size() const { return size_; }
  std::string_view view() const { return {chars(), size_}; }
  std::string copy() const { return std::string(view()); }
  bool holds(std::string_view v) const { return view() == v; }

 private:
  std::unique_ptr<unsigned char[], Release> bytes_;
  std::size_t size_ = 0;
};

// Value layouts, laid out into blocks of their exact size.
// The next value of type T from the fuzzer's bytes, zero-filled where the
// bytes run out.
template <typename T>
T take(const std::uint8_t *&data, std::size_t &size) {
  T v{};
  const std::size_t n = size < sizeof v ? size : sizeof v;
  std::memcpy(&v, data, n);
  data += n;
  size -= n;
  return v;
}

inline Block textBlock(std::string_view s) {
  Block b(s.size() + 1);
  std::memcpy(b.data(), s.data(), s.size());
  b.data()[s.size()] = 0;
  return b;
}

inline Block lobBlock(std::string_view s) {
  Block b(CLI_LOB_AREA_SIZE(s.size()));
  const auto n = static_cast<std::uint32_t>(s.size());
  std::memcpy(b.data(), &n, 4);
  std::memcpy(b.data() + CLI_LOB_DATA_OFFSET, s.data(), s.size());
  return b;
}

template <typename T>
Block numberBlock(T v) {
  Block b(sizeof v);
  std::memcpy(b.data(), &v, sizeof v);
  return b;
}

// A CLI_udfLob result area: its length word holds the capacity on entry,
// its data bytes are unwritten.
inline Block lobArea(std::uint32_t capacity) {
  Block b(CLI_LOB_AREA_SIZE(std::size_t{capacity}));
  std::memcpy(b.data(), &capacity, 4);
  return b;
}

template <typename T>
T numberIn(const Block &b) {
  T v;
  std::memcpy(&v, b.data(), sizeof v);
  return v;
}

inline std::uint32_t lobLength(const Block &b) { return numberIn<std::uint32_t>(b); }

inline std::string_view lobData(const Block &b, std::uint32_t length) {
  return {b.chars() + CLI_LOB_DATA_OFFSET, length};
}

// The terminated text in an area; the terminator must lie inside it.
inline std::string_view textIn(const char *routine, const Block &b) {
  const void *end = std::memchr(b.data(), 0, b.size());
  ORV_CHECK(routine, end != nullptr);
  return {b.chars(), static_cast<std::size_t>(static_cast<const unsigned char *>(end) - b.data())};
}

// An export of the linked library, looked up by name as an engine finds
// it, with its catalogue entry.
struct Export {
  const cli::catalogue::Routine *routine = nullptr;
  void *address = nullptr;
};

// Lookups are kept by the address of the name, which is almost always a
// literal, with the name itself to confirm a hit; a run makes hundreds of
// calls and the lookup would otherwise cost as much as the routine.
inline Export lookUp(const char *name) {
  struct Seen {
    const char *at;
    std::string name;
    Export found;
  };
  static auto *seen = new std::vector<Seen>;  // never destroyed: see Pool
  for (const Seen &s : *seen) {
    if (s.at == name && s.name == name) return s.found;
  }
  Export e{cli::catalogue::find(name), dlsym(RTLD_DEFAULT, name)};
  if (e.address == nullptr) broken(name, "not exported");
  if (seen->size() < 256) seen->push_back({name, name, e});
  return e;
}

inline void *exportAddress(const char *name) { return lookUp(name).address; }

// Every frame argument is a pointer, so a pointer type taking K void *
// parameters serves for any routine with a frame of K arguments.
template <std::size_t... Is>
void invokeWith(void *fn, void *const *args, std::index_sequence<Is...>) {
  using Export = void (*)(decltype(Is, static_cast<void *>(nullptr))...);
  reinterpret_cast<Export>(fn)(args[Is]...);
}

template <std::size_t K>
void invokeFixed(void *fn, const std::vector<void *> &args) {
  invokeWith(fn, args.data(), std::make_index_sequence<K>{});
}

inline void invoke(const char *name, void *fn, const std::vector<void *> &args) {
  switch (args.size()) {
    case 8:
      return invokeFixed<8>(fn, args);
    case 9:
      return invokeFixed<9>(fn, args);
    case 10:
      return invokeFixed<10>(fn, args);
    case 12:
      return invokeFixed<12>(fn, args);
    case 14:
      return invokeFixed<14>(fn, args);
    case 19:
      return invokeFixed<19>(fn, args);
    case 21:
      return invokeFixed<21>(fn, args);
    case 42:
      return invokeFixed<42>(fn, args);
    default:
      broken(name, "no frame of this many arguments");
  }
}

// How an input may differ after the call.
enum class Trim {
  none,        // not at all
  blanks,      // a NUL in place of the first of its trailing 0x20 bytes
  whiteSpace,  // a NUL in place of the first of its trailing blanks, tabs, LF, CR, VT, FF
};

inline bool isWhite(unsigned char c) {
  return c == 0x20 || c == 0x09 || c == 0x0A || c == 0x0D || c == 0x0B || c == 0x0C;
}

// `after` is `before` as it was, or with the NUL of the trim rule.
inline bool trimmedOrSame(std::string_view before, std::string_view after, Trim trim) {
  if (before == after) return true;
  if (trim == Trim::none || before.size() != after.size()) return false;
  // Terminated text: `before` ends with its NUL.
  std::size_t end = before.size() - 1;
  while (end > 0 && (trim == Trim::blanks ? before[end - 1] == ' '
                                          : isWhite(static_cast<unsigned char>(before[end - 1])))) {
    --end;
  }
  std::string want(before);
  want[end] = '\0';
  return after == want;
}

// One call of a scalar export: its inputs and results, each in its own
// block, with indicators and status buffers of their exact sizes.
class Call {
 public:
  explicit Call(const char *name) : name_(name), export_(lookUp(name)) {
    if (export_.routine == nullptr) broken(name, "not in the catalogue");
    inputs_.reserve(4);
    results_.reserve(2);
    indicators_.reserve(6);
    trims_.reserve(4);
    heads_.reserve(2);
    before_.reserve(4);
    resultsBefore_.reserve(2);
  }

  Call &input(Block b, Trim trim = Trim::none) {
    inputs_.push_back(std::move(b));
    trims_.push_back(trim);
    return *this;
  }
  // A result area: `head` bytes as the caller set them (4 for the length
  // word of a CLI_udfLob area), then the unwritten fill.
  Call &result(Block b, std::size_t head = 0) {
    results_.push_back(std::move(b));
    heads_.push_back(head);
    return *this;
  }
  Call &extra(void *p) {
    extras_.push_back(p);
    return *this;
  }
  // A failed call may leave what the routine stored before its test.
  Call &mayStoreOnFailure() {
    mayStore_ = true;
    return *this;
  }

  // Runs the call and checks what holds for every scalar routine without
  // null handling: indicators untouched, inputs untouched but for their
  // trim rule, status buffers untouched on success and a SYSFUN error of
  // the routine's own list on failure, the result untouched on failure.
  // Returns the two-digit SYSFUN code, empty on success.
  std::string run() {
    runRaw();
    for (std::size_t i = 0; i < inputs_.size(); ++i) {
      ORV_CHECK(name_, trimmedOrSame(before_[i], inputs_[i].view(), trims_[i]));
    }
    for (const Block &ind : indicators_)
      ORV_CHECK(name_, numberIn<std::int16_t>(ind) == kIndicator);
    const std::string code = sysfunCode();
    if (!code.empty() && !mayStore_) {
      for (std::size_t i = 0; i < results_.size(); ++i) {
        ORV_CHECK(name_, resultUntouched(i));
      }
    }
    return code;
  }

  // For a routine that reads its first input indicator: runs the call
  // with that indicator set to `first`, and checks nothing of its own.
  void runRawWithFirstIndicator(std::int16_t first) {
    firstIndicator_ = first;
    runRaw();
  }

  // Runs the call and checks nothing of its own.
  void runRaw() {
    before_.clear();
    for (const Block &b : inputs_) before_.push_back(b.copy());
    // Only the head of a result area is kept to compare; the rest is the
    // unwritten fill.
    resultsBefore_.clear();
    for (std::size_t i = 0; i < results_.size(); ++i) {
      resultsBefore_.push_back(std::string(results_[i].view().substr(0, heads_[i])));
    }
    indicators_.clear();
    for (std::size_t i = 0; i < inputs_.size() + results_.size(); ++i) {
      indicators_.push_back(numberBlock(kIndicator));
    }
    if (!inputs_.empty()) std::memcpy(indicators_[0].data(), &firstIndicator_, 2);
    sqlstate_ = Block(CLI_SQLSTATE_SIZE, 'S');
    message_ = Block(CLI_MESSAGE_SIZE, 'M');
    std::vector<void *> args;
    args.reserve(inputs_.size() + results_.size() + indicators_.size() + 4 + extras_.size());
    for (const Block &b : inputs_) args.push_back(b.data());
    for (const Block &b : results_) args.push_back(b.data());
    for (const Block &b : indicators_) args.push_back(b.data());
    args.push_back(sqlstate_.data());
    args.push_back(const_cast<char *>("FUNCTION"));
    args.push_back(const_cast<char *>("SPECIFIC"));
    args.push_back(message_.data());
    args.insert(args.end(), extras_.begin(), extras_.end());
    invoke(name_, export_.address, args);
  }

  // The SYSFUN code of the call, after checking the exact form of the
  // status: both buffers untouched, or "38552" and "SYSFUN:NN" with their
  // terminators and nothing else written, NN one of the routine's codes.
  std::string sysfunCode() const {
    if (untouched(sqlstate_, 'S')) {
      ORV_CHECK(name_, untouched(message_, 'M'));
      return {};
    }
    ORV_CHECK(name_, sqlstate_.holds(std::string_view("38552\0", 6)));
    const std::string_view m = message_.view();
    ORV_CHECK(name_, m.substr(0, 7) == "SYSFUN:" && m[9] == '\0');
    ORV_CHECK(name_, std::all_of(m.begin() + 10, m.end(), [](char c) { return c == 'M'; }));
    const std::string code(m.substr(7, 2));
    static constexpr std::string_view kKnown[] = {"01", "02", "03", "04", "05",
                                                  "06", "07", "08", "10", "11"};
    ORV_CHECK(name_, std::find(std::begin(kKnown), std::end(kKnown), code) != std::end(kKnown));
    ORV_CHECK(name_,
              std::string_view(export_.routine->sysfunCodes).find(code) != std::string_view::npos);
    return code;
  }

  static bool untouched(const Block &b, char fill) {
    return std::all_of(b.view().begin(), b.view().end(), [fill](char c) { return c == fill; });
  }

  const char *name() const { return name_; }
  const Block &in(std::size_t i) const { return inputs_[i]; }
  const Block &out(std::size_t i = 0) const { return results_[i]; }
  const std::string &inputBefore(std::size_t i) const { return before_[i]; }
  const Block &indicator(std::size_t i) const { return indicators_[i]; }
  const Block &sqlstate() const { return sqlstate_; }
  const Block &message() const { return message_; }
  bool resultUntouched(std::size_t i = 0) const {
    const Block &b = results_[i];
    const std::string &head = resultsBefore_[i];
    return b.view().substr(0, head.size()) == head &&
           allUnwritten(b.data() + head.size(), b.size() - head.size());
  }

 private:
  const char *name_;
  Export export_;
  std::vector<Block> inputs_, results_, indicators_;
  std::vector<Trim> trims_;
  std::vector<std::size_t> heads_;
  std::vector<std::string> before_, resultsBefore_;
  std::vector<void *> extras_;
  Block sqlstate_, message_;
  bool mayStore_ = false;
  std::int16_t firstIndicator_ = kIndicator;
};

// With ORV_FUZZ_LAST_INPUT set, each input is written to that file before
// it runs: a fault that wrecks the stack can leave libFuzzer unable to save
// the input that caused it.
inline void keepLastInput(const std::uint8_t *data, std::size_t size) {
  static const char *path = std::getenv("ORV_FUZZ_LAST_INPUT");
  if (path == nullptr) return;
  if (std::FILE *f = std::fopen(path, "wb")) {
    static_cast<void>(std::fwrite(data, 1, size, f));
    static_cast<void>(std::fclose(f));
  }
}

// A terminated text from fuzz bytes: everything up to the first NUL.
inline std::string_view upToNul(std::string_view s) { return s.substr(0, s.find('\0')); }

}  // namespace orv::fuzz
