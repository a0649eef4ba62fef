// The table functions driven through open, fetch and close: the Fmp tables
// with a callback in the engine's part, SQLCACHE_SNAPSHOT over written files.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <initializer_list>
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

namespace fs = std::filesystem;
using namespace orv::snapshot;
using cli::call::TableCall;

// What each result indicator holds before a call, to see which of them
// the routine writes.
constexpr std::int16_t kUnset = 0x5A5A;
constexpr std::int32_t kOpen = CLI_CALL_OPEN, kFetch = CLI_CALL_FETCH, kClose = CLI_CALL_CLOSE;

TableCall tableOf(const char *name, CLI_tableCallback callback = nullptr) {
  return {*cli::catalogue::find(name), orv::test::exportAddress(name), callback, kUnset};
}

// One call of each type in turn, each shown as the status it stored
// (state, and "/" and the message if there is one), as the row of numbers
// it gave with every indicator 0, or as nothing; "+" marks a status with
// an indicator written, "?" a row not wholly written.
std::string steps(TableCall &t, std::initializer_list<std::int32_t> types) {
  std::string out;
  for (const std::int32_t type : types) {
    t.step(type);
    const std::size_t n = cli::catalogue::resultCount(t.row());
    bool written = false, whole = true;
    std::string row;
    for (std::size_t i = 0; i < n; ++i) {
      written = written || t.indicator(i) != kUnset;
      whole = whole && t.indicator(i) == 0;
      row += std::to_string(t.number(i)) + (i + 1 < n ? " " : "");
    }
    const cli::call::StatusBuffers &s = t.status();
    if (s.stored()) {
      out += std::string(s.sqlstate) + (s.message[0] != 0 ? "/" : "") + s.message;
      if (written) out += "+";
    } else if (written) {
      out += (whole ? "" : "?") + row;
    }
    out += "|";
  }
  return out;
}

// The engine's side: its answers to open and close, and the requests it
// was given, with FmpThreads' input and whether a close handed back the
// table that open gave.
struct Engine {
  std::int32_t openStatus = 0, closeStatus = 0, count = 0;
  std::vector<unsigned char> table;
  std::string asked;
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
  if (code == 1) {
    EXPECT_EQ(slots, 2);
    const bool same = slot[1] == reinterpret_cast<std::uintptr_t>(engine->table.data());
    engine->asked += same ? "close " : "close of another table ";
    return engine->closeStatus;
  }
  const bool threads = code == 3;
  EXPECT_EQ(slots, threads ? 4 : 3);
  engine->asked += threads ? "threads " + std::to_string(*numberAt(slot[1])) + " " : "rows ";
  std::int32_t *count = numberAt(slot[threads ? 2 : 1]);
  EXPECT_TRUE(*count == 0 && slot[threads ? 3 : 2] == 0);
  *count = engine->count;
  slot[threads ? 3 : 2] = reinterpret_cast<std::uintptr_t>(engine->table.data());
  return engine->openStatus;
}

// FmpThreads gives six 32-bit columns, FmpRows two and then four 16-bit
// ones; each keeps its scratchpad from call to call.
class Tables : public ::testing::Test {
 protected:
  void SetUp() override {
    engine = &fake;
    threads.setInput(0, &selector);
  }
  void TearDown() override { engine = nullptr; }

  Engine fake;
  std::int32_t selector = 42;
  TableCall threads = tableOf("CLI_udfFmpThreads", callback);
  TableCall rows = tableOf("CLI_udfFmpRows", callback);
};

std::vector<unsigned char> words(std::initializer_list<std::int32_t> values) {
  std::vector<unsigned char> out(values.size() * 4);
  std::size_t i = 0;
  for (std::int32_t v : values) std::memcpy(out.data() + 4 * i++, &v, 4);
  return out;
}

