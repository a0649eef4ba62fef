// The table functions driven through open, fetch and close: the Fmp tables
// with a callback in the engine's part, SQLCACHE_SNAPSHOT over written files.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "engine/services.h"
#include "fakes/fakes.h"
#include "frame/cliudf.h"
#include "frame/table_call.hpp"
#include "models/snapshot.hpp"
#include "snapshot.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

namespace {

using orv::test::exportAddress;
namespace fs = std::filesystem;
using namespace orv::snapshot;

// The engine's side: its answers to open and close, and what it was asked.
struct Engine {
  std::int32_t openStatus = 0, closeStatus = 0, count = 0;
  std::vector<unsigned char> table;
  std::vector<std::int32_t> codes;    // request codes, in order
  std::vector<std::int32_t> inputs;   // FmpThreads' input value on open
  std::vector<std::uint64_t> closed;  // table pointers handed back
};
Engine *engine = nullptr;

std::int32_t *numberAt(std::uint64_t slot) {
  std::int32_t *p = nullptr;
  std::memcpy(&p, &slot, sizeof p);
  return p;
}

std::int32_t callback(std::int32_t slots, void *request) {
  auto *slot = static_cast<std::uint64_t *>(request);
  const std::int32_t code = *numberAt(slot[0]);
  engine->codes.push_back(code);
  if (code == 1) {
    EXPECT_EQ(slots, 2);
    engine->closed.push_back(slot[1]);
    return engine->closeStatus;
  }
  const bool threads = code == 3;
  EXPECT_EQ(slots, threads ? 4 : 3);
  if (threads) engine->inputs.push_back(*numberAt(slot[1]));
  std::int32_t *count = numberAt(slot[threads ? 2 : 1]);
  EXPECT_EQ(*count, 0);
  EXPECT_EQ(slot[threads ? 3 : 2], 0u);
  *count = engine->count;
  slot[threads ? 3 : 2] = reinterpret_cast<std::uintptr_t>(engine->table.data());
  return engine->openStatus;
}

struct Call {
  std::string sqlstate, message;
  std::array<std::int64_t, 6> row{};
  std::array<std::int16_t, 6> indicators{};
};

// FmpThreads gives six 32-bit columns, FmpRows two and then four 16-bit
// ones; each keeps its scratchpad from call to call.
class Tables : public ::testing::Test {
 protected:
  void SetUp() override { engine = &fake; }
  void TearDown() override { engine = nullptr; }

  // `selector` is FmpThreads' one input; FmpRows has none.
  Call run(bool threads, std::int32_t callType, std::int32_t selector = 7) {
    cli::call::TableCall &t = threads ? fmpThreads : fmpRows;
    if (threads) t.setInput(0, &selector);
    t.step(callType);
    Call c{t.status().sqlstate, t.status().message};
    for (std::size_t i = 0; i < 6; ++i) {
      c.row[i] = t.number(i);
      c.indicators[i] = t.indicator(i);
    }
    return c;
  }

