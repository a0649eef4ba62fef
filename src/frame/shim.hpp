// The body of every export, made from its catalogue row.
//
// The exports themselves are generated from the rows (exports.cpp in the
// build folder): each passes its raw arguments to run<Row>, which turns
// them into the views of frame.hpp by the row's layouts, calls the
// routine's logic with them and stores what the logic gives back.  So the
// compiler checks every routine against its row: a logic function whose
// type is not exactly the one that the row implies does not compile, even
// where its values would convert (tests/compile_fail holds such cases).
//
// The logic of a routine takes, in this order:
//   its inputs: a number by value, TextIn (WritableTextIn for a routine
//     marked kWritesInputs), LobIn or BytesIn, each wrapped
//     in Nullable for a routine that reads its input indicators;
//   its result, unless that is a single number, which it returns in an
//     Answer (or, marked kResultByAddress, gets as the result's address):
//     TextOut, LobOut or FixedTextOut, followed by a
//     ResultIndicator for a routine that handles NULL; a table's Row;
//   the extras of its frame: DbInfo; Scratchpad; Scratchpad, CallType;
//     Scratchpad, CallType, CLI_tableCallback.
// and gives back an Answer of its result's type or a Report; it is noexcept.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <tuple>
#include <type_traits>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "frame/frame.hpp"

