// The failure paths that only the engine's services can take, against a
// copy of the library linked to fake services (tests/fakes): what the
// routines hand each service, and what they do when it fails.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "fakes/fakes.h"
#include "frame/cliudf.h"
#include "frame/table_call.hpp"
#include "snapshot.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using namespace orv::test;

class Fakes : public ::testing::Test {
 protected:
  void SetUp() override {
    using Get = OrvFakes *(*)();
    using Reset = void (*)();
    // The control block is the fake services' own, not the library's.
    void *services = openLibrary(ORV_FAKE_SERVICES_PATH);
    ASSERT_NE(services, nullptr) << loaderError();
    fakes = reinterpret_cast<Get>(findExport(services, "orv_fakes"))();
    reinterpret_cast<Reset>(findExport(services, "orv_fakes_reset"))();
  }
  LibraryInUse use{ORV_FAKES_LIBRARY_PATH};
  OrvFakes *fakes = nullptr;
};

// ---- Names -----------------------------------------------------------------

TEST_F(Fakes, NamesFillOneFieldOfTheTimeRecord) {
  DatabaseInfo utf8(1208);
  const CLI_nlsTimeRecord zero{};
  EXPECT_EQ(call("CLI_udfMONTHNAME1", {text("2001-12-01")}, textArea(102), {utf8.block}),
            ok("Sunday"));
  CLI_nlsTimeRecord want = zero;
  want.month = 11;
  EXPECT_EQ(std::memcmp(&fakes->lastTime, &want, sizeof want), 0);
  EXPECT_EQ(fakes->lastNameSize, 101u);
  call("CLI_udfDAYNAME2", {text("2001-01-06")}, textArea(102), {utf8.block});
  want = zero;
  want.dayOfWeek = 6;
  EXPECT_EQ(std::memcmp(&fakes->lastTime, &want, sizeof want), 0);
  EXPECT_EQ(fakes->convertCalls, 0);  // the name was in the database's code page
}

TEST_F(Fakes, NamesFailWithTheNameServiceAndTheConversion) {
  DatabaseInfo utf8(1208), wide(70000);
  fakes->nameLength = 0;
  EXPECT_EQ(call("CLI_udfDAYNAME1", {text("2001-01-07")}, textArea(102), {utf8.block}),
            fails("03"));
  fakes->nameLength = 102;  // more than the buffer holds
  EXPECT_EQ(call("CLI_udfDAYNAME1", {text("2001-01-07")}, textArea(102), {utf8.block}),
            fails("03"));
  fakes->nameLength = 101;
  std::memset(fakes->name, 'n', 101);
  EXPECT_EQ(call("CLI_udfDAYNAME1", {text("2001-01-07")}, textArea(102), {utf8.block}),
            ok(std::string(101, 'n')));
  // A code page above 65535 never equals the name's: the name is converted.
  fakes->nameLength = 6;
  std::memcpy(fakes->name, "Sunday", 6);
  EXPECT_EQ(call("CLI_udfDAYNAME1", {text("2001-01-07")}, textArea(102), {wide.block}),
            ok("Sunday"));
  const CLI_conversionRecord &r = fakes->lastRecord;
  EXPECT_EQ(r.space, 101u);
  EXPECT_TRUE(r.fixed20 == 0 && r.fixed24 == 0 && r.fixed25 == 0 && r.fixed26 == 1 &&
              r.fixed27 == 1 && r.fixed28 == 1 && r.fixed29 == 0 && r.fixed30 == 0xFFFF);
  EXPECT_EQ(fakes->lastSourceCodePage, 1208u);
  EXPECT_EQ(fakes->lastTargetCodePage, 70000u);
  // Any status but 0 fails, positive ones too; what was written stays, terminated.
  fakes->convertStatus = 5;
  fakes->convertBytes = 3;
  EXPECT_EQ(call("CLI_udfDAYNAME1", {text("2001-01-07")}, textArea(102), {wide.block}),
            failsLeaving("03", "Sun"));
}

// ---- Collation names and number text ------------------------------------------

TEST_F(Fakes, CollationNameTakesTheServicesLength) {
  const auto named = [&] {
    return callNullable("CLI_udfCOLLATIONNAME", {fixed(std::string(8, '\x07'))}, textArea(129));
  };
  EXPECT_EQ(named(), ok("NAME"));
  EXPECT_EQ(fakes->lastCollationSize, 129u);
  for (std::int32_t length : {0, -1, 129}) {
    fakes->collationLength = length;
    EXPECT_EQ(named(), ok("INVALID")) << length;
  }
  const int calls = fakes->collationCalls;
  callNullable("CLI_udfCOLLATIONNAME", {nullOf(fixed(std::string(8, '\0')))}, textArea(129));
  EXPECT_EQ(fakes->collationCalls, calls);
}

