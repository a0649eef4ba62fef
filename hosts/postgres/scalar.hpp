// The call path of every scalar function of the extension: read the
// arguments (arguments.hpp), choose the form, make the call of the export
// (common/call.hpp), then turn the result or the status into a PostgreSQL
// value or ERROR.  It knows layouts and the catalogue, never what a
// routine does.
//
// The order is fixed by PostgreSQL's errors (see server.hpp): everything
// that can raise one (reading and detoasting the arguments, allocating
// areas) happens before the call, and the status is reported after it, so
// that no ERROR ever leaves a frame that the module still holds.
//
// Include after server.hpp.
#pragma once

#include <cstddef>
#include <cstdint>
#include <utility>

#include "arguments.hpp"
#include "catalogue/catalogue.hpp"
#include "common/call.hpp"
#include "common/forms.hpp"
#include "common/layouts.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "module.hpp"
#include "signatures.hpp"

namespace orv::pg {

using host::kLobLimit;
using host::kTextLimit;
using host::Outcome;

// The result as PostgreSQL's value of type R: a number of its width, text
// (valid in the database's encoding) or bytea, and a timestamp from the
// library's timestamp text.
template <Type R, cat::Layout L, std::uint32_t Size>
[[gnu::always_inline]] inline Datum deliver(FunctionCallInfo fcinfo,
                                            const host::Result<L, Size> &result) {
  if constexpr (host::isNumber(L)) {
    // The integer macros are alike where a Datum has 64 bits; each names
    // the width it is for.
    if constexpr (R == Type::int2) {  // NOLINT(bugprone-branch-clone)
      return Int16GetDatum(result.value);
    } else if constexpr (R == Type::int4) {
      return Int32GetDatum(result.value);
    } else if constexpr (R == Type::int8) {
      return Int64GetDatum(result.value);
    } else {
      return Float8GetDatum(result.value);
    }
  } else if constexpr (L == cat::Layout::lob) {
    if (!result.fits()) {
      ereport(ERROR, (errcode(ERRCODE_INTERNAL_ERROR),
                      errmsg("%s: the library reported %u bytes in an area of %u",
                             get_func_name(fcinfo->flinfo->fn_oid), result.length(), Size)));
    }
    if constexpr (R == Type::bytea) {
      return PointerGetDatum(resultBytes(result.data(), result.length()));
    } else {
      return PointerGetDatum(resultText(fcinfo, result.data(), result.length()));
    }
  } else if constexpr (R == Type::timestamp) {
    const std::size_t size = result.length();
    Timestamp stamp = 0;
    if (!timestampOf(result.data(), size, stamp)) {
      ereport(ERROR, (errcode(ERRCODE_INTERNAL_ERROR),
                      errmsg("%s: the library gave the timestamp text \"%.*s\", which is not "
                             "of the form YYYY-MM-DD-HH.MM.SS.FFFFFF",
                             get_func_name(fcinfo->flinfo->fn_oid), static_cast<int>(size),
                             result.data())));
    }
    return TimestampGetDatum(stamp);
  } else {
    return PointerGetDatum(resultText(fcinfo, result.data(), result.length()));
  }
}

// The scratchpad of a statement: zero-filled before its first call and
// handed back unchanged on each later one, kept with the function's call
// site for as long as the statement runs.
inline void *statementScratchpad(FunctionCallInfo fcinfo) {
  FmgrInfo *info = fcinfo->flinfo;
  if (info->fn_extra == nullptr) {
    info->fn_extra = MemoryContextAllocZero(info->fn_mcxt, CLI_SCRATCHPAD_SIZE);
  }
  return info->fn_extra;
}

// One call of the export of `Row`, whose result becomes `out`, or whose
// status an ERROR; `longForm`: a CLI_udfLob form serves the call if this
// one refuses it for a length rule.  The arguments are read; everything
// that may raise an ERROR is done before the call.
template <std::size_t Row, Type Result, std::size_t... I>
Outcome callRow(FunctionCallInfo fcinfo, const Argument *arguments, bool longForm, Datum &out,
                std::index_sequence<I...>) {
  static constexpr const cat::Routine &r = cat::kRoutines[Row];
  if constexpr ((r.properties & cat::kHandlesNull) == 0) {
    // Such a function is STRICT; a NULL that comes all the same gives NULL.
    if ((arguments[I].null || ...)) return Outcome::null;
  }
  // Fixed bytes must be exactly as long as the layout.
  [[maybe_unused]] const auto checkSize = [&](std::size_t i) {
    const cat::Slot &slot = r.inputs[i];
    if (slot.layout == cat::Layout::fixedBytes && !arguments[i].null &&
        arguments[i].size != slot.size) {
      reportArgument(fcinfo, ERRCODE_INVALID_PARAMETER_VALUE, static_cast<int>(i), slot.name,
                     slot.size == 8 ? "must be exactly 8 bytes" : "has the wrong length");
    }
  };
  (checkSize(I), ...);

  // Plain data only: no destructor to skip, and only the status buffers and
  // indicators cleared.
  host::ScalarCall<Row, false> call;
  (...,
   (arguments[I].null ? call.template setNull<I>() : load(call.template input<I>(), arguments[I])));
  call.result.prepare([](std::size_t size) { return palloc(size); });
  [[maybe_unused]] const void *dbinfo = nullptr;
  [[maybe_unused]] void *scratchpad = nullptr;
  if constexpr (r.frame == cat::Frame::dbinfo) dbinfo = databaseInfo(fcinfo);
  if constexpr (r.frame == cat::Frame::scratchpad) scratchpad = statementScratchpad(fcinfo);
  call.run(gExports[Row], dbinfo, scratchpad);
  const Outcome o = call.outcome(longForm);
  if (o == Outcome::status) reportStatus(fcinfo, call.status);
  if (o == Outcome::value) out = deliver<Result>(fcinfo, call.result);
  return o;
}

// Whether every text argument fits terminated text.
template <Type... Args, std::size_t... I>
bool textFits(const Argument *arguments, std::index_sequence<I...>) {
  return ((Args != Type::text || arguments[I].null || arguments[I].size <= kTextLimit) && ...);
}

// The first text argument that doesn't fit, reported.
template <std::size_t Row>
[[noreturn]] void reportTooLong(FunctionCallInfo fcinfo, const Argument *arguments, std::size_t n) {
  for (std::size_t i = 0; i < n; ++i) {
    if (arguments[i].size > kTextLimit) {
      reportArgument(fcinfo, ERRCODE_STRING_DATA_RIGHT_TRUNCATION, static_cast<int>(i),
                     cat::kRoutines[Row].inputs[i].name,
                     "is longer than the 4000 bytes that the function takes");
    }
  }
  pg_unreachable();
}

constexpr bool isDatetime(Type t) {
  return t == Type::date || t == Type::time || t == Type::timestamp || t == Type::timestamptz;
}

// Whether every date or time argument reaches an input of terminated text,
// the only input that writes their text forms.
template <std::size_t TextRow, std::size_t LobRow, Type... Args>
constexpr bool datetimeAsText() {
  constexpr Type types[] = {Args..., Type::int4};
  for (std::size_t i = 0; i < sizeof...(Args); ++i) {
    if (!isDatetime(types[i])) continue;
    if (LobRow != kNoRow || TextRow == kNoRow ||
        cat::kRoutines[TextRow].inputs[i].layout != cat::Layout::text) {
      return false;
    }
  }
  return true;
}

// The scalar function of one signature: TextRow serves text that fits,
// LobRow longer text, bytea, and calls that TextRow refuses for a length
// rule.  Either may be kNoRow.
template <std::size_t TextRow, std::size_t LobRow, Type Result, Type... Args>
Datum scalar(FunctionCallInfo fcinfo) {
  constexpr std::size_t n = sizeof...(Args);
  static_assert(datetimeAsText<TextRow, LobRow, Args...>());
  using Indices = std::make_index_sequence<n>;
  Argument arguments[n > 0 ? n : 1];
  [&]<std::size_t... I>(std::index_sequence<I...>) {
    (readArgument<Args>(fcinfo, static_cast<int>(I), arguments[I]), ...);
  }
  (Indices{});

  // No string reaches a routine past the CLI_udfLob limit, in any form:
  // a result as long as its input must fit its area.
  for (std::size_t i = 0; i < n; ++i) {
    if (arguments[i].size > kLobLimit) {
      reportArgument(fcinfo, ERRCODE_STRING_DATA_RIGHT_TRUNCATION, static_cast<int>(i), nullptr,
                     "is longer than the 1048576 bytes that any string may be");
    }
  }

  Datum out = 0;
  const auto finish = [&](Outcome o) -> Datum {
    if (o == Outcome::null) {
      fcinfo->isnull = true;
      return 0;
    }
    return out;
  };
  if constexpr (TextRow != kNoRow) {
    if (textFits<Args...>(arguments, Indices{})) {
      if constexpr (LobRow == kNoRow) {
        return finish(callRow<TextRow, Result>(fcinfo, arguments, false, out, Indices{}));
      } else {
        return finish(host::withLongForm(
            [&] { return callRow<TextRow, Result>(fcinfo, arguments, true, out, Indices{}); },
            [&] { return callRow<LobRow, Result>(fcinfo, arguments, false, out, Indices{}); }));
      }
    } else if constexpr (LobRow == kNoRow) {
      reportTooLong<TextRow>(fcinfo, arguments, n);
    }
  }
  if constexpr (LobRow != kNoRow) {
    return finish(callRow<LobRow, Result>(fcinfo, arguments, false, out, Indices{}));
  }
  pg_unreachable();
}

}  // namespace orv::pg
