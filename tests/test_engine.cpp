// Routines that call the engine's services: number text, collation names,
// day and month names and VEBLOB_CP, against the stand-ins and against fake
// services that fail where a test says.
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cctype>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>

#include "catalogue/catalogue.hpp"
#include "fakes/fakes.h"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;

std::string padded(const std::string &s) { return s + std::string(24 - s.size(), ' '); }

TEST(CharToDouble, ReadsDecimalTextAfterCuttingTrailingSpace) {
  const std::pair<const char *, Outcome> cases[] = {
      {"1.5", okReal(1.5)},        {"1.5 \t\n\r\v\f", okReal(1.5)},
      {"-2.25e2", okReal(-225.0)}, {"+7", okReal(7.0)},
      {"-0", okReal(-0.0)},        {".5", okReal(0.5)},
      {"5.", okReal(5.0)},         {"1e-400", okReal(0.0)},
      {"", fails("11")},           {" \t ", fails("11")},
      {" 1", fails("11")},         {"1e400", fails("11")},
      {"1.5x", fails("11")},       {"e5", fails("11")},
      {"1e", fails("11")},         {"0x10", fails("11")},
      {"nan", fails("11")},        {"1 5", fails("11")},
  };
  for (const auto &[text, want] : cases) {
    EXPECT_EQ(call("CLI_udfCHARTODOUBLE", {orv::test::text(text)}), want) << "'" << text << "'";
  }
}

// DOUBLETOCHAR writes the short notation in 24 bytes: a sign only when
// negative, one digit, the point, up to 14 more digits with no zero at the
// end but the first, "E" and the exponent with no plus sign and no leading
// zero, then blanks.  The text is the double to 15 significant digits, so
// it reads back within half a unit of the 15th digit, and CHARTODOUBLE and
// DOUBLETOCHAR give it back unchanged (but for subnormals, which hold
// fewer digits).
TEST(DoubleToChar, WritesTheShortNotationIn24BytesWhichReadsBack) {
  const std::pair<double, const char *> cases[] = {
      {1.0, "1.0E0"},
      {-1234.5, "-1.2345E3"},
      {0.001, "1.0E-3"},
      {-0.0, "0E0"},
      {123456789012345678.0, "1.23456789012346E17"},
      {-1.23456789012345e-100, "-1.23456789012345E-100"},
      {5e-324, "4.94065645841247E-324"}};
  for (const auto &[x, want] : cases) {
    EXPECT_EQ(call("CLI_udfDOUBLETOCHAR", {f64(x)}), ok(padded(want))) << x;
  }
  const auto shaped = [](const std::string &t) {
    std::size_t i = t[0] == '-' ? 1 : 0;
    const std::size_t e = t.find('E');
    if (e == std::string::npos || e < i + 3 || t[i + 1] != '.') return false;
    for (std::size_t k = i; k < e; ++k) {
      if (k == i + 1) continue;
      if (!std::isdigit(static_cast<unsigned char>(t[k]))) return false;
    }
    if (e - i - 1 > 15 || (t[e - 1] == '0' && e != i + 3)) return false;
    i = e + 1 + (t[e + 1] == '-' ? 1 : 0);
    return i < t.size() && (t[i] != '0' || i + 1 == t.size()) &&
           t.find_first_not_of("0123456789", i) == std::string::npos;
  };
  std::mt19937_64 rng(99);
  for (int i = 0; i < 3000; ++i) {
    const auto x = std::bit_cast<double>(rng());
    if (!std::isfinite(x)) continue;
    const Outcome text = call("CLI_udfDOUBLETOCHAR", {f64(x)});
    const std::string t = text.bytes.substr(0, text.bytes.find(' '));
    ASSERT_TRUE(text.error.empty() && text.bytes == padded(t) && shaped(t)) << text.bytes;
    const double back = std::strtod(t.c_str(), nullptr);
    EXPECT_LE(std::fabs(back - x), std::max(std::fabs(x) * 5e-15, 5e-324)) << t;
    if (std::fabs(x) < 2.2250738585072014e-308) continue;
    const Outcome read = call("CLI_udfCHARTODOUBLE", {orv::test::text(t)});
    EXPECT_EQ(call("CLI_udfDOUBLETOCHAR", {f64(std::bit_cast<double>(read.number))}), text) << t;
  }
}

TEST(CollationName, NamesKnownIdentifiersAndGivesInvalidOtherwise) {
  const auto named = [](const Value &id) { return call("CLI_udfCOLLATIONNAME", {id}); };
  EXPECT_EQ(named(fixed(std::string(8, '\0'))), ok("IDENTITY"));
  EXPECT_EQ(named(fixed(std::string(8, '\xFF'))), ok("INVALID"));
  EXPECT_EQ(named(nullOf(fixed(std::string(8, '\0')))), ok("INVALID"));
  const Outcome icu = named(fixed(std::string("\x01\x00\x00\x02\0\0\0\0", 8)));
  EXPECT_TRUE(icu.bytes.starts_with("ICU_") && icu.bytes.ends_with("_S2")) << icu.bytes;
  EXPECT_EQ(named(fixed(std::string("\x01\xFF\xFF\x02\0\0\0\0", 8))), ok("INVALID"));
}

