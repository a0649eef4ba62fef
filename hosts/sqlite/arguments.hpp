// The argument adapters: SQL values laid out in the frame's value layouts,
// and result areas read back into SQL values.  One adapter per layout
// serves every routine; a row picks its adapters by its slots' layouts.
//
// Include after SQLITE_EXTENSION_INIT3.
#pragma once

#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

#include "catalogue/catalogue.hpp"
#include "connection.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"

namespace orv::host {

using cli::catalogue::kRoutines;
using cli::catalogue::Layout;

constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;

// One SQL argument as the dispatcher has read it, so that no value is asked
// twice: its type (after numeric affinity, for a number argument) and, for
// a string, its bytes and whether terminated text can carry them.
// Only the arguments that a call has are set, and only what their kind
// uses: a row costs what it reads.
struct Argument {
  int type;
  const unsigned char *bytes;
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
  // A CLI_udfLob form could serve the call if the chosen form refuses it for
  // a length rule (SYSFUN:10), and whether it did.
  bool mayGrow = false;
  mutable bool refusedForLength = false;
};

// Most SQL strings are short: these read and write them in at most four
// overlapping words each way, never outside [from, from + size), and call
// the C library only for longer ones.
inline std::uint64_t word(const unsigned char *p) {
  std::uint64_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
inline std::uint32_t halfWord(const unsigned char *p) {
  std::uint32_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
constexpr bool hasZeroByte(std::uint64_t w) {
  return ((w - 0x0101010101010101u) & ~w & 0x8080808080808080u) != 0;
}

[[gnu::always_inline]] inline bool holdsNul(const unsigned char *p, std::size_t size) {
  if (size >= 8 && size <= 16) return hasZeroByte(word(p)) || hasZeroByte(word(p + size - 8));
  if (size > 16 && size <= 32) {
    return hasZeroByte(word(p)) || hasZeroByte(word(p + 8)) || hasZeroByte(word(p + size - 16)) ||
           hasZeroByte(word(p + size - 8));
  }
  if (size >= 4 && size < 8) {
    return hasZeroByte(halfWord(p) | (std::uint64_t{0xFFFFFFFF} << 32)) ||
           hasZeroByte(halfWord(p + size - 4) | (std::uint64_t{0xFFFFFFFF} << 32));
  }
  return size != 0 && std::memchr(p, 0, size) != nullptr;
}

inline void copyShort(char *to, const unsigned char *from, std::size_t size) {
  if (size >= 8 && size <= 16) {
    const std::uint64_t head = word(from), tail = word(from + size - 8);
    std::memcpy(to, &head, 8);
    std::memcpy(to + size - 8, &tail, 8);
  } else if (size > 16 && size <= 32) {
    const std::uint64_t a = word(from), b = word(from + 8), c = word(from + size - 16),
                        d = word(from + size - 8);
    std::memcpy(to, &a, 8);
    std::memcpy(to + 8, &b, 8);
    std::memcpy(to + size - 16, &c, 8);
    std::memcpy(to + size - 8, &d, 8);
  } else if (size != 0) {
    std::memcpy(to, from, size);
  }
}

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

// Integers of the export's width: from an INTEGER in range, or from a REAL
// with a whole value in range; never cut to fit.
template <typename T>
bool loadInteger(const Call &c, std::size_t row, int i, T &out) {
  sqlite3_value *v = c.argv[i];
  const int type = c.arguments[static_cast<std::size_t>(i)].type;
  constexpr auto lo = std::numeric_limits<T>::min();
  constexpr auto hi = std::numeric_limits<T>::max();
  constexpr int bits = std::numeric_limits<T>::digits + 1;
  if (type == SQLITE_INTEGER) {
    const sqlite3_int64 x = sqlite3_value_int64(v);
    if (x >= lo && x <= hi) {
      out = static_cast<T>(x);
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %lld, outside the %d-bit range",
         c.function.label.c_str(), i + 1, argumentName(row, i), x, bits);
    return false;
  }
  if (type == SQLITE_FLOAT) {
    const double d = sqlite3_value_double(v);
    // 2^(bits-1) is exact in a double; hi itself may not be.
    const double limit = std::ldexp(1.0, bits - 1);
    if (d == std::trunc(d) && d >= -limit && d < limit) {
      out = static_cast<T>(d);
      return true;
    }
    fail(c.context, "%s: argument %d (%s) is %!.17g, not a whole number in the %d-bit range",
         c.function.label.c_str(), i + 1, argumentName(row, i), d, bits);
    return false;
  }
  fail(c.context, "%s: argument %d (%s) is not a number", c.function.label.c_str(), i + 1,
       argumentName(row, i));
  return false;
}

// An input in the layout L; Size is the byte count of fixed layouts.
template <Layout L, std::uint32_t Size>
struct Input;

template <typename T>
struct IntegerInput {
  T value{};
  bool load(const Call &c, std::size_t row, int i) { return loadInteger(c, row, i, value); }
  void *pointer() { return &value; }
};
template <std::uint32_t S>
struct Input<Layout::int16, S> : IntegerInput<std::int16_t> {};
template <std::uint32_t S>
struct Input<Layout::int32, S> : IntegerInput<std::int32_t> {};
template <std::uint32_t S>
struct Input<Layout::int64, S> : IntegerInput<std::int64_t> {};

template <std::uint32_t S>
struct Input<Layout::real, S> {
  double value = 0.0;
  bool load(const Call &c, std::size_t row, int i) {
    const int type = c.arguments[static_cast<std::size_t>(i)].type;
    if (type != SQLITE_INTEGER && type != SQLITE_FLOAT) {
      fail(c.context, "%s: argument %d (%s) is not a number", c.function.label.c_str(), i + 1,
           argumentName(row, i));
      return false;
    }
    value = sqlite3_value_double(c.argv[i]);
    return true;
  }
  void *pointer() { return &value; }
};

// Terminated text, copied: for a routine that may write into its inputs.
template <std::uint32_t S>
struct Input<Layout::text, S> {
  // Left uninitialised but for the terminator: a row costs what it copies.
  Input() { text[0] = '\0'; }
  std::array<char, kTextLimit + 1> text;
  bool load(const Call &c, std::size_t /*row*/, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    if (!a.fitsText) {
      failNotText(c, i);
      return false;
    }
    copyShort(text.data(), a.bytes, a.size);
    text[a.size] = '\0';
    return true;
  }
  void *pointer() { return text.data(); }
};

// Terminated text for a routine that only reads it: SQLite's own buffer,
// which sqlite3_value_text ends with a NUL, handed over without a copy.
// The dispatcher has checked that the text holds no NUL of its own.
struct BorrowedText {
  char empty[1] = {};  // a NULL handed to a routine that reads indicators
  char *text = empty;
  bool load(const Call &c, std::size_t /*row*/, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    if (!a.fitsText) {
      failNotText(c, i);
      return false;
    }
    // The routine's parameter is char * by the frame's C signature; a
    // routine not marked kWritesInputs only reads through it.
    text = const_cast<char *>(reinterpret_cast<const char *>(a.bytes));
    return true;
  }
  [[nodiscard]] void *pointer() const { return text; }
};

template <std::uint32_t S>
struct Input<Layout::lob, S> {
  unsigned char *value = empty.data();
  std::array<unsigned char, 4> empty{};  // a NULL handed to a routine that reads indicators
  bool load(const Call &c, std::size_t row, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    const std::size_t size = a.size;
    if (size > kLobLimit) {
      fail(c.context, "%s: argument %d (%s) is %lld bytes long; strings are at most %d bytes",
           c.function.label.c_str(), i + 1, argumentName(row, i), static_cast<long long>(size),
           static_cast<int>(kLobLimit));
      return false;
    }
    value = c.connection.lobInputs[static_cast<std::size_t>(i)].get(CLI_LOB_AREA_SIZE(size));
    const auto length = static_cast<std::uint32_t>(size);
    std::memcpy(value, &length, sizeof length);
    if (size != 0) std::memcpy(value + CLI_LOB_DATA_OFFSET, a.bytes, size);
    return true;
  }
  void *pointer() { return value; }
};

template <std::uint32_t Size>
struct Input<Layout::fixedBytes, Size> {
  std::array<unsigned char, Size> value{};
  bool load(const Call &c, std::size_t row, int i) {
    const Argument &a = c.arguments[static_cast<std::size_t>(i)];
    if (a.size != Size) {
      fail(c.context, "%s: argument %d (%s) must be exactly %d bytes", c.function.label.c_str(),
           i + 1, argumentName(row, i), static_cast<int>(Size));
      return false;
    }
    std::memcpy(value.data(), a.bytes, Size);
    return true;
  }
  void *pointer() { return value.data(); }
};

// The adapter of input I of a row: text that the routine only reads is
// borrowed, anything else laid out in its own storage.
template <std::size_t Row, std::size_t I>
using InputOf =
    std::conditional_t<kRoutines[Row].inputs[I].layout == Layout::text &&
                           (kRoutines[Row].properties & cli::catalogue::kWritesInputs) == 0,
                       BorrowedText,
                       Input<kRoutines[Row].inputs[I].layout, kRoutines[Row].inputs[I].size>>;

// A result in the layout L; Size is the longest text, the capacity of a
// CLI_udfLob or the byte count of fixed text.
template <Layout L, std::uint32_t Size>
struct Result;

template <typename T>
struct IntegerResult {
  T value{};
  bool prepare(const Call &) { return true; }
  void *pointer() { return &value; }
  void deliver(const Call &c) { sqlite3_result_int64(c.context, value); }
};
template <std::uint32_t S>
struct Result<Layout::int16, S> : IntegerResult<std::int16_t> {};
template <std::uint32_t S>
struct Result<Layout::int32, S> : IntegerResult<std::int32_t> {};
template <std::uint32_t S>
struct Result<Layout::int64, S> : IntegerResult<std::int64_t> {};

template <std::uint32_t S>
struct Result<Layout::real, S> {
  double value = 0.0;
  bool prepare(const Call &) { return true; }
  void *pointer() { return &value; }
  void deliver(const Call &c) { sqlite3_result_double(c.context, value); }
};

template <std::uint32_t Longest>
struct Result<Layout::text, Longest> {
  Result() { text[Longest] = '\0'; }
  std::array<char, Longest + 1> text;
  bool prepare(const Call &) { return true; }
  void *pointer() { return text.data(); }
  void deliver(const Call &c) {
    sqlite3_result_text(c.context, text.data(), static_cast<int>(length()), SQLITE_TRANSIENT);
  }
  // A short area is measured inline; a call to strnlen costs more.
  [[nodiscard]] std::size_t length() const {
    if constexpr (Longest <= 32) {
      std::size_t n = 0;
      while (n < Longest && text[n] != '\0') ++n;
      return n;
    } else {
      return ::strnlen(text.data(), Longest);
    }
  }
};

template <std::uint32_t Capacity>
struct Result<Layout::lob, Capacity> {
  unsigned char *value = nullptr;
  bool prepare(const Call &c) {
    value = c.connection.lobResult.get(CLI_LOB_AREA_SIZE(std::size_t{Capacity}));
    const std::uint32_t capacity = Capacity;
    std::memcpy(value, &capacity, sizeof capacity);
    return true;
  }
  void *pointer() { return value; }
  void deliver(const Call &c) {
    std::uint32_t length = 0;
    std::memcpy(&length, value, sizeof length);
    if (length > Capacity) {
      fail(c.context, "%s: the routine reported %u bytes in an area of %u",
           c.function.label.c_str(), length, Capacity);
      return;
    }
    const unsigned char *data = value + CLI_LOB_DATA_OFFSET;
    if (c.blobResult) {
      sqlite3_result_blob(c.context, data, static_cast<int>(length), SQLITE_TRANSIENT);
    } else {
      sqlite3_result_text(c.context, reinterpret_cast<const char *>(data), static_cast<int>(length),
                          SQLITE_TRANSIENT);
    }
  }
};

template <std::uint32_t Size>
struct Result<Layout::fixedText, Size> {
  std::array<char, Size> text{};
  bool prepare(const Call &) { return true; }
  void *pointer() { return text.data(); }
  void deliver(const Call &c) {
    sqlite3_result_text(c.context, text.data(), static_cast<int>(Size), SQLITE_TRANSIENT);
  }
};

}  // namespace orv::host
