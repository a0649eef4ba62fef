// The engine's side of the frame: the one place that lays out the
// arguments of an export from its catalogue row and calls it.
//
// Hosts, the tests, the fuzz targets and the benchmarks place the values
// wherever they like; they hand the caller a Frame of pointers to them,
// and the caller puts those pointers into the frame's order and calls the
// export through the argument count that its row implies.  Every frame
// argument is a pointer, so one pointer type of K void * parameters serves
// every export of K arguments; the counts that occur are read off the
// catalogue at compile time, so a new row needs no edit here.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "frame/cliudf.h"
#include "frame/status.hpp"

namespace cli::call {

namespace cat = cli::catalogue;

// The pointers of one call, by what they are.  `inputs`, `results` and
// their indicators hold N and M entries, as the row has inputs and
// results; the extras are read only where the row's frame has them.
struct Frame {
  void *const *inputs = nullptr;
  void *const *results = nullptr;
  std::int16_t *const *inputIndicators = nullptr;
  std::int16_t *const *resultIndicators = nullptr;
  char *sqlstate = nullptr;
  const char *functionName = nullptr;
  const char *specificName = nullptr;
  char *message = nullptr;
  const void *dbinfo = nullptr;
  void *scratchpad = nullptr;
  std::int32_t *callType = nullptr;
  CLI_tableCallback callback = nullptr;
};

// The most arguments any export takes.
inline constexpr std::size_t kMaxArguments = [] {
  std::size_t most = 0;
  for (const cat::Routine &r : cat::kRoutines) most = std::max(most, cat::argumentCount(r));
  return most;
}();

// Writes the arguments of `row` in the frame's order into `args`, which has
// room for them all (kMaxArguments is enough for any row); returns how many
// there are.
inline std::size_t layOut(const cat::Routine &row, const Frame &f, void **args) noexcept {
  const frame::Positions at = cat::positionsOf(row);
  for (std::size_t i = 0; i < at.inputs; ++i) {
    args[at.input(i)] = f.inputs[i];
    args[at.inputIndicator(i)] = f.inputIndicators[i];
  }
  for (std::size_t j = 0; j < at.results; ++j) {
    args[at.result(j)] = f.results[j];
    args[at.resultIndicator(j)] = f.resultIndicators[j];
  }
  args[at.sqlstate] = f.sqlstate;
  args[at.functionName] = const_cast<char *>(f.functionName);
  args[at.specificName] = const_cast<char *>(f.specificName);
  args[at.message] = f.message;
  if (frame::present(at.dbinfo)) args[at.dbinfo] = const_cast<void *>(f.dbinfo);
  if (frame::present(at.scratchpad)) args[at.scratchpad] = f.scratchpad;
  if (frame::present(at.callType)) args[at.callType] = f.callType;
  if (frame::present(at.callback)) args[at.callback] = reinterpret_cast<void *>(f.callback);
  return at.count;
}

// Calls `fn` with the K arguments at `args`.
template <std::size_t K>
[[gnu::always_inline]] inline void invokeWith(void *fn, void *const *args) noexcept {
  [&]<std::size_t... I>(std::index_sequence<I...>) {
    using Export = void (*)(decltype(I, static_cast<void *>(nullptr))...) noexcept;
    reinterpret_cast<Export>(fn)(args[I]...);
  }
  (std::make_index_sequence<K>{});
}

namespace detail {

// The distinct argument counts of the catalogue's rows.
inline constexpr std::size_t kArityCount = [] {
  std::array<bool, kMaxArguments + 1> seen{};
  std::size_t n = 0;
  for (const cat::Routine &r : cat::kRoutines) {
    const std::size_t k = cat::argumentCount(r);
    if (!seen[k]) ++n;
    seen[k] = true;
  }
  return n;
}();
inline constexpr auto kArities = [] {
  std::array<bool, kMaxArguments + 1> seen{};
  for (const cat::Routine &r : cat::kRoutines) seen[cat::argumentCount(r)] = true;
  std::array<std::size_t, kArityCount> arities{};
  std::size_t n = 0;
  for (std::size_t k = 0; k < seen.size(); ++k) {
    if (seen[k]) arities[n++] = k;
  }
  return arities;
}();

}  // namespace detail

// Calls `fn` with `count` arguments, a count that some row of the
// catalogue has; false, with no call, for any other.
inline bool invoke(void *fn, void *const *args, std::size_t count) noexcept {
  return [&]<std::size_t... I>(std::index_sequence<I...>) {
    return ((count == detail::kArities[I] && (invokeWith<detail::kArities[I]>(fn, args), true)) ||
            ...);
  }
  (std::make_index_sequence<detail::kArityCount>{});
}

// Calls the export `fn` of `row` with the frame `f`.
inline void call(const cat::Routine &row, void *fn, const Frame &f) noexcept {
  void *args[kMaxArguments] = {};
  invoke(fn, args, layOut(row, f, args));
}

// The same for a row known at compile time: the counts and the argument
// count are constants, and the whole is inlined into its caller, so the
// call is as direct as a hand-written one.
template <std::size_t Row>
[[gnu::always_inline]] inline void call(void *fn, const Frame &f) noexcept {
  static constexpr frame::Positions at = cat::kPositions<Row>;
  [&]<std::size_t... I, std::size_t... J>(std::index_sequence<I...>, std::index_sequence<J...>) {
    void *args[at.count] = {};
    ((args[at.input(I)] = f.inputs[I]), ...);
    ((args[at.result(J)] = f.results[J]), ...);
    ((args[at.inputIndicator(I)] = f.inputIndicators[I]), ...);
    ((args[at.resultIndicator(J)] = f.resultIndicators[J]), ...);
    args[at.sqlstate] = f.sqlstate;
    args[at.functionName] = const_cast<char *>(f.functionName);
    args[at.specificName] = const_cast<char *>(f.specificName);
    args[at.message] = f.message;
    if constexpr (frame::present(at.dbinfo)) args[at.dbinfo] = const_cast<void *>(f.dbinfo);
    if constexpr (frame::present(at.scratchpad)) args[at.scratchpad] = f.scratchpad;
    if constexpr (frame::present(at.callType)) args[at.callType] = f.callType;
    if constexpr (frame::present(at.callback)) {
      args[at.callback] = reinterpret_cast<void *>(f.callback);
    }
    invokeWith<at.count>(fn, args);
  }
  (std::make_index_sequence<at.inputs>{}, std::make_index_sequence<at.results>{});
}

// The status buffers of one call, cleared.
struct StatusBuffers {
  char sqlstate[CLI_SQLSTATE_SIZE] = {};
  char message[CLI_MESSAGE_SIZE] = {};
  [[nodiscard]] bool stored() const noexcept { return sqlstate[0] != '\0'; }
};

// The frame of one call of `row`: these values and indicators, the buffers
// of `status`, and the row's SQL name and export name as the function and
// specific names.  The extras are the caller's to add.
inline Frame frameOf(const cat::Routine &row, void *const *inputs, void *const *results,
                     std::int16_t *const *inputIndicators, std::int16_t *const *resultIndicators,
                     StatusBuffers &status) noexcept {
  Frame f;
  f.inputs = inputs;
  f.results = results;
  f.inputIndicators = inputIndicators;
  f.resultIndicators = resultIndicators;
  f.sqlstate = status.sqlstate;
  f.functionName = row.sqlName;
  f.specificName = row.symbol;
  f.message = status.message;
  return f;
}

// The SYSFUN code in a call's status buffers, or none when the status is
// no SYSFUN error (or there is no status).
inline Sysfun sysfunIn(const char *sqlstate, const char *message) noexcept {
  if (std::memcmp(sqlstate, CLI_SQLSTATE_SYSFUN, sizeof CLI_SQLSTATE_SYSFUN) != 0 ||
      std::memcmp(message, CLI_MESSAGE_SYSFUN, sizeof CLI_MESSAGE_SYSFUN - 1) != 0) {
    return Sysfun::none;
  }
  const char *digits = message + sizeof CLI_MESSAGE_SYSFUN - 1;
  if (digits[0] < '0' || digits[0] > '9' || digits[1] < '0' || digits[1] > '9') {
    return Sysfun::none;
  }
  const Sysfun code = sysfunOf(digits);
  return wordsOf(code) != nullptr ? code : Sysfun::none;
}

// Writes a CLI_udfLob of `size` data bytes at `area`, which holds
// CLI_LOB_AREA_SIZE(size) bytes.
inline void layOutLob(void *area, const void *data, std::size_t size) noexcept {
  const auto length = static_cast<std::uint32_t>(size);
  std::memcpy(area, &length, sizeof length);
  if (size != 0) std::memcpy(static_cast<unsigned char *>(area) + CLI_LOB_DATA_OFFSET, data, size);
}

// Prepares a CLI_udfLob result area: its length word holds the capacity.
inline void prepareLobResult(void *area, std::uint32_t capacity) noexcept {
  std::memcpy(area, &capacity, sizeof capacity);
}

// The byte count of a value of `slot`'s layout, as a result area holds it:
// a terminated text with its terminator, a CLI_udfLob with its length word.
constexpr std::size_t areaSize(const cat::Slot &slot) noexcept {
  switch (slot.layout) {
    case cat::Layout::int16:
      return 2;
    case cat::Layout::int32:
      return 4;
    case cat::Layout::int64:
    case cat::Layout::real:
      return 8;
    case cat::Layout::text:
      return std::size_t{slot.size} + 1;
    case cat::Layout::lob:
      return CLI_LOB_AREA_SIZE(std::size_t{slot.size});
    case cat::Layout::fixedText:
    case cat::Layout::fixedBytes:
      return slot.size;
    case cat::Layout::none:
      break;
  }
  return 0;
}

}  // namespace cli::call
