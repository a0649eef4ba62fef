#include "support/frame_call.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cctype>
#include <cstring>
#include <iomanip>
#include <map>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "support/platform.hpp"

namespace orv::test {
namespace {

namespace cat = cli::catalogue;
namespace frame = cli::call;

constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
constexpr unsigned char kCanary = 0xA5;     // fills the bytes behind a result area
constexpr std::size_t kCanaryBytes = 64;
constexpr std::int16_t kIndicator = 0x5A5A;
// The message buffer of the frame, and a guard behind it that a routine
// writing past the message would reach.
constexpr std::size_t kMessageGuardBytes = 42;
constexpr std::size_t kMessageBytes = CLI_MESSAGE_SIZE + kMessageGuardBytes;

const char *currentLibrary = ORV_LIBRARY_PATH;

// The library in use, opened once per path.
void *library() {
  static std::map<std::string, void *> handles;
  auto [at, fresh] = handles.try_emplace(currentLibrary, nullptr);
  if (fresh) {
    at->second = openLibrary(currentLibrary);
    if (at->second == nullptr) ADD_FAILURE() << currentLibrary << ": " << loaderError();
  }
  return at->second;
}

// Puts the caller's extras where the row's frame variant has them: the
// database information block, or the scratchpad, then the call type and
// the table callback.
void placeExtras(const cat::Routine &row, const std::vector<void *> &extras, frame::Frame &f) {
  switch (row.frame) {
    case cat::Frame::plain:
      break;
    case cat::Frame::dbinfo:
      f.dbinfo = extras[0];
      break;
    case cat::Frame::scratchpad:
      f.scratchpad = extras[0];
      break;
    case cat::Frame::table:
    case cat::Frame::tableCallback:
      f.scratchpad = extras[0];
      f.callType = static_cast<std::int32_t *>(extras[1]);
      if (row.frame == cat::Frame::tableCallback) {
        f.callback = reinterpret_cast<CLI_tableCallback>(extras[2]);
      }
      break;
  }
}

std::size_t widthOf(Value::Layout layout) {
  switch (layout) {
    case Value::Layout::int16:
      return 2;
    case Value::Layout::int32:
      return 4;
    default:
      return 8;
  }
}

bool isNumber(Value::Layout layout) {
  return layout != Value::Layout::text && layout != Value::Layout::lob &&
         layout != Value::Layout::fixed;
}

// The bytes of a result's area: a number's width, a CLI_udfLob's length
// word and capacity, or the size asked for.
std::size_t areaOf(const Value &result) {
  if (isNumber(result.layout)) return widthOf(result.layout);
  if (result.layout == Value::Layout::lob) return CLI_LOB_AREA_SIZE(std::size_t{result.size});
  return result.size;
}

// A number is its bytes in the machine's order; terminated text its bytes
// and a NUL; a CLI_udfLob its length word and its data.
std::vector<unsigned char> bytesOf(const Value &v) {
  if (isNumber(v.layout)) {
    unsigned char raw[8];
    const auto n16 = static_cast<std::int16_t>(v.number);
    const auto n32 = static_cast<std::int32_t>(v.number);
    const void *from = v.layout == Value::Layout::int16   ? static_cast<const void *>(&n16)
                       : v.layout == Value::Layout::int32 ? static_cast<const void *>(&n32)
                                                          : static_cast<const void *>(&v.number);
    std::memcpy(raw, from, widthOf(v.layout));
    return {raw, raw + widthOf(v.layout)};
  }
  if (v.layout == Value::Layout::lob) {
    const auto n = static_cast<std::uint32_t>(v.bytes.size());  // the length word's width
    std::vector<unsigned char> out(CLI_LOB_AREA_SIZE(std::size_t{n}));
    frame::layOutLob(out.data(), v.bytes.data(), n);
    return out;
  }
  std::vector<unsigned char> out(v.bytes.begin(), v.bytes.end());
  if (v.layout == Value::Layout::text) out.push_back(0);
  return out;
}

// A number read back from its area, sign-extended; a double as its bits.
std::int64_t numberIn(const unsigned char *area, Value::Layout layout) {
  switch (layout) {
    case Value::Layout::int16: {
      std::int16_t x = 0;
      std::memcpy(&x, area, 2);
      return x;
    }
    case Value::Layout::int32: {
      std::int32_t x = 0;
      std::memcpy(&x, area, 4);
      return x;
    }
    default: {
      std::int64_t x = 0;
      std::memcpy(&x, area, 8);
      return x;
    }
  }
}

Outcome resultIn(const char *name, const std::vector<unsigned char> &out, std::size_t area,
                 const Value &result, bool succeeded);
Outcome callFrame(const char *name, const std::vector<Value> &inputs, const Value &result,
                  bool nullable, const std::vector<void *> &extras);

}  // namespace

LibraryInUse::LibraryInUse(const char *path) : previous_(currentLibrary) { currentLibrary = path; }
LibraryInUse::~LibraryInUse() { currentLibrary = previous_; }

void *exportAddress(const char *name) {
  return library() == nullptr ? nullptr : findExport(library(), name);
}

void PrintTo(const Outcome &o, std::ostream *os) {
  if (!o.error.empty()) {
    *os << "SYSFUN:" << o.error;
  } else {
    *os << ::testing::PrintToString(o.bytes) << " (" << o.bytes.size() << " bytes), " << o.number;
  }
  if (o.real) *os << " = " << std::setprecision(17) << std::bit_cast<double>(o.number);
  if (o.stored) *os << ", stored";
}

Outcome call(const char *name, const std::vector<Value> &inputs, const Value &result,
             const std::vector<void *> &extras) {
  return callFrame(name, inputs, result, false, extras);
}

Outcome callNullable(const char *name, const std::vector<Value> &inputs, const Value &result) {
  return callFrame(name, inputs, result, true, {});
}

namespace {

Outcome callFrame(const char *name, const std::vector<Value> &inputs, const Value &result,
                  bool nullable, const std::vector<void *> &extras) {
  const cat::Routine *row = cat::find(name);
  if (row == nullptr) {
    ADD_FAILURE() << name << " has no row in the catalogue";
    return fails("no row");
  }
  void *fn = exportAddress(name);
  EXPECT_NE(fn, nullptr) << name << " is not exported";
  if (fn == nullptr) return fails("no export");
  if (inputs.size() != cat::inputCount(*row) || cat::resultCount(*row) != 1 ||
      extras.size() != cat::extraCount(row->frame)) {
    ADD_FAILURE() << name << ": its row takes " << cat::inputCount(*row) << " inputs, "
                  << cat::resultCount(*row) << " results and " << cat::extraCount(row->frame)
                  << " extras, not " << inputs.size() << ", 1 and " << extras.size();
    return fails("no frame");
  }

  std::vector<std::vector<unsigned char>> in;
  in.reserve(inputs.size());
  for (const Value &v : inputs) in.push_back(bytesOf(v));

  const std::size_t area = areaOf(result);
  std::vector<unsigned char> out(area + kCanaryBytes, kCanary);
  std::fill_n(out.begin(), area, kUnwritten);
  if (result.layout == Value::Layout::lob) frame::prepareLobResult(out.data(), result.size);
  const std::vector<unsigned char> before = out;

  std::vector<std::int16_t> indicators(inputs.size() + 1, kIndicator);
  if (nullable) {
    for (std::size_t i = 0; i < inputs.size(); ++i) indicators[i] = inputs[i].null ? -1 : 0;
  }
  const std::vector<std::int16_t> indicatorsBefore = indicators;
  char sqlstate[CLI_SQLSTATE_SIZE];
  char message[kMessageBytes];
  std::memset(sqlstate, 'S', sizeof sqlstate);
  std::memset(message, 'M', sizeof message);

  std::array<void *, cat::kMaxInputs> inputAt{};
  std::array<std::int16_t *, cat::kMaxInputs> inputIndicatorAt{};
  for (std::size_t i = 0; i < inputs.size(); ++i) {
    inputAt[i] = inputs[i].placed != nullptr ? const_cast<void *>(inputs[i].placed) : in[i].data();
    inputIndicatorAt[i] = &indicators[i];
  }
  void *const resultAt[] = {out.data()};
  std::int16_t *const resultIndicatorAt[] = {&indicators.back()};
  frame::Frame f;
  f.inputs = inputAt.data();
  f.results = resultAt;
  f.inputIndicators = inputIndicatorAt.data();
  f.resultIndicators = resultIndicatorAt;
  f.sqlstate = sqlstate;
  f.functionName = "FUNCTION";
  f.specificName = "SPECIFIC";
  f.message = message;
  placeExtras(*row, extras, f);
  frame::call(*row, fn, f);

  EXPECT_TRUE(std::all_of(out.begin() + static_cast<std::ptrdiff_t>(area), out.end(),
                          [](unsigned char b) { return b == kCanary; }))
      << name << " wrote past its result area";
  EXPECT_TRUE(std::equal(indicators.begin(), indicators.end() - (nullable ? 1 : 0),
                         indicatorsBefore.begin()))
      << name << " touched a null indicator";
  const int resultIndicator = nullable ? indicators.back() : 0;

  // Routines that handle NULL themselves (VEBLOB_CP) report SQLSTATEs of
  // their own: the five characters are the outcome's error.
  if (nullable && sqlstate[0] != 'S' && std::string(sqlstate, 5) != "38552") {
    Outcome failed = fails(std::string(sqlstate, 5));
    failed.indicator = resultIndicator;
    return failed;
  }
  if (sqlstate[0] != 'S') {
    EXPECT_EQ(std::string(sqlstate, 6), std::string("38552\0", 6)) << name;
    EXPECT_EQ(std::string(message, 7), "SYSFUN:") << name;
    EXPECT_TRUE(std::isdigit(static_cast<unsigned char>(message[7])) &&
                std::isdigit(static_cast<unsigned char>(message[8])))
        << name << ": the code is not two digits";
    EXPECT_EQ(message[9], '\0') << name;
    EXPECT_TRUE(std::all_of(message + 10, message + kMessageBytes, [](char c) { return c == 'M'; }))
        << name << " wrote past the message";
    // A failure may leave what the routine stored before its test.
    if (out == before) {
      Outcome failed = fails(std::string(message + 7, 2));
      failed.indicator = resultIndicator;
      return failed;
    }
    Outcome failed = resultIn(name, out, area, result, false);
    failed.indicator = resultIndicator;
    failed.error = std::string(message + 7, 2);
    failed.stored = true;
    return failed;
  }
  EXPECT_TRUE(std::all_of(sqlstate, sqlstate + 6, [](char c) { return c == 'S'; })) << name;
  EXPECT_TRUE(std::all_of(message, message + kMessageBytes, [](char c) { return c == 'M'; }))
      << name << " wrote a message on success";
  Outcome got = resultIn(name, out, area, result, true);
  got.indicator = resultIndicator;
  return got;
}

}  // namespace

namespace {

// The result area read back in the result's layout.  After a failure a
// CLI_udfLob's length word need not be a length the area holds.
Outcome resultIn(const char *name, const std::vector<unsigned char> &out, std::size_t area,
                 const Value &result, bool succeeded) {
  switch (result.layout) {
    case Value::Layout::int16:
    case Value::Layout::int32:
    case Value::Layout::int64:
      return ok(numberIn(out.data(), result.layout));
    case Value::Layout::real: {
      Outcome o = ok(numberIn(out.data(), result.layout));
      o.real = true;
      return o;
    }
    case Value::Layout::text: {
      const auto end = std::find(out.begin(), out.begin() + static_cast<std::ptrdiff_t>(area), 0);
      EXPECT_NE(end, out.begin() + static_cast<std::ptrdiff_t>(area)) << name << ": no terminator";
      return ok(std::string(out.begin(), end));
    }
    case Value::Layout::fixed:
      return ok(std::string(out.begin(), out.begin() + static_cast<std::ptrdiff_t>(area)));
    case Value::Layout::lob: {
      std::uint32_t n = 0;
      std::memcpy(&n, out.data(), 4);
      if (succeeded) {
        EXPECT_LE(n, result.size) << name << ": length beyond the capacity";
      }
      n = std::min(n, result.size);
      return ok(std::string(out.begin() + 4, out.begin() + 4 + n));
    }
  }
  return {};
}

}  // namespace

}  // namespace orv::test
