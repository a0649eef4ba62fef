// VEBLOB_CP_LARGE and VEBLOB_CP_SMALL: a chain of records copied from one
// code page to another.  Each record is a 22-byte head, copied as it is,
// a tag that says the width of the length field, the length, and a string
// that is converted; the length field is rewritten with the new length,
// and 16- and 32-bit fields can be swapped between byte orders.
//
// The routines trust nothing in the object: a length field or a string
// that runs past its end gives a status, and the conversion service is
// never given more room than the result has left.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <initializer_list>

#include "engine/conversion.hpp"
#include "engine/services.h"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::LobIn;
using cli::LobOut;
using cli::Nullable;
using cli::Report;
using cli::ResultIndicator;

constexpr std::size_t kHead = 22;
// The room that a record needs from its tag on before its string is
// looked at: the test that the head of the next record fits.
constexpr std::size_t kRecordRoom = 26;

bool isOneOf(std::int32_t cp, std::initializer_list<std::int32_t> set) {
  return std::ranges::find(set, cp) != set.end();
}

bool isUtf16(std::int32_t cp) { return isOneOf(cp, {1200, 1202, 13488, 13490, 17584, 17586}); }
bool isMixed(std::int32_t cp) {
  return isOneOf(cp, {932, 942, 943, 949, 950, 970, 1363, 1375, 1381, 1383, 1386, 1394, 5039});
}
bool isNarrowClass(std::int32_t cp) {
  const std::int32_t c = sqlnls_Encoding2(static_cast<std::uint32_t>(cp), 2);
  return c == 2 || c == 9;
}

// By how much a string may grow from one code page to the other: the
// first rule that applies decides.
std::int32_t expansionFactor(std::int32_t from, std::int32_t to) {
  if (to == from || to == 0 || from == 0) return 1;
  if (from == 1208) return to == 819 || isUtf16(to) ? 2 : isOneOf(to, {1232, 1234}) ? 1 : 3;
  if (isOneOf(from, {819, 1252})) return 1;
  if (isOneOf(from, {954, 964})) return 2;
  if (isUtf16(from)) return isUtf16(to) || to == 1204 ? 1 : isNarrowClass(to) ? 1 : 2;
  if (isOneOf(from, {1232, 1234})) {
    if (isUtf16(to) || to == 1204) return 2;
    if (isOneOf(to, {1232, 1234, 1236})) return 1;
    return isNarrowClass(to) ? 2 : 4;
  }
  if (isOneOf(from, {1392, 5488})) return to == 1208 ? 4 : isUtf16(to) || to == 1204 ? 2 : 1;
  if (isMixed(from)) return to == 1208 ? 2 : 1;
  return 1;
}

// The machine's own byte order as the object's byte-order input gives it:
// -1 for big-endian, 0 for little-endian.
std::int32_t machineByteOrder() {
  const std::uint32_t probe = 0x12345678;
  unsigned char first = 0;
  std::memcpy(&first, &probe, 1);
  return first == 0x12 ? -1 : 0;
}

std::size_t widthOfTag(unsigned char tag) {
  switch (tag) {
    case 0x4B:
      return 1;
    case 0x8B:
      return 2;
    case 0xCB:
      return 4;
    default:
      return 0;
  }
}

std::uint32_t readLength(const unsigned char *p, std::size_t width, bool swap) {
  if (width == 1) return p[0];
  unsigned char b[4] = {};
  for (std::size_t i = 0; i < width; ++i) b[i] = p[swap ? width - 1 - i : i];
  if (width == 2) {
    std::uint16_t v = 0;
    std::memcpy(&v, b, 2);
    return v;
  }
  std::uint32_t v = 0;
  std::memcpy(&v, b, 4);
  return v;
}

void writeLength(unsigned char *p, std::size_t width, std::uint32_t value, bool swap) {
  unsigned char b[4] = {};
  if (width == 1) {
    p[0] = static_cast<unsigned char>(value);
    return;
  }
  if (width == 2) {
    const auto v = static_cast<std::uint16_t>(value);
    std::memcpy(b, &v, 2);
  } else {
    std::memcpy(b, &value, 4);
  }
  for (std::size_t i = 0; i < width; ++i) p[i] = b[swap ? width - 1 - i : i];
}

