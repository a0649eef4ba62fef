// Calls an export of the built library the way an engine does: found by
// name, given a frame of pointers to buffers that the caller owns, laid out
// by the library's frame caller (src/frame/call.hpp).
//
// Every call is also checked for what the frame promises whatever the
// routine: nothing written past the result area, null indicators never
// touched, status buffers untouched on success, and on failure exactly
// "38552" and "SYSFUN:NN", NN one of the routine's own codes, stored with
// the result area left as it was.  Calls may come from several threads.
#pragma once

#include <bit>
#include <cstdint>
#include <cstring>
#include <ostream>
#include <string>
#include <vector>

#include "frame/cliudf.h"

namespace orv::test {

// An input or the shape of a result, in one of the frame's layouts.
struct Value {
  enum class Layout { int16, int32, int64, real, text, lob, fixed } layout;
  std::int64_t number = 0;       // an integer, or the bits of a double
  std::string bytes;             // text without its terminator, or CLI_udfLob data
  std::uint32_t size = 0;        // result area: text area bytes, CLI_udfLob capacity, fixed bytes
  bool null = false;             // for routines that read their input indicators
  const void *placed = nullptr;  // an input laid out by the caller, passed as it is
};

inline std::int64_t bitsOf(double d) { return std::bit_cast<std::int64_t>(d); }

inline Value i16(std::int16_t v) { return {Value::Layout::int16, v, {}}; }
inline Value i32(std::int32_t v) { return {Value::Layout::int32, v, {}}; }
inline Value i64(std::int64_t v) { return {Value::Layout::int64, v, {}}; }
inline Value f64(double v) { return {Value::Layout::real, bitsOf(v), {}}; }
inline Value text(std::string s) { return {Value::Layout::text, 0, std::move(s)}; }
inline Value lob(std::string s) { return {Value::Layout::lob, 0, std::move(s)}; }
inline Value fixed(std::string s) { return {Value::Layout::fixed, 0, std::move(s)}; }
// Terminated text (or any input) that the caller has laid out at `at`, in a
// place of its choosing: against a page that can't be read, say.
inline Value placedAt(const void *at) { return {Value::Layout::text, 0, {}, 0, false, at}; }
inline Value nullOf(Value v) {
  v.null = true;
  return v;
}
// Results: a terminated-text area of `area` bytes, a CLI_udfLob area whose
// length word holds `capacity`, fixed bytes, a number of a layout.
inline Value textArea(std::uint32_t area = 4001) { return {Value::Layout::text, 0, {}, area}; }
inline Value lobArea(std::uint32_t capacity = 1048576) {
  return {Value::Layout::lob, 0, {}, capacity};
}
inline Value fixedArea(std::uint32_t size) { return {Value::Layout::fixed, 0, {}, size}; }
inline Value numberArea(Value::Layout layout) { return {layout, 0, {}}; }
inline Value intArea() { return numberArea(Value::Layout::int32); }

// What a call gave: a SYSFUN code, or the result.  A double result is
// held as its bits, so that zeros of both signs and NaNs compare exactly.
struct Outcome {
  std::string error;  // two-digit SYSFUN code, empty on success
  std::string bytes;  // a string result
  std::int64_t number = 0;
  bool stored = false;     // a failure that left a value in the result area
  bool real = false;       // `number` holds the bits of a double
  int indicator = 0;       // the result indicator of a routine that handles NULL itself
  bool leftAlone = false;  // a success that wrote nothing to a string result
  bool operator==(const Outcome &) const = default;
};

inline Outcome ok(std::string bytes) { return {"", std::move(bytes)}; }
inline Outcome ok(std::int64_t number) { return {"", "", number}; }
inline Outcome okReal(double d) { return {"", "", bitsOf(d), false, true}; }
inline Outcome fails(std::string code) { return {std::move(code), ""}; }
// A failure that stored its value before it tested it.
inline Outcome failsStoring(std::string code, double d) {
  return {std::move(code), "", bitsOf(d), true, true};
}
// A failure that left the pieces built so far in a string result.
inline Outcome failsLeaving(std::string code, std::string bytes) {
  return {std::move(code), std::move(bytes), 0, true};
}
// A success that left the string result area as it was, with this result
// indicator (0 for a routine that leaves NULL to the caller).
inline Outcome leftAlone(int indicator = 0) { return {"", "", 0, false, false, indicator, true}; }

void PrintTo(const Outcome &o, std::ostream *os);

// Calls the export `name`, a routine of one result, through the frame
// that its catalogue row gives, with its result area of the row's size.
// A routine that handles NULL itself gets input indicators of -1 for inputs
// made with nullOf and 0 otherwise; its result indicator (0x5A5A if it
// leaves it alone) is in `indicator`, and a status of its own (VEBLOB_CP's)
// is the error "SSSSS/message": five characters and eight, neither
// terminated, with nothing written behind.  Any other routine's null
// indicators must stay as they were.
Outcome call(const char *name, const std::vector<Value> &inputs);
// The same with a result area of this shape, and the frame's extra
// arguments in the frame's order: the database information block, or the
// scratchpad, call type and callback, as many as the row's frame has.
Outcome call(const char *name, const std::vector<Value> &inputs, const Value &result,
             const std::vector<void *> &extras = {});

// A database information block of a database in `codePage`.
struct DatabaseInfo {
  explicit DatabaseInfo(std::uint32_t codePage) {
    std::memcpy(block + CLI_DBINFO_CODEPAGE_OFFSET, &codePage, sizeof codePage);
  }
  unsigned char block[512] = {};
};

// The address of an export of the library in use, or null.
void *exportAddress(const char *name);

// While one lives, calls go to the library at `path` (by default the
// built library): the copy linked against the fake services, for one.
class LibraryInUse {
 public:
  explicit LibraryInUse(const char *path);
  ~LibraryInUse();
  LibraryInUse(const LibraryInUse &) = delete;
  LibraryInUse &operator=(const LibraryInUse &) = delete;

 private:
  const char *previous_;
};

}  // namespace orv::test
