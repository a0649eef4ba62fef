// The table functions of the extension as set-returning functions: one
// call of PostgreSQL's runs the routine's whole life (open, every fetch,
// close) and keeps the rows in PostgreSQL's tuple store.
//
// Include after server.hpp.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "module.hpp"

namespace orv::pg {

// The extension's settings: orvclifn.instance_path.
void defineSettings();

// Before a table function opens: the instance path that the engine's
// services read, and the tables that the host hands to the Fmp routines
// through their callback (the server's processes, the database's tables).
void prepareEngine();
// After it closes: those tables are let go.
void releaseEngine();

// The callback that the Fmp routines call; it answers from the tables that
// prepareEngine made, and raises no ERROR.
std::int32_t engineCallback(std::int32_t slots, void *request);

// The value of result column `column` of `row` from its area, as the
// column's PostgreSQL type.
Datum columnValue(FunctionCallInfo fcinfo, const cli::catalogue::Slot &slot, const void *area);

template <std::size_t Row>
Datum table(FunctionCallInfo fcinfo) {
  namespace cat = cli::catalogue;
  static constexpr const cat::Routine &r = cat::kRoutines[Row];
  constexpr std::size_t n = cat::inputCount(r), m = cat::resultCount(r);
  static_assert(n <= 1, "a table function has at most one input");

  InitMaterializedSRF(fcinfo, 0);
  auto *rsinfo = reinterpret_cast<ReturnSetInfo *>(fcinfo->resultinfo);
  prepareEngine();

  // The frame, in memory of the call: nothing here has a destructor, and
  // PostgreSQL frees it all when the call ends, also by an ERROR.
  void *areas[m];
  std::int16_t indicators[m];
  std::int16_t *resultIndicators[m];
  for (std::size_t i = 0; i < m; ++i) {
    areas[i] = palloc0(cli::call::areaSize(r.results[i]));
    resultIndicators[i] = &indicators[i];
  }
  std::int32_t input = n == 1 ? PG_GETARG_INT32(0) : 0;
  std::int16_t inputIndicator = 0;
  void *inputs[] = {&input};
  std::int16_t *inputIndicators[] = {&inputIndicator};
  void *scratchpad = palloc0(256);
  std::int32_t callType = CLI_CALL_OPEN;
  cli::call::StatusBuffers status;
  cli::call::Frame f =
      cli::call::frameOf(r, inputs, areas, inputIndicators, resultIndicators, status);
  f.scratchpad = scratchpad;
  f.callType = &callType;
  f.callback = engineCallback;
  void *fn = gExports[Row];

  const auto step = [&](std::int32_t type) {
    callType = type;
    status = cli::call::StatusBuffers{};
    for (std::size_t i = 0; i < m; ++i) {
      indicators[i] = -1;  // a column that the routine leaves alone is NULL
      if (r.results[i].layout == cat::Layout::lob) {
        cli::call::prepareLobResult(areas[i], r.results[i].size);
      }
    }
    cli::call::call<Row>(fn, f);
  };
  const auto ended = [&] {
    return std::memcmp(status.sqlstate, CLI_SQLSTATE_NO_MORE_ROWS, 5) == 0;
  };

  // The routine holds what it opened (a file, a block, the engine's table)
  // until it is closed; an ERROR while the rows are stored closes it first.
  volatile bool open = false;
  bool failed = false;
  cli::call::StatusBuffers failure;
  PG_TRY();
  {
    step(CLI_CALL_OPEN);
    open = true;
    failed = status.stored() && !ended();
    while (!failed && !status.stored()) {
      step(CLI_CALL_FETCH);
      if (status.stored()) {
        failed = !ended();
        break;
      }
      Datum values[m];
      bool nulls[m];
      for (std::size_t i = 0; i < m; ++i) {
        // A column that the routine left alone is NULL; a terminated-text
        // column, which it writes on every row without its indicator, is not.
        nulls[i] = indicators[i] < 0 && r.results[i].layout != cat::Layout::text;
        values[i] = nulls[i] ? 0 : columnValue(fcinfo, r.results[i], areas[i]);
      }
      tuplestore_putvalues(rsinfo->setResult, rsinfo->setDesc, values, nulls);
    }
    if (failed) failure = status;
    open = false;
    step(CLI_CALL_CLOSE);
    if (!failed && status.stored()) {
      failed = true;
      failure = status;
    }
  }
  PG_CATCH();
  {
    if (open) step(CLI_CALL_CLOSE);
    releaseEngine();
    PG_RE_THROW();
  }
  PG_END_TRY();
  releaseEngine();
  if (failed) reportStatus(fcinfo, failure);
  return 0;
}

}  // namespace orv::pg
