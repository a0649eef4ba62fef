// Exports of LOCATE, REPLACE and INSERT.
//
// LOCATE and REPLACE find their matches with the linear-time Searcher; the
// results are those of the left-to-right definitions (the first match, then
// the next one behind it, never overlapping).  Every routine builds its
// result in one pass, appending each piece once; REPLACE of a single byte
// has a path of its own for text full of matches.
#include <bit>
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "frame/frame.hpp"
#include "routines.hpp"
#include "string/search.hpp"

namespace {

using cli::Bytes;
using cli::Report;
using cli::Sysfun;
using cli::str::kNotFound;
using cli::str::Searcher;

std::int32_t positionOf(std::size_t offset) { return static_cast<std::int32_t>(offset + 1); }

// The first match at or after the 1-based position `start`, counted from the
// beginning of the searched string; 0 when there is none or when the search
// string does not fit behind `start`.
std::int32_t locate(Bytes search, Bytes searched, std::size_t start) noexcept {
  const std::size_t at = Searcher(search).find(searched, start - 1);
  return at == kNotFound ? 0 : positionOf(at);
}

// Copies n bytes, reading and writing none outside the two ranges: short
// pieces, the common case between matches, as two overlapping moves of
// one width instead of a call.
[[gnu::always_inline]] inline void copyPiece(cli::Byte *to, const cli::Byte *from,
                                             std::size_t n) noexcept {
  const auto move = [&]<class Word>(Word) {
    Word head, tail;
    std::memcpy(&head, from, sizeof head);
    std::memcpy(&tail, from + n - sizeof tail, sizeof tail);
    std::memcpy(to, &head, sizeof head);
    std::memcpy(to + n - sizeof tail, &tail, sizeof tail);
  };
  if (n > 16) {
    std::memcpy(to, from, n);
  } else if (n >= 8) {
    move(std::uint64_t{});
  } else if (n >= 4) {
    move(std::uint32_t{});
  } else if (n >= 2) {
    move(std::uint16_t{});
  } else if (n == 1) {
    *to = *from;
  }
}

// Appends pieces to a result area of `limit` bytes, refusing a piece that
// would pass the limit.
class Builder {
 public:
  Builder(cli::Byte *area, std::size_t limit) noexcept : area_(area), limit_(limit) {}
  [[gnu::always_inline]] bool append(const cli::Byte *data, std::size_t size) noexcept {
    if (size > limit_ - length_) return false;
    copyPiece(area_ + length_, data, size);
    length_ += size;
    return true;
  }
  [[nodiscard]] std::size_t length() const noexcept { return length_; }

