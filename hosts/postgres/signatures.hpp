// Which SQL functions the PostgreSQL extension creates, read off the
// catalogue.  Free of PostgreSQL types, so that the generator that writes
// the install script and the module's entry points uses the same rules.
//
// PostgreSQL chooses among functions of one name by the types of the
// arguments, so the extension offers one function per name and argument
// types, and the types say which export serves a call:
//
//  - Numbers by their type: int2, int4, int8 and float8 reach the export
//    of that width, where the function has one (ABS3, ABS2, ABS4, ABS1).
//  - text reaches the terminated-text form while every text argument fits
//    (at most 4000 bytes), and the CLI_udfLob form otherwise; a call that
//    the terminated-text form refuses for a length rule (SYSFUN:10) is
//    served by the CLI_udfLob form too (common/forms.hpp).  bytea reaches
//    the CLI_udfLob form only, and gives bytea back.
//  - Of two exports of the same layouts, the one that reads its whole text
//    serves the plain name (see kNarrowerForm).
//  - The date routines also take date, timestamp, timestamp with time zone
//    and time values, turned into the library's text forms by the host; a
//    routine whose result is a timestamp text then gives a timestamp back.
//  - Every export also answers to its own name without the CLI_udf prefix
//    (left2, ascii3), which reaches that export and no other.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "common/forms.hpp"
#include "common/names.hpp"

