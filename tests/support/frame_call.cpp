#include "support/frame_call.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cctype>
#include <cstring>
#include <iomanip>
#include <map>
#include <mutex>
#include <utility>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "support/platform.hpp"

namespace orv::test {
namespace {

namespace cat = cli::catalogue;
namespace frame = cli::call;
using Bytes = std::vector<unsigned char>;

constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
constexpr unsigned char kCanary = 0xA5;     // fills the bytes behind a result area
constexpr std::size_t kCanaryBytes = 64;
constexpr std::int16_t kIndicator = 0x5A5A;
// The message buffer of the frame, and a guard behind it that a routine
// writing past the message would reach.
constexpr std::size_t kMessageBytes = CLI_MESSAGE_SIZE + 42;

const char *currentLibrary = ORV_LIBRARY_PATH;

template <typename It, typename T>
bool allAre(It from, It to, T value) {
  return std::all_of(from, to, [&](auto b) { return b == value; });
}

// Puts the caller's extras where the row's frame variant has them: the
// database information block, or the scratchpad, then the call type and
// the table callback.
void placeExtras(const cat::Routine &row, const std::vector<void *> &extras, frame::Frame &f) {
  const unsigned has = cat::extrasOf(row.frame);
  std::size_t next = 0;
  if ((has & cat::kDbinfo) != 0) f.dbinfo = extras[next++];
  if ((has & cat::kScratchpad) != 0) f.scratchpad = extras[next++];
  if ((has & cat::kCallType) != 0) f.callType = static_cast<std::int32_t *>(extras[next++]);
  if ((has & cat::kCallback) != 0) f.callback = reinterpret_cast<CLI_tableCallback>(extras[next]);
}

template <typename T>
Bytes bytesOfNumber(T x) {
  Bytes out(sizeof x);
  std::memcpy(out.data(), &x, sizeof x);
  return out;
}

template <typename T>
std::int64_t numberAt(const unsigned char *area) {
  T x{};
  std::memcpy(&x, area, sizeof x);
  return x;
}

// A number is its bytes in the machine's order; terminated text its bytes
// and a NUL; a CLI_udfLob its length word and its data.
Bytes bytesOf(const Value &v) {
  switch (v.layout) {
    case Value::Layout::int16:
      return bytesOfNumber(static_cast<std::int16_t>(v.number));
    case Value::Layout::int32:
      return bytesOfNumber(static_cast<std::int32_t>(v.number));
    case Value::Layout::int64:
    case Value::Layout::real:
      return bytesOfNumber(v.number);
    case Value::Layout::lob: {
      const auto n = static_cast<std::uint32_t>(v.bytes.size());  // the length word's width
      Bytes out(CLI_LOB_AREA_SIZE(std::size_t{n}));
      frame::layOutLob(out.data(), v.bytes.data(), n);
      return out;
    }
    default: {
      Bytes out(v.bytes.begin(), v.bytes.end());
      if (v.layout == Value::Layout::text) out.push_back(0);
      return out;
    }
  }
}

// The bytes of a result's area: a CLI_udfLob's length word and capacity,
// the size asked for, or a number's width.
std::size_t areaOf(const Value &result) {
  if (result.layout == Value::Layout::lob) return CLI_LOB_AREA_SIZE(std::size_t{result.size});
  if (result.layout == Value::Layout::text || result.layout == Value::Layout::fixed) {
    return result.size;
  }
  return bytesOf(result).size();
}

// The result area read back in the result's layout.  After a failure a
// CLI_udfLob's length word need not be a length the area holds.
Outcome resultIn(const char *name, const Bytes &out, std::size_t area, const Value &result,
                 bool succeeded) {
  const auto end = out.begin() + static_cast<std::ptrdiff_t>(area);
  switch (result.layout) {
    case Value::Layout::text: {
      const auto nul = std::find(out.begin(), end, 0);
      EXPECT_NE(nul, end) << name << ": no terminator";
      return ok(std::string(out.begin(), nul));
    }
    case Value::Layout::fixed:
      return ok(std::string(out.begin(), end));
    case Value::Layout::lob: {
      std::uint32_t n = 0;
      std::memcpy(&n, out.data(), 4);
      EXPECT_TRUE(!succeeded || n <= result.size) << name << ": length " << n << " beyond capacity";
      n = std::min(n, result.size);
      return ok(std::string(out.begin() + 4, out.begin() + 4 + n));
    }
    // A number, sign-extended; a double as its bits.
    case Value::Layout::int16:
      return ok(numberAt<std::int16_t>(out.data()));
    case Value::Layout::int32:
      return ok(numberAt<std::int32_t>(out.data()));
    case Value::Layout::int64:
      return ok(numberAt<std::int64_t>(out.data()));
    case Value::Layout::real:
      return okReal(std::bit_cast<double>(numberAt<std::int64_t>(out.data())));
  }
  return {};
}

Outcome callFrame(const char *name, const std::vector<Value> &inputs, const Value &result,
                  bool nullable, const std::vector<void *> &extras) {
  const cat::Routine *row = cat::find(name);
  void *fn = exportAddress(name);
  if (row == nullptr || fn == nullptr) {
    ADD_FAILURE() << name << (row == nullptr ? " has no row in the catalogue" : " is not exported");
    return fails("no export");
  }
  if (inputs.size() != cat::inputCount(*row) || cat::resultCount(*row) != 1 ||
      extras.size() != cat::extraCount(row->frame)) {
    ADD_FAILURE() << name << ": its row takes " << cat::inputCount(*row) << " inputs, "
                  << cat::resultCount(*row) << " results and " << cat::extraCount(row->frame)
                  << " extras, not " << inputs.size() << ", 1 and " << extras.size();
    return fails("no frame");
  }

  std::vector<Bytes> in;
  in.reserve(inputs.size());
  std::vector<std::int16_t> indicators(inputs.size() + 1, kIndicator);
  std::array<void *, cat::kMaxInputs> inputAt{};
  std::array<std::int16_t *, cat::kMaxInputs> inputIndicatorAt{};
  for (std::size_t i = 0; i < inputs.size(); ++i) {
    in.push_back(bytesOf(inputs[i]));
    inputAt[i] = inputs[i].placed != nullptr ? const_cast<void *>(inputs[i].placed) : in[i].data();
    if (nullable) indicators[i] = inputs[i].null ? -1 : 0;
    inputIndicatorAt[i] = &indicators[i];
  }
  const std::vector<std::int16_t> indicatorsBefore = indicators;

  const std::size_t area = areaOf(result);
  // Each thread keeps its areas from call to call: a CLI_udfLob area is a
  // megabyte, and allocating it anew on each call is slow on some systems.
  thread_local Bytes out, before;
  out.assign(area + kCanaryBytes, kCanary);
  std::fill_n(out.begin(), area, kUnwritten);
  if (result.layout == Value::Layout::lob) frame::prepareLobResult(out.data(), result.size);
  before = out;
  char sqlstate[CLI_SQLSTATE_SIZE];
  char message[kMessageBytes];
  std::memset(sqlstate, 'S', sizeof sqlstate);
  std::memset(message, 'M', sizeof message);

  void *const resultAt[] = {out.data()};
  std::int16_t *const resultIndicatorAt[] = {&indicators.back()};
  frame::Frame f{.inputs = inputAt.data(),
                 .results = resultAt,
                 .inputIndicators = inputIndicatorAt.data(),
                 .resultIndicators = resultIndicatorAt,
                 .sqlstate = sqlstate,
                 .functionName = "FUNCTION",
                 .specificName = "SPECIFIC",
                 .message = message};
  placeExtras(*row, extras, f);
  frame::call(*row, fn, f);

  EXPECT_TRUE(allAre(out.begin() + static_cast<std::ptrdiff_t>(area), out.end(), kCanary))
      << name << " wrote past its result area";
  EXPECT_TRUE(std::equal(indicators.begin(), indicators.end() - (nullable ? 1 : 0),
                         indicatorsBefore.begin()))
      << name << " touched a null indicator";
  Outcome got;
  if (nullable && sqlstate[0] != 'S' && std::string(sqlstate, 5) != "38552") {
    // A status of the routine's own: five characters and eight.
    EXPECT_TRUE(sqlstate[5] == 'S' && allAre(message + 8, message + kMessageBytes, 'M')) << name;
    got = fails(std::string(sqlstate, 5) + "/" + std::string(message, 8));
  } else if (sqlstate[0] != 'S') {
    const std::string code(message, 10);
    EXPECT_EQ(std::string(sqlstate, 6), std::string("38552\0", 6)) << name;
    EXPECT_TRUE(code.starts_with("SYSFUN:") && std::isdigit(static_cast<unsigned char>(code[7])) &&
                std::isdigit(static_cast<unsigned char>(code[8])) && code[9] == '\0')
        << name << ": message " << ::testing::PrintToString(code);
    EXPECT_TRUE(allAre(message + 10, message + kMessageBytes, 'M'))
        << name << " wrote past the message";
    // A failure may leave what the routine stored before its test.
    if (out != before) {
      got = resultIn(name, out, area, result, false);
      got.stored = true;
    }
    got.error = std::string(message + 7, 2);
  } else {
    EXPECT_TRUE(allAre(sqlstate, sqlstate + 6, 'S')) << name;
    EXPECT_TRUE(allAre(message, message + kMessageBytes, 'M'))
        << name << " wrote a message on success";
    // No text or CLI_udfLob of some capacity can be the bytes of the area
    // before the call: a routine that wrote nothing.
    const bool told = result.layout == Value::Layout::text ||
                      (result.layout == Value::Layout::lob && result.size > 0);
    got = told && out == before ? leftAlone() : resultIn(name, out, area, result, true);
  }
  got.indicator = nullable ? indicators.back() : 0;
  return got;
}

}  // namespace

LibraryInUse::LibraryInUse(const char *path) : previous_(currentLibrary) { currentLibrary = path; }
LibraryInUse::~LibraryInUse() { currentLibrary = previous_; }

// Each library is opened once, and each of its exports found once.
void *exportAddress(const char *name) {
  static std::mutex mutex;
  static std::map<std::string, void *> libraries, exports;
  const std::lock_guard<std::mutex> lock(mutex);
  auto [library, fresh] = libraries.try_emplace(currentLibrary);
  if (fresh) library->second = openLibrary(currentLibrary);
  if (library->second == nullptr) {
    if (fresh) ADD_FAILURE() << currentLibrary << ": " << loaderError();
    return nullptr;
  }
  auto [at, first] = exports.try_emplace(std::string(currentLibrary) + ':' + name);
  if (first) at->second = findExport(library->second, name);
  return at->second;
}

void PrintTo(const Outcome &o, std::ostream *os) {
  if (!o.error.empty()) {
    *os << "SYSFUN:" << o.error;
  } else if (o.leftAlone) {
    *os << "result left alone";
  } else {
    *os << ::testing::PrintToString(o.bytes) << " (" << o.bytes.size() << " bytes), " << o.number;
  }
  if (o.real) *os << " = " << std::setprecision(17) << std::bit_cast<double>(o.number);
  if (o.stored) *os << ", stored";
  if (o.indicator != 0) *os << ", indicator " << o.indicator;
}

Outcome call(const char *name, const std::vector<Value> &inputs, const Value &result,
             const std::vector<void *> &extras) {
  return callFrame(name, inputs, result, false, extras);
}

Outcome callNullable(const char *name, const std::vector<Value> &inputs, const Value &result) {
  return callFrame(name, inputs, result, true, {});
}

}  // namespace orv::test
