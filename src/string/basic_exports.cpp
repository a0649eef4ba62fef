// Exports of SPACE, LCASE, RTRIM, LTRIM, LEFT, RIGHT, REPEAT, CHAR and ASCII.
//
// The export ending in 1 takes terminated text, the one ending in 2 a
// CLI_udfLob; both run one template over the layout (Text or Lob).  Every
// limit is checked before anything is stored in the result, so a failed
// call leaves the result area as the caller left it.
#include <cstdint>

#include "frame/frame.hpp"
#include "string/basic.hpp"

namespace {

using cli::Bytes;
using cli::Ind;
using cli::Lob;
using cli::NameArg;
using cli::Status;
using cli::Sysfun;
using cli::Text;

template <class Form>
void lcase(const typename Form::Value *in, typename Form::Value *out) noexcept {
  const Bytes s = Form::read(in);
  cli::str::lowerCase(s, Form::area(out));
  Form::finish(out, s.size);
}

template <class Form>
void store(Bytes kept, typename Form::Value *out) noexcept {
  cli::str::copy(kept, Form::area(out));
  Form::finish(out, kept.size);
}

template <class Form>
void rtrim(const typename Form::Value *in, typename Form::Value *out) noexcept {
  store<Form>(cli::str::withoutTrailingBlanks(Form::read(in)), out);
}

template <class Form>
void ltrim(const typename Form::Value *in, typename Form::Value *out) noexcept {
  store<Form>(cli::str::withoutLeadingBlanks(Form::read(in)), out);
}

// LEFT and RIGHT after their own check of n: exactly n bytes, blanks behind
// the data where the input is shorter.
template <class Form>
void left(const typename Form::Value *in, std::int32_t n, typename Form::Value *out) noexcept {
  const auto width = static_cast<std::size_t>(n);
  cli::str::padded(Form::head(in, width), width, Form::area(out));
  Form::finish(out, width);
}

template <class Form>
void right(const typename Form::Value *in, std::int32_t n, typename Form::Value *out) noexcept {
  const auto width = static_cast<std::size_t>(n);
  cli::str::rightPadded(Form::read(in), width, Form::area(out));
  Form::finish(out, width);
}

// REPEAT: an empty input gives an empty result whatever the count; else the
// count must lie in 0 to limit / length.
template <class Form, std::size_t Limit>
void repeat(const typename Form::Value *in, std::int32_t count, typename Form::Value *out,
            Status status) noexcept {
  const Bytes s = Form::read(in);
  if (s.size == 0) {
    Form::finish(out, 0);
    return;
  }
  if (count < 0 || static_cast<std::size_t>(count) > Limit / s.size) {
    status.raise(Sysfun::tooLong);
    return;
  }
  const auto times = static_cast<std::size_t>(count);
  cli::str::repeat(s, times, Form::area(out));
  Form::finish(out, s.size * times);
}

// SPACE, LEFT1 and RIGHT1 take a count from 0 to 4000.
constexpr bool outsideTextLimit(std::int32_t n) noexcept {
  return n < 0 || n > static_cast<std::int32_t>(cli::kTextLimit);
}

}  // namespace

CLI_EXPORT void CLI_udfSPACE(const std::int32_t *count, char *result, Ind, Ind, char *sqlstate,
                             NameArg, NameArg, char *message) noexcept {
  const std::int32_t n = *count;
  if (outsideTextLimit(n)) return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  const auto width = static_cast<std::size_t>(n);
  std::memset(result, ' ', width);
  result[width] = '\0';
}

CLI_EXPORT void CLI_udfLCASE1(const char *in, char *out, Ind, Ind, char *, NameArg, NameArg,
                              char *) noexcept {
  lcase<Text>(in, out);
}

CLI_EXPORT void CLI_udfLCASE2(const CLI_udfLob *in, CLI_udfLob *out, Ind, Ind, char *, NameArg,
                              NameArg, char *) noexcept {
  lcase<Lob>(in, out);
}

CLI_EXPORT void CLI_udfRTRIM1(const char *in, char *out, Ind, Ind, char *, NameArg, NameArg,
                              char *) noexcept {
  rtrim<Text>(in, out);
}

