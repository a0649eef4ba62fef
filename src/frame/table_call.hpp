// A table function's life through the caller: the scratchpad, the call
// type, the input values and one row of result areas, laid out from the
// row's result slots, each area a block of exactly its size.  For hosts,
// tests, fuzz targets and benchmarks: it allocates, which no routine may.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>
#include <vector>

#include "frame/call.hpp"

namespace cli::call {

class TableCall {
 public:
  // Room for the engine's length word and any table function's data.
  static constexpr std::size_t kScratchpadSize = 256;

  // `unset` is what each result indicator holds before a call, so that a
  // column the routine leaves alone can be told apart.  The frame is laid
  // out once, here; a call only resets what the routine may have changed.
  TableCall(const cat::Routine &row, void *fn, CLI_tableCallback callback = nullptr,
            std::int16_t unset = -1)
      : row_(row),
        fn_(fn),
        unset_(unset),
        at_(cat::positionsOf(row)),
        inputs_(at_.inputs),
        results_(at_.results) {
    std::array<void *, cat::kMaxResults> areas{};
    std::array<std::int16_t *, cat::kMaxInputs> inputIndicators{};
    std::array<std::int16_t *, cat::kMaxResults> resultIndicators{};
    areas_.reserve(results_);
    for (std::size_t i = 0; i < inputs_; ++i) inputIndicators[i] = &inputIndicators_[i];
    for (std::size_t i = 0; i < results_; ++i) {
      areas_.emplace_back(areaSize(row.results[i]));
      areas[i] = areas_.back().data();
      resultIndicators[i] = &indicators_[i];
      if (row.results[i].layout == cat::Layout::lob) lobColumns_[lobs_++] = i;
    }
    Frame f = frameOf(row, inputValues_.data(), areas.data(), inputIndicators.data(),
                      resultIndicators.data(), status_);
    f.scratchpad = scratchpad_.data();
    f.callType = &callType_;
    f.callback = callback;
    count_ = layOut(row, f, args_.data());
  }
  TableCall(const TableCall &) = delete;
  TableCall &operator=(const TableCall &) = delete;

  // Input i, the caller's value, read on every call.
  void setInput(std::size_t i, void *value, std::int16_t indicator = 0) noexcept {
    inputValues_[i] = value;
    args_[at_.input(i)] = value;
    inputIndicators_[i] = indicator;
  }

  // One call with `type`, the status buffers cleared, each result
  // indicator set to `unset` and each CLI_udfLob area's length word to its
  // capacity first.
  void step(std::int32_t type) noexcept {
    callType_ = type;
    status_ = StatusBuffers{};
    std::fill_n(indicators_.begin(), results_, unset_);
    for (std::size_t i = 0; i < lobs_; ++i) {
      prepareLobResult(areas_[lobColumns_[i]].data(), row_.results[lobColumns_[i]].size);
    }
    invoke(fn_, args_.data(), count_);
  }

  // Open on a zero-filled scratchpad; true unless a status was stored
  // other than the end of the table.
  bool open() noexcept {
    scratchpad_.fill(0);
    step(CLI_CALL_OPEN);
    return !status_.stored() || ended();
  }
  // True when the call gave a row.
  bool fetch() noexcept {
    step(CLI_CALL_FETCH);
    return !status_.stored();
  }
  void close() noexcept { step(CLI_CALL_CLOSE); }

  [[nodiscard]] const StatusBuffers &status() const noexcept { return status_; }
  [[nodiscard]] bool ended() const noexcept {
    return std::memcmp(status_.sqlstate, CLI_SQLSTATE_NO_MORE_ROWS, 5) == 0;
  }
  [[nodiscard]] const cat::Routine &row() const noexcept { return row_; }
  [[nodiscard]] unsigned char *area(std::size_t column) noexcept { return areas_[column].data(); }
  [[nodiscard]] std::int16_t indicator(std::size_t column) const noexcept {
    return indicators_[column];
  }
  [[nodiscard]] unsigned char *scratchpad() noexcept { return scratchpad_.data(); }

  // A number column, widened.
  [[nodiscard]] std::int64_t number(std::size_t column) const noexcept {
    const unsigned char *a = areas_[column].data();
    switch (row_.results[column].layout) {
      case cat::Layout::int16: {
        std::int16_t v = 0;
        std::memcpy(&v, a, sizeof v);
        return v;
      }
      case cat::Layout::int32: {
        std::int32_t v = 0;
        std::memcpy(&v, a, sizeof v);
        return v;
      }
      default: {
        std::int64_t v = 0;
        std::memcpy(&v, a, sizeof v);
        return v;
      }
    }
  }
  // A text column up to its terminator, or a CLI_udfLob column's data, its
  // length held to the area's capacity.
  [[nodiscard]] std::string_view text(std::size_t column) const noexcept {
    const auto *a = reinterpret_cast<const char *>(areas_[column].data());
    const cat::Slot &slot = row_.results[column];
    if (slot.layout == cat::Layout::lob) {
      std::uint32_t n = 0;
      std::memcpy(&n, a, sizeof n);
      return {a + CLI_LOB_DATA_OFFSET, n < slot.size ? n : slot.size};
    }
    return {a, ::strnlen(a, areas_[column].size())};
  }

 private:
  const cat::Routine &row_;
  void *fn_;
  std::int16_t unset_;
  frame::Positions at_;           // where the frame's arguments stand
  std::size_t inputs_, results_;  // the row's counts
  std::int32_t callType_ = CLI_CALL_OPEN;
  std::array<unsigned char, kScratchpadSize> scratchpad_{};
  std::vector<std::vector<unsigned char>> areas_;
  std::array<void *, cat::kMaxInputs> inputValues_{};
  std::array<std::int16_t, cat::kMaxInputs> inputIndicators_{};
  std::array<std::int16_t, cat::kMaxResults> indicators_{};
  StatusBuffers status_;
  std::array<void *, kMaxArguments> args_{};
  std::size_t count_ = 0;
  std::array<std::size_t, cat::kMaxResults> lobColumns_{};  // the CLI_udfLob results
  std::size_t lobs_ = 0;
};

}  // namespace cli::call
