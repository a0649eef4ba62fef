// FmpThreads and FmpRows: two of the engine's tables as table functions.
//
// The engine hands over an entry point, the table-function callback.  On
// open the routine asks it for a table of fixed-size row records, on each
// fetch it copies one record into the result columns, and on close it
// gives the table back.  The table is the engine's: the routine neither
// allocates nor frees it.
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "frame/frame.hpp"

namespace {

using cli::Ind;
using cli::NameArg;

// The scratchpad's data: row count, table pointer, next row index.
struct Scratch {
  std::int32_t count;
  const unsigned char *table;
  std::int32_t next;
};

Scratch load(const unsigned char *scratchpad) {
  Scratch s;
  std::memcpy(&s, scratchpad + CLI_SCRATCHPAD_DATA_OFFSET, sizeof s);
  return s;
}

void save(unsigned char *scratchpad, const Scratch &s) {
  std::memcpy(scratchpad + CLI_SCRATCHPAD_DATA_OFFSET, &s, sizeof s);
}

void storeState(char *sqlstate, const char *state) { std::memcpy(sqlstate, state, 6); }

void callFailed(char *sqlstate, char *message, const char *state, std::int32_t status) {
  storeState(sqlstate, state);
  static_cast<void>(std::snprintf(message, CLI_MESSAGE_SIZE, CLI_MESSAGE_API_CALL_FAILED,
                                  static_cast<int>(status)));
}

// A request record: 64-bit slots, the first pointing at the request code.
using Slot = std::uint64_t;
static_assert(sizeof(void *) == sizeof(Slot), "a slot holds a pointer");
template <typename T>
Slot slotOf(T *pointer) {
  return reinterpret_cast<std::uintptr_t>(pointer);
}

constexpr std::int32_t kNoTable = -3;  // FmpThreads: an empty table, not a failure

// Close, both: give the table back if one is held; clear it whatever the
// callback says.
void close(unsigned char *scratchpad, CLI_tableCallback callback, char *sqlstate, char *message) {
  Scratch s = load(scratchpad);
  if (s.table == nullptr) return;
  std::int32_t code = 1;
  Slot request[2] = {slotOf(&code), reinterpret_cast<std::uintptr_t>(s.table)};
  const std::int32_t status = callback(2, request);
  if (status != 0) callFailed(sqlstate, message, CLI_SQLSTATE_CLOSE_CALLBACK_FAILED, status);
  s.table = nullptr;
  save(scratchpad, s);
}

// Fetch, both: the row at the next index, or "02000".  The index rises on
// every fetch; no row is read through a null table.
const unsigned char *nextRow(unsigned char *scratchpad, std::size_t rowSize, char *sqlstate) {
  Scratch s = load(scratchpad);
  const std::int32_t index = s.next;
  s.next = static_cast<std::int32_t>(static_cast<std::uint32_t>(index) + 1u);
  save(scratchpad, s);
  if (index >= s.count || index < 0 || s.table == nullptr) {
    storeState(sqlstate, CLI_SQLSTATE_NO_MORE_ROWS);
    return nullptr;
  }
  return s.table + static_cast<std::size_t>(index) * rowSize;
}

template <typename T>
T field(const unsigned char *row, std::size_t offset) {
  T v;
  std::memcpy(&v, row + offset, sizeof v);
  return v;
}

}  // namespace

CLI_EXPORT void CLI_udfFmpThreads(const std::int32_t *selector, std::int32_t *r1, std::int32_t *r2,
                                  std::int32_t *r3, std::int32_t *r4, std::int32_t *r5,
                                  std::int32_t *r6, Ind, Ind n1, Ind n2, Ind n3, Ind n4, Ind n5,
                                  Ind n6, char *sqlstate, NameArg, NameArg, char *message,
                                  unsigned char *scratchpad, const std::int32_t *callType,
                                  CLI_tableCallback callback) noexcept {
  switch (*callType) {
    case CLI_CALL_OPEN: {
      Scratch s = load(scratchpad);
      s.table = nullptr;
      save(scratchpad, s);
      std::int32_t code = 3, input = *selector, count = 0;
      Slot request[4] = {slotOf(&code), slotOf(&input), slotOf(&count), 0};
      const std::int32_t status = callback(4, request);
      if (status == kNoTable) {
        count = 0;
      } else if (status != 0) {
        callFailed(sqlstate, message, CLI_SQLSTATE_OPEN_CALLBACK_FAILED, status);
      }
      s.count = count;
      std::memcpy(&s.table, &request[3], sizeof s.table);  // the slot holds the pointer
      s.next = 0;
      save(scratchpad, s);
      return;
    }
    case CLI_CALL_FETCH: {
      const unsigned char *row = nextRow(scratchpad, 28, sqlstate);
      if (row == nullptr) return;
      std::int32_t *results[] = {r1, r2, r3, r4, r5, r6};
      Ind indicators[] = {n1, n2, n3, n4, n5, n6};
      for (std::size_t i = 0; i < 6; ++i) {
        *results[i] = field<std::int32_t>(row, 4 + 4 * i);
        *indicators[i] = 0;
      }
      return;
    }
    case CLI_CALL_CLOSE:
      return close(scratchpad, callback, sqlstate, message);
    default:
      return;
  }
}

CLI_EXPORT void CLI_udfFmpRows(std::int32_t *r1, std::int32_t *r2, std::int16_t *r3,
                               std::int16_t *r4, std::int16_t *r5, std::int16_t *r6, Ind n1, Ind n2,
                               Ind n3, Ind n4, Ind n5, Ind n6, char *sqlstate, NameArg, NameArg,
                               char *message, unsigned char *scratchpad,
                               const std::int32_t *callType, CLI_tableCallback callback) noexcept {
  switch (*callType) {
    case CLI_CALL_OPEN: {
      Scratch s = load(scratchpad);
      s.table = nullptr;
      save(scratchpad, s);
      std::int32_t code = 2, count = 0;
      Slot request[3] = {slotOf(&code), slotOf(&count), 0};
      const std::int32_t status = callback(3, request);
      if (status != 0) {
        return callFailed(sqlstate, message, CLI_SQLSTATE_OPEN_CALLBACK_FAILED, status);
      }
      s.count = count;
      std::memcpy(&s.table, &request[2], sizeof s.table);
      s.next = 0;
      save(scratchpad, s);
      return;
    }
    case CLI_CALL_FETCH: {
      const unsigned char *row = nextRow(scratchpad, 16, sqlstate);
      if (row == nullptr) return;
      *r1 = field<std::int32_t>(row, 0);
      *r2 = field<std::int32_t>(row, 4);
      *r3 = field<std::int16_t>(row, 8);
      *r4 = field<std::int16_t>(row, 10);
      *r5 = row[12];  // unsigned bytes, widened with zeros
      *r6 = row[13];
      *n1 = *n2 = *n3 = *n4 = *n5 = *n6 = 0;
      return;
    }
    case CLI_CALL_CLOSE:
      return close(scratchpad, callback, sqlstate, message);
    default:
      return;
  }
}
