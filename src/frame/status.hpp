// The status channel, typed: the SYSFUN codes and every other status that a
// routine of the library stores, as one value that routine logic hands
// back and the export's shim writes into the frame's buffers.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstring>

#include "cliudf.h"

namespace cli {

// The SYSFUN codes by name; none (0) is success.
enum class Sysfun : std::uint8_t {
  none = 0,
#define CLI_SYSFUN_ENUMERATOR(number, name, text, words) name = (number),
  CLI_SYSFUN_CODES(CLI_SYSFUN_ENUMERATOR)
#undef CLI_SYSFUN_ENUMERATOR
};

// The two characters of a code.
struct SysfunText {
  char digits[3];
};
constexpr SysfunText textOf(Sysfun code) noexcept {
  const auto n = static_cast<unsigned>(code);
  return {{static_cast<char>('0' + n / 10), static_cast<char>('0' + n % 10), '\0'}};
}

// The code that two characters spell, as the date parser hands it on.
constexpr Sysfun sysfunOf(const char *digits) noexcept {
  return static_cast<Sysfun>((digits[0] - '0') * 10 + (digits[1] - '0'));
}

// What the condition of a code is, in words; null for a number that is no
// code.
constexpr const char *wordsOf(Sysfun code) noexcept {
  switch (code) {
#define CLI_SYSFUN_WORDS(number, name, text, words) \
  case Sysfun::name:                                \
    return words;
    CLI_SYSFUN_CODES(CLI_SYSFUN_WORDS)
#undef CLI_SYSFUN_WORDS
    case Sysfun::none:
      break;
  }
  return nullptr;
}

// One status that a routine reports, or none.
class Report {
 public:
  enum class Kind : std::uint8_t {
    none,
    sysfun,               // "38552", "SYSFUN:" and the code
    endOfTable,           // "02000": no further row
    openCallbackFailed,   // "38620", "API call failed %d"
    closeCallbackFailed,  // "38660", "API call failed %d"
    resultTooSmall,       // "38601", "sqlocpcv": no room for the next record
    conversionFailed,     // "38602", "sqlocpcv": the service failed
    unknownLengthForm,    // "38603", "sqlocpcv": a record is not understood
  };

  constexpr Report() noexcept = default;
  constexpr Report(Sysfun code) noexcept  // NOLINT(google-explicit-constructor): a code is a report
      : kind_(code == Sysfun::none ? Kind::none : Kind::sysfun), code_(code) {}
  static constexpr Report of(Kind kind, std::int32_t status = 0) noexcept {
    Report r;
    r.kind_ = kind;
    r.status_ = status;
    return r;
  }

  [[nodiscard]] constexpr Kind kind() const noexcept { return kind_; }
  [[nodiscard]] constexpr Sysfun code() const noexcept { return code_; }
  [[nodiscard]] constexpr bool failed() const noexcept { return kind_ != Kind::none; }

  // Writes the status into the frame's buffers; nothing at all for none.
  void store(char *sqlstate, char *message) const noexcept {
    switch (kind_) {
      case Kind::none:
        return;
      case Kind::sysfun:
        return CLI_raiseSysfun(sqlstate, message, textOf(code_).digits);
      case Kind::endOfTable:
        std::memcpy(sqlstate, CLI_SQLSTATE_NO_MORE_ROWS, CLI_SQLSTATE_SIZE);
        return;
      case Kind::openCallbackFailed:
        return callFailed(sqlstate, message, CLI_SQLSTATE_OPEN_CALLBACK_FAILED);
      case Kind::closeCallbackFailed:
        return callFailed(sqlstate, message, CLI_SQLSTATE_CLOSE_CALLBACK_FAILED);
      case Kind::resultTooSmall:
        return conversion(sqlstate, message, CLI_SQLSTATE_RESULT_TOO_SMALL);
      case Kind::conversionFailed:
        return conversion(sqlstate, message, CLI_SQLSTATE_CONVERSION_FAILED);
      case Kind::unknownLengthForm:
        return conversion(sqlstate, message, CLI_SQLSTATE_UNKNOWN_LENGTH_FORM);
    }
  }

 private:
  // The state with its terminator, and the callback's status in the message.
  void callFailed(char *sqlstate, char *message, const char *state) const noexcept {
    std::memcpy(sqlstate, state, CLI_SQLSTATE_SIZE);
    static_cast<void>(std::snprintf(message, CLI_MESSAGE_SIZE, CLI_MESSAGE_API_CALL_FAILED,
                                    static_cast<int>(status_)));
  }
  // Exactly five and eight characters, neither terminated.
  static void conversion(char *sqlstate, char *message, const char *state) noexcept {
    std::memcpy(sqlstate, state, 5);
    std::memcpy(message, CLI_MESSAGE_SQLOCPCV, 8);  // NOLINT(bugprone-not-null-terminated-result)
  }

  Kind kind_ = Kind::none;
  Sysfun code_ = Sysfun::none;
  std::int32_t status_ = 0;
};

// The end of a table function's table.
inline constexpr Report kEndOfTable = Report::of(Report::Kind::endOfTable);

// What a routine with a number as its result gives back: the value, or a
// code, or both where the routine stores its value before it tests it.
template <typename T>
struct Answer {
  T value{};
  Sysfun code{};        // none: success
  bool stored = false;  // on failure: the value was stored before the test
};

template <typename T>
constexpr Answer<T> success(T value) {
  return {value, Sysfun::none, false};
}
template <typename T>
constexpr Answer<T> failure(Sysfun code) {
  return {T{}, code, false};
}
// A failure that leaves `value` in the result area.
template <typename T>
constexpr Answer<T> failureAfterStoring(T value, Sysfun code) {
  return {value, code, true};
}

}  // namespace cli
