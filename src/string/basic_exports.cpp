// Exports of SPACE, LCASE, RTRIM, LTRIM, LEFT, RIGHT, REPEAT, CHAR and ASCII.
//
// The export ending in 1 takes terminated text, the one ending in 2 a
// CLI_udfLob; both run one template over the views of the two layouts.
// Every limit is checked before anything is stored in the result, so a
// failed call leaves the result area as the caller left it.
#include <cstdint>

#include "frame/frame.hpp"
#include "routines.hpp"
#include "string/basic.hpp"

namespace {

using cli::Bytes;
using cli::Report;
using cli::Sysfun;

template <class In, class Out>
Report lcase(In in, Out out) noexcept {
  const Bytes s = in.bytes();
  cli::str::lowerCase(s, out.area());
  out.finish(s.size);
  return {};
}

template <class Out>
Report copyOut(Bytes kept, Out out) noexcept {
  cli::str::copy(kept, out.area());
  out.finish(kept.size);
  return {};
}

// LEFT and RIGHT once n is known to fit: exactly n bytes, blanks behind the
// data where the input is shorter.
template <class In, class Out>
Report left(In in, std::int32_t n, Out out) noexcept {
  const auto width = static_cast<std::size_t>(n);
  cli::str::padded(in.head(width), width, out.area());
  out.finish(width);
  return {};
}

template <class In, class Out>
Report right(In in, std::int32_t n, Out out) noexcept {
  const auto width = static_cast<std::size_t>(n);
  cli::str::rightPadded(in.bytes(), width, out.area());
  out.finish(width);
  return {};
}

// REPEAT: an empty input gives an empty result whatever the count; else the
// count must lie in 0 to the result's limit divided by the length.
template <class In, class Out>
Report repeat(In in, std::int32_t count, Out out) noexcept {
  const Bytes s = in.bytes();
  if (s.size == 0) {
    out.finish(0);
    return {};
  }
  if (count < 0 || static_cast<std::size_t>(count) > out.limit() / s.size) return Sysfun::tooLong;
  const auto times = static_cast<std::size_t>(count);
  cli::str::repeat(s, times, out.area());
  out.finish(s.size * times);
  return {};
}

// A count from 0 to the longest text of the result (SPACE, LEFT1, RIGHT1).
bool outside(std::int32_t n, const cli::TextOut &out) noexcept {
  return n < 0 || static_cast<std::size_t>(n) > out.limit();
}

}  // namespace

namespace cli {

Report routine::SPACE(std::int32_t count, TextOut result) noexcept {
  if (outside(count, result)) return Sysfun::outOfRange;
  const auto width = static_cast<std::size_t>(count);
  std::memset(result.chars(), ' ', width);
  result.finish(width);
  return {};
}

Report routine::LCASE1(TextIn string, TextOut result) noexcept { return lcase(string, result); }
Report routine::LCASE2(LobIn string, LobOut result) noexcept { return lcase(string, result); }

Report routine::RTRIM1(TextIn string, TextOut result) noexcept {
  return copyOut(str::withoutTrailingBlanks(string.bytes()), result);
}
Report routine::RTRIM2(LobIn string, LobOut result) noexcept {
  return copyOut(str::withoutTrailingBlanks(string.bytes()), result);
}

Report routine::LTRIM1(TextIn string, TextOut result) noexcept {
  return copyOut(str::withoutLeadingBlanks(string.bytes()), result);
}
Report routine::LTRIM2(LobIn string, LobOut result) noexcept {
  return copyOut(str::withoutLeadingBlanks(string.bytes()), result);
}

Report routine::LEFT1(TextIn string, std::int32_t n, TextOut result) noexcept {
  if (outside(n, result)) return Sysfun::outOfRange;
  return left(string, n, result);
}

// The highest n that passes is the capacity minus 1.
Report routine::LEFT2(LobIn string, std::int32_t n, LobOut result) noexcept {
  if (n < 0 || static_cast<std::uint32_t>(n) >= result.capacity()) return Sysfun::outOfRange;
  return left(string, n, result);
}

Report routine::RIGHT1(TextIn string, std::int32_t n, TextOut result) noexcept {
  if (outside(n, result)) return Sysfun::outOfRange;
  return right(string, n, result);
}

// The highest n that passes is the capacity itself.
Report routine::RIGHT2(LobIn string, std::int32_t n, LobOut result) noexcept {
  if (n < 0 || static_cast<std::uint32_t>(n) > result.capacity()) return Sysfun::outOfRange;
  return right(string, n, result);
}

Report routine::REPEAT1(TextIn string, std::int32_t count, TextOut result) noexcept {
  return repeat(string, count, result);
}
Report routine::REPEAT2(LobIn string, std::int32_t count, LobOut result) noexcept {
  return repeat(string, count, result);
}

Report routine::CHAR(std::int32_t code, TextOut result) noexcept {
  result.chars()[0] = static_cast<char>(str::charOfCode(code));
  result.finish(1);
  return {};
}

// ASCII1 and ASCII2 are one routine under two names: the first byte of the
// text, which is the terminator (0) for empty text.
Answer<std::int32_t> routine::ASCII1(TextIn string) noexcept {
  return success(std::int32_t{static_cast<unsigned char>(string.chars()[0])});
}
Answer<std::int32_t> routine::ASCII2(TextIn string) noexcept {
  return success(std::int32_t{static_cast<unsigned char>(string.chars()[0])});
}
Answer<std::int32_t> routine::ASCII3(LobIn string) noexcept {
  const Bytes s = string.bytes();
  return success(std::int32_t{s.size == 0 ? Byte{0} : s.data[0]});
}

}  // namespace cli
