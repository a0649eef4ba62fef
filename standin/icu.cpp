// The stand-ins' code pages, names and collations by ICU, on Linux.
#include <unicode/dtfmtsym.h>
#include <unicode/locid.h>
#include <unicode/ucnv.h>
#include <unicode/ucol.h>
#include <unicode/unistr.h>

#include <array>
#include <cstdio>
#include <utility>

#include "services_data.hpp"

namespace orv::standin {
namespace {

// Code pages whose ICU name is not "ibm-<number>".
constexpr std::pair<std::uint32_t, const char *> kNames[] = {
    {1208, "UTF-8"},
    {1200, "UTF-16BE"},
    {1202, "UTF-16LE"},
    {13488, "UTF-16BE"},
    {13490, "UTF-16LE"},
    {17584, "UTF-16BE"},
    {17586, "UTF-16LE"},
    {1204, "UTF-16"},
    {1232, "UTF-32BE"},
    {1234, "UTF-32LE"},
    {1236, "UTF-32"},
    {819, "ISO-8859-1"},
    {1252, "windows-1252"},
    {954, "EUC-JP"},
    {932, "ibm-943_P15A-2003"},
    {943, "ibm-943_P15A-2003"},
    {1392, "GB18030"},
    {5488, "GB18030"},
    {950, "windows-950"},
    {1394, "ibm-943_P15A-2003"},
    {5039, "ibm-943_P15A-2003"},
};

struct Open {
  std::uint32_t codePage = 0;
  int role = 0;
  UConverter *converter = nullptr;
};

// A few converters per thread, opened once: ICU converters are not to be
// shared between threads.
class Cache {
 public:
  ~Cache() {
    for (Open &o : slots_) {
      if (o.converter != nullptr) ucnv_close(o.converter);
    }
  }
  // Each role has slots of its own, so that opening the target's converter
  // never closes the source's, which the same conversion is about to use.
  UConverter *get(std::uint32_t codePage, int role) {
    const std::size_t r = role == 0 ? 0 : 1;
    Open *const own = slots_.data() + r * kPerRole;
    for (std::size_t i = 0; i < kPerRole; ++i) {
      if (own[i].converter != nullptr && own[i].codePage == codePage) return own[i].converter;
    }
    UConverter *c = open(codePage);
    if (c == nullptr) return nullptr;
    Open &slot = own[next_[r]++ % kPerRole];
    if (slot.converter != nullptr) ucnv_close(slot.converter);
    slot = {codePage, role, c};
    return c;
  }

 private:
  static UConverter *open(std::uint32_t codePage) {
    const char *name = nullptr;
    for (const auto &[number, icuName] : kNames) {
      if (number == codePage) name = icuName;
    }
    char ibm[24];
    if (name == nullptr) {
      static_cast<void>(std::snprintf(ibm, sizeof ibm, "ibm-%u", codePage));
      name = ibm;
    }
    UErrorCode status = U_ZERO_ERROR;
    UConverter *c = ucnv_open(name, &status);
    if (U_FAILURE(status)) return nullptr;
    // Refuse bytes that are not valid in the source, and characters that
    // the target cannot hold, rather than substituting them.
    ucnv_setToUCallBack(c, UCNV_TO_U_CALLBACK_STOP, nullptr, nullptr, nullptr, &status);
    ucnv_setFromUCallBack(c, UCNV_FROM_U_CALLBACK_STOP, nullptr, nullptr, nullptr, &status);
    return c;
  }

  static constexpr std::size_t kPerRole = 4;
  std::array<Open, 2 * kPerRole> slots_{};
  std::array<std::size_t, 2> next_{};
};

// The ICU converter for an engine code page, opened for this thread and
// kept open; null for a code page that is not known.  A conversion takes
// one converter for its source and another for its target (role 0 and 1),
// also when both are the same code page.
UConverter *converterFor(std::uint32_t codePage, int role = 0) {
  thread_local Cache cache;
  return cache.get(codePage, role);
}

}  // namespace

std::int32_t convert(const unsigned char *source, std::uint32_t length,
                     std::uint32_t sourceCodePage, std::uint32_t targetCodePage,
                     unsigned char *target, std::uint32_t &space) {
  UConverter *from = converterFor(sourceCodePage, 0);
  UConverter *to = converterFor(targetCodePage, 1);
  if (from == nullptr || to == nullptr) return -1;
  ucnv_reset(from);
  ucnv_reset(to);
  char *out = reinterpret_cast<char *>(target);
  char *const start = out;
  const char *in = reinterpret_cast<const char *>(source);
  std::array<UChar, 256> pivot{};
  UChar *pivotSource = pivot.data();
  UChar *pivotTarget = pivot.data();
  UErrorCode status = U_ZERO_ERROR;
  ucnv_convertEx(to, from, &out, out + space, &in, in + length, pivot.data(), &pivotSource,
                 &pivotTarget, pivot.data() + pivot.size(), 1, 1, &status);
  space -= static_cast<std::uint32_t>(out - start);
  if (status == U_BUFFER_OVERFLOW_ERROR) return -2;
  return U_FAILURE(status) ? -3 : 0;
}

EncodingClass encodingClassOf(std::uint32_t codePage) {
  UConverter *c = converterFor(codePage);
  if (c == nullptr) return kUnknown;
  switch (ucnv_getType(c)) {
    case UCNV_UTF8:
      return kUtf8;
    case UCNV_UTF16_BigEndian:
    case UCNV_UTF16_LittleEndian:
    case UCNV_UTF16:
      return kUtf16;
    case UCNV_UTF32_BigEndian:
    case UCNV_UTF32_LittleEndian:
    case UCNV_UTF32:
      return kUtf32;
    default:
      break;
  }
  if (ucnv_getMaxCharSize(c) > 1) return kMultiByte;
  // One byte a character: EBCDIC when the letter A is 0xC1.
  const UChar a = u'A';
  char out[4];
  UErrorCode status = U_ZERO_ERROR;
  ucnv_reset(c);
  const int32_t n = ucnv_fromUChars(c, out, sizeof out, &a, 1, &status);
  return U_SUCCESS(status) && n == 1 && static_cast<unsigned char>(out[0]) == 0xC1
             ? kSingleByteEbcdic
             : kSingleByte;
}

}  // namespace orv::standin

namespace orv::standin {

bool namesOf(const char *locale, Names &names) {
  UErrorCode status = U_ZERO_ERROR;
  const icu::DateFormatSymbols symbols(icu::Locale(locale), status);
  if (U_FAILURE(status)) return false;
  int32_t count = 0;
  const icu::UnicodeString *months = symbols.getMonths(count);
  for (int32_t i = 0; i < 12 && i < count; ++i) {
    names.months[static_cast<std::size_t>(i)].clear();
    months[i].toUTF8String(names.months[static_cast<std::size_t>(i)]);
  }
  const icu::UnicodeString *days = symbols.getWeekdays(count);  // [1] is Sunday
  for (int32_t i = 1; i <= 7 && i < count; ++i) {
    names.days[static_cast<std::size_t>(i - 1)].clear();
    days[i].toUTF8String(names.days[static_cast<std::size_t>(i - 1)]);
  }
  return true;
}

bool collationLocale(std::int32_t index, std::string &locale) {
  if (index >= ucol_countAvailable()) return false;
  locale = ucol_getAvailable(index);
  return true;
}

}  // namespace orv::standin
