// CLI_udfFmpThreads and CLI_udfFmpRows with a callback that plays the
// engine from the fuzzer's bytes.
//
// Input: for each of the two routines in turn, an option byte, the open
// status, the close status and the row count (32-bit words), the selector,
// then row records.  Option bit 0 hands back no table, bit 1 a status
// other than 0 on close.  The table handed back holds exactly as many rows
// as the count says (none for a negative count), each in its own
// allocation, so that a read past it is caught.
//
// Checked: statuses are "38620" / "38660" with "API call failed %d" of
// the status, or "02000", or nothing; a row gives the record's fields and
// 0 in all six indicators; past the end nothing is written; close hands
// back the table it was given, once.
#include <array>
#include <cinttypes>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;

struct Engine {
  std::int32_t openStatus = 0, closeStatus = 0, count = 0;
  bool giveTable = true;
  Block table;
  int opens = 0, closes = 0;
  std::uint64_t closed = 0;
};
Engine *engine = nullptr;

// The number a request slot points at.
std::int32_t *target(std::uint64_t slot) {
  std::int32_t *p = nullptr;
  std::memcpy(&p, &slot, sizeof p);
  return p;
}

std::int32_t callback(std::int32_t slots, void *request) {
  auto *slot = static_cast<std::uint64_t *>(request);
  const std::int32_t code = *target(slot[0]);
  if (code == 1) {
    ORV_CHECK("callback", slots == 2);
    ++engine->closes;
    engine->closed = slot[1];
    return engine->closeStatus;
  }
  ORV_CHECK("callback", code == 2 || code == 3);
  const bool threads = code == 3;
  ORV_CHECK("callback", slots == (threads ? 4 : 3));
  ++engine->opens;
  std::int32_t *count = target(slot[threads ? 2 : 1]);
  ORV_CHECK("callback", *count == 0 && slot[threads ? 3 : 2] == 0);
  *count = engine->count;
  if (engine->giveTable)
    slot[threads ? 3 : 2] = reinterpret_cast<std::uintptr_t>(engine->table.data());
  return engine->openStatus;
}

std::string failed(std::int32_t status) {
  char text[CLI_MESSAGE_SIZE];
  static_cast<void>(std::snprintf(text, sizeof text, "API call failed %" PRId32, status));
  return {text, std::strlen(text) + 1};
}

