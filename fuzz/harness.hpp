// What every fuzz target shares.  Each value of a call sits in a heap block
// of exactly its size, so that a routine reading or writing one byte past
// an input, a result, an indicator or a status buffer is caught by
// AddressSanitizer; the blocks' addresses go into a cli::call::Frame, and
// the library's frame caller (src/frame/call.hpp) calls the export with
// them in the frame's order, as an engine does.  A broken invariant is
// reported on standard error and ends the run with __builtin_trap, which
// libFuzzer records as a crash with its input.
#pragma once

#include <dlfcn.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "frame/status.hpp"

namespace orv::fuzz {

namespace cat = cli::catalogue;

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

// Whether `n` bytes all hold `fill`: the first does, and each the same as
// the one before.  memcmp, not a loop, which the fuzzer's comparison
// tracing would make slow on a 1 MiB area.
inline bool allAre(const void *at, std::size_t n, unsigned char fill = kUnwritten) {
  const auto *p = static_cast<const unsigned char *>(at);
  return n == 0 || (p[0] == fill && std::memcmp(p, p + 1, n - 1) == 0);
}

// Large blocks are kept for the next block of the same size: a 1 MiB
// CLI_udfLob area, mapped and unmapped on every call, would make a run
// slow.  Never destroyed, so that the kept blocks stay reachable at exit
// and the leak check does not count them.
inline std::vector<std::pair<std::size_t, unsigned char *>> &keptBlocks() {
  static auto *kept = new std::vector<std::pair<std::size_t, unsigned char *>>;
  return *kept;
}
struct Release {
  std::size_t size = 0;
  void operator()(unsigned char *p) const {
    if (size < 65536 || keptBlocks().size() >= 16) {
      delete[] p;
    } else {
      keptBlocks().emplace_back(size, p);
    }
  }
};

// Bytes on the heap with nothing behind them: the allocation is exactly
// the value's size (a byte for an empty value).
class Block {
 public:
  Block() = default;
  explicit Block(std::size_t size, unsigned char fill = kUnwritten) : size_(size) {
    const std::size_t n = std::max<std::size_t>(size, 1);
    auto &kept = keptBlocks();
    const auto at = std::find_if(kept.begin(), kept.end(), [&](auto &k) { return k.first == n; });
    bytes_ = {at == kept.end() ? new unsigned char[n] : at->second, Release{n}};
    if (at != kept.end()) kept.erase(at);
    std::memset(bytes_.get(), fill, n);
  }
  // A block that holds these bytes.
  explicit Block(std::string_view bytes) : Block(bytes.size()) {
    std::copy(bytes.begin(), bytes.end(), chars());
  }
  [[nodiscard]] unsigned char *data() const { return bytes_.get(); }
  [[nodiscard]] char *chars() const { return reinterpret_cast<char *>(bytes_.get()); }
  [[nodiscard]] std::size_t size() const { return size_; }
  [[nodiscard]] std::string_view view() const { return {chars(), size_}; }