TEST_F(Fakes, NumberTextHandsOverTheTrimmedLengthAndShortensTheRawText) {
  fakes->a2fValue = 2.5;
  EXPECT_EQ(call("CLI_udfCHARTODOUBLE", {text("12 \t\n")}, numberArea(Value::Layout::real)),
            okReal(2.5));
  EXPECT_EQ(fakes->lastA2fLength, 2u);
  fakes->a2fStatus = -4;
  EXPECT_EQ(call("CLI_udfCHARTODOUBLE", {text("12")}, numberArea(Value::Layout::real)),
            fails("11"));
  const std::pair<const char *, const char *> raw[] = {
      {"+1.00000000000000E+000", "1.0E0"},
      {"-9.87654321098765E-099", "-9.87654321098765E-99"},
      {"+5.00000000000000E+300", "5.0E300"},
  };
  for (const auto &[in, out] : raw) {
    std::memcpy(fakes->rawText, in, 23);
    EXPECT_EQ(call("CLI_udfDOUBLETOCHAR", {f64(1.0)}, fixedArea(24)).bytes,
              std::string(out) + std::string(24 - std::strlen(out), ' '))
        << in;
  }
}

// ---- VEBLOB_CP ------------------------------------------------------------------

// The object of one record with a 32-bit length field and `n` bytes.
std::string oneRecord(std::size_t n) {
  std::string r(22, 'H');
  r += '\xCB';
  const auto length = static_cast<std::uint32_t>(n);
  r.append(reinterpret_cast<const char *>(&length), 4);
  return r + std::string(n, 's');
}

TEST_F(Fakes, VeblobTakesPositiveStatusesAsSuccessAndAsksTheEncodingClass) {
  const auto copy = [&](const char *routine, std::size_t n, std::int32_t from, std::int32_t to) {
    return callNullable(routine, {lob(oneRecord(n)), i32(from), i32(to), i32(0)}, lobArea(1000000));
  };
  fakes->convertStatus = 4;
  Outcome got = copy("CLI_udfVEBLOB_CP_LARGE", 3, 819, 1208);
  EXPECT_EQ(got.bytes, oneRecord(3));
  EXPECT_EQ(got.indicator, 1);
  EXPECT_EQ(fakes->lastRecord.space, 30u);  // the object's size
  // UTF-16 to a class-2 code page may not grow (factor 1); to another class
  // it may double (factor 2): 300000 bytes then pass SMALL's room test or not.
  fakes->convertStatus = 0;
  fakes->encodingClass = 2;
  EXPECT_EQ(copy("CLI_udfVEBLOB_CP_SMALL", 300000, 1200, 37).indicator, 1);
  fakes->encodingClass = 1;
  const int calls = fakes->convertCalls;
  EXPECT_EQ(copy("CLI_udfVEBLOB_CP_SMALL", 300000, 1200, 37).error, "38601/sqlocpcv");
  EXPECT_EQ(fakes->convertCalls, calls);  // refused before converting
}

// ---- SQLCACHE_SNAPSHOT ---------------------------------------------------------

class FakeSnapshot : public Fakes {
 protected:
  void SetUp() override {
    Fakes::SetUp();
    dir = std::filesystem::temp_directory_path() / ("orv_fakes_" + std::to_string(processId()));
    std::filesystem::create_directories(dir / "tmp");
    std::snprintf(fakes->instancePath, sizeof fakes->instancePath, "%s", dir.string().c_str());
    const cli::catalogue::Routine *routine = cli::catalogue::find("SQLCACHE_SNAPSHOT");
    ASSERT_NE(routine, nullptr);
    table.emplace(*routine, exportAddress("SQLCACHE_SNAPSHOT"));
  }
  void TearDown() override { std::filesystem::remove_all(dir); }
  void write(const std::string &stream) {
    std::ofstream(dir / "tmp" / "cache.sql", std::ios::binary) << stream;
  }
  // The SQLSTATE of one call.
  std::string step(std::int32_t callType) {
    table->step(callType);
    const char *sqlstate = table->status().sqlstate;
    return {sqlstate, ::strnlen(sqlstate, sizeof table->status().sqlstate)};
  }
  // Rows until the table ends.
  int rows() {
    zeroScratchpad();
    step(CLI_CALL_OPEN);
    int n = 0;
    while (n < 200000 && step(CLI_CALL_FETCH).empty()) ++n;
    step(CLI_CALL_CLOSE);
    return n;
  }
  // A fresh scratchpad, as the engine gives before an open.
  void zeroScratchpad() {
    std::memset(table->scratchpad(), 0, cli::call::TableCall::kScratchpadSize);
  }
  std::filesystem::path dir;
  std::optional<cli::call::TableCall> table;
};