 private:
  cli::Byte *area_;
  std::size_t limit_;
  std::size_t length_ = 0;
};

// Source bytes that REPLACE of a single byte takes at a time.
constexpr std::size_t kByteBlock = 64;

// REPLACE of a single byte, when the result fits.  The matches are counted
// first, so that the result is known to fit and no piece needs a check.
// Then the filter kernel marks the matches of 64 source bytes at a time:
// the bytes between matches are copied in one piece each, however many
// blocks they span, and a block of nothing but matches is written at once
// where the replacement is 16 bytes or fewer.
// Returns false, with nothing written, when the result would pass `limit`;
// the caller then builds it piece by piece up to the failure.
bool replaceByte(Bytes source, cli::Byte search, Bytes replacement, cli::Byte *area,
                 std::size_t limit, std::size_t &length) noexcept {
  const cli::str::FilterKernel &kernel = cli::str::bestFilterKernel();
  const cli::Byte *from = source.data;
  const std::size_t n = source.size, r = replacement.size;
  const std::size_t matches = kernel.count(from, n, search);
  // n - matches + matches * r, without overflow for any r.
  if (n - matches > limit || (matches != 0 && r > (limit - (n - matches)) / matches)) return false;
  length = n - matches + matches * r;

  cli::Byte *to = area;
  cli::Byte *const end = area + length;
  // A replacement of up to 8 bytes is stored as one word where the result
  // has room behind it; the bytes past the replacement are written over by
  // what follows.
  std::uint64_t word = 0;
  std::memcpy(&word, replacement.data, r < 8 ? r : 8);
  const auto replaceOne = [&] {
    if (r <= 8 && end - to >= 8) {
      std::memcpy(to, &word, 8);
    } else {
      copyPiece(to, replacement.data, r);
    }
    to += r;
  };
  std::size_t copied = 0;  // the source bytes before this are in the result
  const auto match = [&](std::size_t at) {
    copyPiece(to, from + copied, at - copied);
    to += at - copied;
    replaceOne();
    copied = at + 1;
  };
  constexpr std::size_t kPatterned = 16;
  cli::Byte pattern[kByteBlock * kPatterned];
  std::size_t patterned = 0;
  const std::size_t whole = n - n % kByteBlock;
  for (std::size_t i = 0; i < whole; i += kByteBlock) {
    std::uint64_t mask = kernel.agree64(from + i, search);
    if (mask == 0) continue;
    if (mask == ~std::uint64_t{0} && r <= kPatterned && copied == i) {
      if (r == 1) {
        std::memset(to, replacement.data[0], kByteBlock);
      } else if (r > 1) {
        if (patterned == 0) {  // the replacement 64 times over, made once
          for (std::size_t k = 0; k < kByteBlock; ++k)
            copyPiece(pattern + k * r, replacement.data, r);
          patterned = kByteBlock * r;
        }
        std::memcpy(to, pattern, patterned);
      }
      to += kByteBlock * r;
      copied = i + kByteBlock;
      continue;
    }
    for (; mask != 0; mask &= mask - 1) match(i + static_cast<std::size_t>(std::countr_zero(mask)));
  }
  for (std::size_t i = whole; i < n; ++i) {
    if (from[i] == search) match(i);
  }
  copyPiece(to, from + copied, n - copied);
  return true;
}

// REPLACE: every match of `search`, left to right and not overlapping,
// replaced; an empty search string matches nothing.  Raises 10 as soon as a
// piece would take the result past the limit; the pieces so far stay, as
// terminated text in the text form.
template <class In, class Out>
Report replace(In sourceValue, In searchValue, In replacementValue, Out out) noexcept {
  constexpr bool kText = std::is_same_v<Out, cli::TextOut>;
  const Bytes source = sourceValue.bytes();
  const Bytes search = searchValue.bytes();
  const Bytes replacement = replacementValue.bytes();
  const std::size_t limit = out.limit();
  // What a failure leaves in the result: an empty text, or the source's
  // length in the length word.
  out.finish(kText ? 0 : source.size);
  std::size_t length = 0;
  // A short source is served as well by memchr from match to match.
  if (search.size == 1 && source.size >= kByteBlock &&
      replaceByte(source, search.data[0], replacement, out.area(), limit, length)) {
    out.finish(length);
    return {};
  }
  Builder result(out.area(), limit);
  const auto fail = [&]() -> Report {
    if constexpr (kText) out.finish(result.length());
    return Sysfun::tooLong;
  };
  std::size_t scan = 0;
  if (search.size != 0) {
    const Searcher searcher(search);
    Searcher::Scan matches(searcher, source);
    for (std::size_t at; (at = matches.next(scan)) != kNotFound; scan = at + search.size) {
      if (!result.append(source.data + scan, at - scan) ||
          !result.append(replacement.data, replacement.size)) {
        return fail();
      }
    }
  }
  if (!result.append(source.data + scan, source.size - scan)) return fail();
  out.finish(result.length());
  return {};
}

// INSERT after its checks: the source's first p - 1 bytes, the new string,
// and what is left of the source behind the deleted range.
template <class Out>
Report spliced(Bytes source, std::int64_t p, std::int64_t l, Bytes added, Out out) noexcept {
  Builder result(out.area(), static_cast<std::size_t>(-1));
  const auto head = static_cast<std::size_t>(p - 1);
  result.append(source.data, head);
  result.append(added.data, added.size);
  const auto rest = static_cast<std::size_t>(p - 1 + l);
  if (rest < source.size) result.append(source.data + rest, source.size - rest);
  out.finish(result.length());
  return {};
}

// The checks of INSERT in their order: codes 10 before codes 01.  The
// length s - l + i is formed as the form's 32-bit value (signed for text,
// unsigned for CLI_udfLob, so that a deletion longer than source and new
// string together wraps and fails); where the range runs past the end of
// the source the true result length p - 1 + i must fit too, whatever p is,
// so that this code 10 wins over the code 01 of a start below 1.  p + l is
// formed in 64 bits, so no length to delete can wrap it into range.
Sysfun insertCheck(bool lobForm, std::size_t s, std::int64_t p, std::int64_t l, std::size_t i,
                   std::size_t limit) noexcept {
  const bool tooLong = lobForm
                           ? static_cast<std::uint32_t>(s) - static_cast<std::uint32_t>(l) +
                                     static_cast<std::uint32_t>(i) >
                                 limit
                           : static_cast<std::int32_t>(
                                 static_cast<std::uint32_t>(s) - static_cast<std::uint32_t>(l) +
                                 static_cast<std::uint32_t>(i)) > static_cast<std::int64_t>(limit);
  if (tooLong || p > static_cast<std::int64_t>(s)) return Sysfun::tooLong;
  const auto end = static_cast<std::int64_t>(s);
  if (l >= 0 && p - 1 + l > end &&
      p - 1 + static_cast<std::int64_t>(i) > static_cast<std::int64_t>(limit)) {
    return Sysfun::tooLong;
  }
  if (p < 1 || (!lobForm && p > static_cast<std::int64_t>(limit))) return Sysfun::outOfRange;
  if (l < 0 || p + l > static_cast<std::int64_t>(limit)) return Sysfun::outOfRange;
  return Sysfun::none;
}

}  // namespace

