// What every fuzz target shares: calling an export the way an engine does,
// with each argument in a heap block of its own (block.hpp) handed to the
// library's frame caller (arguments.hpp), and the checks that hold for
// every call whatever the routine.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "arguments.hpp"
#include "block.hpp"
#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "frame/status.hpp"

namespace orv::fuzz {

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
  // The extras, for a routine whose frame has them (the call stops the
  // run otherwise, and where one of the frame's extras is not given).
  // The database information block stays the caller's and may be null,
  // as an engine may pass it.
  Call &dbinfo(const void *block) {
    dbinfo_ = block;
    hasDbinfo_ = true;
    return *this;
  }
  Call &scratchpad(Block b) {
    scratchpad_ = std::move(b);
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
    Arguments args;
    for (std::size_t i = 0; i < inputs_.size(); ++i) args.input(inputs_[i], indicators_[i]);
    for (std::size_t i = 0; i < results_.size(); ++i) {
      args.result(results_[i], indicators_[inputs_.size() + i]);
    }
    args.status(sqlstate_, message_);
    if (hasDbinfo_) args.dbinfo(dbinfo_);
    if (scratchpad_.data() != nullptr) args.scratchpad(scratchpad_);
    args.call(export_);
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
    // A code of the library's table, and one of the routine's own.
    const cli::Sysfun sysfun = cli::call::sysfunIn(sqlstate_.chars(), message_.chars());
    ORV_CHECK(name_, sysfun != cli::Sysfun::none);
    const std::string code(m.substr(7, 2));
    ORV_CHECK(name_, code == cli::textOf(sysfun).digits);
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
  const void *dbinfo_ = nullptr;
  bool hasDbinfo_ = false;
  Block scratchpad_;
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

}  // namespace orv::fuzz
