#include "support/frame_call.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <iomanip>
#include <map>
#include <mutex>
#include <string_view>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "support/platform.hpp"

namespace orv::test {
namespace {

namespace cat = cli::catalogue;
using Bytes = std::vector<unsigned char>;
using L = Value::Layout;
static_assert(std::endian::native == std::endian::little, "numbers are their low bytes");

constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
constexpr unsigned char kCanary = 0xA5;     // fills the bytes behind a result area
constexpr std::size_t kCanaryBytes = 64;
constexpr std::int16_t kIndicator = 0x5A5A;
constexpr std::size_t kMessageBytes = CLI_MESSAGE_SIZE + 42;  // with a guard behind

const char *currentLibrary = ORV_LIBRARY_PATH;

bool allAre(const auto *from, const auto *to, int value) {
  return std::all_of(from, to, [&](auto b) { return b == value; });
}

constexpr std::size_t widthOf(L layout) {
  return layout == L::int16 ? 2 : layout == L::int32 ? 4 : 8;
}

// A number is its bytes in the machine's order; terminated text its bytes
// and a NUL; a CLI_udfLob its length word and its data.
Bytes bytesOf(const Value &v) {
  if (v.layout == L::lob) {
    const auto n = static_cast<std::uint32_t>(v.bytes.size());  // the length word's width
    Bytes out(CLI_LOB_AREA_SIZE(std::size_t{n}));
    cli::call::layOutLob(out.data(), v.bytes.data(), n);
    return out;
  }
  if (v.layout != L::text && v.layout != L::fixed) {
    Bytes out(widthOf(v.layout));
    std::memcpy(out.data(), &v.number, out.size());
    return out;
  }
  Bytes out(v.bytes.begin(), v.bytes.end());
  if (v.layout == L::text) out.push_back(0);
  return out;
}

// The shape of a catalogue result slot, whose layouts run in the same
// order, behind `none` and with two fixed ones.
static_assert(static_cast<int>(cat::Layout::int16) == static_cast<int>(L::int16) + 1 &&
              static_cast<int>(cat::Layout::fixedText) == static_cast<int>(L::fixed) + 1);
Value areaFor(const cat::Slot &slot) {
  const auto layout = static_cast<L>(
      std::min(static_cast<int>(slot.layout), static_cast<int>(cat::Layout::fixedText)) - 1);
  return {layout, 0, {}, layout == L::text ? slot.size + 1 : slot.size};
}

// The result area read back in the result's layout.  After a failure a
// CLI_udfLob's length word need not be a length the area holds.
Outcome resultIn(const char *name, const Bytes &out, std::size_t area, const Value &result,
                 bool succeeded) {
  const auto *at = out.data();
  if (result.layout == L::text) {
    const auto *nul = std::find(at, at + area, 0);
    EXPECT_NE(nul, at + area) << name << ": no terminator";
    return ok(std::string(at, nul));
  }
  if (result.layout == L::fixed) return ok(std::string(at, at + area));
  if (result.layout == L::lob) {
    std::uint32_t n = 0;
    std::memcpy(&n, at, 4);
    EXPECT_TRUE(!succeeded || n <= result.size) << name << ": length " << n << " beyond capacity";
    return ok(std::string(at + 4, at + 4 + std::min(n, result.size)));
  }
  // A number, sign-extended; a double as its bits.
  std::int64_t v = 0;
  std::memcpy(&v, at, area);
  if (area < 8 && (at[area - 1] & 0x80) != 0) v -= std::int64_t{1} << (8 * area);
  Outcome o = ok(v);
  o.real = result.layout == L::real;
  return o;
}

Outcome callFrame(const char *name, const std::vector<Value> &inputs, const Value *shape,
                  const std::vector<void *> &extras) {
  const cat::Routine *row = cat::find(name);
  void *fn = exportAddress(name);
  if (row == nullptr || fn == nullptr || inputs.size() != cat::inputCount(*row) ||
      cat::resultCount(*row) != 1 || extras.size() != cat::extraCount(row->frame)) {
    ADD_FAILURE() << name << " is no export of " << inputs.size() << " inputs, one result and "
                  << extras.size() << " extras";
    return fails("no frame");
  }
  const Value result = shape != nullptr ? *shape : areaFor(row->results[0]);
  const bool nullable = (row->properties & cat::kHandlesNull) != 0;

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

  const std::size_t area = result.layout == L::lob ? CLI_LOB_AREA_SIZE(std::size_t{result.size})
                           : result.layout == L::text || result.layout == L::fixed
                               ? result.size
                               : widthOf(result.layout);
  // Each thread keeps its areas from call to call: a CLI_udfLob area is a
  // megabyte, and allocating it anew on each call is slow on some systems.
  thread_local Bytes out, before;
  out.assign(area + kCanaryBytes, kCanary);
  std::fill_n(out.begin(), area, kUnwritten);
  if (result.layout == L::lob) cli::call::prepareLobResult(out.data(), result.size);
  before = out;
  char sqlstate[CLI_SQLSTATE_SIZE];
  char message[kMessageBytes];
  std::memset(sqlstate, 'S', sizeof sqlstate);
  std::memset(message, 'M', sizeof message);

  void *const resultAt[] = {out.data()};
  std::int16_t *const resultIndicatorAt[] = {&indicators.back()};
  cli::call::Frame f{.inputs = inputAt.data(),
                     .results = resultAt,
                     .inputIndicators = inputIndicatorAt.data(),
                     .resultIndicators = resultIndicatorAt,
                     .sqlstate = sqlstate,
                     .functionName = "FUNCTION",
                     .specificName = "SPECIFIC",
                     .message = message};
  // The caller's extras, in the frame's order.
  const unsigned has = cat::extrasOf(row->frame);
  auto extra = extras.begin();
  if ((has & cat::kDbinfo) != 0) f.dbinfo = *extra++;
  if ((has & cat::kScratchpad) != 0) f.scratchpad = *extra++;
  if ((has & cat::kCallType) != 0) f.callType = static_cast<std::int32_t *>(*extra++);
  if ((has & cat::kCallback) != 0) f.callback = reinterpret_cast<CLI_tableCallback>(*extra);
  cli::call::call(*row, fn, f);

  EXPECT_TRUE(allAre(out.data() + area, out.data() + out.size(), kCanary))
      << name << " wrote past its result area";
  EXPECT_TRUE(std::equal(indicators.begin(), indicators.end() - (nullable ? 1 : 0),
                         indicatorsBefore.begin()))
      << name << " touched a null indicator";
  Outcome got;
  if (nullable && sqlstate[0] != 'S' && std::string_view(sqlstate, 5) != "38552") {
    // A status of the routine's own: five characters and eight.
    EXPECT_TRUE(sqlstate[5] == 'S' && allAre(message + 8, message + kMessageBytes, 'M')) << name;
    got = fails(std::string(sqlstate, 5) + "/" + std::string(message, 8));
  } else if (sqlstate[0] != 'S') {
    const std::string code(message, 10);
    EXPECT_EQ(std::string(sqlstate, 6), std::string("38552\0", 6)) << name;
    EXPECT_TRUE(code.starts_with("SYSFUN:") && std::isdigit(static_cast<unsigned char>(code[7])) &&
                std::isdigit(static_cast<unsigned char>(code[8])) && code[9] == '\0' &&
                row->raises.contains(cli::sysfunOf(&code[7])))
        << name << ": message " << ::testing::PrintToString(code);
    EXPECT_TRUE(allAre(message + 10, message + kMessageBytes, 'M'))
        << name << " wrote past the message";
    // A failure may leave what the routine stored before its test.
    if (out != before) {
      got = resultIn(name, out, area, result, false);
      got.stored = true;
    }
    got.error = code.substr(7, 2);
  } else {
    EXPECT_TRUE(allAre(sqlstate, sqlstate + 6, 'S')) << name;
    EXPECT_TRUE(allAre(message, message + kMessageBytes, 'M'))
        << name << " wrote a message on success";
    // No text or CLI_udfLob of some capacity can be the bytes of the area
    // before the call: a routine that wrote nothing.
    const bool told = result.layout == L::text || (result.layout == L::lob && result.size > 0);
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

Outcome call(const char *name, const std::vector<Value> &inputs) {
  return callFrame(name, inputs, nullptr, {});
}

Outcome call(const char *name, const std::vector<Value> &inputs, const Value &result,
             const std::vector<void *> &extras) {
  return callFrame(name, inputs, &result, extras);
}

}  // namespace orv::test
