// Exports of LOCATE, REPLACE and INSERT.
//
// LOCATE and REPLACE find their matches with the linear-time Searcher; the
// results are those of the left-to-right definitions (the first match, then
// the next one behind it, never overlapping).  Every routine builds its
// result in one pass, appending each piece once.
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "frame/frame.hpp"
#include "string/search.hpp"

namespace {

using cli::Bytes;
using cli::Ind;
using cli::Lob;
using cli::NameArg;
using cli::Status;
using cli::Sysfun;
using cli::Text;
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

// Appends pieces to a result area of `limit` bytes, failing before a piece
// would pass the limit.  Terminated text keeps its terminator behind every
// piece, so that a failure leaves the pieces so far as terminated text.
template <class Form>
class Builder {
 public:
  Builder(cli::Byte *area, std::size_t limit) noexcept : area_(area), limit_(limit) {}
  bool append(const cli::Byte *data, std::size_t size) noexcept {
    if (size > limit_ - length_) return false;
    if (size != 0) std::memcpy(area_ + length_, data, size);
    length_ += size;
    if constexpr (std::is_same_v<Form, Text>) area_[length_] = 0;
    return true;
  }
  [[nodiscard]] std::size_t length() const noexcept { return length_; }

 private:
  cli::Byte *area_;
  std::size_t limit_;
  std::size_t length_ = 0;
};

// REPLACE: every match of `search`, left to right and not overlapping,
// replaced; an empty search string matches nothing.  Raises 10 as soon as a
// piece would take the result past the limit; the pieces so far stay.
template <class Form, std::size_t Limit>
void replace(const typename Form::Value *sourceValue, const typename Form::Value *searchValue,
             const typename Form::Value *replacementValue, typename Form::Value *out,
             Status status) noexcept {
  const Bytes source = Form::read(sourceValue);
  const Bytes search = Form::read(searchValue);
  const Bytes replacement = Form::read(replacementValue);
  // What a failure leaves in the result: an empty text, or the source's
  // length in the length word.
  Form::finish(out, std::is_same_v<Form, Text> ? 0 : source.size);
  Builder<Form> result(Form::area(out), Limit);
  std::size_t scan = 0;
  if (search.size != 0) {
    const Searcher searcher(search);
    for (std::size_t at; (at = searcher.find(source, scan)) != kNotFound; scan = at + search.size) {
      if (!result.append(source.data + scan, at - scan) ||
          !result.append(replacement.data, replacement.size)) {
        return status.raise(Sysfun::tooLong);
      }
    }
  }
  if (!result.append(source.data + scan, source.size - scan)) return status.raise(Sysfun::tooLong);
  Form::finish(out, result.length());
}

// INSERT after its checks: the source's first p - 1 bytes, the new string,
// and what is left of the source behind the deleted range.
template <class Form>
void insert(Bytes source, std::int64_t p, std::int64_t l, Bytes added,
            typename Form::Value *out) noexcept {
  Builder<Form> result(Form::area(out), static_cast<std::size_t>(-1));
  const auto head = static_cast<std::size_t>(p - 1);
  result.append(source.data, head);
  result.append(added.data, added.size);
  const auto rest = static_cast<std::size_t>(p - 1 + l);
  if (rest < source.size) result.append(source.data + rest, source.size - rest);
  Form::finish(out, result.length());
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
  return Sysfun{};
}

}  // namespace

CLI_EXPORT void CLI_udfLOCATE1(const char *search, const char *searched, const std::int32_t *start,
                               std::int32_t *result, Ind, Ind, Ind, Ind, char *sqlstate, NameArg,
                               NameArg, char *message) noexcept {
  const std::int32_t s = *start;
  if (s < 1 || s > static_cast<std::int32_t>(cli::kTextLimit)) {
    return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  }
  const Bytes h = Text::read(searched);
  *result = static_cast<std::size_t>(s) - 1 > h.size
                ? 0
                : locate(Text::read(search), h, static_cast<std::size_t>(s));
}

CLI_EXPORT void CLI_udfLOCATE2(const CLI_udfLob *search, const CLI_udfLob *searched,
                               const std::int32_t *start, std::int32_t *result, Ind, Ind, Ind, Ind,
                               char *sqlstate, NameArg, NameArg, char *message) noexcept {
  const std::int32_t s = *start;
  if (s < 1 || s > static_cast<std::int32_t>(cli::kLobLimit)) {
    return Status{sqlstate, message}.raise(Sysfun::outOfRange);
  }
  *result = locate(Lob::read(search), Lob::read(searched), static_cast<std::size_t>(s));
}

CLI_EXPORT void CLI_udfLOCATE3(const char *search, const char *searched, std::int32_t *result, Ind,
                               Ind, Ind, char *, NameArg, NameArg, char *) noexcept {
  *result = locate(Text::read(search), Text::read(searched), 1);
}

CLI_EXPORT void CLI_udfLOCATE4(const CLI_udfLob *search, const CLI_udfLob *searched,
                               std::int32_t *result, Ind, Ind, Ind, char *, NameArg, NameArg,
                               char *) noexcept {
  *result = locate(Lob::read(search), Lob::read(searched), 1);
}

CLI_EXPORT void CLI_udfREPLACE1(const char *source, const char *search, const char *replacement,
                                char *result, Ind, Ind, Ind, Ind, char *sqlstate, NameArg, NameArg,
                                char *message) noexcept {
  replace<Text, cli::kTextLimit>(source, search, replacement, result, Status{sqlstate, message});
}

CLI_EXPORT void CLI_udfREPLACE2(const CLI_udfLob *source, const CLI_udfLob *search,
                                const CLI_udfLob *replacement, CLI_udfLob *result, Ind, Ind, Ind,
                                Ind, char *sqlstate, NameArg, NameArg, char *message) noexcept {
  replace<Lob, cli::kLobLimit>(source, search, replacement, result, Status{sqlstate, message});
}

CLI_EXPORT void CLI_udfINSERT1(const char *source, const std::int32_t *start,
                               const std::int32_t *length, const char *added, char *result, Ind,
                               Ind, Ind, Ind, Ind, char *sqlstate, NameArg, NameArg,
                               char *message) noexcept {
  const Bytes s = Text::read(source), i = Text::read(added);
  const Sysfun code = insertCheck(false, s.size, *start, *length, i.size, cli::kTextLimit);
  if (code != Sysfun{}) return Status{sqlstate, message}.raise(code);
  insert<Text>(s, *start, *length, i, result);
}

CLI_EXPORT void CLI_udfINSERT2(const CLI_udfLob *source, const std::int32_t *start,
                               const std::int32_t *length, const CLI_udfLob *added,
                               CLI_udfLob *result, Ind, Ind, Ind, Ind, Ind, char *sqlstate, NameArg,
                               NameArg, char *message) noexcept {
  const Bytes s = Lob::read(source), i = Lob::read(added);
  const Sysfun code = insertCheck(true, s.size, *start, *length, i.size, Lob::capacity(result));
  if (code != Sysfun{}) return Status{sqlstate, message}.raise(code);
  insert<Lob>(s, *start, *length, i, result);
}
