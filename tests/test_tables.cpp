// The Fmp table functions, driven through open, fetch and close with a
// callback that plays the engine's part.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/cliudf.h"
#include "frame/table_call.hpp"
#include "support/frame_call.hpp"

namespace {

using orv::test::exportAddress;

// The engine's side: its answers to open and close, and what it was asked.
struct Engine {
  std::int32_t openStatus = 0, closeStatus = 0, count = 0;
  std::vector<unsigned char> table;
  std::vector<std::int32_t> codes;    // request codes, in order
  std::vector<std::int32_t> inputs;   // FmpThreads' input value on open
  std::vector<std::uint64_t> closed;  // table pointers handed back
};
Engine *engine = nullptr;

// The number that a request slot points at.
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

// One call of either routine; rows come back as six numbers.
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

TEST_F(Tables, ThreadsTakeStatusMinus3AsAnEmptyTable) {
  fake.openStatus = -3;
  fake.count = 5;
  fake.table = words({0});  // a table pointer left in the record
  EXPECT_EQ(run(true, CLI_CALL_OPEN).sqlstate, "");
  EXPECT_EQ(run(true, CLI_CALL_FETCH).sqlstate, "02000");
  run(true, CLI_CALL_CLOSE);
  EXPECT_EQ(fake.codes, (std::vector<std::int32_t>{3, 1}));
}

TEST_F(Tables, ReportFailedCallbacksWithTheirStatus) {
  fake.table = words({0, 0, 0, 0});
  fake.openStatus = 5;
  const Call threads = run(true, CLI_CALL_OPEN);
  EXPECT_EQ(threads.sqlstate + "|" + threads.message, "38620|API call failed 5");
  fake.openStatus = -3;
  const Call rows = run(false, CLI_CALL_OPEN);
  EXPECT_EQ(rows.sqlstate + "|" + rows.message, "38620|API call failed -3");
  EXPECT_EQ(run(false, CLI_CALL_FETCH).sqlstate, "02000");  // no table: nothing is read
  fake.openStatus = 0;
  fake.closeStatus = -2147483647 - 1;
  run(false, CLI_CALL_OPEN);
  const Call close = run(false, CLI_CALL_CLOSE);
  EXPECT_EQ(close.sqlstate + "|" + close.message, "38660|API call failed -2147483648");
  run(false, CLI_CALL_CLOSE);  // the pointer was cleared all the same
  EXPECT_EQ(fake.closed.size(), 1u);
}

TEST_F(Tables, RowsWidenTheirUnsignedBytes) {
  fake.count = 1;
  fake.table = {1, 0, 0, 0, 2, 0, 0, 0, 0xFF, 0xFF, 4, 0, 0xFF, 0x80, 9, 9};
  run(false, CLI_CALL_OPEN);
  EXPECT_EQ(run(false, CLI_CALL_FETCH).row, (std::array<std::int64_t, 6>{1, 2, -1, 4, 255, 128}));
  EXPECT_EQ(run(false, CLI_CALL_FETCH).sqlstate, "02000");
}

}  // namespace
