// ORVSYS64 stand-in: code pages, names, number text, collation names,
// the instance path, files, memory blocks and the diagnostic log.
#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "engine/services.h"
#include "files.hpp"
#include "platform.hpp"
#include "services_data.hpp"

namespace {

constexpr std::uint16_t kUtf8 = 1208;

// ---- Names of months and days ------------------------------------------

// A name as a thread's cache keeps it.  The cache is trivially
// destructible: mingw-w64 runs the destructors of a DLL's thread_local
// objects after it has freed their storage, so a thread_local std::string
// there crashes each thread that ends.
struct Name {
  std::size_t size = 0;  // the whole name's length, also beyond what is kept
  std::array<unsigned char, 255> bytes{};

  Name &operator=(const std::string &name) {
    size = name.size();
    std::copy_n(name.begin(), std::min(name.size(), bytes.size()), bytes.begin());
    return *this;
  }
};

// The names of the locale last asked for, looked up once per thread.
struct Names {
  std::array<char, 128> locale{};  // empty when the locale was too long to keep
  std::array<Name, 12> months{};
  std::array<Name, 7> days{};  // Sunday first
};

const Names &namesOf(const char *locale) {
  thread_local Names names;
  if (std::strcmp(names.locale.data(), locale) == 0 && names.months[0].size != 0) return names;
  const std::size_t length = std::strlen(locale);
  names.locale[0] = '\0';
  if (length < names.locale.size()) std::copy_n(locale, length + 1, names.locale.begin());
  orv::standin::Names found;
  if (!orv::standin::namesOf(locale, found)) {
    for (Name &m : names.months) m.size = 0;
    return names;
  }
  std::copy(found.months.begin(), found.months.end(), names.months.begin());
  std::copy(found.days.begin(), found.days.end(), names.days.begin());
  return names;
}

const char *serverLocale() {
  const char *locale = std::getenv("ORVENGINE_LOCALE");
  return locale != nullptr && *locale != '\0' ? locale : "en_US";
}

std::uint8_t giveName(const Name &name, std::uint32_t size, unsigned char *out,
                      std::uint16_t *codePage) {
  if (name.size == 0 || name.size > size || name.size > 255) return 0;
  std::copy_n(name.bytes.begin(), name.size, out);  // no terminator: the length is returned
  *codePage = kUtf8;
  return static_cast<std::uint8_t>(name.size);
}

// ---- Number text -------------------------------------------------------

// [+-] digits [. digits] [(e|E) [+-] digits], with a digit somewhere
// before the exponent; nothing else, no blanks.
bool isDecimal(const char *s, std::size_t n) {
  std::size_t i = 0;
  if (i < n && (s[i] == '+' || s[i] == '-')) ++i;
  std::size_t digits = 0;
  for (; i < n && s[i] >= '0' && s[i] <= '9'; ++i) ++digits;
  if (i < n && s[i] == '.') {
    for (++i; i < n && s[i] >= '0' && s[i] <= '9'; ++i) ++digits;
  }
  if (digits == 0) return false;
  if (i < n && (s[i] == 'e' || s[i] == 'E')) {
    ++i;
    if (i < n && (s[i] == '+' || s[i] == '-')) ++i;
    std::size_t exponent = 0;
    for (; i < n && s[i] >= '0' && s[i] <= '9'; ++i) ++exponent;
    if (exponent == 0) return false;
  }
  return i == n;
}

// ---- Static data: the chain to the snapshot name -----------------------

constexpr std::size_t kNameOffset = 26408;
constexpr std::size_t kNameRoom = 256;

// The chain as the engine lays it out: the static data holds the first
// link at byte 88, the record it points to holds the second at byte 0, the
// next holds the third at byte 112, and the last record holds the name.
struct StaticData {
  alignas(8) unsigned char head[96];     // the first link at byte 88
  alignas(8) unsigned char first[8];     // the second link at byte 0
  alignas(8) unsigned char second[120];  // the third link at byte 112
  alignas(8) unsigned char last[kNameOffset + kNameRoom];
};

void putPointer(unsigned char *at, const void *pointer) {
  std::memcpy(at, &pointer, sizeof pointer);
}

// ---- Files ---------------------------------------------------------------

}  // namespace