Outcome name(const char *routine, const char *date, void *dbinfo) {
  return call(routine, {text(date)}, textArea(102), {dbinfo});
}

DatabaseInfo utf8{1208};

// In the stand-in's default locale, en_US.
TEST(Names, GiveTheServersNamesForEachReader) {
  orv::test::unsetEnvironment("ORVENGINE_LOCALE");
  const struct {
    const char *routine, *date;
    Outcome want;
  } cases[] = {
      {"CLI_udfDAYNAME2", "2000-12-31-99.99.99", ok("Sunday")},
      {"CLI_udfDAYNAME1", "2001-01-01 12:00:00", ok("Monday")},
      {"CLI_udfDAYNAME2", "0001-01-01", ok("Monday")},
      {"CLI_udfDAYNAME1", "9999-12-31", ok("Friday")},
      {"CLI_udfMONTHNAME1", "2001-01-31 junk", ok("January")},
      {"CLI_udfMONTHNAME2", "2000-02-29", ok("February")},
      {"CLI_udfDAYNAME1", "2001-03-05 junk", fails("06")},
      {"CLI_udfMONTHNAME2", "2001-03-05 junk", fails("06")},
      {"CLI_udfDAYNAME2", "2001-13-05", fails("04")},
      {"CLI_udfMONTHNAME1", "2001-02-29", fails("04")},
  };
  for (const auto &c : cases) {
    EXPECT_EQ(name(c.routine, c.date, utf8.block), c.want) << c.routine << " " << c.date;
  }
  // Without the block the date is still checked, but no name is fetched.
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-13-05", nullptr), fails("04"));
  EXPECT_EQ(name("CLI_udfMONTHNAME2", "2001-01-05", nullptr), leftAlone());
}

TEST(Names, ConvertIntoTheDatabasesCodePage) {
  orv::test::setEnvironment("ORVENGINE_LOCALE", "de_DE");
  DatabaseInfo latin1{819}, ebcdic{37}, unknown{70000};
  EXPECT_EQ(name("CLI_udfMONTHNAME1", "2001-03-01", utf8.block), ok("M\xC3\xA4rz"));
  EXPECT_EQ(name("CLI_udfMONTHNAME1", "2001-03-01", latin1.block), ok("M\xE4rz"));
  EXPECT_EQ(name("CLI_udfDAYNAME2", "2001-01-07", ebcdic.block),
            ok("\xE2\x96\x95\x95\xA3\x81\x87"));
  EXPECT_EQ(name("CLI_udfDAYNAME2", "2001-01-07", unknown.block).error, "03");
  orv::test::unsetEnvironment("ORVENGINE_LOCALE");
}

// A record: head, tag, length field in the given byte order, string.
std::string record(unsigned char tag, const std::string &text, bool bigEndian = false) {
  std::string r(22, 'H');
  r += static_cast<char>(tag);
  const std::size_t width = tag == 0x4B ? 1 : tag == 0x8B ? 2 : 4;
  for (std::size_t i = 0; i < width; ++i) {
    const std::size_t shift = 8 * (bigEndian ? width - 1 - i : i);
    r += static_cast<char>((text.size() >> shift) & 0xFF);
  }
  return r + text;
}

const char *const kSmall = "CLI_udfVEBLOB_CP_SMALL";

Outcome copy(const Value &object, std::int32_t from, std::int32_t to, std::int32_t order = 0,
             const char *routine = "CLI_udfVEBLOB_CP_LARGE") {
  return call(routine, {object, i32(from), i32(to), i32(order)});
}

// A copy, which sets the result indicator to 1, and a refusal, which
// leaves it alone.
Outcome copied(std::string data) { return {"", std::move(data), 0, false, false, 1}; }
Outcome refused(const std::string &status) {
  return {status + "/sqlocpcv", "", 0, false, false, 0x5A5A};
}