// An unknown call type does nothing; a close without a table held asks
// nothing.
TEST_F(Tables, ThreadsDeliverEachRowThenEndAndGiveTheTableBack) {
  fake.count = 2;
  fake.table = words({99, 1, 2, 3, 4, 5, 6, 99, -1, -2, -3, -4, -5, -6});
  EXPECT_EQ(steps(threads, {kOpen, kFetch, kFetch, kFetch, kFetch, 7, kClose, kClose}),
            "|1 2 3 4 5 6|-1 -2 -3 -4 -5 -6|02000|02000||||");
  EXPECT_EQ(fake.asked, "threads 42 close ");
}

// Status -3 on open is an empty table to FmpThreads and a failure to
// FmpRows, whose 16-bit columns widen with their sign and whose last two
// take a byte each.  A close that fails clears the table all the same.
TEST_F(Tables, ReportFailedCallbacksWithTheirStatusAndRowsWidenTheirBytes) {
  fake.openStatus = -3;
  fake.count = 5;  // and a table pointer left in the record
  fake.table = {1, 0, 0, 0, 2, 0, 0, 0, 0xFF, 0xFF, 4, 0, 0xFF, 0x80, 9, 9};
  EXPECT_EQ(steps(threads, {kOpen, kFetch, kClose}), "|02000||");
  EXPECT_EQ(steps(rows, {kOpen, kFetch}), "38620/API call failed -3|02000|");
  fake.openStatus = 5;
  EXPECT_EQ(steps(threads, {kOpen}), "38620/API call failed 5|");
  fake.openStatus = 0;
  fake.count = 1;
  fake.closeStatus = -2147483647 - 1;
  EXPECT_EQ(steps(rows, {kOpen, kFetch, kFetch, kClose, kClose}),
            "|1 2 -1 4 255 128|02000|38660/API call failed -2147483648||");
  EXPECT_EQ(fake.asked, "threads 42 close rows threads 42 rows close ");
}

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

  // One call: a fetch's row as "section:statement", or the SQLSTATE it
  // stored.  Column 17 holds "unset" before it, so that a column the
  // routine leaves alone shows.  An open is on a zero-filled scratchpad,
  // as the engine gives it.
  std::string call(std::int32_t type) {
    std::memset(table.area(16), 0, 9);
    std::memcpy(table.area(16), "unset", 5);
    if (type != kOpen) {
      table.step(type);
    } else if (!table.open()) {
      ADD_FAILURE() << "open stored " << table.status().sqlstate;
    }
    if (table.status().stored()) return table.status().sqlstate;
    const std::string statement(table.indicator(17) == 0 ? table.text(17) : "");
    return std::string(table.text(16)) + ":" + statement;
  }

  // Opens, fetches until the table ends (or a limit, should it never),
  // closes; the rows as "section:statement".
  std::vector<std::string> texts() {
    std::vector<std::string> out;
    EXPECT_EQ(call(kOpen), "unset:");
    for (std::string row; out.size() < 200000 && (row = call(kFetch)) != "02000";) {
      out.push_back(row);
    }
    call(kClose);
    return out;
  }

  orv::test::LibraryInUse use;
  fs::path dir =
      fs::temp_directory_path() / ("orv_snapshot_" + std::to_string(orv::test::processId()));
  TableCall table = tableOf("SQLCACHE_SNAPSHOT");
};

Statement numbered(std::int32_t base, std::string text) {
  Statement s;
  for (std::size_t i = 0; i < 16; ++i) s.columns[i] = base + static_cast<std::int32_t>(i);
  s.text = std::move(text);
  return s;
}

