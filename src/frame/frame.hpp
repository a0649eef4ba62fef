// Typed views of the routine frame, for the library's own C++ code.
//
// An export's shim receives raw pointers in the frame's order and hands
// its routine these views instead: inputs and results in their layouts,
// the result indicator of a routine that handles NULL, the database
// information block, the scratchpad, the call type and a table's row.  The
// routine works on byte ranges and values and never on frame positions;
// it gives back a Report or an Answer (status.hpp), which the shim stores.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "cliudf.h"
#include "platform.hpp"
#include "status.hpp"

namespace cli {

using Byte = unsigned char;

inline constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
inline constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;

// A read-only run of bytes, as routine logic sees a string of either layout.
struct Bytes {
  const Byte *data;
  std::size_t size;
};

// An input of terminated text: bytes up to the first NUL.  The engine's
// input buffers are writable, and a routine marked kWritesInputs (the date
// and number parsers, which cut trailing blanks in place) gets its text as
// WritableTextIn; every other routine gets a TextIn, which can only read,
// so a host may hand those routines a buffer it must not have written.
template <class Char>
class BasicTextIn {
 public:
  explicit BasicTextIn(Char *value) noexcept : value_(value) {}
  [[nodiscard]] Char *chars() const noexcept { return value_; }
  [[nodiscard]] Bytes bytes() const noexcept {
    return {reinterpret_cast<const Byte *>(value_), std::strlen(value_)};
  }
  // The first min(length, limit) bytes, without looking past `limit`.
  [[nodiscard]] Bytes head(std::size_t limit) const noexcept {
    return {reinterpret_cast<const Byte *>(value_), ::strnlen(value_, limit)};
  }

 private:
  Char *value_;
};
using TextIn = BasicTextIn<const char>;
using WritableTextIn = BasicTextIn<char>;

// A CLI_udfLob: a 32-bit length word, then the data.  Read through memcpy
// so that the word may stand at any address.
inline std::uint32_t lengthWordOf(const void *value) noexcept {
  std::uint32_t n;
  std::memcpy(&n, value, sizeof n);
  return n;
}

class LobIn {
 public:
  explicit LobIn(const CLI_udfLob *value) noexcept : value_(value) {}
  [[nodiscard]] Bytes bytes() const noexcept {
    return {reinterpret_cast<const Byte *>(value_) + CLI_LOB_DATA_OFFSET, lengthWordOf(value_)};
  }
  [[nodiscard]] Bytes head(std::size_t limit) const noexcept {
    const Bytes all = bytes();
    return {all.data, all.size < limit ? all.size : limit};
  }

 private:
  const CLI_udfLob *value_;
};

// Fixed bytes: exactly the declared count, opaque.
class BytesIn {
 public:
  explicit BytesIn(const Byte *value) noexcept : value_(value) {}
  [[nodiscard]] const Byte *data() const noexcept { return value_; }

 private:
  const Byte *value_;
};

// A terminated-text result: room for `longest` bytes and the terminator.
class TextOut {
 public:
  TextOut(char *area, std::uint32_t longest) noexcept : area_(area), longest_(longest) {}
  [[nodiscard]] Byte *area() const noexcept { return reinterpret_cast<Byte *>(area_); }
  [[nodiscard]] char *chars() const noexcept { return area_; }
  // The longest text that the routine may build.
  [[nodiscard]] std::size_t limit() const noexcept { return longest_; }
  // Completes a result of `size` bytes.
  void finish(std::size_t size) const noexcept { area_[size] = '\0'; }

 private:
  char *area_;
  std::uint32_t longest_;
};

// A CLI_udfLob result.  `limit` is the longest string the routine builds;
// on entry the length word holds the capacity that the engine gave.
class LobOut {
 public:
  LobOut(CLI_udfLob *value, std::uint32_t limit) noexcept : value_(value), limit_(limit) {}
  [[nodiscard]] Byte *area() const noexcept {
    return reinterpret_cast<Byte *>(value_) + CLI_LOB_DATA_OFFSET;
  }
  [[nodiscard]] std::size_t limit() const noexcept { return limit_; }
  [[nodiscard]] std::uint32_t capacity() const noexcept { return lengthWordOf(value_); }
  // Stores the true length once the result is complete.
  void finish(std::size_t size) const noexcept {
    const auto n = static_cast<std::uint32_t>(size);
    std::memcpy(value_, &n, sizeof n);
  }