TEST(VeblobCopy, ConvertsEachStringAndRewritesItsLengthOrRefuses) {
  EXPECT_EQ(copy(nullOf(lob("")), 819, 1208), leftAlone(-1));
  const std::string two = record(0x8B, "\xE4\xE4", true) + record(0xCB, "\xFC", true);
  std::string unknownTag = record(0x4B, "ab");
  unknownTag[22] = 0x11;
  // The space for each string is the object's size; a converted string
  // longer than that fails, and one longer than its 8-bit field can say.
  const std::string grows = record(0x4B, std::string(200, '\xE4'));
  const std::string cut = record(0xCB, "abcdef");
  const struct {
    std::string object;
    std::int32_t from, to, order;
    Outcome want;
  } cases[] = {
      {std::string(22, 'H'), 819, 1208, 0, copied("")},
      {record(0x4B, ""), 819, 1208, 0, copied(record(0x4B, ""))},
      {record(0x4B, "M\xE4rz"), 819, 1208, 0, copied(record(0x4B, "M\xC3\xA4rz"))},
      // Two records, 16- and 32-bit fields, the second in the object's order.
      {two, 819, 1208, -1,
       copied(record(0x8B, "\xC3\xA4\xC3\xA4", true) + record(0xCB, "\xC3\xBC", true))},
      {two, 819, 819, 1, copied(two)},  // 1 swaps as -1 does
      // Bytes behind the last whole record are dropped.
      {record(0x4B, "ab") + "HHHH", 1208, 1208, 0, copied(record(0x4B, "ab"))},
      {record(0x4B, "ab") + std::string(22, 'H'), 1208, 1208, 0, copied(record(0x4B, "ab"))},
      {unknownTag, 1208, 1208, 0, refused("38603")},
      {record(0x4B, "\xFF"), 1208, 819, 0, refused("38602")},
      {grows, 819, 1208, 0, refused("38602")},
      {grows + record(0x4B, std::string(250, 'a')), 819, 1208, 0, refused("38601")},
      // Lengths and strings that run past the end of the object.
      {cut.substr(0, cut.size() - 2), 1208, 1208, 0, refused("38603")},
      {cut.substr(0, 25), 1208, 1208, 0, refused("38603")},
  };
  for (const auto &c : cases) {
    EXPECT_EQ(copy(lob(c.object), c.from, c.to, c.order), c.want)
        << ::testing::PrintToString(c.object);
  }
}

// Many code pages in turn on one thread: opening a conversion's target must
// never close its source (the stand-in keeps a few converters per thread).
TEST(VeblobCopy, RoundTripsThroughManyCodePagesInTurn) {
  const std::string text = record(0x4B, "Marz 2001");
  for (int round = 0; round < 3; ++round) {
    for (const std::int32_t page : {1252, 37, 1208, 1200, 1202, 13488, 13490, 17584, 17586, 819}) {
      const Outcome there = copy(lob(text), 819, page);
      ASSERT_EQ(there.error, "") << page;
      EXPECT_EQ(copy(lob(there.bytes), page, 819), copied(text)) << page;
    }
  }
}

// A copy of the library linked to fake services (tests/fakes), for what
// the routines hand each service and what they do when it fails.
class Fakes : public ::testing::Test {
 protected:
  void SetUp() override {
    fakes = orvFreshFakes();
    ASSERT_NE(fakes, nullptr) << loaderError();
  }
  LibraryInUse use{ORV_FAKES_LIBRARY_PATH};
  OrvFakes *fakes = nullptr;
};

TEST_F(Fakes, NamesFillOneFieldOfTheTimeRecordAndFailWithTheServiceOrTheConversion) {
  CLI_nlsTimeRecord december{}, saturday{};
  december.month = 11;
  saturday.dayOfWeek = 6;
  EXPECT_EQ(name("CLI_udfMONTHNAME1", "2001-12-01", utf8.block), ok("Sunday"));
  EXPECT_EQ(std::memcmp(&fakes->lastTime, &december, sizeof december), 0);
  EXPECT_EQ(fakes->lastNameSize, 101u);
  name("CLI_udfDAYNAME2", "2001-01-06", utf8.block);
  EXPECT_EQ(std::memcmp(&fakes->lastTime, &saturday, sizeof saturday), 0);
  EXPECT_EQ(fakes->convertCalls, 0);  // the name was in the database's code page
  DatabaseInfo wide(70000);
  fakes->nameLength = 0;
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-01-07", utf8.block), fails("03"));
  fakes->nameLength = 102;  // more than the buffer holds
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-01-07", utf8.block), fails("03"));
  fakes->nameLength = 101;
  std::memset(fakes->name, 'n', 101);
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-01-07", utf8.block), ok(std::string(101, 'n')));
  // A code page above 65535 never equals the name's: the name is converted.
  fakes->nameLength = 6;
  std::memcpy(fakes->name, "Sunday", 6);
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-01-07", wide.block), ok("Sunday"));
  const CLI_conversionRecord &r = fakes->lastRecord;
  EXPECT_EQ(r.space, 101u);
  EXPECT_TRUE(r.fixed20 == 0 && r.fixed24 == 0 && r.fixed25 == 0 && r.fixed26 == 1 &&
              r.fixed27 == 1 && r.fixed28 == 1 && r.fixed29 == 0 && r.fixed30 == 0xFFFF);
  EXPECT_EQ(fakes->lastSourceCodePage, 1208u);
  EXPECT_EQ(fakes->lastTargetCodePage, 70000u);
  // Any status but 0 fails, positive ones too; what was written stays, terminated.
  fakes->convertStatus = 5;
  fakes->convertBytes = 3;
  EXPECT_EQ(name("CLI_udfDAYNAME1", "2001-01-07", wide.block), failsLeaving("03", "Sun"));
}