void drive(bool threads, const std::uint8_t *&data, std::size_t &size) {
  const char *name = threads ? "CLI_udfFmpThreads" : "CLI_udfFmpRows";
  const std::size_t rowSize = threads ? 28 : 16;
  Engine e;
  const auto options = take<std::uint8_t>(data, size);
  e.openStatus = take<std::int32_t>(data, size);
  e.closeStatus = (options & 2u) != 0 ? take<std::int32_t>(data, size) : 0;
  e.count = take<std::int32_t>(data, size) % 64;
  e.giveTable = (options & 1u) == 0;
  const auto selector = take<std::int32_t>(data, size);
  const std::size_t rows = e.count > 0 ? static_cast<std::size_t>(e.count) : 0;
  e.table = Block(rows * rowSize);
  for (std::size_t i = 0; i < rows * rowSize; ++i)
    e.table.data()[i] = take<std::uint8_t>(data, size);
  engine = &e;

  // Each argument has a block of its own for the whole table, laid out
  // afresh before every call: a table makes up to 70 calls, and new blocks
  // for each would cost far more than the routine.
  std::vector<Block> results, inds;
  for (int i = 0; i < 6; ++i) results.emplace_back(!threads && i >= 2 ? 2 : 4);
  for (int i = 0; i < 7; ++i) inds.emplace_back(2);
  Block scratchpad(100, 0), sqlstate(CLI_SQLSTATE_SIZE), message(CLI_MESSAGE_SIZE), input(4),
      type(4);
  Frame frame(sqlstate, message);
  if (threads) frame.input(input, inds[6]);
  for (std::size_t i = 0; i < 6; ++i) frame.result(results[i], inds[i]);
  frame.f.scratchpad = scratchpad.data();
  frame.f.callType = reinterpret_cast<std::int32_t *>(type.data());
  frame.f.callback = &callback;
  const Export routine = lookUp(name);

  // One call; true when it wrote no column nor indicator.
  const auto run = [&](std::int32_t callType, std::array<std::int64_t, 6> &row,
                       std::array<std::int16_t, 6> &indicators, std::string &state) {
    for (Block &r : results) std::memset(r.data(), kUnwritten, r.size());
    for (Block &i : inds) std::memcpy(i.data(), &kIndicator, 2);
    std::memset(sqlstate.data(), 'S', sqlstate.size());
    std::memset(message.data(), 'M', message.size());
    std::memcpy(input.data(), &selector, 4);
    std::memcpy(type.data(), &callType, 4);
    frame.call(routine);
    ORV_CHECK(name, numberIn<std::int32_t>(input) == selector);
    ORV_CHECK(name, numberIn<std::int16_t>(inds[6]) == kIndicator);
    bool untouched = true;
    for (std::size_t i = 0; i < 6; ++i) {
      indicators[i] = numberIn<std::int16_t>(inds[i]);
      row[i] = results[i].size() == 2 ? numberAt<std::int16_t>(results[i].data())
                                      : numberAt<std::int32_t>(results[i].data());
      untouched =
          untouched && allAre(results[i].data(), results[i].size()) && indicators[i] == kIndicator;
    }
    // A state with its terminator, and only a failed callback's message.
    state = allAre(sqlstate.data(), sqlstate.size(), 'S') ? "" : sqlstate.view().substr(0, 5);
    const std::string want = state == "38620"   ? failed(e.openStatus)
                             : state == "38660" ? failed(e.closeStatus)
                                                : "";
    ORV_CHECK(name,
              state.empty() || ((state == "02000" || !want.empty()) && sqlstate.data()[5] == 0));
    ORV_CHECK(name, message.view().starts_with(want) &&
                        allAre(message.data() + want.size(), message.size() - want.size(), 'M'));
    return untouched;
  };

  std::array<std::int64_t, 6> row{};
  std::array<std::int16_t, 6> indicators{};
  std::string state;
  ORV_CHECK(name, run(CLI_CALL_OPEN, row, indicators, state));
  ORV_CHECK(name, e.opens == 1);
  const bool openFailed = e.openStatus != 0 && !(threads && e.openStatus == -3);
  ORV_CHECK(name, state == (openFailed ? "38620" : ""));
  // Rows are read only from a table that was handed over with its count.
  std::size_t expectRows = 0;
  if (e.giveTable && (!openFailed || threads))
    expectRows = threads && e.openStatus == -3 ? 0 : rows;
  for (std::size_t i = 0; i < expectRows + 3; ++i) {
    const bool untouched = run(i % 5 == 4 ? 9 : CLI_CALL_FETCH, row, indicators, state);
    if (i % 5 == 4) {
      ORV_CHECK(name, untouched && state.empty());
      continue;
    }
    if (state == "02000") {
      ORV_CHECK(name, untouched);
      continue;
    }
    ORV_CHECK(name, state.empty());
    // A row: which one is the fetch count so far, skipping the unknown types.
    const std::size_t index = i - i / 5;
    ORV_CHECK(name, index < rows);
    // FmpThreads: six 32-bit fields from byte 4; FmpRows: two 32-bit, two
    // 16-bit and two bytes.
    const unsigned char *r = e.table.data() + index * rowSize;
    for (std::size_t k = 0; k < 6; ++k) {
      const std::int64_t want = threads ? numberAt<std::int32_t>(r + 4 + 4 * k)
                                : k < 2 ? numberAt<std::int32_t>(r + 4 * k)
                                : k < 4 ? numberAt<std::int16_t>(r + 4 + 2 * k)
                                        : r[8 + k];
      ORV_CHECK(name, row[k] == want && indicators[k] == 0);
    }
  }
  run(CLI_CALL_CLOSE, row, indicators, state);
  const bool held = e.giveTable && (!openFailed || threads) && e.table.data() != nullptr;
  ORV_CHECK(name, e.closes == (held ? 1 : 0));
  if (held) {
    ORV_CHECK(name, e.closed == reinterpret_cast<std::uintptr_t>(e.table.data()));
    ORV_CHECK(name, state == (e.closeStatus != 0 ? "38660" : ""));
  }
  run(CLI_CALL_CLOSE, row, indicators, state);
  ORV_CHECK(name, e.closes == (held ? 1 : 0) && state.empty());
  engine = nullptr;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  drive(true, data, size);
  drive(false, data, size);
  return 0;
}
