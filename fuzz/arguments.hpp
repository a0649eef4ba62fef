// Finding an export as an engine does, and calling it with blocks: the
// pointers to the blocks go into a cli::call::Frame, and the library's
// frame caller lays them out in the frame's order and calls the export
// through the argument count that its catalogue row implies.
#pragma once

#include <dlfcn.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "block.hpp"
#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"

namespace orv::fuzz {

namespace cat = cli::catalogue;

// An export of the linked library, looked up by name as an engine finds
// it, with its catalogue row.
struct Export {
  const cat::Routine *routine = nullptr;
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
  Export e{cat::find(name), dlsym(RTLD_DEFAULT, name)};
  if (e.address == nullptr) broken(name, "not exported");
  if (e.routine == nullptr) broken(name, "not in the catalogue");
  if (seen->size() < 256) seen->push_back({name, name, e});
  return e;
}

// The arguments of one call, each a block of its own: values with their
// indicators in the order of the row's slots, the status buffers and the
// extras by what they are.  The blocks must outlive the calls; the same
// arguments serve any number of calls.
class Arguments {
 public:
  Arguments &input(const Block &value, const Block &indicator) {
    if (inputCount_ == inputs_.size()) broken("Arguments", "more inputs than any row has");
    inputs_[inputCount_] = value.data();
    inputIndicators_[inputCount_++] = indicatorIn(indicator);
    return *this;
  }
  Arguments &result(const Block &value, const Block &indicator) {
    if (resultCount_ == results_.size()) broken("Arguments", "more results than any row has");
    results_[resultCount_] = value.data();
    resultIndicators_[resultCount_++] = indicatorIn(indicator);
    return *this;
  }
  Arguments &status(const Block &sqlstate, const Block &message) {
    frame_.sqlstate = sqlstate.chars();
    frame_.message = message.chars();
    return *this;
  }
  // The database information block; null is a value an engine may pass.
  Arguments &dbinfo(const void *block) {
    frame_.dbinfo = block;
    extras_ |= cat::kDbinfo;
    return *this;
  }
  Arguments &scratchpad(const Block &b) {
    frame_.scratchpad = b.data();
    extras_ |= cat::kScratchpad;
    return *this;
  }
  Arguments &callType(const Block &b) {
    frame_.callType = reinterpret_cast<std::int32_t *>(b.data());
    extras_ |= cat::kCallType;
    return *this;
  }
  Arguments &callback(CLI_tableCallback entry) {
    frame_.callback = entry;
    extras_ |= cat::kCallback;
    return *this;
  }

  // Calls `e` through the frame caller.  The values and extras given must
  // be exactly those of the row: the caller reads as many pointers as the
  // row has slots, and passes the extras of the row's frame variant.
  void call(const Export &e) {
    const cat::Routine &row = *e.routine;
    if (inputCount_ != cat::inputCount(row) || resultCount_ != cat::resultCount(row)) {
      broken(row.symbol, "values other than the row's slots");
    }
    if (extras_ != cat::extrasOf(row.frame))
      broken(row.symbol, "extras other than the row's frame");
    if (frame_.sqlstate == nullptr) broken(row.symbol, "no status buffers");
    frame_.inputs = inputs_.data();
    frame_.results = results_.data();
    frame_.inputIndicators = inputIndicators_.data();
    frame_.resultIndicators = resultIndicators_.data();
    frame_.functionName = "FUNCTION";
    frame_.specificName = "SPECIFIC";
    cli::call::call(row, e.address, frame_);
  }

 private:
  std::array<void *, cat::kMaxInputs> inputs_{};
  std::array<void *, cat::kMaxResults> results_{};
  std::array<std::int16_t *, cat::kMaxInputs> inputIndicators_{};
  std::array<std::int16_t *, cat::kMaxResults> resultIndicators_{};
  std::size_t inputCount_ = 0, resultCount_ = 0;
  unsigned extras_ = 0;
  cli::call::Frame frame_;
};

}  // namespace orv::fuzz
