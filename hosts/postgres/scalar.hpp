// The call path of every scalar function of the extension: read the
// arguments, choose the form, lay the frame out and call the export
// through the frame caller, then turn the result or the status into a
// PostgreSQL value or ERROR.  It knows layouts and the catalogue, never
// what a routine does.
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
#include <cstring>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "frame/status.hpp"
#include "module.hpp"
#include "signatures.hpp"

namespace orv::pg {

inline constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
inline constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;

// What a date or time argument is.  Its text form is written where the
// routine's input is laid out, with no copy in between.
enum class Datetime : unsigned char { none, date, time, timestamp };

// One argument as PostgreSQL handed it, read once: a number, a string's
// bytes, or a date or time value (in `integer`, `size` the length of its
// text form).
struct Argument {
  bool null;
  Datetime datetime;
  std::int64_t integer;
  double real;
  const char *bytes;
  std::size_t size;
};

// The arguments are not zeroed first, as that costs more on every call
// than a short routine does: this sets every member.
template <Type T>
void readArgument(FunctionCallInfo fcinfo, int i, Argument &a) {
  a.null = PG_ARGISNULL(i);
  a.datetime = Datetime::none;
  a.integer = 0;
  a.real = 0;
  a.bytes = nullptr;
  a.size = 0;
  if (a.null) return;
  const Datum d = PG_GETARG_DATUM(i);
  if constexpr (T == Type::int2) {
    a.integer = DatumGetInt16(d);
  } else if constexpr (T == Type::int4) {
    a.integer = DatumGetInt32(d);
  } else if constexpr (T == Type::int8) {
    a.integer = DatumGetInt64(d);
  } else if constexpr (T == Type::float8) {
    a.real = DatumGetFloat8(d);
  } else if constexpr (T == Type::text || T == Type::bytea) {
    const varlena *v = PG_DETOAST_DATUM_PACKED(d);
    a.bytes = VARDATA_ANY(v);
    a.size = VARSIZE_ANY_EXHDR(v);
  } else {
    bool fits = true;
    if constexpr (T == Type::date) {
      a.datetime = Datetime::date;
      a.integer = DatumGetDateADT(d);
      a.size = kDateSize;
      fits = dateFits(DatumGetDateADT(d));
    } else if constexpr (T == Type::time) {
      a.datetime = Datetime::time;
      a.integer = DatumGetTimeADT(d);
      a.size = kTimeSize;
    } else {
      // A timestamp with time zone in the session's time zone, as
      // PostgreSQL's own cast gives it.
      const Datum local = T == Type::timestamp ? d : DirectFunctionCall1(timestamptz_timestamp, d);
      a.datetime = Datetime::timestamp;
      a.integer = DatumGetTimestamp(local);
      a.size = kTimestampSize;
      fits = timestampFits(DatumGetTimestamp(local));
    }
    if (!fits) {
      reportArgument(fcinfo, ERRCODE_DATETIME_VALUE_OUT_OF_RANGE, i, nullptr,
                     "lies outside the years 1 to 9999 that the library takes");
    }
  }
}

// The text form of a date or time argument that fits, at `out`.
inline void writeDatetime(const Argument &a, char *out) {
  switch (a.datetime) {
    case Datetime::date:
      dateText(static_cast<DateADT>(a.integer), out);
      return;
    case Datetime::time:
      timeText(a.integer, out);
      return;
    case Datetime::timestamp:
      timestampText(a.integer, out);
      return;
    case Datetime::none:
      break;
  }
}

// An input in the layout L; Size is the byte count of fixed bytes.
template <cat::Layout L, std::uint32_t Size>
struct Input;

template <typename T>
struct IntegerInput {
  T value;
  void load(const Argument &a) { value = static_cast<T>(a.integer); }
  void *pointer() { return &value; }
};
template <std::uint32_t S>
struct Input<cat::Layout::int16, S> : IntegerInput<std::int16_t> {};
template <std::uint32_t S>
struct Input<cat::Layout::int32, S> : IntegerInput<std::int32_t> {};
template <std::uint32_t S>
struct Input<cat::Layout::int64, S> : IntegerInput<std::int64_t> {};

template <std::uint32_t S>
struct Input<cat::Layout::real, S> {
  double value;
  void load(const Argument &a) { value = a.real; }
  void *pointer() { return &value; }
};

// Terminated text, copied: the routines may write into their inputs.  The
// form choice has made sure that the text fits.
template <std::uint32_t S>
struct Input<cat::Layout::text, S> {
  char text[kTextLimit + 1];
  void load(const Argument &a) {
    if (a.null) {
      text[0] = '\0';
      return;
    }
    if (a.datetime != Datetime::none) {
      writeDatetime(a, text);
    } else {
      std::memcpy(text, a.bytes, a.size);
    }
    text[a.size] = '\0';
  }
  void *pointer() { return text; }
};

template <std::uint32_t S>
struct Input<cat::Layout::lob, S> {
  void *value;
  void load(const Argument &a) {
    const std::size_t size = a.null ? 0 : a.size;
    value = palloc(CLI_LOB_AREA_SIZE(size));
    cli::call::layOutLob(value, a.bytes, size);
  }
  void *pointer() { return value; }
};

template <std::uint32_t Size>
struct Input<cat::Layout::fixedBytes, Size> {
  unsigned char value[Size];
  void load(const Argument &a) {
    if (a.null) {
      std::memset(value, 0, Size);
    } else {
      std::memcpy(value, a.bytes, Size);
    }
  }
  void *pointer() { return value; }
};

// The inputs of one call, each in its layout, reached by index with
// inputAt<I>.  Unlike a std::tuple, which value-initialises its members,
// this is default-initialised: a text input is an area of 4001 bytes, and
// zeroing those on every call would cost more than most routines do.  Each
// load() writes everything that the routine reads.
template <std::size_t I, typename T>
struct HeldInput {
  T value;
};
template <typename Indices, typename... T>
struct Inputs;
template <std::size_t... I, typename... T>
struct Inputs<std::index_sequence<I...>, T...> : HeldInput<I, T>... {};

template <std::size_t I, typename T>
T &inputAt(HeldInput<I, T> &held) {
  return held.value;
}

// A result in the layout L, and its value for PostgreSQL as type R.
template <cat::Layout L, std::uint32_t Size, Type R>
struct Output;

template <typename T, Type R>
struct NumberOutput {
  T value;
  void prepare() {}
  void *pointer() { return &value; }
  Datum deliver(FunctionCallInfo) {
    if constexpr (R == Type::int2) {
      return Int16GetDatum(value);
    } else if constexpr (R == Type::int4) {
      return Int32GetDatum(value);
    } else if constexpr (R == Type::int8) {
      return Int64GetDatum(value);
    } else {
      return Float8GetDatum(value);
    }
  }
};
template <std::uint32_t S, Type R>
struct Output<cat::Layout::int16, S, R> : NumberOutput<std::int16_t, R> {};
template <std::uint32_t S, Type R>
struct Output<cat::Layout::int32, S, R> : NumberOutput<std::int32_t, R> {};
template <std::uint32_t S, Type R>
struct Output<cat::Layout::int64, S, R> : NumberOutput<std::int64_t, R> {};
template <std::uint32_t S, Type R>
struct Output<cat::Layout::real, S, R> : NumberOutput<double, R> {};

template <std::uint32_t Longest, Type R>
struct Output<cat::Layout::text, Longest, R> {
  char text[Longest + 1];
  void prepare() { text[Longest] = '\0'; }
  void *pointer() { return text; }
  Datum deliver(FunctionCallInfo fcinfo) {
    const std::size_t size = ::strnlen(text, Longest);
    if constexpr (R == Type::timestamp) {
      Timestamp stamp = 0;
      if (!timestampOf(text, size, stamp)) {
        ereport(ERROR,
                (errcode(ERRCODE_INTERNAL_ERROR),
                 errmsg("%s: the library gave the timestamp text \"%.*s\", which is not "
                        "of the form YYYY-MM-DD-HH.MM.SS.FFFFFF",
                        get_func_name(fcinfo->flinfo->fn_oid), static_cast<int>(size), text)));
      }
      return TimestampGetDatum(stamp);
    } else {
      return PointerGetDatum(resultText(fcinfo, text, size));
    }
  }
};

template <std::uint32_t Capacity, Type R>
struct Output<cat::Layout::lob, Capacity, R> {
  unsigned char *value;
  void prepare() {
    value = static_cast<unsigned char *>(palloc(CLI_LOB_AREA_SIZE(std::size_t{Capacity})));
    cli::call::prepareLobResult(value, Capacity);
  }
  void *pointer() { return value; }
  Datum deliver(FunctionCallInfo fcinfo) {
    std::uint32_t length = 0;
    std::memcpy(&length, value, sizeof length);
    if (length > Capacity) {
      ereport(ERROR, (errcode(ERRCODE_INTERNAL_ERROR),
                      errmsg("%s: the library reported %u bytes in an area of %u",
                             get_func_name(fcinfo->flinfo->fn_oid), length, Capacity)));
    }
    const unsigned char *data = value + CLI_LOB_DATA_OFFSET;
    if constexpr (R == Type::bytea) {
      return PointerGetDatum(resultBytes(data, length));
    } else {
      return PointerGetDatum(resultText(fcinfo, reinterpret_cast<const char *>(data), length));
    }
  }
};

template <std::uint32_t Size, Type R>
struct Output<cat::Layout::fixedText, Size, R> {
  char text[Size];
  void prepare() {}
  void *pointer() { return text; }
  Datum deliver(FunctionCallInfo fcinfo) { return PointerGetDatum(resultText(fcinfo, text, Size)); }
};

// The scratchpad of a statement: zero-filled before its first call and
// handed back unchanged on each later one, kept with the function's call
// site for as long as the statement runs.
inline constexpr std::size_t kScratchpadSize = 4 + 100;

inline void *statementScratchpad(FunctionCallInfo fcinfo) {
  FmgrInfo *info = fcinfo->flinfo;
  if (info->fn_extra == nullptr) {
    info->fn_extra = MemoryContextAllocZero(info->fn_mcxt, kScratchpadSize);
  }
  return info->fn_extra;
}

enum class Outcome : unsigned char { value, null, status };

// One call of the export of `Row`.  The arguments are read; everything
// that may raise an ERROR is done before the call.
template <std::size_t Row, Type Result, std::size_t... I>
Outcome callRow(FunctionCallInfo fcinfo, const Argument *arguments, Datum &out,
                cli::call::StatusBuffers &status, std::index_sequence<I...>) {
  static constexpr const cat::Routine &r = cat::kRoutines[Row];
  constexpr std::size_t n = sizeof...(I);
  [[maybe_unused]] std::int16_t inputIndicators[n + 1] = {};
  std::int16_t resultIndicator = 0;
  if constexpr ((r.properties & cat::kHandlesNull) == 0) {
    // Such a function is STRICT; a NULL that comes all the same gives NULL.
    if ((arguments[I].null || ...)) return Outcome::null;
  }
  if constexpr (n > 0) {
    for (std::size_t i = 0; i < n; ++i) inputIndicators[i] = arguments[i].null ? -1 : 0;
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

  // Plain data only: no destructor to skip, and nothing zeroed.
  [[maybe_unused]] Inputs<std::index_sequence<I...>, Input<r.inputs[I].layout, r.inputs[I].size>...>
      inputs;
  (..., inputAt<I>(inputs).load(arguments[I]));
  Output<r.results[0].layout, r.results[0].size, Result> result;
  result.prepare();

  void *values[] = {inputAt<I>(inputs).pointer()..., nullptr};
  void *results[] = {result.pointer()};
  std::int16_t *inputNulls[] = {&inputIndicators[I]..., nullptr};
  std::int16_t *resultNulls[] = {&resultIndicator};
  cli::call::Frame f = cli::call::frameOf(r, values, results, inputNulls, resultNulls, status);
  if constexpr (r.frame == cat::Frame::dbinfo) f.dbinfo = databaseInfo(fcinfo);
  if constexpr (r.frame == cat::Frame::scratchpad) f.scratchpad = statementScratchpad(fcinfo);
  cli::call::call<Row>(gExports[Row], f);

  if (status.stored()) return Outcome::status;
  if (resultIndicator < 0) return Outcome::null;
  out = result.deliver(fcinfo);
  return Outcome::value;
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
  cli::call::StatusBuffers status;
  const auto finish = [&](Outcome o) -> Datum {
    if (o == Outcome::status) reportStatus(fcinfo, status);
    if (o == Outcome::null) {
      fcinfo->isnull = true;
      return 0;
    }
    return out;
  };
  if constexpr (TextRow != kNoRow) {
    if (textFits<Args...>(arguments, Indices{})) {
      const Outcome o = callRow<TextRow, Result>(fcinfo, arguments, out, status, Indices{});
      if constexpr (LobRow == kNoRow) {
        return finish(o);
      } else {
        const bool lengthRule =
            o == Outcome::status &&
            cli::call::sysfunIn(status.sqlstate, status.message) == cli::Sysfun::tooLong;
        if (!lengthRule) return finish(o);
        status = cli::call::StatusBuffers{};
      }
    } else if constexpr (LobRow == kNoRow) {
      reportTooLong<TextRow>(fcinfo, arguments, n);
    }
  }
  if constexpr (LobRow != kNoRow) {
    return finish(callRow<LobRow, Result>(fcinfo, arguments, out, status, Indices{}));
  }
  pg_unreachable();
}

}  // namespace orv::pg
