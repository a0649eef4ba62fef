// The stand-ins' code pages, names and collations by hand, for Windows,
// where the build has no ICU.  What they know is listed in
// standin/README.md; everything else is unknown.
#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "services_data.hpp"

namespace orv::standin {
namespace {

enum class Form : std::uint8_t {
  utf8,
  utf16be,
  utf16le,
  utf32be,
  utf32le,
  latin1,
  cp1252,
  ebcdic37
};

struct CodePage {
  std::uint32_t number;
  Form form;
  EncodingClass encodingClass;
};

constexpr CodePage kCodePages[] = {
    {1208, Form::utf8, kUtf8},         {1200, Form::utf16be, kUtf16},
    {13488, Form::utf16be, kUtf16},    {17584, Form::utf16be, kUtf16},
    {1202, Form::utf16le, kUtf16},     {13490, Form::utf16le, kUtf16},
    {17586, Form::utf16le, kUtf16},    {1232, Form::utf32be, kUtf32},
    {1234, Form::utf32le, kUtf32},     {819, Form::latin1, kSingleByte},
    {1252, Form::cp1252, kSingleByte}, {37, Form::ebcdic37, kSingleByteEbcdic},
};

const CodePage *codePageOf(std::uint32_t number) {
  for (const CodePage &c : kCodePages) {
    if (c.number == number) return &c;
  }
  return nullptr;
}

// windows-1252 from 0x80 to 0x9F; 0 where the byte has no character.
constexpr std::array<char16_t, 32> k1252 = {
    0x20AC, 0x0000, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, 0x0000, 0x017D, 0x0000, 0x0000, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x0000, 0x017E, 0x0178,
};

// EBCDIC code page 37 (US and Canada), byte to character.
constexpr std::array<char16_t, 256> k37 = {
    0x0000, 0x0001, 0x0002, 0x0003, 0x009C, 0x0009, 0x0086, 0x007F, 0x0097, 0x008D, 0x008E, 0x000B,
    0x000C, 0x000D, 0x000E, 0x000F, 0x0010, 0x0011, 0x0012, 0x0013, 0x009D, 0x0085, 0x0008, 0x0087,
    0x0018, 0x0019, 0x0092, 0x008F, 0x001C, 0x001D, 0x001E, 0x001F, 0x0080, 0x0081, 0x0082, 0x0083,
    0x0084, 0x000A, 0x0017, 0x001B, 0x0088, 0x0089, 0x008A, 0x008B, 0x008C, 0x0005, 0x0006, 0x0007,
    0x0090, 0x0091, 0x0016, 0x0093, 0x0094, 0x0095, 0x0096, 0x0004, 0x0098, 0x0099, 0x009A, 0x009B,
    0x0014, 0x0015, 0x009E, 0x001A, 0x0020, 0x00A0, 0x00E2, 0x00E4, 0x00E0, 0x00E1, 0x00E3, 0x00E5,
    0x00E7, 0x00F1, 0x00A2, 0x002E, 0x003C, 0x0028, 0x002B, 0x007C, 0x0026, 0x00E9, 0x00EA, 0x00EB,
    0x00E8, 0x00ED, 0x00EE, 0x00EF, 0x00EC, 0x00DF, 0x0021, 0x0024, 0x002A, 0x0029, 0x003B, 0x00AC,
    0x002D, 0x002F, 0x00C2, 0x00C4, 0x00C0, 0x00C1, 0x00C3, 0x00C5, 0x00C7, 0x00D1, 0x00A6, 0x002C,
    0x0025, 0x005F, 0x003E, 0x003F, 0x00F8, 0x00C9, 0x00CA, 0x00CB, 0x00C8, 0x00CD, 0x00CE, 0x00CF,
    0x00CC, 0x0060, 0x003A, 0x0023, 0x0040, 0x0027, 0x003D, 0x0022, 0x00D8, 0x0061, 0x0062, 0x0063,
    0x0064, 0x0065, 0x0066, 0x0067, 0x0068, 0x0069, 0x00AB, 0x00BB, 0x00F0, 0x00FD, 0x00FE, 0x00B1,
    0x00B0, 0x006A, 0x006B, 0x006C, 0x006D, 0x006E, 0x006F, 0x0070, 0x0071, 0x0072, 0x00AA, 0x00BA,
    0x00E6, 0x00B8, 0x00C6, 0x00A4, 0x00B5, 0x007E, 0x0073, 0x0074, 0x0075, 0x0076, 0x0077, 0x0078,
    0x0079, 0x007A, 0x00A1, 0x00BF, 0x00D0, 0x00DD, 0x00DE, 0x00AE, 0x005E, 0x00A3, 0x00A5, 0x00B7,
    0x00A9, 0x00A7, 0x00B6, 0x00BC, 0x00BD, 0x00BE, 0x005B, 0x005D, 0x00AF, 0x00A8, 0x00B4, 0x00D7,
    0x007B, 0x0041, 0x0042, 0x0043, 0x0044, 0x0045, 0x0046, 0x0047, 0x0048, 0x0049, 0x00AD, 0x00F4,
    0x00F6, 0x00F2, 0x00F3, 0x00F5, 0x007D, 0x004A, 0x004B, 0x004C, 0x004D, 0x004E, 0x004F, 0x0050,
    0x0051, 0x0052, 0x00B9, 0x00FB, 0x00FC, 0x00F9, 0x00FA, 0x00FF, 0x005C, 0x00F7, 0x0053, 0x0054,
    0x0055, 0x0056, 0x0057, 0x0058, 0x0059, 0x005A, 0x00B2, 0x00D4, 0x00D6, 0x00D2, 0x00D3, 0x00D5,
    0x0030, 0x0031, 0x0032, 0x0033, 0x0034, 0x0035, 0x0036, 0x0037, 0x0038, 0x0039, 0x00B3, 0x00DB,
    0x00DC, 0x00D9, 0x00DA, 0x009F,
};

constexpr char32_t kInvalid = 0xFFFFFFFF;

bool isScalar(char32_t c) { return c < 0x110000 && (c < 0xD800 || c > 0xDFFF); }

// The character at `in` (up to `end`), moving `in` past it; kInvalid for
// bytes that are not a character, or for the start of a cut one.
char32_t decode(Form form, const unsigned char *&in, const unsigned char *end) {
  const auto left = static_cast<std::size_t>(end - in);
  const auto word16 = [&](std::size_t at, bool big) {
    return static_cast<char16_t>(big ? (in[at] << 8) | in[at + 1] : (in[at + 1] << 8) | in[at]);
  };
  switch (form) {
    case Form::latin1:
      return *in++;
    case Form::cp1252: {
      const unsigned char b = *in++;
      if (b < 0x80 || b > 0x9F) return b;
      return k1252[b - 0x80U] == 0 ? kInvalid : k1252[b - 0x80U];
    }
    case Form::ebcdic37:
      return k37[*in++];
    case Form::utf8: {
      const unsigned char b = in[0];
      std::size_t n = 0;
      char32_t c = 0;
      char32_t least = 0;
      if (b < 0x80) {
        ++in;
        return b;
      }
      if (b >= 0xC2 && b <= 0xDF) {
        n = 2, c = b & 0x1FU, least = 0x80;
      } else if (b >= 0xE0 && b <= 0xEF) {
        n = 3, c = b & 0x0FU, least = 0x800;
      } else if (b >= 0xF0 && b <= 0xF4) {
        n = 4, c = b & 0x07U, least = 0x10000;
      } else {
        return kInvalid;
      }
      if (left < n) return kInvalid;
      for (std::size_t i = 1; i < n; ++i) {
        if ((in[i] & 0xC0U) != 0x80) return kInvalid;
        c = (c << 6) | (in[i] & 0x3FU);
      }
      if (c < least || !isScalar(c)) return kInvalid;
      in += n;
      return c;
    }
    case Form::utf16be:
    case Form::utf16le: {
      const bool big = form == Form::utf16be;
      if (left < 2) return kInvalid;
      const char16_t first = word16(0, big);
      if (first < 0xD800 || first > 0xDFFF) {
        in += 2;
        return first;
      }
      if (first > 0xDBFF || left < 4) return kInvalid;
      const char16_t second = word16(2, big);
      if (second < 0xDC00 || second > 0xDFFF) return kInvalid;
      in += 4;
      return 0x10000 + ((char32_t{first} - 0xD800) << 10) + (char32_t{second} - 0xDC00);
    }
    case Form::utf32be:
    case Form::utf32le: {
      if (left < 4) return kInvalid;
      char32_t c = 0;
      for (std::size_t i = 0; i < 4; ++i) {
        c = (c << 8) | in[form == Form::utf32be ? i : 3 - i];
      }
      if (!isScalar(c)) return kInvalid;
      in += 4;
      return c;
    }
  }
  return kInvalid;
}

// The bytes of `c` in `form`, their count in `n`; false when the code page
// has no such character.
bool encode(Form form, char32_t c, std::array<unsigned char, 4> &out, std::size_t &n) {
  switch (form) {
    case Form::latin1:
      if (c > 0xFF) return false;
      out[0] = static_cast<unsigned char>(c), n = 1;
      return true;
    case Form::cp1252:
      if (c < 0x80 || (c >= 0xA0 && c <= 0xFF)) {
        out[0] = static_cast<unsigned char>(c), n = 1;
        return true;
      }
      for (std::size_t i = 0; i < k1252.size(); ++i) {
        if (k1252[i] != 0 && k1252[i] == c) {
          out[0] = static_cast<unsigned char>(0x80 + i), n = 1;
          return true;
        }
      }
      return false;
    case Form::ebcdic37:
      for (std::size_t i = 0; i < k37.size(); ++i) {
        if (k37[i] == c) {
          out[0] = static_cast<unsigned char>(i), n = 1;
          return true;
        }
      }
      return false;
    case Form::utf8:
      if (c < 0x80) {
        out[0] = static_cast<unsigned char>(c), n = 1;
      } else if (c < 0x800) {
        out[0] = static_cast<unsigned char>(0xC0 | (c >> 6));
        out[1] = static_cast<unsigned char>(0x80 | (c & 0x3F)), n = 2;
      } else if (c < 0x10000) {
        out[0] = static_cast<unsigned char>(0xE0 | (c >> 12));
        out[1] = static_cast<unsigned char>(0x80 | ((c >> 6) & 0x3F));
        out[2] = static_cast<unsigned char>(0x80 | (c & 0x3F)), n = 3;
      } else {
        out[0] = static_cast<unsigned char>(0xF0 | (c >> 18));
        out[1] = static_cast<unsigned char>(0x80 | ((c >> 12) & 0x3F));
        out[2] = static_cast<unsigned char>(0x80 | ((c >> 6) & 0x3F));
        out[3] = static_cast<unsigned char>(0x80 | (c & 0x3F)), n = 4;
      }
      return true;
    case Form::utf16be:
    case Form::utf16le: {
      const bool big = form == Form::utf16be;
      const auto put = [&](std::size_t at, char32_t word) {
        out[at + (big ? 0 : 1)] = static_cast<unsigned char>(word >> 8);
        out[at + (big ? 1 : 0)] = static_cast<unsigned char>(word & 0xFF);
      };
      if (c < 0x10000) {
        put(0, c), n = 2;
      } else {
        put(0, 0xD800 + ((c - 0x10000) >> 10));
        put(2, 0xDC00 + ((c - 0x10000) & 0x3FF)), n = 4;
      }
      return true;
    }
    case Form::utf32be:
    case Form::utf32le:
      for (std::size_t i = 0; i < 4; ++i) {
        out[form == Form::utf32be ? i : 3 - i] = static_cast<unsigned char>(c >> (24 - 8 * i));
      }
      n = 4;
      return true;
  }
  return false;
}

struct Locale {
  std::string_view language;
  std::array<const char *, 12> months;
  std::array<const char *, 7> days;
};

const Locale kLocales[] = {
    {"en",
     {"January", "February", "March", "April", "May", "June", "July", "August", "September",
      "October", "November", "December"},
     {"Sunday", "Monday", "Tuesday", "Wednesday", "Thursday", "Friday", "Saturday"}},
    {"de",
     {"Januar", "Februar", "M\xC3\xA4rz", "April", "Mai", "Juni", "Juli", "August", "September",
      "Oktober", "November", "Dezember"},
     {"Sonntag", "Montag", "Dienstag", "Mittwoch", "Donnerstag", "Freitag", "Samstag"}},
    {"fr",
     {"janvier", "f\xC3\xA9vrier", "mars", "avril", "mai", "juin", "juillet", "ao\xC3\xBBt",
      "septembre", "octobre", "novembre",
      "d\xC3\xA9"
      "cembre"},
     {"dimanche", "lundi", "mardi", "mercredi", "jeudi", "vendredi", "samedi"}},
};

// The collation locales, numbered from 0.
constexpr const char *kCollationLocales[] = {"af", "ar", "de", "en", "en_US", "es", "fr", "ja"};

}  // namespace

EncodingClass encodingClassOf(std::uint32_t codePage) {
  const CodePage *c = codePageOf(codePage);
  return c == nullptr ? kUnknown : c->encodingClass;
}

std::int32_t convert(const unsigned char *source, std::uint32_t length,
                     std::uint32_t sourceCodePage, std::uint32_t targetCodePage,
                     unsigned char *target, std::uint32_t &space) {
  const CodePage *from = codePageOf(sourceCodePage);
  const CodePage *to = codePageOf(targetCodePage);
  if (from == nullptr || to == nullptr) return -1;
  const unsigned char *in = source;
  const unsigned char *const end = source + length;
  while (in < end) {
    const char32_t c = decode(from->form, in, end);
    std::array<unsigned char, 4> bytes{};
    std::size_t n = 0;
    if (c == kInvalid || !encode(to->form, c, bytes, n)) return -3;
    // As much as fits is written, also of a character cut by the end.
    const std::size_t fits = std::min<std::size_t>(n, space);
    std::memcpy(target, bytes.data(), fits);
    target += fits;
    space -= static_cast<std::uint32_t>(fits);
    if (fits < n) return -2;
  }
  return 0;
}

// The language is what comes before '_', '-', '.' or '@': "de_DE" is "de".
bool namesOf(const char *locale, Names &names) {
  const std::string_view name(locale);
  const std::string_view language = name.substr(0, name.find_first_of("_-.@"));
  for (const Locale &l : kLocales) {
    if (l.language != language) continue;
    std::copy(l.months.begin(), l.months.end(), names.months.begin());
    std::copy(l.days.begin(), l.days.end(), names.days.begin());
    return true;
  }
  return false;
}

bool collationLocale(std::int32_t index, std::string &locale) {
  if (index < 0 || static_cast<std::size_t>(index) >= std::size(kCollationLocales)) return false;
  locale = kCollationLocales[index];
  return true;
}

}  // namespace orv::standin
