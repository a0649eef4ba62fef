// What every family of bench_routines shares: the built library's exports
// found by name, their catalogue rows, values laid out as the frame holds
// them, a call's frame laid out once through the frame caller, and the
// reference times that the 1 MiB rows report their ratios against.
#pragma once

#include <benchmark/benchmark.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"

namespace orv::bench {

namespace cat = cli::catalogue;

// The export `symbol` of the built library, and its catalogue row; either
// missing ends the program with a message.
void *exportNamed(const char *symbol);
const cat::Routine &routineNamed(const char *symbol);

// A value as the frame holds it: terminated text, a CLI_udfLob, or a
// number of its own width.  Result areas: a text area holds the longest
// text built, a CLI_udfLob area `capacity` bytes, its length word holding
// the capacity, as an engine hands it.
using Value = std::vector<unsigned char>;
Value text(std::string_view s);
Value lob(std::string_view s);
template <typename T>
Value number(T x) {
  Value v(sizeof x);
  std::memcpy(v.data(), &x, sizeof x);
  return v;
}
inline Value int32(std::int32_t x) { return number(x); }
Value textArea();
Value lobArea(std::uint32_t capacity = cat::kLob);

// The frame of a routine of one result, laid out once from its row: the
// values stay where the caller keeps them, and each call of the export
// goes through `args()` and `count()`.  The indicators start at 0 (every
// input a value) and the status buffers cleared.  The routine writes into
// the object, so it is never declared const.
class PreparedCall {
 public:
  PreparedCall(const cat::Routine &row, const void *const *inputs, void *result,
               const void *dbinfo = nullptr) noexcept;
  PreparedCall(const PreparedCall &) = delete;
  PreparedCall &operator=(const PreparedCall &) = delete;

  [[nodiscard]] void *const *args() const noexcept { return args_.data(); }
  [[nodiscard]] std::size_t count() const noexcept { return count_; }
  [[nodiscard]] const cli::call::StatusBuffers &status() const noexcept { return status_; }

 private:
  std::array<void *, cat::kMaxInputs> inputs_{};
  std::array<void *, 1> results_{};
  std::array<std::int16_t, cat::kMaxInputs + 1> indicators_{};
  std::array<std::int16_t *, cat::kMaxInputs> inputIndicators_{};
  std::array<std::int16_t *, 1> resultIndicators_{};
  cli::call::StatusBuffers status_;
  std::array<void *, cli::call::kMaxArguments> args_{};
  std::size_t count_ = 0;
};

// Calls `symbol` with the inputs and one result in a loop.  A CLI_udfLob
// result's length word is set to its capacity before each call, as an
// engine hands it.  Returns the time of one call in nanoseconds, by the
// wall clock.
double run(benchmark::State &state, const char *symbol, std::vector<Value> inputs, Value result,
           std::int64_t bytesPerCall = 0);

inline constexpr std::size_t kMiB = std::size_t{1} << 20;

// The reference times of this run, in nanoseconds, by row.
void setReferenceTime(const std::string &reference, double ns);
// Reports `ns` as a ratio to a reference row, where that row has run (a
// filter may leave it out).
void setRatio(benchmark::State &state, const char *counter, double ns,
              const std::string &reference);

// The families of rows, registered in the order in which they run.
void registerDateRows();
void registerNumericRows();
void registerSearchRows();
void registerNameRows();
void registerSnapshotRows();
void registerTimestampRows();
void registerStringRows();

}  // namespace orv::bench