 private:
  CLI_udfLob *value_;
  std::uint32_t limit_;
};

// Fixed text: exactly `size` bytes, filled up with blanks, no terminator.
class FixedTextOut {
 public:
  FixedTextOut(char *area, std::uint32_t size) noexcept : area_(area), size_(size) {}
  [[nodiscard]] char *chars() const noexcept { return area_; }
  [[nodiscard]] std::size_t size() const noexcept { return size_; }

 private:
  char *area_;
  std::uint32_t size_;
};

// An input of a routine that reads its null indicator itself.
template <class T>
struct Nullable {
  T value;
  std::int16_t indicator;
  [[nodiscard]] bool null() const noexcept { return indicator < 0; }
};

// The result indicator of a routine that handles NULL itself.
class ResultIndicator {
 public:
  explicit ResultIndicator(std::int16_t *indicator) noexcept : indicator_(indicator) {}
  void set(std::int16_t value) const noexcept { *indicator_ = value; }

 private:
  std::int16_t *indicator_;
};

// The database information block, or null; one field of it is read.
class DbInfo {
 public:
  explicit DbInfo(const Byte *block) noexcept : block_(block) {}
  [[nodiscard]] bool present() const noexcept { return block_ != nullptr; }
  [[nodiscard]] std::uint32_t codePage() const noexcept {
    return lengthWordOf(block_ + CLI_DBINFO_CODEPAGE_OFFSET);
  }

 private:
  const Byte *block_;
};

// The statement's scratchpad.  Its first word is the engine's; a routine's
// data stands behind it and is read and written as one record.
class Scratchpad {
 public:
  explicit Scratchpad(Byte *block) noexcept : block_(block) {}
  template <class Data>
  [[nodiscard]] Data load() const noexcept {
    Data d;
    std::memcpy(&d, block_ + CLI_SCRATCHPAD_DATA_OFFSET, sizeof d);
    return d;
  }
  template <class Data>
  void save(const Data &d) const noexcept {
    std::memcpy(block_ + CLI_SCRATCHPAD_DATA_OFFSET, &d, sizeof d);
  }

 private:
  Byte *block_;
};

// What a call of a table function asks for.
enum class CallType : std::int32_t {
  open = CLI_CALL_OPEN,
  fetch = CLI_CALL_FETCH,
  close = CLI_CALL_CLOSE,
};

// The result columns of a table function's row, with their indicators.
// A column that a fetch fills gets the indicator 0.
class Row {
 public:
  Row(void *const *values, std::int16_t *const *indicators, const std::uint32_t *sizes) noexcept
      : values_(values), indicators_(indicators), sizes_(sizes) {}
  template <class T>
  void put(std::size_t column, T value) const noexcept {
    std::memcpy(values_[column], &value, sizeof value);
    filled(column);
  }
  [[nodiscard]] char *chars(std::size_t column) const noexcept {
    return static_cast<char *>(values_[column]);
  }
  [[nodiscard]] LobOut lob(std::size_t column) const noexcept {
    return {static_cast<CLI_udfLob *>(values_[column]), sizes_[column]};
  }
  void filled(std::size_t column) const noexcept { *indicators_[column] = 0; }

 private:
  void *const *values_;
  std::int16_t *const *indicators_;
  const std::uint32_t *sizes_;
};

// The life of a table function: one open, any number of fetches, one close.
// Each step reads the routine's record from the scratchpad, works on it
// and writes it back; any other call type returns at once, changing
// nothing.
template <class Data, class Open, class Fetch, class Close>
Report tableStep(CallType type, Scratchpad scratchpad, Open open, Fetch fetch,
                 Close close) noexcept {
  Report report;
  Data data = scratchpad.load<Data>();
  switch (type) {
    case CallType::open:
      report = open(data);
      break;
    case CallType::fetch:
      report = fetch(data);
      break;
    case CallType::close:
      report = close(data);
      break;
    default:
      return report;
  }
  scratchpad.save(data);
  return report;
}

}  // namespace cli
