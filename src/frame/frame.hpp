// Typed views of the routine frame, for the library's own C++ code.
//
// An export shim receives raw pointers in the frame's order; these views
// give names to what the pointers hold (terminated text, CLI_udfLob, the
// status channel) so that routine logic works on plain byte ranges and
// never on frame positions.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "cliudf.h"
#include "platform.hpp"

namespace cli {

using Byte = unsigned char;
// A null indicator argument; routines without null handling never touch it.
using Ind = std::int16_t *;
// The function name and specific name arguments, which no routine reads.
using NameArg = const char *;

inline constexpr std::size_t kTextLimit = CLI_TEXT_LIMIT;
inline constexpr std::size_t kLobLimit = CLI_LOB_LIMIT;

// The SYSFUN error codes, by number.
enum class Sysfun : std::uint8_t {
  outOfRange = 1,
  divisionByZero = 2,
  overflow = 3,
  badDate = 4,
  badTime = 5,
  badTimestamp = 6,
  badDuration = 7,
  badInterval = 8,
  tooLong = 10,
  notANumber = 11,
};

// The status channel of one call: the SQLSTATE and message buffers.
class Status {
 public:
  Status(char *sqlstate, char *message) noexcept : sqlstate_(sqlstate), message_(message) {}

  // Raises a SYSFUN error given as its two-digit text.
  void raise(const char *code) const noexcept { CLI_raiseSysfun(sqlstate_, message_, code); }

  void raise(Sysfun code) const noexcept {
    const auto n = static_cast<unsigned>(code);
    const char text[3] = {static_cast<char>('0' + n / 10), static_cast<char>('0' + n % 10), '\0'};
    raise(text);
  }

 private:
  char *sqlstate_;
  char *message_;
};

// A read-only run of bytes, as routine logic sees a string of either layout.
struct Bytes {
  const Byte *data;
  std::size_t size;
};

// Terminated text: bytes up to the first NUL.  A result area holds the
// routine's limit plus one byte for the terminator.
struct Text {
  using Value = char;

  static Bytes read(const char *value) noexcept {
    return {reinterpret_cast<const Byte *>(value), std::strlen(value)};
  }
  // The first min(length, limit) bytes, without looking past `limit`.
  static Bytes head(const char *value, std::size_t limit) noexcept {
    return {reinterpret_cast<const Byte *>(value), ::strnlen(value, limit)};
  }
  static Byte *area(char *result) noexcept { return reinterpret_cast<Byte *>(result); }
  // Completes a result of `size` bytes.
  static void finish(char *result, std::size_t size) noexcept { result[size] = '\0'; }
};

// CLI_udfLob: a 32-bit length word, then the data.  Read through memcpy so
// that the word may stand at any address.
struct Lob {
  using Value = CLI_udfLob;

  static std::uint32_t lengthWord(const CLI_udfLob *value) noexcept {
    std::uint32_t n;
    std::memcpy(&n, value, sizeof n);
    return n;
  }
  static Bytes read(const CLI_udfLob *value) noexcept {
    return {reinterpret_cast<const Byte *>(value) + CLI_LOB_DATA_OFFSET, lengthWord(value)};
  }
  static Bytes head(const CLI_udfLob *value, std::size_t limit) noexcept {
    const Bytes all = read(value);
    return {all.data, all.size < limit ? all.size : limit};
  }
  // On entry a result's length word holds the capacity of its area.
  static std::uint32_t capacity(const CLI_udfLob *result) noexcept { return lengthWord(result); }
  static Byte *area(CLI_udfLob *result) noexcept {
    return reinterpret_cast<Byte *>(result) + CLI_LOB_DATA_OFFSET;
  }
  // Stores the true length once the result is complete.
  static void finish(CLI_udfLob *result, std::size_t size) noexcept {
    const auto n = static_cast<std::uint32_t>(size);
    std::memcpy(result, &n, sizeof n);
  }
};

}  // namespace cli
