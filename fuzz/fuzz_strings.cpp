// Strings and integer arguments through every string routine, in both
// layouts: terminated text and CLI_udfLob.
//
// Input: a byte that picks the routine family (LCASE, the trims, LEFT and
// RIGHT, REPEAT, REPLACE, INSERT, LOCATE, ASCII, SPACE and CHAR), an
// option byte, two 32-bit integers, a 32-bit capacity, then three strings
// separated by NUL bytes (the last one runs to the end).  Option bit 0
// keeps the integers small (-2 to 4100); bit 2 puts the capacity of
// LEFT2, RIGHT2 and INSERT2 at the limit.  Strings are cut at 64 KiB,
// terminated texts at 4100 bytes (4000 for the routines without a limit
// of their own).
//
// Two costly variants are picked by a hash of the whole input, not by
// bits the fuzzer keeps when it mutates, so that they stay as rare in a
// campaign as they are among all inputs: one input in 1024 grows the
// first CLI_udfLob string to about the 1048576-byte limit by repeating it,
// one in 32 gives every CLI_udfLob result its full 1 MiB area.  Every
// result is checked against the routine's definition worked out here.
#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "harness.hpp"
#include "models/search.hpp"

namespace {

using namespace orv::fuzz;

constexpr std::uint32_t kLob = cli::catalogue::kLob;
constexpr std::size_t kText = cli::catalogue::kText;

struct Want {
  std::string code;
  std::string bytes;
};

// Calls a routine with string and integer inputs; `lob` picks the layout
// of every string input and of the result.
inline bool wideAreas = false;  // every CLI_udfLob result gets its full 1 MiB

struct StringCall {
  Call c;
  bool lob;
  StringCall(const char *name, bool isLob) : c(name), lob(isLob) {}
  StringCall &str(std::string_view s) {
    c.input(lob ? lobBlock(s) : textBlock(s));
    return *this;
  }
  StringCall &num(std::int32_t v) {
    c.input(numberBlock(v));
    return *this;
  }
  // Runs with a string result of `capacity` bytes (a text area holds one
  // more) and checks it against `want`.  A CLI_udfLob routine with a fixed
  // limit doesn't read its capacity; unless `wideAreas` is set, one that
  // should succeed gets an area just large enough for the right result,
  // and one that should fail without storing gets none at all, so that a
  // run doesn't fill and scan 1 MiB per call, and any byte written past
  // the result is caught as well.
  void expect(std::uint32_t capacity, const Want &want, bool mayStore = false,
              bool fixedLimit = false) {
    if (lob && fixedLimit && !wideAreas) {
      if (want.code.empty()) {
        capacity = static_cast<std::uint32_t>(want.bytes.size());
      } else if (!mayStore) {
        capacity = 0;
      }
    }
    c.result(lob ? lobArea(capacity) : Block(std::size_t{capacity} + 1), lob ? 4 : 0);
    if (mayStore) c.mayStoreOnFailure();
    const std::string code = c.run();
    ORV_CHECK(c.name(), code == want.code);
    if (!code.empty()) return;
    if (lob) {
      ORV_CHECK(c.name(),
                numberIn<std::uint32_t>(c.out()) <= capacity && lobIn(c.out()) == want.bytes);
    } else {
      ORV_CHECK(c.name(), textIn(c.name(), c.out()) == want.bytes);
    }
  }
  void expectNumber(std::int32_t want, const std::string &wantCode = {}) {
    c.result(Block(4));
    const std::string code = c.run();
    ORV_CHECK(c.name(), code == wantCode);
    if (code.empty()) ORV_CHECK(c.name(), numberIn<std::int32_t>(c.out()) == want);
  }
};

bool blank(char ch) { return ch == ' ' || ch == '\t'; }

std::string lowered(std::string_view s) {
  std::string out(s);
  for (char &ch : out) ch = static_cast<char>(std::tolower(static_cast<unsigned char>(ch)));
  return out;
}

std::size_t find(std::string_view in, std::string_view what, std::size_t from) {
  if (from > in.size()) return std::string_view::npos;
  return in.find(what, from);
}

Want replaced(std::string_view source, std::string_view search, std::string_view with,
              std::size_t limit) {
  std::string out;
  std::size_t at = 0;
  if (!search.empty()) {
    for (std::size_t hit; (hit = find(source, search, at)) != std::string_view::npos;) {
      out.append(source.substr(at, hit - at)).append(with);
      if (out.size() > limit) return {"10", {}};
      at = hit + search.size();
    }
  }
  out.append(source.substr(at));
  if (out.size() > limit) return {"10", {}};
  return {"", out};
}

// INSERT as the unit tests' model gives it.
Want inserted(const orv::model::Inserted &model) { return {model.code, model.bytes}; }

// FNV-1a: a hash the fuzzer's mutations scatter.
std::uint32_t fnv1a(const std::uint8_t *data, std::size_t size) {
  std::uint32_t h = 2166136261u;
  for (std::size_t i = 0; i < size; ++i) h = (h ^ data[i]) * 16777619u;
  return h;
}

// The routine families, one of which each input drives.
enum class Family : std::uint8_t {
  lcase,
  trim,
  leftRight,
  repeat,
  replace,
  insert,
  locate,
  ascii,
  spaceChar,  // the last
};
constexpr unsigned kFamilies = static_cast<unsigned>(Family::spaceChar) + 1;

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  if (size < 14) return 0;
  const std::uint32_t hash = fnv1a(data, size);
  // One routine family per input, in both layouts: a call on a long
  // string costs far more than the fuzzer's own work, and thirty calls on
  // every input would make the campaign thirty times longer for the same
  // number of calls of each routine.
  const auto family = static_cast<Family>(data[0] % kFamilies);
  ++data;
  --size;
  const std::uint8_t options = data[0];
  std::int32_t n1 = 0, n2 = 0;
  std::uint32_t capacity = 0;
  std::memcpy(&n1, data + 1, 4);
  std::memcpy(&n2, data + 5, 4);
  std::memcpy(&capacity, data + 9, 4);
  if ((options & 1u) != 0) {
    n1 = static_cast<std::int32_t>(static_cast<std::uint32_t>(n1) % 4103u) - 2;
    n2 = static_cast<std::int32_t>(static_cast<std::uint32_t>(n2) % 4103u) - 2;
  }
  wideAreas = (hash >> 10 & 31u) == 0;
  // The capacity of LEFT2, RIGHT2 and INSERT2: mostly small, within reach
  // of the small integers.
  capacity = (options & 4u) != 0 ? kLob - 2 + capacity % 4 : capacity % 8200u;