TEST_F(FakeSnapshot, EndsTheTableOnAFailedReadInEachStepOfTheSectionScan) {
  using namespace orv::snapshot;
  // Statement first, so that the scan skips it and goes back to it.
  const Statement st{{}, "s"};
  write(element(30, "") + statement(st) + element(321, "T") + element(322, "dd"));
  ASSERT_EQ(rows(), 1);
  // Reads in order: 30, the statement's header, 321 and its text, 322 and its
  // data, the statement's header again, the last byte of its data (to see
  // that the file holds it), then its data.
  for (int failing = 1; failing <= 9; ++failing) {
    fakes->reads = 0;
    fakes->failReadAt = failing;
    EXPECT_EQ(rows(), 0) << "read " << failing;
  }
  fakes->failReadAt = 0;
  fakes->seekFails = 1;
  EXPECT_EQ(rows(), 0);
}

TEST_F(FakeSnapshot, LogsAFailedAllocationAndKeepsNoBlock) {
  write(orv::snapshot::statement({{}, "s"}));
  fakes->allocationStatus = 7;
  zeroScratchpad();
  step(CLI_CALL_OPEN);
  EXPECT_EQ(step(CLI_CALL_FETCH), "02000");
  EXPECT_EQ(fakes->logCalls, 1);
  EXPECT_STREQ(fakes->logMessage, "SQLCACHE_SNAPSHOT: unable to allocate temporary sqlcache stmt");
  EXPECT_EQ(fakes->logStatus, 7);
  step(CLI_CALL_CLOSE);
  EXPECT_EQ(fakes->frees, 0);
  EXPECT_EQ(fakes->closes, 1);
}

// A statement that claims more than the rest of the file is refused before
// a block is asked for, and logged as a block that can't be had; the block
// of the statements before it goes back as it does before any new block.
TEST_F(FakeSnapshot, RefusesAStatementLargerThanTheFileAndLogsIt) {
  std::string huge = orv::snapshot::element(19, "12345678");
  huge.replace(0, 4, "\xF0\xFF\xFF\xDD", 4);  // 3.7 GB in a file of a few bytes
  write(orv::snapshot::statement({{}, "s"}) + huge);
  zeroScratchpad();
  step(CLI_CALL_OPEN);
  EXPECT_EQ(step(CLI_CALL_FETCH), "");
  EXPECT_EQ(step(CLI_CALL_FETCH), "02000");
  EXPECT_EQ(fakes->logCalls, 1);
  EXPECT_STREQ(fakes->logMessage, "SQLCACHE_SNAPSHOT: unable to allocate temporary sqlcache stmt");
  EXPECT_EQ(fakes->logStatus, -1);
  EXPECT_EQ(fakes->allocations, 1);
  EXPECT_EQ(fakes->frees, 1);
  step(CLI_CALL_CLOSE);
  EXPECT_EQ(fakes->frees, 1);
  EXPECT_EQ(fakes->closes, 1);
}

// The static data is asked for once on every entry, open included.
TEST_F(FakeSnapshot, AsksForTheStaticDataOncePerCall) {
  write(orv::snapshot::statement({{}, "s"}));
  zeroScratchpad();
  for (const std::int32_t type : {CLI_CALL_OPEN, CLI_CALL_FETCH, CLI_CALL_FETCH, CLI_CALL_CLOSE}) {
    fakes->staticDataCalls = 0;
    step(type);
    EXPECT_EQ(fakes->staticDataCalls, 1) << "call type " << type;
  }
}

TEST_F(FakeSnapshot, NeedsNoInstancePathOrFileToCloseCleanly) {
  fakes->instanceStatus = 3;
  zeroScratchpad();
  EXPECT_EQ(step(CLI_CALL_OPEN), "02000");
  EXPECT_EQ(step(CLI_CALL_FETCH), "02000");
  step(CLI_CALL_CLOSE);
  EXPECT_EQ(fakes->opens + fakes->closes, 0);
}

// One block serves a whole scan: it is replaced only by a larger one.
TEST_F(FakeSnapshot, AllocatesOnlyForNewLargestStatements) {
  std::string stream;
  int largest = 0, expected = 0;
  for (int i = 0; i < 100000; ++i) {
    const int size = (i * 7919) % 97;
    if (size > largest || i == 0) {
      largest = size;
      ++expected;
    }
    stream += orv::snapshot::statement({{}, std::string(static_cast<std::size_t>(size), 'q')});
  }
  write(stream);
  EXPECT_EQ(rows(), 100000);
  EXPECT_EQ(fakes->allocations, expected);
  EXPECT_EQ(fakes->frees, expected);
}

}  // namespace