namespace cli {

Answer<std::int32_t> routine::LOCATE1(TextIn search, TextIn string, std::int32_t start) noexcept {
  if (start < 1 || start > static_cast<std::int32_t>(kTextLimit)) {
    return failure<std::int32_t>(Sysfun::outOfRange);
  }
  const Bytes h = string.bytes();
  return success(static_cast<std::size_t>(start) - 1 > h.size
                     ? 0
                     : locate(search.bytes(), h, static_cast<std::size_t>(start)));
}

Answer<std::int32_t> routine::LOCATE2(LobIn search, LobIn string, std::int32_t start) noexcept {
  if (start < 1 || start > static_cast<std::int32_t>(kLobLimit)) {
    return failure<std::int32_t>(Sysfun::outOfRange);
  }
  return success(locate(search.bytes(), string.bytes(), static_cast<std::size_t>(start)));
}

Answer<std::int32_t> routine::LOCATE3(TextIn search, TextIn string) noexcept {
  return success(locate(search.bytes(), string.bytes(), 1));
}

Answer<std::int32_t> routine::LOCATE4(LobIn search, LobIn string) noexcept {
  return success(locate(search.bytes(), string.bytes(), 1));
}

Report routine::REPLACE1(TextIn source, TextIn search, TextIn replacement,
                         TextOut result) noexcept {
  return replace(source, search, replacement, result);
}

Report routine::REPLACE2(LobIn source, LobIn search, LobIn replacement, LobOut result) noexcept {
  return replace(source, search, replacement, result);
}

Report routine::INSERT1(TextIn source, std::int32_t start, std::int32_t length, TextIn insert,
                        TextOut result) noexcept {
  const Bytes s = source.bytes(), i = insert.bytes();
  const Sysfun code = insertCheck(false, s.size, start, length, i.size, result.limit());
  if (code != Sysfun::none) return code;
  return spliced(s, start, length, i, result);
}

Report routine::INSERT2(LobIn source, std::int32_t start, std::int32_t length, LobIn insert,
                        LobOut result) noexcept {
  const Bytes s = source.bytes(), i = insert.bytes();
  const Sysfun code = insertCheck(true, s.size, start, length, i.size, result.capacity());
  if (code != Sysfun::none) return code;
  return spliced(s, start, length, i, result);
}

}  // namespace cli
