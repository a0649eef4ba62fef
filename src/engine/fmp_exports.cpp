// FmpThreads and FmpRows: two of the engine's tables as table functions.
//
// The engine hands over an entry point, the table-function callback.  On
// open the routine asks it for a table of fixed-size row records, on each
// fetch it copies one record into the result columns, and on close it
// gives the table back.  The table is the engine's: the routine neither
// allocates nor frees it.
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Report;

// The scratchpad's data: row count, table pointer, next row index.
struct FmpScratch {
  std::int32_t count;
  const unsigned char *table;
  std::int32_t next;
};

// A request record: 64-bit slots, the first pointing at the request code.
using Slot = std::uint64_t;
static_assert(sizeof(void *) == sizeof(Slot), "a slot holds a pointer");
template <typename T>
Slot slotOf(T *pointer) {
  return reinterpret_cast<std::uintptr_t>(pointer);
}

// The request codes, and the bytes of one row of each table.
enum Request : std::int32_t { kClose = 1, kOpenRows = 2, kOpenThreads = 3 };
constexpr std::size_t kThreadRow = 28, kRowsRow = 16;
constexpr std::int32_t kNoTable = -3;  // FmpThreads: an empty table, not a failure

// The table pointer that the callback left in a request's last slot.
const unsigned char *tableIn(const Slot &slot) {
  const unsigned char *table = nullptr;
  std::memcpy(&table, &slot, sizeof table);
  return table;
}

// Close, both: give the table back if one is held; clear it whatever the
// callback says.
Report close(FmpScratch &s, CLI_tableCallback callback) {
  if (s.table == nullptr) return {};
  std::int32_t code = kClose;
  Slot request[2] = {slotOf(&code), reinterpret_cast<std::uintptr_t>(s.table)};
  const std::int32_t status = callback(2, request);
  s.table = nullptr;
  if (status != 0) return Report::of(Report::Kind::closeCallbackFailed, status);
  return {};
}

// Fetch, both: the row at the next index, or null at the end of the table.
// The index rises on every fetch; no row is read through a null table.
const unsigned char *nextRow(FmpScratch &s, std::size_t rowSize) {
  const std::int32_t index = s.next;
  s.next = static_cast<std::int32_t>(static_cast<std::uint32_t>(index) + 1u);
  if (index >= s.count || index < 0 || s.table == nullptr) return nullptr;
  return s.table + static_cast<std::size_t>(index) * rowSize;
}

template <typename T>
T field(const unsigned char *row, std::size_t offset) {
  T v;
  std::memcpy(&v, row + offset, sizeof v);
  return v;
}

}  // namespace

namespace cli {

// Rows of six 32-bit numbers, from byte 4 of each 28-byte record.
Report routine::FmpThreads(std::int32_t selector, Row row, Scratchpad scratchpad,
                           CallType call_type, CLI_tableCallback callback) noexcept {
  const auto open = [&](FmpScratch &s) -> Report {
    s.table = nullptr;
    std::int32_t code = kOpenThreads, input = selector, count = 0;
    Slot request[4] = {slotOf(&code), slotOf(&input), slotOf(&count), 0};
    const std::int32_t status = callback(4, request);
    s.count = status == kNoTable ? 0 : count;
    s.table = tableIn(request[3]);
    s.next = 0;
    if (status != 0 && status != kNoTable) {
      return Report::of(Report::Kind::openCallbackFailed, status);
    }
    return {};
  };
  const auto fetch = [&](FmpScratch &s) -> Report {
    const unsigned char *record = nextRow(s, kThreadRow);
    if (record == nullptr) return cli::kEndOfTable;
    for (std::size_t i = 0; i < 6; ++i) row.put(i, field<std::int32_t>(record, 4 + 4 * i));
    return {};
  };
  return tableStep<FmpScratch>(call_type, scratchpad, open, fetch,
                               [&](FmpScratch &s) { return close(s, callback); });
}

// Rows of two 32-bit numbers, two 16-bit ones and two unsigned bytes,
// widened with zeros, from each 16-byte record.  A failed open leaves the
// count and the next index as they were.
Report routine::FmpRows(Row row, Scratchpad scratchpad, CallType call_type,
                        CLI_tableCallback callback) noexcept {
  const auto open = [&](FmpScratch &s) -> Report {
    s.table = nullptr;
    std::int32_t code = kOpenRows, count = 0;
    Slot request[3] = {slotOf(&code), slotOf(&count), 0};
    const std::int32_t status = callback(3, request);
    if (status != 0) return Report::of(Report::Kind::openCallbackFailed, status);
    s.count = count;
    s.table = tableIn(request[2]);
    s.next = 0;
    return {};
  };
  const auto fetch = [&](FmpScratch &s) -> Report {
    const unsigned char *record = nextRow(s, kRowsRow);
    if (record == nullptr) return cli::kEndOfTable;
    row.put(0, field<std::int32_t>(record, 0));
    row.put(1, field<std::int32_t>(record, 4));
    row.put(2, field<std::int16_t>(record, 8));
    row.put(3, field<std::int16_t>(record, 10));
    row.put(4, std::int16_t{record[12]});
    row.put(5, std::int16_t{record[13]});
    return {};
  };
  return tableStep<FmpScratch>(call_type, scratchpad, open, fetch,
                               [&](FmpScratch &s) { return close(s, callback); });
}

}  // namespace cli