CLI_EXPORT void CLI_udfRTRIM2(const CLI_udfLob *in, CLI_udfLob *out, Ind, Ind, char *, NameArg,
                              NameArg, char *) noexcept {
  rtrim<Lob>(in, out);
}

CLI_EXPORT void CLI_udfLTRIM1(const char *in, char *out, Ind, Ind, char *, NameArg, NameArg,
                              char *) noexcept {
  ltrim<Text>(in, out);
}

CLI_EXPORT void CLI_udfLTRIM2(const CLI_udfLob *in, CLI_udfLob *out, Ind, Ind, char *, NameArg,
                              NameArg, char *) noexcept {
  ltrim<Lob>(in, out);
}

CLI_EXPORT void CLI_udfLEFT1(const char *in, const std::int32_t *n, char *out, Ind, Ind, Ind,
                             char *sqlstate, NameArg, NameArg, char *message) noexcept {
  if (outsideTextLimit(*n)) return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  left<Text>(in, *n, out);
}

// The highest n that passes is the capacity minus 1.
CLI_EXPORT void CLI_udfLEFT2(const CLI_udfLob *in, const std::int32_t *n, CLI_udfLob *out, Ind, Ind,
                             Ind, char *sqlstate, NameArg, NameArg, char *message) noexcept {
  if (*n < 0 || static_cast<std::uint32_t>(*n) >= Lob::capacity(out)) {
    return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  }
  left<Lob>(in, *n, out);
}

CLI_EXPORT void CLI_udfRIGHT1(const char *in, const std::int32_t *n, char *out, Ind, Ind, Ind,
                              char *sqlstate, NameArg, NameArg, char *message) noexcept {
  if (outsideTextLimit(*n)) return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  right<Text>(in, *n, out);
}

// The highest n that passes is the capacity itself.
CLI_EXPORT void CLI_udfRIGHT2(const CLI_udfLob *in, const std::int32_t *n, CLI_udfLob *out, Ind,
                              Ind, Ind, char *sqlstate, NameArg, NameArg, char *message) noexcept {
  if (*n < 0 || static_cast<std::uint32_t>(*n) > Lob::capacity(out)) {
    return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  }
  right<Lob>(in, *n, out);
}

CLI_EXPORT void CLI_udfREPEAT1(const char *in, const std::int32_t *count, char *out, Ind, Ind, Ind,
                               char *sqlstate, NameArg, NameArg, char *message) noexcept {
  repeat<Text, cli::kTextLimit>(in, *count, out, Status{sqlstate, message});
}

CLI_EXPORT void CLI_udfREPEAT2(const CLI_udfLob *in, const std::int32_t *count, CLI_udfLob *out,
                               Ind, Ind, Ind, char *sqlstate, NameArg, NameArg,
                               char *message) noexcept {
  repeat<Lob, cli::kLobLimit>(in, *count, out, Status{sqlstate, message});
}

CLI_EXPORT void CLI_udfCHAR(const std::int32_t *code, char *out, Ind, Ind, char *, NameArg, NameArg,
                            char *) noexcept {
  out[0] = static_cast<char>(cli::str::charOfCode(*code));
  out[1] = '\0';
}

// ASCII1 and ASCII2 are one routine under two names: the first byte of the
// text, which is the terminator (0) for empty text.
CLI_EXPORT void CLI_udfASCII1(const char *in, std::int32_t *out, Ind, Ind, char *, NameArg, NameArg,
                              char *) noexcept {
  *out = static_cast<unsigned char>(in[0]);
}

CLI_EXPORT void CLI_udfASCII2(const char *in, std::int32_t *out, Ind, Ind, char *, NameArg, NameArg,
                              char *) noexcept {
  *out = static_cast<unsigned char>(in[0]);
}

CLI_EXPORT void CLI_udfASCII3(const CLI_udfLob *in, std::int32_t *out, Ind, Ind, char *, NameArg,
                              NameArg, char *) noexcept {
  const Bytes s = Lob::read(in);
  *out = s.size == 0 ? 0 : s.data[0];
}
