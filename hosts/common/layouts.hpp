// The frame's value layouts over plain values.  One adapter per layout
// holds an input or a result where the export reads or writes it: a host
// fills an input from what it has read of its engine's value (a whole
// number, a double, or a string's bytes and size) and reads a result back
// as such a value.  A row picks its adapters by its slots' layouts, so one
// adapter serves every routine.
//
// The adapters are plain data and are not initialised: each input is set
// by set() or setNull() before the call, each result prepared by prepare(),
// and a row costs only what it writes.
#pragma once

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "common/bytes.hpp"
#include "common/forms.hpp"
#include "frame/call.hpp"
#include "frame/cliudf.h"

namespace orv::host {

namespace cat = cli::catalogue;

// The C++ type of a numeric layout.
template <cat::Layout L>
using NumberOf = std::conditional_t<
    L == cat::Layout::int16, std::int16_t,
    std::conditional_t<L == cat::Layout::int32, std::int32_t,
                       std::conditional_t<L == cat::Layout::int64, std::int64_t, double>>>;

// The bits of an integer layout of type T.
template <typename T>
inline constexpr int kBits = std::numeric_limits<T>::digits + 1;

// Whether an integer fits the layout of type T, never cut to fit.
template <typename T>
constexpr bool fitsInteger(std::int64_t x) {
  return x >= std::numeric_limits<T>::min() && x <= std::numeric_limits<T>::max();
}

// Whether a double is a whole number in the range of type T.
template <typename T>
inline bool wholeInteger(double d) {
  // 2^(bits-1) is exact in a double; the largest value of T may not be.
  const double limit = std::ldexp(1.0, kBits<T> - 1);
  return d == std::trunc(d) && d >= -limit && d < limit;
}

template <typename T>
struct NumberInput {
  T value;
  void set(T v) { value = v; }
  void setNull() { value = 0; }
  void *pointer() { return &value; }
};

// An input in the layout L: a number of its width, or one of the string
// layouts below; Size is the byte count of fixed bytes.
template <cat::Layout L, std::uint32_t Size>
struct Input : NumberInput<NumberOf<L>> {
  static_assert(isNumber(L));
};

// Terminated text, copied into an area of its own: for a routine that may
// write into its inputs, or an engine whose text has no terminator.  The
// host has made sure that the text fits (fitsText).
struct CopiedText {
  char text[kTextLimit + 1];
  void set(const char *bytes, std::size_t size) {
    copyShort(text, bytes, size);
    text[size] = '\0';
  }
  // For a host that writes the text itself: the area, then the length.
  char *area() { return text; }
  void written(std::size_t size) { text[size] = '\0'; }
  void setNull() { text[0] = '\0'; }
  void *pointer() { return text; }
};
template <std::uint32_t S>
struct Input<cat::Layout::text, S> : CopiedText {};

// Terminated text that the engine holds with its terminator, handed over
// without a copy, for a routine that only reads its inputs.  The host has
// made sure that it holds no NUL of its own.
struct BorrowedText {
  char *text;
  // The routine's parameter is char * by the frame's C signature; a
  // routine not marked kWritesInputs only reads through it.
  // The text of `size` bytes at `bytes`, with its terminator behind them.
  void set(const char *bytes, std::size_t /*size*/) { text = const_cast<char *>(bytes); }
  void setNull() { text = const_cast<char *>(""); }
  [[nodiscard]] void *pointer() const { return text; }
};

template <std::uint32_t S>
struct Input<cat::Layout::lob, S> {
  unsigned char *value;
  unsigned char empty[CLI_LOB_DATA_OFFSET];
  // Lays the bytes out at `area`, which holds CLI_LOB_AREA_SIZE(size) bytes.
  void set(void *area, const char *bytes, std::size_t size) {
    cli::call::layOutLob(area, bytes, size);
    value = static_cast<unsigned char *>(area);
  }
  void setNull() {
    std::memset(empty, 0, sizeof empty);
    value = empty;
  }
  void *pointer() { return value; }
};

template <std::uint32_t Size>
struct Input<cat::Layout::fixedBytes, Size> {
  unsigned char value[Size];
  // Exactly Size bytes: the host has checked the length.
  void set(const char *bytes) { std::memcpy(value, bytes, Size); }
  void setNull() { std::memset(value, 0, Size); }
  void *pointer() { return value; }
};

// The adapter of input I of row Row.  With Borrow, for an engine whose text
// ends with a terminator, text that the routine only reads is borrowed;
// anything else is laid out in storage of its own.
template <std::size_t Row, std::size_t I, bool Borrow>
using InputOf = std::conditional_t<
    Borrow && cat::kRoutines[Row].inputs[I].layout == cat::Layout::text &&
        (cat::kRoutines[Row].properties & cat::kWritesInputs) == 0,
    BorrowedText, Input<cat::kRoutines[Row].inputs[I].layout, cat::kRoutines[Row].inputs[I].size>>;

// The inputs of one call, each in its layout, reached by index with
// inputAt<I>.  Unlike a std::tuple, which value-initialises its members,
// this is default-initialised: a text input is an area of 4001 bytes, and
// zeroing those on every call would cost more than most routines do.
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

template <std::size_t Row, bool Borrow, typename Indices>
struct InputsOfRow;
template <std::size_t Row, bool Borrow, std::size_t... I>
struct InputsOfRow<Row, Borrow, std::index_sequence<I...>> {
  using type = Inputs<std::index_sequence<I...>, InputOf<Row, I, Borrow>...>;
};
template <std::size_t Row, bool Borrow>
using InputsOf =
    typename InputsOfRow<Row, Borrow,
                         std::make_index_sequence<cat::inputCount(cat::kRoutines[Row])>>::type;

template <typename T>
struct NumberResult {
  T value;
  template <class Allocate>
  void prepare(Allocate && /*allocate*/) {}
  void *pointer() { return &value; }
};

// A result in the layout L: a number of its width, or one of the string
// layouts below; Size is the longest text, the capacity of a CLI_udfLob or
// the byte count of fixed text.  prepare() takes a function that gives an
// area of a byte count, which only a CLI_udfLob asks for.
template <cat::Layout L, std::uint32_t Size>
struct Result : NumberResult<NumberOf<L>> {
  static_assert(isNumber(L));
};

template <std::uint32_t Longest>
struct Result<cat::Layout::text, Longest> {
  char text[Longest + 1];
  template <class Allocate>
  void prepare(Allocate && /*allocate*/) {
    text[Longest] = '\0';
  }
  void *pointer() { return text; }
  [[nodiscard]] const char *data() const { return text; }
  // An area of a few bytes is measured inline; for a longer one the C
  // library's strnlen costs less than a loop.
  [[nodiscard]] std::size_t length() const {
    if constexpr (Longest <= 8) {
      std::size_t n = 0;
      while (n < Longest && text[n] != '\0') ++n;
      return n;
    } else {
      return ::strnlen(text, Longest);
    }
  }
};

template <std::uint32_t Capacity>
struct Result<cat::Layout::lob, Capacity> {
  static constexpr std::uint32_t kCapacity = Capacity;
  unsigned char *value;
  // Its length word holds the capacity on entry.
  template <class Allocate>
  void prepare(Allocate &&allocate) {
    value = static_cast<unsigned char *>(allocate(CLI_LOB_AREA_SIZE(std::size_t{Capacity})));
    cli::call::prepareLobResult(value, Capacity);
  }
  void *pointer() { return value; }
  [[nodiscard]] const char *data() const {
    return reinterpret_cast<const char *>(value + CLI_LOB_DATA_OFFSET);
  }
  // The length that the routine stored, which a faulty one could have put
  // beyond the capacity (see fits()).
  [[nodiscard]] std::uint32_t length() const {
    std::uint32_t length = 0;
    std::memcpy(&length, value, sizeof length);
    return length;
  }
  [[nodiscard]] bool fits() const { return length() <= Capacity; }
};

template <std::uint32_t Size>
struct Result<cat::Layout::fixedText, Size> {
  char text[Size];
  template <class Allocate>
  void prepare(Allocate && /*allocate*/) {}
  void *pointer() { return text; }
  [[nodiscard]] const char *data() const { return text; }
  [[nodiscard]] static constexpr std::size_t length() { return Size; }
};

template <std::size_t Row>
using ResultOf = Result<cat::kRoutines[Row].results[0].layout, cat::kRoutines[Row].results[0].size>;

}  // namespace orv::host