// Every number column with its indicator 0, column 17's indicator left
// alone; elements lie packed at any byte offset, so a pair element behind
// an unknown one of odd length still gives its two children.
TEST_F(Snapshot, DeliversEveryColumnOfEachStatementAndPairsAtOddOffsets) {
  write(section("PKG1") + statement(numbered(100, "SELECT 1")) +
        statement(numbered(-200, std::string("x\0y", 3))));
  std::string want = "|";
  for (const int base : {100, -200}) {
    for (int i = 0; i < 16; ++i) want += std::to_string(base + i) + " ";
    want += "|";
  }
  EXPECT_TRUE(table.open());
  std::string got = "|";
  for (int i = 0; i < 2; ++i) {
    table.step(kFetch);
    for (std::size_t c = 0; c < 16; ++c) {
      got += std::to_string(table.number(c)) + (table.indicator(c) == 0 ? " " : "? ");
    }
    got += table.indicator(16) == kUnset && table.indicator(17) == 0 ? "|" : "?|";
  }
  EXPECT_EQ(got, want);
  EXPECT_EQ(table.text(17), std::string("x\0y", 3));
  table.close();
  std::string pair =
      element(300, std::string("\x05\0\0\0", 4)) + element(301, std::string("\x06\0\0\0", 4));
  write(element(19, element(9999, "odd") + element(229, pair) + element(312, "s")));
  EXPECT_TRUE(table.open());
  table.step(kFetch);
  EXPECT_EQ(std::to_string(table.number(10)) + std::to_string(table.number(11)), "56");
  EXPECT_EQ(table.text(17), "s");
  table.close();
}

// Streams that break their limits end the table; nothing outside the
// areas is read or written.  (Statements with and without a section, in
// either order, and files that end early are in the test of a file cut at
// every byte.)
TEST_F(Snapshot, ReadsSectionsInEveryOrderAndEndsOnHostileStreams) {
  const auto st = [](const char *text) { return statement(numbered(1, text)); };
  std::string lying = element(19, element(554, "1234"));
  lying[8] = 100;  // an inner element that claims more than its statement holds
  const struct {
    std::string stream;
    std::vector<std::string> want;
  } cases[] = {
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
// which fail where a test says and trace what they are asked.
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
// read falls short and the table ends with nothing logged; a block is
// replaced only by a larger one.
TEST_F(FakeSnapshot, FollowsItsDefinitionOnAFileCutAtAnyByte) {
  const auto st = [](const std::string &text) {
    return element(19, element(554, "1234") + element(312, text));
  };
  const std::string whole = st("first") + section("S1") + st("b") + st("a longer one") +
                            st("of same size") + element(30, "") + st("c") + st("dd") +
                            element(321, "S2") + element(322, "data") + st("e");
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
    call(kOpen);
    model.open();
    got += scratchpad();
    want += state(model.capacity, model.text.data(), model.closed, model.block);
    for (int i = 0; i < 10; ++i) {
      const std::string row = call(kFetch);
      got += row + " " + scratchpad();
      const auto expected = model.fetch();
      want += expected.value_or("02000") + " " +
              state(model.capacity, model.text.data(), model.closed, model.block);
      if (!expected) break;
    }
    call(kClose);
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
// Without an instance path no file is opened or closed.
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
      {one, 7, "s o s r8 a9 l7 s c"},
      {one + claiming(0xDDFFFFF0), 0, "s o s r8 a9 r9 s r8 f m3724541935 r1 m-3724541935 l-1 s c"},
      {claiming(64 << 20), 0, "s o s r8 a67108864 r67108864 s c f"},
      {claiming((64 << 20) + 1), 0, "s o s r8 m67108864 r1 m-67108864 l-1 s c"},
  };
  for (const auto &c : cases) {
    resetFakes();
    fakes->allocationStatus = c.failure;
    write(c.stream);
    texts();
    EXPECT_STREQ(fakes->trace, c.trace);
    if (std::strstr(fakes->trace, " l") != nullptr) {
      EXPECT_STREQ(fakes->logMessage,
                   "SQLCACHE_SNAPSHOT: unable to allocate temporary sqlcache stmt");
    }
  }
  resetFakes();
  fakes->instanceStatus = 3;
  EXPECT_EQ(call(kOpen), "02000");
  EXPECT_EQ(call(kFetch), "02000");
  call(kClose);
  EXPECT_STREQ(fakes->trace, "s s s");
}

}  // namespace