  Engine fake;
  cli::call::TableCall fmpThreads{*cli::catalogue::find("CLI_udfFmpThreads"),
                                  exportAddress("CLI_udfFmpThreads"), callback, 0x5A5A};
  cli::call::TableCall fmpRows{*cli::catalogue::find("CLI_udfFmpRows"),
                               exportAddress("CLI_udfFmpRows"), callback, 0x5A5A};
};

std::vector<unsigned char> words(std::initializer_list<std::int32_t> values) {
  std::vector<unsigned char> out(values.size() * 4);
  std::size_t i = 0;
  for (std::int32_t v : values) std::memcpy(out.data() + 4 * i++, &v, 4);
  return out;
}

TEST_F(Tables, ThreadsDeliverEachRowThenEndAndGiveTheTableBack) {
  fake.count = 2;
  fake.table = words({99, 1, 2, 3, 4, 5, 6, 99, -1, -2, -3, -4, -5, -6});
  EXPECT_EQ(run(true, CLI_CALL_OPEN, 42).sqlstate, "");
  EXPECT_EQ(fake.inputs, std::vector<std::int32_t>{42});
  const Call first = run(true, CLI_CALL_FETCH), second = run(true, CLI_CALL_FETCH);
  EXPECT_EQ(first.row, (std::array<std::int64_t, 6>{1, 2, 3, 4, 5, 6}));
  EXPECT_EQ(second.row, (std::array<std::int64_t, 6>{-1, -2, -3, -4, -5, -6}));
  EXPECT_EQ(first.indicators, (std::array<std::int16_t, 6>{}));
  for (int i = 0; i < 2; ++i) {
    const Call end = run(true, CLI_CALL_FETCH);
    EXPECT_EQ(end.sqlstate, "02000");
    EXPECT_EQ(end.indicators[0], 0x5A5A);
  }
  EXPECT_EQ(run(true, 7).sqlstate, "");  // an unknown call type does nothing
  EXPECT_EQ(run(true, CLI_CALL_CLOSE).sqlstate, "");
  EXPECT_EQ(fake.closed,
            std::vector<std::uint64_t>{reinterpret_cast<std::uintptr_t>(fake.table.data())});
  EXPECT_EQ(fake.codes, (std::vector<std::int32_t>{3, 1}));
  run(true, CLI_CALL_CLOSE);  // no table held: no close request
  EXPECT_EQ(fake.codes.size(), 2u);
}

// Status -3 on open is an empty table to FmpThreads and a failure to FmpRows,
// whose 16-bit columns widen as unsigned.
TEST_F(Tables, ReportFailedCallbacksWithTheirStatusAndRowsWidenTheirBytes) {
  fake.openStatus = -3;
  fake.count = 5;  // and a table pointer left in the record
  fake.table = {1, 0, 0, 0, 2, 0, 0, 0, 0xFF, 0xFF, 4, 0, 0xFF, 0x80, 9, 9};
  EXPECT_EQ(run(true, CLI_CALL_OPEN).sqlstate, "");
  EXPECT_EQ(run(true, CLI_CALL_FETCH).sqlstate, "02000");
  run(true, CLI_CALL_CLOSE);
  EXPECT_EQ(fake.codes, (std::vector<std::int32_t>{3, 1}));
  const Call rows = run(false, CLI_CALL_OPEN);
  EXPECT_EQ(rows.sqlstate + "|" + rows.message, "38620|API call failed -3");
  EXPECT_EQ(run(false, CLI_CALL_FETCH).sqlstate, "02000");  // no table: nothing is read
  fake.openStatus = 5;
  const Call threads = run(true, CLI_CALL_OPEN);
  EXPECT_EQ(threads.sqlstate + "|" + threads.message, "38620|API call failed 5");
  fake.openStatus = 0;
  fake.count = 1;
  fake.closeStatus = -2147483647 - 1;
  run(false, CLI_CALL_OPEN);
  EXPECT_EQ(run(false, CLI_CALL_FETCH).row, (std::array<std::int64_t, 6>{1, 2, -1, 4, 255, 128}));
  EXPECT_EQ(run(false, CLI_CALL_FETCH).sqlstate, "02000");
  const Call close = run(false, CLI_CALL_CLOSE);
  EXPECT_EQ(close.sqlstate + "|" + close.message, "38660|API call failed -2147483648");
  run(false, CLI_CALL_CLOSE);         // the pointer was cleared all the same
  EXPECT_EQ(fake.closed.size(), 2u);  // FmpThreads' and the first
}

// What each result indicator holds before a call, to see which of them
// the routine writes.
constexpr std::int16_t kUnset = 0x5A5A;

struct Row {
  std::array<std::int32_t, 16> columns{};
  std::string text;       // column 17
  std::string statement;  // column 18
  std::array<std::int16_t, 18> indicators{};
};

// SQLCACHE_SNAPSHOT of the library at `library`, over a folder of its own.
class Snapshot : public ::testing::Test {
 protected:
  explicit Snapshot(const char *library = ORV_LIBRARY_PATH) : use(library) {}
  void SetUp() override {
    fs::create_directories(dir / "tmp");
    orv::test::setEnvironment("ORVENGINE_INSTANCE_PATH", dir.string().c_str());
    orv::test::setEnvironment("ORVENGINE_SNAPSHOT_NAME", "cache");
  }
  void TearDown() override {
    fs::remove_all(dir);
    orv::test::unsetEnvironment("ORVENGINE_INSTANCE_PATH");
    orv::test::unsetEnvironment("ORVENGINE_SNAPSHOT_NAME");
  }
  void write(const std::string &stream) {
    std::ofstream(dir / "tmp" / "cache.sql", std::ios::binary) << stream;
  }

