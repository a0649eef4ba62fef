// SQL values into the frame's value layouts and back: each SQL argument
// set into the adapter of its layout (common/layouts.hpp), with the errors
// that SQLite reports when a value does not fit, and each result adapter
// read back into an SQLite result.
//
// Include after SQLITE_EXTENSION_INIT3.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "catalogue/catalogue.hpp"
#include "common/forms.hpp"
#include "common/layouts.hpp"
#include "connection.hpp"

namespace orv::sqlite {

using cli::catalogue::kRoutines;
using cli::catalogue::Layout;
using host::kLobLimit;
using host::kTextLimit;

// One SQL argument as the dispatcher has read it, so that no value is asked
// twice: its type (after numeric affinity, for a number argument) and, for
// a string, its bytes and whether terminated text can carry them.
// Only the arguments that a call has are set, and only what their kind
// uses: a row costs what it reads.
struct Argument {
  int type;
  const char *bytes;
  std::size_t size;
  bool fitsText;
};

// Everything that one call of a row needs.
struct Call {
  Call(sqlite3_context *c, sqlite3_value **v, Connection &n, const Function &f)
      : context(c), argv(v), connection(n), function(f) {}
  sqlite3_context *context;
  sqlite3_value **argv;
  std::array<Argument, cli::catalogue::kMaxInputs> arguments;  // the first argc are set
  Connection &connection;
  const Function &function;
  bool blobResult = false;  // the first string argument was a BLOB
  // A CLI_udfLob form serves the call if the chosen form refuses it for a
  // length rule (SYSFUN:10).
  bool longForm = false;
};

template <typename... Args>
void fail(sqlite3_context *context, const char *format, Args... args) {
  char *text = sqlite3_mprintf(format, args...);
  if (text == nullptr) {
    sqlite3_result_error_nomem(context);
    return;
  }
  sqlite3_result_error(context, text, -1);
  sqlite3_free(text);
}

// Reports that string argument i cannot be terminated text, saying why,
// and which export takes such strings where the function's name has none.
inline void failNotText(const Call &c, int i) {
  const Argument &a = c.arguments[static_cast<std::size_t>(i)];
  const char *label = c.function.label.c_str();
  const char *name = c.function.argumentNames[static_cast<std::size_t>(i)];
  // "; sysfun_lcase2 takes such strings", or nothing; made without an
  // allocation, as this runs outside the call's handler of bad_alloc.
  const bool longer = !c.function.longerForm.empty();
  const char *hintHead = longer ? "; " : "";
  const char *hintName = c.function.longerForm.c_str();
  const char *hintTail = longer ? " takes such strings" : "";
  if (a.type == SQLITE_BLOB) {
    fail(c.context, "%s: argument %d (%s) is a BLOB, and the function takes text only%s%s%s", label,
         i + 1, name, hintHead, hintName, hintTail);
  } else if (a.size > kTextLimit) {
    fail(c.context,
         "%s: argument %d (%s) is %lld bytes long, and the function takes text of at most %d "
         "bytes%s%s%s",
         label, i + 1, name, static_cast<long long>(a.size), static_cast<int>(kTextLimit), hintHead,
         hintName, hintTail);
  } else {
    fail(c.context,
         "%s: argument %d (%s) holds a NUL byte, and the function takes text without NUL "
         "bytes%s%s%s",
         label, i + 1, name, hintHead, hintName, hintTail);
  }
}

inline const char *argumentName(std::size_t row, int i) {
  const char *name = kRoutines[row].inputs[i].name;
  return name != nullptr ? name : "";
}

// Numbers: a double from an INTEGER or a REAL; integers of the export's
// width from an INTEGER in range, or from a REAL with a whole value in
// range, never cut to fit.
template <typename T>
[[gnu::always_inline]] inline bool load(const Call &c, std::size_t row, int i,
                                        host::NumberInput<T> &in) {
  sqlite3_value *v = c.argv[i];
  const int type = c.arguments[static_cast<std::size_t>(i)].type;
  if (type != SQLITE_INTEGER && type != SQLITE_FLOAT) {
    fail(c.context, "%s: argument %d (%s) is not a number", c.function.label.c_str(), i + 1,
         argumentName(row, i));
    return false;
  }
  if constexpr (std::is_same_v<T, double>) {
    in.set(sqlite3_value_double(v));
    return true;
  } else if (type == SQLITE_INTEGER) {
    const sqlite3_int64 x = sqlite3_value_int64(v);
    if (host::fitsInteger<T>(x)) {
      in.set(static_cast<T>(x));
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %lld, outside the %d-bit range",
         c.function.label.c_str(), i + 1, argumentName(row, i), x, host::kBits<T>);
    return false;
  } else {
    const double d = sqlite3_value_double(v);
    if (host::wholeInteger<T>(d)) {
      in.set(static_cast<T>(d));
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %!.17g, not a whole number in the %d-bit range",
         c.function.label.c_str(), i + 1, argumentName(row, i), d, host::kBits<T>);
    return false;
  }
}

// Terminated text: copied for a routine that may write into its inputs,
// and otherwise SQLite's own buffer, which sqlite3_value_text ends with a
// NUL, handed over without a copy.
template <class T>
concept TextInput = std::is_base_of_v<host::CopiedText, T> || std::is_same_v<T, host::BorrowedText>;

template <TextInput Text>
[[gnu::always_inline]] inline bool load(const Call &c, std::size_t /*row*/, int i, Text &in) {
  const Argument &a = c.arguments[static_cast<std::size_t>(i)];
  if (!a.fitsText) {
    failNotText(c, i);
    return false;
  }
  in.set(a.bytes, a.size);
  return true;
}

// A CLI_udfLob in the connection's area for argument i.
template <std::uint32_t S>
[[gnu::always_inline]] inline bool load(const Call &c, std::size_t row, int i,
                                        host::Input<Layout::lob, S> &in) {
  const Argument &a = c.arguments[static_cast<std::size_t>(i)];
  const std::size_t size = a.size;
  if (size > kLobLimit) {
    fail(c.context, "%s: argument %d (%s) is %lld bytes long; strings are at most %d bytes",
         c.function.label.c_str(), i + 1, argumentName(row, i), static_cast<long long>(size),
         static_cast<int>(kLobLimit));
    return false;
  }
  in.set(c.connection.lobInputs[static_cast<std::size_t>(i)].get(CLI_LOB_AREA_SIZE(size)), a.bytes,
         size);
  return true;
}

template <std::uint32_t Size>
[[gnu::always_inline]] inline bool load(const Call &c, std::size_t row, int i,
                                        host::Input<Layout::fixedBytes, Size> &in) {
  const Argument &a = c.arguments[static_cast<std::size_t>(i)];
  if (a.size != Size) {
    fail(c.context, "%s: argument %d (%s) must be exactly %d bytes", c.function.label.c_str(),
         i + 1, argumentName(row, i), static_cast<int>(Size));
    return false;
  }
  in.set(a.bytes);
  return true;
}

// The result as an SQLite value: a number as an INTEGER or a REAL, text as
// TEXT, a CLI_udfLob as TEXT or, when the first string argument was a BLOB,
// as a BLOB.
template <Layout L, std::uint32_t Size>
[[gnu::always_inline]] inline void deliver(const Call &c, const host::Result<L, Size> &result) {
  if constexpr (L == Layout::real) {
    sqlite3_result_double(c.context, result.value);
  } else if constexpr (host::isNumber(L)) {
    sqlite3_result_int64(c.context, result.value);
  } else if constexpr (L == Layout::lob) {
    if (!result.fits()) {
      fail(c.context, "%s: the routine reported %u bytes in an area of %u",
           c.function.label.c_str(), result.length(), Size);
      return;
    }
    const auto length = static_cast<int>(result.length());
    if (c.blobResult) {
      sqlite3_result_blob(c.context, result.data(), length, SQLITE_TRANSIENT);
    } else {
      sqlite3_result_text(c.context, result.data(), length, SQLITE_TRANSIENT);
    }
  } else {
    sqlite3_result_text(c.context, result.data(), static_cast<int>(result.length()),
                        SQLITE_TRANSIENT);
  }
}

}  // namespace orv::sqlite