TEST_F(Fakes, CollationNameTakesTheServicesLength) {
  const auto named = [&] { return call("CLI_udfCOLLATIONNAME", {fixed(std::string(8, '\x07'))}); };
  EXPECT_EQ(named(), ok("NAME"));
  EXPECT_EQ(fakes->lastCollationSize, 129u);
  for (std::int32_t length : {0, -1, 129}) {
    fakes->collationLength = length;
    EXPECT_EQ(named(), ok("INVALID")) << length;
  }
  const int calls = fakes->collationCalls;
  call("CLI_udfCOLLATIONNAME", {nullOf(fixed(std::string(8, '\0')))});
  EXPECT_EQ(fakes->collationCalls, calls);
}

TEST_F(Fakes, NumberTextHandsOverTheTrimmedLengthAndShortensTheRawText) {
  fakes->a2fValue = 2.5;
  EXPECT_EQ(call("CLI_udfCHARTODOUBLE", {text("12 \t\n")}), okReal(2.5));
  EXPECT_EQ(fakes->lastA2fLength, 2u);
  fakes->a2fStatus = -4;
  EXPECT_EQ(call("CLI_udfCHARTODOUBLE", {text("12")}), fails("11"));
  const std::pair<const char *, const char *> raw[] = {
      {"+1.00000000000000E+000", "1.0E0"},
      {"-9.87654321098765E-099", "-9.87654321098765E-99"},
      {"+5.00000000000000E+300", "5.0E300"},
  };
  for (const auto &[in, out] : raw) {
    std::memcpy(fakes->rawText, in, 23);
    EXPECT_EQ(call("CLI_udfDOUBLETOCHAR", {f64(1.0)}), ok(padded(out))) << in;
  }
}

TEST_F(Fakes, VeblobTakesPositiveStatusesAsSuccess) {
  fakes->convertStatus = 4;
  EXPECT_EQ(copy(lob(record(0xCB, "sss")), 819, 1208), copied(record(0xCB, "sss")));
  EXPECT_EQ(fakes->lastRecord.space, 30u);  // the object's size
}

// The room a copy asks for is the string's length times the factor of its
// pair of code pages (for a UTF-16 or 1232/1234 source, by the target's
// encoding class).  SMALL holds 500000 bytes and a one-record object's data
// starts at byte 27, so with the fake conversion, which copies, n bytes fit
// while 27 + n * factor < 500000; one more is refused before converting.
TEST_F(Fakes, VeblobAsksForTheRoomOfEachPairOfCodePages) {
  const struct {
    std::int32_t from, to, encodingClass, factor;
  } pairs[] = {
      {1208, 1208, 1, 1}, {37, 0, 1, 1},      {0, 1208, 1, 1},     {1208, 819, 1, 2},
      {1208, 1200, 1, 2}, {1208, 1234, 1, 1}, {1208, 37, 1, 3},    {819, 1208, 1, 1},
      {1252, 1200, 1, 1}, {954, 1208, 1, 2},  {964, 37, 1, 2},     {1200, 13488, 1, 1},
      {1202, 1204, 1, 1}, {1200, 37, 2, 1},   {17586, 37, 9, 1},   {1200, 37, 1, 2},
      {1232, 1202, 1, 2}, {1234, 1204, 1, 2}, {1232, 1236, 1, 1},  {1232, 37, 2, 2},
      {1234, 37, 1, 4},   {1392, 1208, 1, 4}, {5488, 17584, 1, 2}, {1392, 1204, 1, 2},
      {5488, 37, 1, 1},   {932, 1208, 1, 2},  {5039, 37, 1, 1},    {437, 1208, 1, 1},
  };
  for (const auto &p : pairs) {
    fakes->encodingClass = p.encodingClass;
    const std::size_t longest = 499972 / static_cast<std::size_t>(p.factor);
    const std::string fits = record(0xCB, std::string(longest, 's'));
    EXPECT_EQ(copy(lob(fits), p.from, p.to, 0, kSmall), copied(fits)) << p.from << " to " << p.to;
    const int calls = fakes->convertCalls;
    EXPECT_EQ(copy(lob(record(0xCB, std::string(longest + 1, 's'))), p.from, p.to, 0, kSmall),
              refused("38601"))
        << p.from << " to " << p.to;
    EXPECT_EQ(fakes->convertCalls, calls);
  }
}

}  // namespace