  // One call; a fetch's row is returned with the SQLSTATE it stored.  The
  // number columns hold -7 and column 17 "unset" before it, so that a
  // column the routine leaves alone shows.
  std::pair<Row, std::string> call(std::int32_t callType) {
    cli::call::TableCall &t = table;
    const std::int32_t unset = -7;
    for (std::size_t i = 0; i < 16; ++i) std::memcpy(t.area(i), &unset, sizeof unset);
    std::memset(t.area(16), 0, cli::call::areaSize(t.row().results[16]));
    std::memcpy(t.area(16), "unset", 5);
    // An open is on a zero-filled scratchpad, as the engine gives it.
    if (callType == CLI_CALL_OPEN) {
      static_cast<void>(t.open());
    } else {
      t.step(callType);
    }
    Row row;
    for (std::size_t i = 0; i < 16; ++i) row.columns[i] = static_cast<std::int32_t>(t.number(i));
    row.text = t.text(16);
    if (t.indicator(17) == 0) row.statement = t.text(17);
    for (std::size_t i = 0; i < 18; ++i) row.indicators[i] = t.indicator(i);
    const char *sqlstate = t.status().sqlstate;
    return {row, std::string(sqlstate, ::strnlen(sqlstate, sizeof t.status().sqlstate))};
  }

  // Opens, fetches until the table ends (or a limit, should it never), closes.
  std::vector<Row> rows() {
    std::vector<Row> out;
    EXPECT_EQ(openTable(), "");
    for (std::size_t i = 0; i < 200000; ++i) {
      auto [row, state] = call(CLI_CALL_FETCH);
      if (state == "02000") break;
      EXPECT_EQ(state, "");
      out.push_back(row);
    }
    call(CLI_CALL_CLOSE);
    return out;
  }

  std::vector<std::string> texts() {
    std::vector<std::string> out;
    for (const Row &r : rows()) out.push_back(r.text + ":" + r.statement);
    return out;
  }

  std::string openTable() { return call(CLI_CALL_OPEN).second; }

