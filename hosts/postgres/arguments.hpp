// The arguments of a scalar function as PostgreSQL hands them over: each
// Datum read once into a plain value (a number, a string's bytes, or a
// date or time value), and set from there into the adapter of its layout
// (common/layouts.hpp).
//
// Include after server.hpp.
#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "catalogue/catalogue.hpp"
#include "common/layouts.hpp"
#include "frame/cliudf.h"
#include "module.hpp"
#include "signatures.hpp"

namespace orv::pg {

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
[[gnu::always_inline]] inline void readArgument(FunctionCallInfo fcinfo, int i, Argument &a) {
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

// An argument that is not NULL into the adapter of its layout.  What could
// keep it out has been checked before: the text fits terminated text,
// fixed bytes have their length.
template <typename T>
[[gnu::always_inline]] inline void load(host::NumberInput<T> &in, const Argument &a) {
  if constexpr (std::is_same_v<T, double>) {
    in.set(a.real);
  } else {
    in.set(static_cast<T>(a.integer));
  }
}

// Terminated text, copied: PostgreSQL's text has no terminator.  A date or
// time value is written there in its text form.
[[gnu::always_inline]] inline void load(host::CopiedText &in, const Argument &a) {
  if (a.datetime != Datetime::none) {
    writeDatetime(a, in.area());
    in.written(a.size);
  } else {
    in.set(a.bytes, a.size);
  }
}

// A CLI_udfLob in memory of the call.
template <std::uint32_t S>
[[gnu::always_inline]] inline void load(host::Input<cat::Layout::lob, S> &in, const Argument &a) {
  in.set(palloc(CLI_LOB_AREA_SIZE(a.size)), a.bytes, a.size);
}

template <std::uint32_t Size>
[[gnu::always_inline]] inline void load(host::Input<cat::Layout::fixedBytes, Size> &in,
                                        const Argument &a) {
  in.set(a.bytes);
}

}  // namespace orv::pg
