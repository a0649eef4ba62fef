#include "support/frame_call.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cctype>
#include <cstring>
#include <iomanip>
#include <map>
#include <utility>

#include "support/platform.hpp"

namespace orv::test {
namespace {

constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
constexpr unsigned char kCanary = 0xA5;     // fills the bytes behind a result area
constexpr std::size_t kCanaryBytes = 64;
constexpr std::int16_t kIndicator = 0x5A5A;
constexpr std::size_t kMessageBytes = 70;

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

// Every frame argument is a pointer, so a pointer type taking K void *
// parameters serves for any routine with a frame of K arguments.
template <std::size_t... Is>
bool invoke(void *fn, void *const *args, std::index_sequence<Is...>) {
  using Export = void (*)(decltype(Is, static_cast<void *>(nullptr))...);
  reinterpret_cast<Export>(fn)(args[Is]...);
  return true;
}

// Calls `fn` with as many arguments as `args` holds, 6 + one of Ks.
template <std::size_t... Ks>
bool invokeAny(void *fn, const std::vector<void *> &args, std::index_sequence<Ks...>) {
  const bool known =
      ((args.size() == Ks + 6 && invoke(fn, args.data(), std::make_index_sequence<Ks + 6>{})) ||
       ...);
  if (!known) ADD_FAILURE() << "no frame of " << args.size() << " arguments";
  return known;
}

// Calls `fn` with the 6 to 15 arguments of a frame with its extras.
bool invokeFrame(void *fn, const std::vector<void *> &args) {
  return invokeAny(fn, args, std::make_index_sequence<10>{});
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

// A number is its bytes in the machine's order; terminated text its bytes
// and a NUL; a CLI_udfLob its length word and its data.
std::vector<unsigned char> layOut(const Value &v) {
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
  std::vector<unsigned char> out(v.bytes.begin(), v.bytes.end());
  if (v.layout == Value::Layout::fixed) return out;
  if (v.layout == Value::Layout::text) {
    out.push_back(0);
  } else {
    const auto word = static_cast<std::uint32_t>(std::ssize(v.bytes));
    unsigned char head[4];
    std::memcpy(head, &word, sizeof word);
    out.insert(out.begin(), head, head + 4);
  }
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
  void *fn = exportAddress(name);
  EXPECT_NE(fn, nullptr) << name << " is not exported";
  if (fn == nullptr) return fails("no export");

  std::vector<std::vector<unsigned char>> in;
  in.reserve(inputs.size());
  for (const Value &v : inputs) in.push_back(layOut(v));

  const std::size_t area = isNumber(result.layout)               ? widthOf(result.layout)
                           : result.layout == Value::Layout::lob ? 4 + std::size_t{result.size}
                                                                 : result.size;
  std::vector<unsigned char> out(area + kCanaryBytes, kCanary);
  std::fill_n(out.begin(), area, kUnwritten);
  if (result.layout == Value::Layout::lob) std::memcpy(out.data(), &result.size, 4);
  const std::vector<unsigned char> before = out;

  std::vector<std::int16_t> indicators(inputs.size() + 1, kIndicator);
  if (nullable) {
    for (std::size_t i = 0; i < inputs.size(); ++i) indicators[i] = inputs[i].null ? -1 : 0;
  }
  const std::vector<std::int16_t> indicatorsBefore = indicators;
  char sqlstate[6];
  char message[kMessageBytes];
  std::memset(sqlstate, 'S', sizeof sqlstate);
  std::memset(message, 'M', sizeof message);

  std::vector<void *> args;
  args.reserve(2 * inputs.size() + 6);
  for (std::size_t i = 0; i < in.size(); ++i) {
    args.push_back(inputs[i].placed != nullptr ? const_cast<void *>(inputs[i].placed)
                                               : in[i].data());
  }
  args.push_back(out.data());
  for (auto &i : indicators) args.push_back(&i);
  args.push_back(sqlstate);
  args.push_back(const_cast<char *>("FUNCTION"));
  args.push_back(const_cast<char *>("SPECIFIC"));
  args.push_back(message);
  args.insert(args.end(), extras.begin(), extras.end());
  if (!invokeFrame(fn, args)) return fails("no frame");

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