extern "C" {

int32_t sqlocpcv(const unsigned char **source, uint32_t sourceLength, uint32_t sourceCodePage,
                 uint32_t targetCodePage, int32_t, CLI_conversionRecord *record, int32_t *) {
  return orv::standin::convert(*source, sourceLength, sourceCodePage, targetCodePage,
                               record->target, record->space);
}

uint8_t sqloNLSGetServerMonthName(const CLI_nlsTimeRecord *time, uint32_t size, unsigned char *name,
                                  uint16_t *codePage) {
  if (time->month < 0 || time->month > 11) return 0;
  return giveName(namesOf(serverLocale()).months[static_cast<std::size_t>(time->month)], size, name,
                  codePage);
}

uint8_t sqloNLSGetServerDayName(const CLI_nlsTimeRecord *time, uint32_t size, unsigned char *name,
                                uint16_t *codePage) {
  if (time->dayOfWeek < 0 || time->dayOfWeek > 6) return 0;
  return giveName(namesOf(serverLocale()).days[static_cast<std::size_t>(time->dayOfWeek)], size,
                  name, codePage);
}

// Decimal text only; a value beyond the double range is refused, one that
// underflows becomes zero or a subnormal, as strtod would give it.
int32_t sqlrxa2f(const char *text, uint32_t length, double *value, uint32_t valueSize) {
  if (valueSize != sizeof(double) || !isDecimal(text, length)) return 1;
  const char *first = text + (length > 0 && text[0] == '+' ? 1 : 0);
  double parsed = 0.0;
  const auto [end, error] = std::from_chars(first, text + length, parsed);
  if (error == std::errc::result_out_of_range) {
    std::string copy(text, length);
    errno = 0;
    parsed = std::strtod(copy.c_str(), nullptr);
    if (std::isinf(parsed)) return 1;
  } else if (error != std::errc{} || end != text + length) {
    return 1;
  }
  *value = parsed;
  return 0;
}

// %+.14E, correctly rounded by the C library, with a three-digit exponent.
// An infinity or a NaN is written as its sign and INF or NAN, blank-filled.
int32_t sqlrxf2a(const double *value, int32_t digits, char *text, uint32_t valueSize) {
  if (valueSize != sizeof(double) || digits != 15) return 1;
  const double v = *value;
  if (!std::isfinite(v)) {
    static_cast<void>(std::snprintf(
        text, 23, "%-22s",
        std::isnan(v) ? (std::signbit(v) ? "-NAN" : "+NAN") : (v < 0 ? "-INF" : "+INF")));
    return 0;
  }
  char raw[40];
  static_cast<void>(std::snprintf(raw, sizeof raw, "%+.14E", v));  // +d.ddddddddddddddE+xx[x]
  const auto exponent = static_cast<int>(std::strtol(raw + 18, nullptr, 10));  // -324 to 308
  const int magnitude = exponent < 0 ? -exponent : exponent;
  std::memcpy(text, raw, 18);
  text[18] = exponent < 0 ? '-' : '+';
  text[19] = static_cast<char>('0' + magnitude / 100 % 10);
  text[20] = static_cast<char>('0' + magnitude / 10 % 10);
  text[21] = static_cast<char>('0' + magnitude % 10);
  text[22] = '\0';
  return 0;
}

// Identifiers (see standin/README.md): all zeros is IDENTITY; 0x01, a
// 16-bit little-endian index into the collation locales, a strength of
// 0 to 4 and four zeros is ICU_<locale>_S<strength>.
int32_t sqlnlsCollIDMapIDToName(char *name, uint32_t size, const unsigned char *id, int32_t) {
  static const unsigned char kZeros[8] = {};
  std::string text;
  if (std::memcmp(id, kZeros, 8) == 0) {
    text = "IDENTITY";
  } else if (id[0] == 0x01 && id[3] <= 4 && std::memcmp(id + 4, kZeros, 4) == 0) {
    const int32_t index = id[1] | (id[2] << 8);
    std::string locale;
    if (!orv::standin::collationLocale(index, locale)) return 0;
    text = "ICU_" + locale + "_S" + static_cast<char>('0' + (id[3] == 0 ? 3 : id[3]));
  } else {
    return 0;
  }
  if (text.size() >= size) return 0;
  std::copy(text.begin(), text.end(), name);  // no terminator: the length is returned
  return static_cast<int32_t>(text.size());
}

void *sqlo_get_static_data(void) {
  thread_local StaticData data{};
  putPointer(data.head + 88, data.first);
  putPointer(data.first, data.second);
  putPointer(data.second + 112, data.last);
  const char *name = std::getenv("ORVENGINE_SNAPSHOT_NAME");
  if (name == nullptr) name = "sqlcache";
  static_cast<void>(
      std::snprintf(reinterpret_cast<char *>(data.last + kNameOffset), kNameRoom, "%s", name));
  return data.head;
}

int32_t sqleinstancepath(int32_t, char *path) {
  const char *value = std::getenv("ORVENGINE_INSTANCE_PATH");
  if (value == nullptr) return 1;
  const std::size_t n = std::strlen(value);
  if (n == 0 || n >= 264) return 1;
  std::memcpy(path, value, n + 1);
  return 0;
}

int32_t sqloopenp(const char *path, int32_t, int32_t, CLI_fileHandle *handle, int32_t) {
  return orv::standin::openFile(path, handle);
}

int32_t sqloread(CLI_fileHandle handle, void *destination, uint32_t count, uint32_t *read) {
  return orv::standin::readFile(handle, destination, count, read);
}

int32_t sqlochgfileptr(CLI_fileHandle handle, int64_t offset, int32_t origin, int32_t) {
  return orv::standin::moveIn(handle, offset, origin);
}

int32_t sqloclose(CLI_fileHandle handle) { return orv::standin::closeFile(handle); }

int32_t sqlogmblkEx(void *, uint64_t size, int32_t, void **block, const char *, int32_t, int32_t) {
  void *p = std::malloc(size == 0 ? 1 : size);
  if (p == nullptr) return 1;
  *block = p;
  return 0;
}

int32_t sqlofmblkEx(const char *, int32_t, void *block) {
  std::free(block);
  return 0;
}

void sqlt_logerr_data(const char *message, const void *data, int32_t dataSize, int32_t level) {
  int32_t status = 0;
  if (dataSize == 4) std::memcpy(&status, data, 4);
  static_cast<void>(
      std::fprintf(stderr, "orvengine log (level %d): %s: %d\n", level, message, status));
}

}  // extern "C"