// The statuses of this routine, each with the message "sqlocpcv".
constexpr Report kResultTooSmall = Report::of(Report::Kind::resultTooSmall);
constexpr Report kConversionFailed = Report::of(Report::Kind::conversionFailed);
constexpr Report kUnknownLengthForm = Report::of(Report::Kind::unknownLengthForm);

// The copy into a result of `out.limit()` bytes.  On a NULL object the
// result is NULL too; on success the result indicator is 1.
Report copyObject(Nullable<LobIn> object, std::int32_t from, std::int32_t to,
                  std::int32_t byteOrder, LobOut result, ResultIndicator resultNull) noexcept {
  if (object.null()) {
    resultNull.set(object.indicator);
    return {};
  }
  const std::size_t capacity = result.limit();
  const bool swap = byteOrder != machineByteOrder();
  const std::int32_t factor = expansionFactor(from, to);
  const cli::Bytes in = object.value.bytes();
  unsigned char *out = result.area();
  std::size_t end = 0;  // the end of the last converted string in the result
  if (in.size >= kHead + 1) {
    std::size_t t = kHead, u = kHead;
    for (;;) {
      if (u + kRecordRoom > capacity) return kResultTooSmall;
      const unsigned char tag = in.data[t];
      const std::size_t width = widthOfTag(tag);
      if (width == 0) return kUnknownLengthForm;
      // A length field or string past the end of the object is no record.
      if (t + 1 + width > in.size) return kUnknownLengthForm;
      std::memcpy(out + u - kHead, in.data + t - kHead, kHead + 1);
      const std::uint32_t n = readLength(in.data + t + 1, width, swap);
      const std::size_t source = t + 1 + width;
      if (n > in.size - source) return kUnknownLengthForm;
      const std::size_t v = u + 1 + width;
      // The room test as the contract gives it: n times the factor in
      // floating point, with 0.5 added, truncated.
      const double scaled = static_cast<double>(n) * factor + 0.5;
      const auto room = static_cast<std::uint64_t>(scaled);
      if (v + room >= capacity) return kResultTooSmall;
      // The object's size is the space, but never more than the result holds.
      const auto space =
          static_cast<std::uint32_t>(in.size < capacity - v ? in.size : capacity - v);
      const cli::Converted c =
          cli::CLI_convertCodePage(in.data + source, n, static_cast<std::uint32_t>(from),
                                   static_cast<std::uint32_t>(to), out + v, space);
      if (c.status < 0) return kConversionFailed;
      // The new length must fit the width of its field.
      if (c.length > space || (width < 4 && c.length >= (1u << (8 * width)))) {
        return kResultTooSmall;
      }
      writeLength(out + u + 1, width, c.length, swap);
      end = v + c.length;
      t = source + n + kHead;
      u = end + kHead;
      if (t + 1 > in.size) break;
    }
  }
  result.finish(end);
  resultNull.set(1);
  return {};
}

}  // namespace

namespace cli {

Report routine::VEBLOB_CP_LARGE(Nullable<LobIn> object, Nullable<std::int32_t> source_code_page,
                                Nullable<std::int32_t> target_code_page,
                                Nullable<std::int32_t> byte_order, LobOut result,
                                ResultIndicator result_null) noexcept {
  return copyObject(object, source_code_page.value, target_code_page.value, byte_order.value,
                    result, result_null);
}

Report routine::VEBLOB_CP_SMALL(Nullable<LobIn> object, Nullable<std::int32_t> source_code_page,
                                Nullable<std::int32_t> target_code_page,
                                Nullable<std::int32_t> byte_order, LobOut result,
                                ResultIndicator result_null) noexcept {
  return copyObject(object, source_code_page.value, target_code_page.value, byte_order.value,
                    result, result_null);
}

}  // namespace cli