namespace cli::shim {

namespace cat = cli::catalogue;

constexpr bool isNumber(cat::Layout l) {
  return l == cat::Layout::int16 || l == cat::Layout::int32 || l == cat::Layout::int64 ||
         l == cat::Layout::real;
}

// The view of input I of row R, from its pointer.
template <std::size_t R, std::size_t I, class Pointer>
auto inputView(Pointer p) noexcept {
  constexpr cat::Layout layout = cat::kRoutines[R].inputs[I].layout;
  if constexpr (layout == cat::Layout::text) {
    if constexpr ((cat::kRoutines[R].properties & cat::kWritesInputs) != 0) {
      return WritableTextIn{p};
    } else {
      return TextIn{p};
    }
  } else if constexpr (layout == cat::Layout::lob) {
    return LobIn{p};
  } else if constexpr (layout == cat::Layout::fixedBytes) {
    return BytesIn{p};
  } else {
    static_assert(isNumber(layout));
    return *p;
  }
}

// The view of result I of row R, from its pointer; not for numbers.
template <std::size_t R, std::size_t I, class Pointer>
auto resultView(Pointer p) noexcept {
  constexpr cat::Slot slot = cat::kRoutines[R].results[I];
  if constexpr (slot.layout == cat::Layout::text) {
    return TextOut{p, slot.size};
  } else if constexpr (slot.layout == cat::Layout::lob) {
    return LobOut{p, slot.size};
  } else {
    static_assert(slot.layout == cat::Layout::fixedText);
    return FixedTextOut{p, slot.size};
  }
}

// The view of input I of row R as its logic takes it: wrapped with its
// indicator for a routine that handles NULL.
template <std::size_t R, std::size_t I, class Arguments>
auto inputArgument(const Arguments &a) noexcept {
  constexpr frame::Positions at = cat::kPositions<R>;
  if constexpr ((cat::kRoutines[R].properties & cat::kHandlesNull) != 0) {
    using View = decltype(inputView<R, I>(std::get<at.input(I)>(a)));
    return Nullable<View>{inputView<R, I>(std::get<at.input(I)>(a)),
                          *std::get<at.inputIndicator(I)>(a)};
  } else {
    return inputView<R, I>(std::get<at.input(I)>(a));
  }
}

// Calls `f` with the extras of row R's frame, as views.  The views are
// handed on as arguments, never gathered in memory first, so that they
// reach the logic in registers.
template <std::size_t R, class Arguments, class F>
decltype(auto) withExtras(const Arguments &a, F f) noexcept {
  constexpr frame::Positions at = cat::kPositions<R>;
  constexpr unsigned extras = cat::extrasOf(cat::kRoutines[R].frame);
  if constexpr (extras == 0) {
    return f();
  } else if constexpr (extras == cat::kDbinfo) {
    return f(DbInfo{std::get<at.dbinfo>(a)});
  } else if constexpr (extras == cat::kScratchpad) {
    return f(Scratchpad{std::get<at.scratchpad>(a)});
  } else if constexpr (extras == (cat::kScratchpad | cat::kCallType)) {
    return f(Scratchpad{std::get<at.scratchpad>(a)},
             static_cast<CallType>(*std::get<at.callType>(a)));
  } else {
    static_assert(extras == (cat::kScratchpad | cat::kCallType | cat::kCallback));
    return f(Scratchpad{std::get<at.scratchpad>(a)},
             static_cast<CallType>(*std::get<at.callType>(a)), std::get<at.callback>(a));
  }
}

// The number type of a numeric layout.
template <cat::Layout L>
using NumberOf = std::conditional_t<
    L == cat::Layout::int16, std::int16_t,
    std::conditional_t<L == cat::Layout::int32, std::int32_t,
                       std::conditional_t<L == cat::Layout::int64, std::int64_t, double>>>;

// What the logic of row R gives back: its one numeric result in an Answer
// of that result's type, unless a service writes it at its address; a
// Report for everything else.
template <std::size_t R>
using Returned =
    std::conditional_t<cat::kRoutines[R].frame != cat::Frame::table &&
                           cat::kRoutines[R].frame != cat::Frame::tableCallback &&
                           (cat::kRoutines[R].properties & cat::kResultByAddress) == 0 &&
                           isNumber(cat::kRoutines[R].results[0].layout),
                       Answer<NumberOf<cat::kRoutines[R].results[0].layout>>, Report>;

// Calls the logic with the inputs of row R, then `between` (the result's
// views), then the extras.  The logic's type must be exactly the one that
// these imply: a call would otherwise compile wherever the values convert,
// a double taken for a 32-bit input or a 16-bit Answer stored into a
// 32-bit result.
template <std::size_t R, auto Logic, class Arguments, class... Between>
decltype(auto) callLogic(const Arguments &a, Between... between) noexcept {
  return withExtras<R>(a, [&]<class... Extras>(Extras... extras) {
    return [&]<std::size_t... I>(std::index_sequence<I...>) {
      using Exact =
          Returned<R> (*)(decltype(inputArgument<R, I>(a))..., Between..., Extras...) noexcept;
      static_assert(std::is_same_v<decltype(Logic), Exact>,
                    "the logic takes the views that its row implies and gives back its Answer "
                    "or Report, noexcept");
      return Logic(inputArgument<R, I>(a)..., between..., extras...);
    }
    (std::make_index_sequence<inputCount(cat::kRoutines[R])>{});
  });
}

// A table's result columns, with their indicators and sizes.
template <std::size_t R, class Arguments>
struct RowArguments {
  static constexpr const cat::Routine &r = cat::kRoutines[R];
  static constexpr frame::Positions at = cat::kPositions<R>;
  static constexpr std::size_t m = at.results;
  explicit RowArguments(const Arguments &a) noexcept {
    [&]<std::size_t... I>(std::index_sequence<I...>) {
      ((values[I] = std::get<at.result(I)>(a)), ...);
      ((indicators[I] = std::get<at.resultIndicator(I)>(a)), ...);
    }
    (std::make_index_sequence<m>{});
  }
  static constexpr auto sizes = [] {
    std::array<std::uint32_t, m> s{};
    for (std::size_t i = 0; i < m; ++i) s[i] = r.results[i].size;
    return s;
  }();
  std::array<void *, m> values{};
  std::array<std::int16_t *, m> indicators{};
  [[nodiscard]] Row view() const noexcept {
    return {values.data(), indicators.data(), sizes.data()};
  }
};

// The logic is a template argument, not a pointer handed over, so that its
// call is a direct one that the optimiser can inline into the export.
template <std::size_t R, auto Logic, class... Raw>
void run(Raw... raw) noexcept {
  constexpr const cat::Routine &r = cat::kRoutines[R];
  constexpr frame::Positions at = cat::kPositions<R>;
  constexpr std::size_t m = at.results;
  static_assert(sizeof...(Raw) == at.count, "the export's arguments are its row's");
  const std::tuple<Raw...> a{raw...};
  char *const sqlstate = std::get<at.sqlstate>(a);
  char *const message = std::get<at.message>(a);

  if constexpr (r.frame == cat::Frame::table || r.frame == cat::Frame::tableCallback) {
    const RowArguments<R, std::tuple<Raw...>> row(a);
    callLogic<R, Logic>(a, row.view()).store(sqlstate, message);
  } else if constexpr ((r.properties & cat::kResultByAddress) != 0) {
    static_assert(m == 1 && isNumber(r.results[0].layout));
    callLogic<R, Logic>(a, std::get<at.result(0)>(a)).store(sqlstate, message);
  } else if constexpr (isNumber(r.results[0].layout)) {
    static_assert(m == 1 && (r.properties & cat::kHandlesNull) == 0);
    const auto answer = callLogic<R, Logic>(a);
    if (answer.code == Sysfun::none || answer.stored) *std::get<at.result(0)>(a) = answer.value;
    if (answer.code != Sysfun::none) Report(answer.code).store(sqlstate, message);
  } else if constexpr ((r.properties & cat::kHandlesNull) != 0) {
    static_assert(m == 1);
    callLogic<R, Logic>(a, resultView<R, 0>(std::get<at.result(0)>(a)),
                        ResultIndicator{std::get<at.resultIndicator(0)>(a)})
        .store(sqlstate, message);
  } else {
    static_assert(m == 1);
    const Report report = callLogic<R, Logic>(a, resultView<R, 0>(std::get<at.result(0)>(a)));
    if (report.failed()) report.store(sqlstate, message);
  }
}

}  // namespace cli::shim