  std::string_view rest(reinterpret_cast<const char *>(data) + 13, size - 13);
  std::string_view part[3];
  for (std::string_view &p : part) {
    const std::size_t end = std::min(rest.find('\0'), rest.size());
    p = rest.substr(0, std::min<std::size_t>(end, 65536));
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
  std::string big(part[0]);
  // Growing to 1 MiB makes a call thousands of times slower.
  if ((hash & 1023u) == 0 && !big.empty()) {
    const std::size_t target = kLob - 2 + (capacity >> 8) % 5;
    while (big.size() < target) big.append(big.substr(0, target - big.size()));
  }
  const std::string_view a = big, b = part[1], cpart = part[2];

  for (const bool lob : {false, true}) {
    // Terminated text cannot hold a NUL: the parts have none, and are cut.
    const std::string_view s = lob ? a : a.substr(0, std::min<std::size_t>(a.size(), kText + 100));
    const std::string_view plain = s.substr(0, std::min<std::size_t>(s.size(), lob ? kLob : kText));
    const char *const suffix = lob ? "2" : "1";
    const auto name = [&](const char *base) {
      static thread_local std::string full;
      full = std::string("CLI_udf") + base + suffix;
      return full.c_str();
    };
    const std::uint32_t area = lob ? kLob : static_cast<std::uint32_t>(kText);

    if (family == Family::lcase)
      StringCall(name("LCASE"), lob).str(plain).expect(area, {"", lowered(plain)}, false, true);
    if (family == Family::trim) {
      std::size_t end = plain.size();
      while (end > 0 && blank(plain[end - 1])) --end;
      StringCall(name("RTRIM"), lob)
          .str(plain)
          .expect(area, {"", std::string(plain.substr(0, end))}, false, true);
      std::size_t start = 0;
      while (start < plain.size() && blank(plain[start])) ++start;
      StringCall(name("LTRIM"), lob)
          .str(plain)
          .expect(area, {"", std::string(plain.substr(start))}, false, true);
    }
    // LEFT and RIGHT: n within 0..4000 for text; for CLI_udfLob below
    // the capacity (LEFT) or up to it (RIGHT).
    if (family == Family::leftRight) {
      const std::int64_t high = lob ? std::int64_t{capacity} - 1 : std::int64_t{kText};
      const std::uint32_t cap = lob ? capacity : static_cast<std::uint32_t>(kText);
      Want left{"01", {}}, right{"01", {}};
      if (n1 >= 0 && n1 <= high) {
        const auto n = static_cast<std::size_t>(n1);
        left = {"", std::string(s.substr(0, n))};
        left.bytes.resize(n, ' ');
      }
      if (n1 >= 0 && n1 <= high + (lob ? 1 : 0)) {
        const auto n = static_cast<std::size_t>(n1);
        right = {"", std::string(n <= s.size() ? s.substr(s.size() - n) : s)};
        right.bytes.resize(n, ' ');
      }
      StringCall(name("LEFT"), lob).str(s).num(n1).expect(cap, left);
      StringCall(name("RIGHT"), lob).str(s).num(n1).expect(cap, right);
    }
    if (family == Family::repeat) {
      const std::size_t limit = lob ? kLob : kText;
      Want want{"", {}};
      if (!s.empty()) {
        if (n2 < 0 || static_cast<std::size_t>(n2) > limit / s.size()) {
          want.code = "10";
        } else {
          for (std::int32_t i = 0; i < n2; ++i) want.bytes.append(s);
        }
      }
      StringCall(name("REPEAT"), lob).str(s).num(n2).expect(area, want, false, true);
    }
    if (family == Family::replace) {
      StringCall(lob ? "CLI_udfREPLACE2" : "CLI_udfREPLACE1", lob)
          .str(s)
          .str(b)
          .str(cpart)
          .expect(area, replaced(s, b, cpart, lob ? kLob : kText), true, true);
    }
    if (family == Family::insert) {
      const std::uint32_t cap = lob ? capacity : static_cast<std::uint32_t>(kText);
      StringCall(lob ? "CLI_udfINSERT2" : "CLI_udfINSERT1", lob)
          .str(s)
          .num(n1)
          .num(n2)
          .str(b)
          .expect(cap, inserted(orv::model::insert(lob, s, n1, n2, b, cap)));
    }
    // LOCATE: search string b in s.
    if (family == Family::locate) {
      const std::size_t hit = s.find(b);
      const std::int32_t first =
          hit == std::string_view::npos ? 0 : static_cast<std::int32_t>(hit) + 1;
      StringCall(lob ? "CLI_udfLOCATE4" : "CLI_udfLOCATE3", lob).str(b).str(s).expectNumber(first);
      const std::int32_t high =
          lob ? static_cast<std::int32_t>(kLob) : static_cast<std::int32_t>(kText);
      std::int32_t want = 0;
      std::string code;
      if (n1 < 1 || n1 > high) {
        code = "01";
      } else {
        const std::size_t from = find(s, b, static_cast<std::size_t>(n1 - 1));
        want = from == std::string_view::npos ? 0 : static_cast<std::int32_t>(from) + 1;
      }
      StringCall(lob ? "CLI_udfLOCATE2" : "CLI_udfLOCATE1", lob)
          .str(b)
          .str(s)
          .num(n1)
          .expectNumber(want, code);
    }
    // ASCII: two text forms, one CLI_udfLob form.
    if (family == Family::ascii) {
      const std::int32_t firstByte = s.empty() ? 0 : static_cast<unsigned char>(s[0]);
      if (lob) {
        StringCall("CLI_udfASCII3", true).str(s).expectNumber(firstByte);
      } else {
        StringCall("CLI_udfASCII1", false).str(s).expectNumber(firstByte);
        StringCall("CLI_udfASCII2", false).str(s).expectNumber(firstByte);
      }
    }
  }

  // SPACE and CHAR take an integer only.
  if (family == Family::spaceChar) {
    Want want{"01", {}};
    if (n1 >= 0 && n1 <= static_cast<std::int32_t>(kText))
      want = {"", std::string(static_cast<std::size_t>(n1), ' ')};
    StringCall("CLI_udfSPACE", false).num(n1).expect(kText, want);
    const char byte = n2 == 0 ? ' ' : (n2 < 0 || n2 > 255) ? '\xFF' : static_cast<char>(n2);
    StringCall("CLI_udfCHAR", false).num(n2).expect(1, {"", std::string(1, byte)});
  }
  return 0;
}
