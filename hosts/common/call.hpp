// One call of a scalar export, as every host makes it: the inputs and the
// result in their layouts, the indicators and the status buffers, the call
// through the frame caller, and what it came to as one Outcome.  The host
// fills the inputs from its engine's values before, and turns the Outcome
// into its engine's value, NULL or error after.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "common/layouts.hpp"
#include "frame/call.hpp"
#include "frame/status.hpp"

namespace orv::host {

// What one call of an export came to.
enum class Outcome : unsigned char {
  value,   // the result is in the result's adapter
  null,    // the routine stored a negative result indicator
  status,  // the routine stored a status in the status buffers
  // The terminated-text form refused the call for a length rule
  // (SYSFUN:10), and the function has a CLI_udfLob form to serve it.
  refusedForLength,
};

// The Outcome of a call from its status buffers and result indicator;
// `longForm` says whether a CLI_udfLob form could serve a call that is
// refused for a length rule.
inline Outcome outcomeOf(const cli::call::StatusBuffers &status, std::int16_t resultIndicator,
                         bool longForm) {
  if (status.stored()) {
    return longForm && cli::call::sysfunIn(status.sqlstate, status.message) == cli::Sysfun::tooLong
               ? Outcome::refusedForLength
               : Outcome::status;
  }
  if (resultIndicator < 0) return Outcome::null;
  return Outcome::value;
}

// Calls `shortForm`, and where its Outcome is refusedForLength, `longForm`
// instead, whose Outcome is then the call's.  Each calls one form and
// gives back its Outcome.
template <class Short, class Long>
[[gnu::always_inline]] inline Outcome withLongForm(Short &&shortForm, Long &&longForm) {
  const Outcome o = shortForm();
  return o == Outcome::refusedForLength ? longForm() : o;
}

// One call of the export of catalogue row Row, laid out as the frame
// caller wants it.  Borrow: text that the routine only reads is the
// engine's own, terminated (see InputOf).  The indicators and the status
// buffers start cleared; the inputs and the result are left as they are
// until the host sets and prepares them.
template <std::size_t Row, bool Borrow>
struct ScalarCall {
  static constexpr const cat::Routine &kRow = cat::kRoutines[Row];
  static constexpr std::size_t kInputs = cat::inputCount(kRow);
  static_assert(cat::resultCount(kRow) == 1);

  // What starts cleared comes first, in one run of bytes that a few wide
  // stores clear (see the constructor).
  alignas(16) cli::call::StatusBuffers status;
  std::int16_t resultIndicator = 0;
  std::int16_t inputIndicators[kInputs + 1] = {};
  InputsOf<Row, Borrow> inputs;
  ResultOf<Row> result;

  // The status buffers cleared as one block of bytes, which the compiler
  // joins with the indicators into a few wide stores in place of the
  // buffers' own clearing, member by member.
  ScalarCall() noexcept { std::memset(static_cast<void *>(&status), 0, sizeof status); }

  template <std::size_t I>
  auto &input() {
    return inputAt<I>(inputs);
  }
  // Input I is NULL: its indicator says so, and its adapter holds an empty
  // value for a routine that reads its indicators.
  template <std::size_t I>
  void setNull() {
    inputIndicators[I] = -1;
    input<I>().setNull();
  }

  // Calls `fn`, the export, with the inputs as they are set, the prepared
  // result and, where the row's frame has them, the database information
  // block or the scratchpad.
  [[gnu::always_inline]] void run(void *fn, const void *dbinfo = nullptr,
                                  void *scratchpad = nullptr) {
    run(fn, dbinfo, scratchpad, std::make_index_sequence<kInputs>{});
  }

  // What the call came to; `longForm` as for outcomeOf.
  [[nodiscard]] Outcome outcome(bool longForm) const {
    return outcomeOf(status, resultIndicator, longForm);
  }

 private:
  template <std::size_t... I>
  [[gnu::always_inline]] void run(void *fn, const void *dbinfo, void *scratchpad,
                                  std::index_sequence<I...>) {
    void *values[] = {input<I>().pointer()..., nullptr};
    void *results[] = {result.pointer()};
    std::int16_t *inputNulls[] = {&inputIndicators[I]..., nullptr};
    std::int16_t *resultNulls[] = {&resultIndicator};
    cli::call::Frame f = cli::call::frameOf(kRow, values, results, inputNulls, resultNulls, status);
    if constexpr (kRow.frame == cat::Frame::dbinfo) f.dbinfo = dbinfo;
    if constexpr (kRow.frame == cat::Frame::scratchpad) f.scratchpad = scratchpad;
    cli::call::call<Row>(fn, f);
  }
};

}  // namespace orv::host
