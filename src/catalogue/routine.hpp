// What a row of the catalogue says of one export: its names, frame, the
// layouts of its values, its properties, the SYSFUN codes it can raise, a
// summary and an example; and the makers that the rows are written with.
#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <string>

#include "frame/cliudf.h"
#include "frame/status.hpp"

namespace cli::catalogue {

// Value layouts of the frame.
enum class Layout : std::uint8_t {
  none,        // an unused slot
  int16,       // 16-bit signed integer
  int32,       // 32-bit signed integer
  int64,       // 64-bit signed integer
  real,        // 64-bit IEEE 754 double
  text,        // terminated text
  lob,         // CLI_udfLob: 32-bit length, then the data
  fixedText,   // exactly `size` bytes, filled up with blanks, no terminator
  fixedBytes,  // exactly `size` opaque bytes
};

// One input or result.  `size` is, for a text result, the longest text the
// routine can write (its area holds one byte more); for a CLI_udfLob result,
// the capacity of the area's data; for fixed layouts, the byte count.
struct Slot {
  Layout layout = Layout::none;
  std::uint32_t size = 0;
  const char *name = nullptr;
};

// The extras behind the diagnostic message buffer.
enum class Frame : std::uint8_t {
  plain,          // none
  dbinfo,         // database information block
  scratchpad,     // scratchpad
  table,          // scratchpad, call type
  tableCallback,  // scratchpad, call type, table-function callback
};

// Properties, as bits.
enum : unsigned {
  kDeterministic = 1u,  // the same inputs always give the same result
  kInnocuous = 2u,      // no side effects and no access to outside state
  kHandlesNull = 4u,    // reads its input indicators itself
  // Reads less of its text than the function's other export of the same
  // layouts (the date at the head only, or a time only); hosts prefer the
  // other one and reach this one by its own name.
  kNarrowerForm = 8u,
  // Its one numeric result is written by a service of the engine that the
  // routine hands the result's address to, so the logic gets the address
  // rather than giving back an Answer.
  kResultByAddress = 16u,
  // Uses state that the whole process shares (the standard library's
  // random number state), so calls on other threads or in other processes
  // of one query do not see the same sequence.
  kSharedState = 32u,
  // May write into its text inputs: it cuts trailing blanks off them in
  // place.  A host must hand such a routine a copy it may write; any other
  // routine only reads its inputs.
  kWritesInputs = 64u,
};
inline constexpr unsigned kPure = kDeterministic | kInnocuous;

// The SYSFUN codes that a routine can raise.
class SysfunSet {
 public:
  constexpr SysfunSet() noexcept = default;
  constexpr SysfunSet(std::initializer_list<Sysfun> codes) noexcept {
    for (const Sysfun code : codes) bits_ |= bit(code);
  }

  // False for Sysfun::none and for any number that is no code.
  [[nodiscard]] constexpr bool contains(Sysfun code) const noexcept {
    return (bits_ & bit(code)) != 0;
  }
  [[nodiscard]] constexpr bool empty() const noexcept { return bits_ == 0; }
  constexpr SysfunSet &operator|=(SysfunSet other) noexcept {
    bits_ |= other.bits_;
    return *this;
  }

  // The codes' digits, from the lowest code up, each behind a blank but
  // the first: "04 06"; "" for none.
  [[nodiscard]] std::string digits() const {
    std::string out;
    for (unsigned n = 1; n < kBits; ++n) {
      const auto code = static_cast<Sysfun>(n);
      if (!contains(code)) continue;
      if (!out.empty()) out += ' ';
      out += cli::textOf(code).digits;
    }
    return out;
  }

 private:
  static constexpr unsigned kBits = 32;
  static constexpr std::uint32_t bit(Sysfun code) noexcept {
    const auto n = static_cast<unsigned>(code);
    return n != 0 && n < kBits ? std::uint32_t{1} << n : 0;
  }
  std::uint32_t bits_ = 0;
};

// A call of the routine as a user writes it in SQL, and what it gives.
//
// `call` is the SQL name with the arguments as SQL literals: numbers,
// 'text' and x'0A1B' for bytes.  `result` is the result as such a literal,
// or, for a result that changes from call to call, a condition on it:
// "LIKE 'pattern'" (where _ stands for any one character) or
// "BETWEEN low AND high".  A double agrees with the literal to 12 digits.
// Every example is called through both hosts by its export's own name
// (tools/examples_sql.cpp writes the scripts).
struct Example {
  const char *call = nullptr;  // null: none, for a table function
  const char *result = nullptr;
};

inline constexpr std::size_t kMaxInputs = 4;
inline constexpr std::size_t kMaxResults = 18;

struct Routine {
  const char *symbol = nullptr;   // the export's name
  const char *sqlName = nullptr;  // the SQL function that it serves
  Frame frame = Frame::plain;
  Slot inputs[kMaxInputs] = {};
  Slot results[kMaxResults] = {};
  unsigned properties = 0;
  SysfunSet raises = {};
  const char *summary = "";
  Example example = {};
};

// Slot makers.  Inputs carry a name for the reference; results a size.
constexpr Slot int16(const char *name = "") { return {Layout::int16, 0, name}; }
constexpr Slot int32(const char *name = "") { return {Layout::int32, 0, name}; }
constexpr Slot int64(const char *name = "") { return {Layout::int64, 0, name}; }
constexpr Slot real(const char *name = "") { return {Layout::real, 0, name}; }
constexpr Slot text(const char *name) { return {Layout::text, 0, name}; }
constexpr Slot lob(const char *name) { return {Layout::lob, 0, name}; }
constexpr Slot bytes(std::uint32_t size, const char *name) {
  return {Layout::fixedBytes, size, name};
}
constexpr Slot textOf(std::uint32_t longest) { return {Layout::text, longest, ""}; }
constexpr Slot lobOf(std::uint32_t capacity) { return {Layout::lob, capacity, ""}; }
constexpr Slot fixedText(std::uint32_t size) { return {Layout::fixedText, size, ""}; }

inline constexpr std::uint32_t kText = CLI_TEXT_LIMIT;  // longest terminated text built
inline constexpr std::uint32_t kLob = CLI_LOB_LIMIT;    // longest CLI_udfLob string
inline constexpr std::uint32_t kStamp = 26;             // a timestamp text
inline constexpr std::uint32_t kName = 101;             // a day or month name

}  // namespace cli::catalogue