namespace orv::pg {

namespace cat = cli::catalogue;
using cat::Frame;
using cat::kRoutines;
using cat::Layout;
using cat::Routine;
using host::exportName;
using host::isString;
using host::lowerCase;
using host::takesLob;

// The PostgreSQL types that the extension's functions take and give.
enum class Type : unsigned char {
  int2,
  int4,
  int8,
  float8,
  text,
  bytea,
  date,
  time,
  timestamp,
  timestamptz,
};

constexpr const char *sqlType(Type t) {
  switch (t) {
    case Type::int2:
      return "int2";
    case Type::int4:
      return "int4";
    case Type::int8:
      return "int8";
    case Type::float8:
      return "float8";
    case Type::text:
      return "text";
    case Type::bytea:
      return "bytea";
    case Type::date:
      return "date";
    case Type::time:
      return "time";
    case Type::timestamp:
      return "timestamp";
    case Type::timestamptz:
      return "timestamptz";
  }
  return "";
}

// The spelling of a Type in C++, for the generated entry points: each
// enumerator is named as its SQL type.
inline std::string cppType(Type t) { return std::string("Type::") + sqlType(t); }

inline constexpr std::size_t kNoRow = static_cast<std::size_t>(-1);

// A routine whose result is a timestamp text: given a date or time value
// it gives a timestamp back.
constexpr bool givesTimestampText(const Routine &r) {
  return r.results[0].layout == Layout::text && r.results[0].size == cat::kStamp;
}

// Frames that the extension calls as scalar functions.
constexpr bool scalar(const Routine &r) {
  return cat::resultCount(r) == 1 &&
         (r.frame == Frame::plain || r.frame == Frame::dbinfo || r.frame == Frame::scratchpad);
}

// One function of the extension.
struct Signature {
  std::string name;  // in lower case, in the schema sysfun
  std::vector<Type> arguments;
  Type result = Type::int4;      // for a scalar function
  std::size_t textRow = kNoRow;  // the form for text that fits, or the only form
  std::size_t lobRow = kNoRow;   // the CLI_udfLob form, for longer text
  std::string symbol;            // the module's C entry point
  [[nodiscard]] std::size_t row() const { return textRow != kNoRow ? textRow : lobRow; }
  [[nodiscard]] bool table() const { return !scalar(kRoutines[row()]); }
};

constexpr Type numberType(Layout l) {
  switch (l) {
    case Layout::int16:
      return Type::int2;
    case Layout::int32:
      return Type::int4;
    case Layout::int64:
      return Type::int8;
    default:
      return Type::float8;
  }
}

// The PostgreSQL type of an input of `layout` when strings come as `string`.
constexpr Type argumentType(Layout layout, Type string) {
  if (layout == Layout::fixedBytes) return Type::bytea;
  return isString(layout) ? string : numberType(layout);
}

// The result type of `r` when its string inputs come as `string`, or as a
// date or time value (`datetime`).
constexpr Type resultType(const Routine &r, Type string, bool datetime) {
  const Layout l = r.results[0].layout;
  if (datetime && givesTimestampText(r)) return Type::timestamp;
  if (l == Layout::lob) return string == Type::bytea ? Type::bytea : Type::text;
  if (l == Layout::text || l == Layout::fixedText) return Type::text;
  return numberType(l);
}

// Whether two rows take the same kinds of arguments: numbers of the same
// widths where the other has numbers, strings where the other has strings.
inline bool sameShape(const Routine &a, const Routine &b) {
  if (cat::inputCount(a) != cat::inputCount(b)) return false;
  for (std::size_t i = 0; i < cat::inputCount(a); ++i) {
    const Layout x = a.inputs[i].layout, y = b.inputs[i].layout;
    if (isString(x) != isString(y) || (!isString(x) && x != y)) return false;
  }
  return true;
}

// The date and time types that a date routine's text input also takes,
// by what the input is: a date, a time, or either.
inline std::vector<Type> datetimeTypes(const Routine &r) {
  if (cat::inputCount(r) != 1 || r.inputs[0].layout != Layout::text) return {};
  const std::string_view name = r.inputs[0].name;
  if (name == "date") return {Type::date, Type::timestamp, Type::timestamptz};
  if (name == "time") return {Type::time};
  if (name == "value") return {Type::date, Type::time, Type::timestamp, Type::timestamptz};
  return {};
}

inline std::vector<Signature> signatures() {
  std::vector<Signature> out;
  const auto add = [&](std::string name, std::vector<Type> arguments, Type result,
                       std::size_t textRow, std::size_t lobRow) {
    std::string symbol = "orv_pg_" + name;
    for (Type t : arguments) symbol += std::string("_") + sqlType(t);
    out.push_back(
        {std::move(name), std::move(arguments), result, textRow, lobRow, std::move(symbol)});
  };
  const auto typesOf = [](const Routine &r, Type string) {
    std::vector<Type> types;
    for (std::size_t i = 0; i < cat::inputCount(r); ++i) {
      types.push_back(argumentType(r.inputs[i].layout, string));
    }
    return types;
  };

  // Plain names: the rows of one SQL name, one function per shape.
  std::vector<bool> done(cat::kRoutineCount, false);
  for (std::size_t i = 0; i < cat::kRoutineCount; ++i) {
    if (done[i]) continue;
    const Routine &first = kRoutines[i];
    std::size_t textRow = kNoRow, lobRow = kNoRow;
    for (std::size_t j = i; j < cat::kRoutineCount; ++j) {
      const Routine &r = kRoutines[j];
      if (done[j] || std::string_view(r.sqlName) != first.sqlName || !sameShape(first, r)) {
        continue;
      }
      done[j] = true;
      std::size_t &slot = takesLob(r) ? lobRow : textRow;
      // Of two rows of one layout, the one that reads its whole text.
      if (slot == kNoRow || host::narrower(kRoutines[slot])) slot = j;
    }
    const std::string name = lowerCase(first.sqlName);
    const Routine &main = kRoutines[textRow != kNoRow ? textRow : lobRow];
    if (!scalar(main)) {
      add(name, typesOf(main, Type::text), Type::text, textRow, lobRow);
      continue;
    }
    add(name, typesOf(main, Type::text), resultType(main, Type::text, false), textRow, lobRow);
    if (lobRow != kNoRow) {
      const Routine &lob = kRoutines[lobRow];
      add(name, typesOf(lob, Type::bytea), resultType(lob, Type::bytea, false), kNoRow, lobRow);
    }
    if (textRow != kNoRow) {
      for (Type t : datetimeTypes(main)) add(name, {t}, resultType(main, t, true), textRow, kNoRow);
    }
  }

  // Each export by its own name, in its own layouts only.
  for (std::size_t i = 0; i < cat::kRoutineCount; ++i) {
    const Routine &r = kRoutines[i];
    const std::string own = exportName(r);
    if (own == lowerCase(r.sqlName)) continue;
    const bool lob = takesLob(r) || (scalar(r) && r.results[0].layout == Layout::lob);
    const std::size_t textRow = lob ? kNoRow : i, lobRow = lob ? i : kNoRow;
    if (!scalar(r)) {
      add(own, typesOf(r, Type::text), Type::text, textRow, lobRow);
      continue;
    }
    add(own, typesOf(r, Type::text), resultType(r, Type::text, false), textRow, lobRow);
    if (lob) add(own, typesOf(r, Type::bytea), resultType(r, Type::bytea, false), textRow, lobRow);
  }
  return out;
}

}  // namespace orv::pg