  orv::test::LibraryInUse use;
  fs::path dir =
      fs::temp_directory_path() / ("orv_snapshot_" + std::to_string(orv::test::processId()));
  cli::call::TableCall table{*cli::catalogue::find("SQLCACHE_SNAPSHOT"),
                             orv::test::exportAddress("SQLCACHE_SNAPSHOT"), nullptr, kUnset};
};

Statement numbered(std::int32_t base, std::string text) {
  Statement s;
  for (std::size_t i = 0; i < 16; ++i) s.columns[i] = base + static_cast<std::int32_t>(i);
  s.text = std::move(text);
  return s;
}

TEST_F(Snapshot, DeliversEveryColumnOfEachStatementAndPairsAtOddOffsets) {
  write(section("PKG1") + statement(numbered(100, "SELECT 1")) +
        statement(numbered(-200, std::string("x\0y", 3))));
  const std::vector<Row> got = rows();
  ASSERT_EQ(got.size(), 2u);
  EXPECT_EQ(got[0].columns, numbered(100, "").columns);
  EXPECT_EQ(got[1].columns, numbered(-200, "").columns);
  EXPECT_EQ(got[1].statement, std::string("x\0y", 3));
  EXPECT_EQ(got[0].text, "PKG1");
  for (std::size_t i = 0; i < 18; ++i) {
    EXPECT_EQ(got[0].indicators[i], i == 16 ? 0x5A5A : 0) << "column " << i + 1;
  }
  // Elements lie packed at any byte offset: a pair element behind an unknown
  // one of odd length still gives its two children.
  std::string pair =
      element(300, std::string("\x05\0\0\0", 4)) + element(301, std::string("\x06\0\0\0", 4));
  write(element(19, element(9999, "odd") + element(229, pair) + element(312, "s")));
  const std::vector<Row> odd = rows();
  ASSERT_EQ(odd.size(), 1u);
  EXPECT_EQ(odd[0].columns[10], 5);
  EXPECT_EQ(odd[0].columns[11], 6);
  EXPECT_EQ(odd[0].statement, "s");
}

// Streams that break their limits end the table; nothing outside the
// areas is read or written.
TEST_F(Snapshot, ReadsSectionsInEveryOrderAndEndsOnHostileStreams) {
  const auto st = [](const char *text) { return statement(numbered(1, text)); };
  std::string lying = element(19, element(554, "1234"));
  lying[8] = 100;  // an inner element that claims more than its statement holds
  const struct {
    std::string stream;
    std::vector<std::string> want;
  } cases[] = {
      {"", {}},
      {st("a"), {":a"}},  // no section: column 17 is empty
      {section("S1") + st("a") + st("b"), {"S1:a", "S1:b"}},
      // Statements before the section's text and data are read after them.
      {element(30, "") + st("a") + st("b") + element(321, "S2") + element(322, "dd") + st("c"),
       {"S2:a", "S2:b"}},
      {section("S1") + section("S2") + st("a"), {}},
      {section("LONGTEXT") + st("a") + section("S") + st("b"), {"LONGTEXT:a", "S:b"}},
      {section("S1") + st("a") + element(77, "") + st("b"), {"S1:a"}},
      {st("a") + element(19, element(9999, "zz") + element(312, "kept")), {":a", ":kept"}},
      {element(30, "") + element(321, "NINEBYTES") + element(322, "") + st("a"), {}},
      {element(30, "") + element(321, "S") + element(322, std::string(265, 'd')) + st("a"), {}},
      {element(19, element(554, "12345678") + element(540, "1")), {}},  // too short for its column
      {element(19, element(229, element(300, "1234"))), {}},            // no child 301
      {element(19, element(554, "1234").substr(0, 6)), {}},             // a header cut short
      {element(19, element(312, std::string(1048576, 's'))), {}},       // no room for the NUL
      {st("a").substr(0, st("a").size() - 1), {}},                      // the file ends early
      {lying, {}},
  };
  for (const auto &c : cases) {
    write(c.stream);
    EXPECT_EQ(texts(), c.want);
  }
}

// The file's path is composed in 256 bytes: a path of 255 characters is
// read, and a longer one is no file at all, never the file that its first
// 255 characters would name.
TEST_F(Snapshot, EndsTheTableWhenTheFileCannotBeFound) {
  const std::size_t room = 255 - (dir / "tmp" / ".sql").string().size();
  const std::string fits(room, 'n'), over(room + 1, 'n'), stream = statement(numbered(1, "a"));
  std::ofstream(dir / "tmp" / (fits + ".sql"), std::ios::binary) << stream;
  std::ofstream(dir / "tmp" / (over + ".sq"), std::ios::binary) << stream;  // the cut path
  for (const auto &[name, rows] : {std::pair{fits, 1u}, {over, 0u}, {std::string("missing"), 0u}}) {
    orv::test::setEnvironment("ORVENGINE_SNAPSHOT_NAME", name.c_str());
    EXPECT_EQ(texts().size(), rows) << name.size();
  }
}

// The stand-in's file service, which opens the regular files of the tests
// above, refuses at once a folder, a device and a FIFO that nobody writes
// to, so that the table ends as it does for a missing file.  An open that
// waited for a writer would hang here until the test's time runs out.
TEST_F(Snapshot, OpensOnlyARegularFileAndNeverWaits) {
  void *services = orv::test::openLibrary(ORV_STANDIN_SYS_PATH);
  ASSERT_NE(services, nullptr) << orv::test::loaderError();
  const auto open =
      reinterpret_cast<decltype(&sqloopenp)>(orv::test::findExport(services, "sqloopenp"));
  const std::string file = (dir / "tmp" / "cache.sql").string();
  std::vector<std::string> refused = {(dir / "tmp").string(), orv::test::aDevice()};
  if (orv::test::makeFifo(file)) refused.push_back(file);
  CLI_fileHandle handle{};
  for (const std::string &path : refused) EXPECT_NE(open(path.c_str(), 20, 1024, &handle, 0), 0);
  EXPECT_TRUE(texts().empty());
  orv::test::closeLibrary(services);
}

// The same over a copy of the library linked to fake services (tests/fakes),
// which fail where a test says and count what they are asked.
class FakeSnapshot : public Snapshot {
 protected:
  FakeSnapshot() : Snapshot(ORV_FAKES_LIBRARY_PATH) {}
  void SetUp() override {
    resetFakes();
    ASSERT_NE(fakes, nullptr) << orv::test::loaderError();
    Snapshot::SetUp();
  }
  // Services that succeed, with the instance path of the test's folder.
  void resetFakes() {
    fakes = orvFreshFakes();
    if (fakes == nullptr) return;
    static_cast<void>(
        std::snprintf(fakes->instancePath, sizeof fakes->instancePath, "%s", dir.string().c_str()));
  }
  OrvFakes *fakes = nullptr;
};

// A snapshot cut at every byte: the services asked, the rows, the SQLSTATEs
// and the scratchpad after every call are those of the table's definition
// (tests/models/snapshot.hpp).  A statement cut short gets its block, the
// read falls short and the table ends with nothing logged.
TEST_F(FakeSnapshot, FollowsItsDefinitionOnAFileCutAtAnyByte) {
  const auto st = [](const std::string &text) {
    return element(19, element(554, "1234") + element(312, text));
  };
  const std::string whole = st("first") + section("S1") + st("b") + st("a longer one") +
                            element(30, "") + st("c") + st("dd") + element(321, "S2") +
                            element(322, "data") + st("e");
  for (std::size_t cut = 0; cut <= whole.size(); ++cut) {
    resetFakes();
    write(whole.substr(0, cut));
    orv::model::SnapshotTable model(whole.substr(0, cut));
    std::string got, want;
    // After each call: the row or the end, and the scratchpad's fields.
    const auto state = [](std::uint32_t capacity, const char *text, std::uint8_t closed,
                          bool block) {
      return std::to_string(capacity) + "/" + std::string(text, ::strnlen(text, 9)) + "/" +
             std::to_string(closed) + (block ? "/block " : "/none ");
    };
    const auto scratchpad = [&] {
      const unsigned char *data = table.scratchpad() + CLI_SCRATCHPAD_DATA_OFFSET;
      std::uint32_t capacity = 0;
      void *block = nullptr;
      std::memcpy(&capacity, data + 16, 4);
      std::memcpy(&block, data + 32, sizeof block);
      return state(capacity, reinterpret_cast<const char *>(data + 20), data[29], block != nullptr);
    };
    openTable();
    model.open();
    got += scratchpad();
    want += state(model.capacity, model.text.data(), model.closed, model.block);
    for (int i = 0; i < 10; ++i) {
      const auto [row, sqlstate] = call(CLI_CALL_FETCH);
      got += (sqlstate.empty() ? row.text + ":" + row.statement : sqlstate) + " " + scratchpad();
      const auto expected = model.fetch();
      want += expected.value_or("02000") + " " +
              state(model.capacity, model.text.data(), model.closed, model.block);
      if (!expected) break;
    }
    call(CLI_CALL_CLOSE);
    model.close();
    EXPECT_EQ(got, want) << "cut at " << cut;
    EXPECT_EQ(fakes->trace, model.trace) << "cut at " << cut;
  }
}

// A block that can't be had is logged and ends the table: one that the
// service fails to give, or one for a statement that claims more than 64
// MiB and more than the rest of the file, refused before it is asked for.
// The block of the statements before goes back as it does before any new
// block.  Up to 64 MiB a claim gets its block whatever the file holds.
TEST_F(FakeSnapshot, LogsABlockThatCannotBeHadAndKeepsNone) {
  const std::string one = element(19, element(312, "s"));  // 9 bytes of data
  const auto claiming = [](std::uint32_t size) {
    std::string e = element(19, "12345678");
    std::memcpy(e.data(), &size, 4);
    return e;
  };
  const struct {
    std::string stream;
    std::int32_t failure;
    const char *trace;
  } cases[] = {
      {one, 7, "o r8 a9 l7 c"},
      {one + claiming(0xDDFFFFF0), 0, "o r8 a9 r9 r8 f m3724541935 r1 m-3724541935 l-1 c"},
      {claiming(64 << 20), 0, "o r8 a67108864 r67108864 c f"},
      {claiming((64 << 20) + 1), 0, "o r8 m67108864 r1 m-67108864 l-1 c"},
  };
  for (const auto &c : cases) {
    resetFakes();
    fakes->allocationStatus = c.failure;
    write(c.stream);
    rows();
    EXPECT_STREQ(fakes->trace, c.trace);
    if (fakes->logCalls != 0) {
      EXPECT_STREQ(fakes->logMessage,
                   "SQLCACHE_SNAPSHOT: unable to allocate temporary sqlcache stmt");
    }
  }
}

// The static data is asked for once on every entry, open included.
TEST_F(FakeSnapshot, AsksForTheStaticDataOncePerCall) {
  write(statement({{}, "s"}));
  for (const std::int32_t type : {CLI_CALL_OPEN, CLI_CALL_FETCH, CLI_CALL_FETCH, CLI_CALL_CLOSE}) {
    fakes->staticDataCalls = 0;
    call(type);
    EXPECT_EQ(fakes->staticDataCalls, 1) << "call type " << type;
  }
}

TEST_F(FakeSnapshot, NeedsNoInstancePathOrFileToCloseCleanly) {
  fakes->instanceStatus = 3;
  EXPECT_EQ(openTable(), "02000");
  EXPECT_EQ(call(CLI_CALL_FETCH).second, "02000");
  call(CLI_CALL_CLOSE);
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
    stream += statement({{}, std::string(static_cast<std::size_t>(size), 'q')});
  }
  write(stream);
  EXPECT_EQ(rows().size(), 100000u);
  EXPECT_EQ(fakes->allocations, expected);
  EXPECT_EQ(fakes->frees, expected);
}

}  // namespace
