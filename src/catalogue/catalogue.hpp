// The catalogue: one row for every export of the library.
//
// A row (routine.hpp) names the export and gives its SQL name, frame
// variant, the layouts of its inputs and results, its properties, the
// SYSFUN codes it can raise, a one-line summary and an example.
// Everything that names an export is made from this table: the exports
// themselves and the declarations of their logic (written by orv_generate,
// see generate.cpp), the linker's export lists, the public header, the
// hosts' registrations, the function reference in docs/functions.md, the
// test that the library exports exactly what the table says and the test
// that runs each example through both hosts.  Adding a routine is one row
// in the rows file of its family and one logic function with the
// signature that the row declares.
#pragma once

#include <algorithm>
#include <array>
#include <bit>
#include <cstddef>
#include <iterator>
#include <string_view>

#include "catalogue/routine.hpp"
#include "catalogue/rows_datetime.hpp"
#include "catalogue/rows_engine.hpp"
#include "catalogue/rows_maths.hpp"
#include "catalogue/rows_numeric.hpp"
#include "catalogue/rows_string.hpp"
#include "frame/positions.hpp"

namespace cli::catalogue {

// The rows, by family, joined into one table.  The order is the exports'
// order wherever they are listed: in the export lists, the hosts'
// registrations, the PostgreSQL install script and the function reference.
template <std::size_t... N>
consteval auto joined(const Routine (&...parts)[N]) {
  std::array<Routine, (N + ...)> all{};
  auto at = all.begin();
  ((at = std::copy(std::begin(parts), std::end(parts), at)), ...);
  return all;
}
inline constexpr auto kRoutines =
    joined(kDatetimeRows, kNumericRows, kMathsRows, kStringRows, kEngineRows);

inline constexpr std::size_t kRoutineCount = kRoutines.size();

// Every routine but a table function shows a call and its result.
constexpr bool hasExampleAsItShould(const Routine &r) {
  const bool table = r.frame == Frame::table || r.frame == Frame::tableCallback;
  return table == (r.example.call == nullptr) && table == (r.example.result == nullptr);
}
static_assert(std::ranges::all_of(kRoutines, hasExampleAsItShould));

// The data export, which is no routine and has no row.
inline constexpr const char *kDataExport = "sqlzThisIsAORVLibrary";

template <std::size_t N>
constexpr std::size_t countSlots(const Slot (&slots)[N]) {
  std::size_t n = 0;
  while (n < N && slots[n].layout != Layout::none) ++n;
  return n;
}
constexpr std::size_t inputCount(const Routine &r) { return countSlots(r.inputs); }
constexpr std::size_t resultCount(const Routine &r) { return countSlots(r.results); }

// The extras that a frame variant has, as the bits of frame/positions.hpp.
using frame::kCallback;
using frame::kCallType;
using frame::kDbinfo;
using frame::kScratchpad;

constexpr unsigned extrasOf(Frame f) {
  switch (f) {
    case Frame::plain:
      return 0;
    case Frame::dbinfo:
      return kDbinfo;
    case Frame::scratchpad:
      return kScratchpad;
    case Frame::table:
      return kScratchpad | kCallType;
    case Frame::tableCallback:
      return kScratchpad | kCallType | kCallback;
  }
  return 0;
}

constexpr std::size_t extraCount(Frame f) {
  return static_cast<std::size_t>(std::popcount(extrasOf(f)));
}

// Where each argument of the row's export stands, and how many there are.
constexpr frame::Positions positionsOf(const Routine &r) {
  return frame::positionsOf(inputCount(r), resultCount(r), extrasOf(r.frame));
}
template <std::size_t Row>
inline constexpr frame::Positions kPositions = positionsOf(kRoutines[Row]);
constexpr std::size_t argumentCount(const Routine &r) { return positionsOf(r).count; }

constexpr const Routine *find(std::string_view symbol) {
  for (const Routine &r : kRoutines) {
    if (symbol == r.symbol) return &r;
  }
  return nullptr;
}

static_assert(positionsOf(*find("CLI_udfFmpThreads")).count == 21 &&
              positionsOf(*find("CLI_udfFmpThreads")).callback == 20);
static_assert(positionsOf(*find("CLI_udfFmpRows")).count == 19 &&
              positionsOf(*find("CLI_udfFmpRows")).scratchpad == 16);
static_assert(positionsOf(*find("SQLCACHE_SNAPSHOT")).count == 42 &&
              positionsOf(*find("SQLCACHE_SNAPSHOT")).callType == 41 &&
              !frame::present(positionsOf(*find("SQLCACHE_SNAPSHOT")).callback));
static_assert(positionsOf(*find("CLI_udfRAND1")).resultIndicator(0) == 1 &&
              positionsOf(*find("CLI_udfRAND1")).count == 6);
static_assert(positionsOf(*find("CLI_udfRAND2")).scratchpad == 8 &&
              positionsOf(*find("CLI_udfDAYNAME1")).dbinfo == 8);
static_assert(positionsOf(*find("CLI_udfSPACE")).sqlstate == 4 &&
              positionsOf(*find("CLI_udfSPACE")).message == 7);
static_assert(positionsOf(*find("CLI_udfMOD1")).sqlstate == 6 &&
              positionsOf(*find("CLI_udfMOD1")).message == 9);

}  // namespace cli::catalogue