 private:
  std::unique_ptr<unsigned char[], Release> bytes_;
  std::size_t size_ = 0;
};

// The next value of type T from the fuzzer's bytes, zero-filled where the
// bytes run out.
template <typename T>
T take(const std::uint8_t *&data, std::size_t &size) {
  T v{};
  const std::size_t n = std::min(size, sizeof v);
  std::memcpy(&v, data, n);
  data += n;
  size -= n;
  return v;
}

template <typename T>
std::string_view bytesOf(const T &v) {
  return {reinterpret_cast<const char *>(&v), sizeof v};
}
template <typename T>
Block numberBlock(T v) {
  return Block(bytesOf(v));
}
inline Block textBlock(std::string_view s) { return Block(std::string(s) + '\0'); }
inline Block lobBlock(std::string_view s) {
  return Block(std::string(bytesOf(static_cast<std::uint32_t>(s.size()))) + std::string(s));
}
// A CLI_udfLob result area: its length word holds the capacity on entry,
// its data bytes are unwritten.
inline Block lobArea(std::uint32_t capacity) {
  Block b(CLI_LOB_AREA_SIZE(std::size_t{capacity}));
  cli::call::prepareLobResult(b.data(), capacity);
  return b;
}

template <typename T>
T numberAt(const void *at) {
  T v;
  std::memcpy(&v, at, sizeof v);
  return v;
}
template <typename T>
T numberIn(const Block &b) {
  return numberAt<T>(b.data());
}
// A CLI_udfLob's data, as long as its length word says.
inline std::string_view lobIn(const Block &b) {
  return b.view().substr(CLI_LOB_DATA_OFFSET, numberIn<std::uint32_t>(b));
}
// The terminated text in an area; the terminator must lie inside it.
inline std::string_view textIn(const char *routine, const Block &b) {
  const std::size_t end = b.view().find('\0');
  ORV_CHECK(routine, end != std::string_view::npos);
  return b.view().substr(0, end);
}
// A terminated text from fuzz bytes: everything up to the first NUL.
inline std::string_view upToNul(std::string_view s) { return s.substr(0, s.find('\0')); }

// An export of the linked library, found by name as an engine finds it,
// with its catalogue row; each once, since a run makes hundreds of calls
// and the lookup would otherwise cost as much as the routine.
struct Export {
  const cat::Routine *routine = nullptr;
  void *address = nullptr;
};
inline Export lookUp(const char *name) {
  static auto *seen = new std::map<std::string, Export, std::less<>>;  // never destroyed
  if (const auto at = seen->find(std::string_view(name)); at != seen->end()) return at->second;
  const Export e{cat::find(name), dlsym(RTLD_DEFAULT, name)};
  if (e.address == nullptr || e.routine == nullptr) broken(name, "not exported, or not catalogued");
  return seen->emplace(name, e).first->second;
}

// The frame of a call whose values, indicators and status buffers are
// blocks that outlive it; the same frame serves any number of calls.  The
// extras are set on `f` by what they are.
class Frame {
 public:
  Frame(const Block &sqlstate, const Block &message) {
    f.inputs = in_.data();
    f.results = out_.data();
    f.inputIndicators = inIndicators_.data();
    f.resultIndicators = outIndicators_.data();
    f.sqlstate = sqlstate.chars();
    f.functionName = "FUNCTION";
    f.specificName = "SPECIFIC";
    f.message = message.chars();
  }
  Frame(const Frame &) = delete;
  Frame &operator=(const Frame &) = delete;
  void input(const Block &value, const Block &indicator) {
    in_.at(inputs_) = value.data();
    inIndicators_[inputs_++] = reinterpret_cast<std::int16_t *>(indicator.data());
  }
  void result(const Block &value, const Block &indicator) {
    out_.at(results_) = value.data();
    outIndicators_[results_++] = reinterpret_cast<std::int16_t *>(indicator.data());
  }
  // The caller reads as many values as the row has slots, and the extras
  // of the row's frame.
  void call(const Export &e) const { cli::call::call(*e.routine, e.address, f); }

  cli::call::Frame f;

 private:
  std::array<void *, cat::kMaxInputs> in_{};
  std::array<void *, cat::kMaxResults> out_{};
  std::array<std::int16_t *, cat::kMaxInputs> inIndicators_{};
  std::array<std::int16_t *, cat::kMaxResults> outIndicators_{};
  std::size_t inputs_ = 0, results_ = 0;
};

// `after` is the terminated text `before` as it was, or, for a routine
// that may cut trailing white space off its text inputs in place, with a
// NUL in place of one byte from which only white space runs to the end.
inline bool trimmedOrSame(std::string_view before, std::string_view after, bool mayTrim) {
  if (before == after) return true;
  const std::size_t k = static_cast<std::size_t>(
      std::mismatch(before.begin(), before.end(), after.begin(), after.end()).first -
      before.begin());
  const std::string_view rest = before.substr(k, before.size() - k - 1);
  return mayTrim && before.size() == after.size() && after[k] == '\0' &&
         after.substr(k + 1) == before.substr(k + 1) &&
         rest.find_first_not_of(" \t\n\v\f\r") == std::string_view::npos;
}

// One call of a scalar export: its inputs and its result, each in its own
// block, with indicators and status buffers of their exact sizes.
class Call {
 public:
  explicit Call(const char *name) : name_(name), export_(lookUp(name)) {}

  Call &input(Block b) {
    inputs_.push_back(std::move(b));
    return *this;
  }
  // The result area: `head` bytes as the caller set them (4 for the length
  // word of a CLI_udfLob area), then the unwritten fill.
  Call &result(Block b, std::size_t head = 0) {
    result_ = std::move(b);
    head_ = std::string(result_.view().substr(0, head));
    return *this;
  }
  // The database information block, for a routine whose frame has it;
  // it stays the caller's and may be null, as an engine may pass it.
  Call &dbinfo(const void *block) {
    dbinfo_ = block;
    return *this;
  }
  // A failed call may leave what the routine stored before its test.
  Call &mayStoreOnFailure() {
    mayStore_ = true;
    return *this;
  }

  // Runs the call and checks what holds for every scalar routine without
  // null handling: indicators untouched, inputs untouched but for their
  // trailing white space, status buffers untouched on success and a SYSFUN
  // error of the routine's own list on failure, the result untouched on
  // failure.  Returns the two-digit SYSFUN code, empty on success.
  std::string run() {
    runRaw();
    const bool mayTrim = (export_.routine->properties & cat::kWritesInputs) != 0;
    for (std::size_t i = 0; i < inputs_.size(); ++i) {
      ORV_CHECK(name_, trimmedOrSame(before_[i], inputs_[i].view(), mayTrim));
    }
    for (std::size_t i = 0; i <= inputs_.size(); ++i) ORV_CHECK(name_, indicator(i) == kIndicator);
    std::string code = sysfunCode();
    if (!code.empty() && !mayStore_) ORV_CHECK(name_, resultUntouched());
    return code;
  }

  // Runs the call, the first input indicator set to `first`, and checks
  // nothing of its own.
  void runRaw(std::int16_t first = kIndicator) {
    before_.clear();
    for (const Block &b : inputs_) before_.emplace_back(b.view());
    indicators_.clear();
    for (std::size_t i = 0; i <= inputs_.size(); ++i) {
      indicators_.push_back(numberBlock(i == 0 ? first : kIndicator));
    }
    sqlstate_ = Block(CLI_SQLSTATE_SIZE, 'S');
    message_ = Block(CLI_MESSAGE_SIZE, 'M');
    Frame frame(sqlstate_, message_);
    for (std::size_t i = 0; i < inputs_.size(); ++i) frame.input(inputs_[i], indicators_[i]);
    frame.result(result_, indicators_.back());
    frame.f.dbinfo = dbinfo_;
    frame.call(export_);
  }

  // The SYSFUN code of the call, after checking the exact form of the
  // status: both buffers untouched, or "38552" and "SYSFUN:NN" with their
  // terminators and nothing else written, NN one of the routine's codes.
  [[nodiscard]] std::string sysfunCode() const {
    if (allAre(sqlstate_.data(), sqlstate_.size(), 'S')) {
      ORV_CHECK(name_, allAre(message_.data(), message_.size(), 'M'));
      return {};
    }
    ORV_CHECK(name_, sqlstate_.view() == std::string_view("38552\0", 6));
    const std::string_view m = message_.view();
    ORV_CHECK(name_,
              m.substr(0, 7) == "SYSFUN:" && m[9] == '\0' && allAre(&m[10], m.size() - 10, 'M'));
    const cli::Sysfun sysfun = cli::call::sysfunIn(sqlstate_.chars(), message_.chars());
    ORV_CHECK(name_, sysfun != cli::Sysfun::none && m.substr(7, 2) == cli::textOf(sysfun).digits);
    ORV_CHECK(name_, export_.routine->raises.contains(sysfun));
    return std::string(m.substr(7, 2));
  }

  [[nodiscard]] const char *name() const { return name_; }
  [[nodiscard]] const Block &in(std::size_t i) const { return inputs_[i]; }
  [[nodiscard]] const Block &out() const { return result_; }
  [[nodiscard]] const std::string &inputBefore(std::size_t i) const { return before_[i]; }
  // Input i's indicator, or the result's for the last i.
  [[nodiscard]] std::int16_t indicator(std::size_t i) const {
    return numberIn<std::int16_t>(indicators_[i]);
  }
  [[nodiscard]] const Block &sqlstate() const { return sqlstate_; }
  [[nodiscard]] const Block &message() const { return message_; }
  // The head of the area as the caller set it, the rest unwritten.
  [[nodiscard]] bool resultUntouched() const {
    return result_.view().starts_with(head_) &&
           allAre(result_.data() + head_.size(), result_.size() - head_.size());
  }

 private:
  const char *name_;
  Export export_;
  std::vector<Block> inputs_, indicators_;
  Block result_, sqlstate_, message_;
  std::string head_;
  std::vector<std::string> before_;
  const void *dbinfo_ = nullptr;
  bool mayStore_ = false;
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

}  // namespace orv::fuzz
