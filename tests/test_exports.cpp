// The library's exports are exactly the catalogue's routines, in code
// under their undecorated names, and the data export as data, read from the
// library itself (an ELF file's dynamic symbols or a loaded DLL's export
// directory); the frame caller and what the hosts read back from a status;
// and every scalar routine, called from 8 threads at once.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <iterator>
#include <map>
#include <set>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "frame/call.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

#if !defined(_WIN32)
#include <elf.h>
#endif

namespace {

namespace cat = cli::catalogue;
using cat::kRoutines;
using namespace orv::test;

// The library's own name, and each export with what it is: "code", "data",
// or what else the library says of it.
struct Surface {
  std::string name;
  std::map<std::string, std::string> exports;
};

#if defined(_WIN32)

template <typename T>
T at(const unsigned char *p) {
  T value{};
  std::memcpy(&value, p, sizeof(T));
  return value;
}

// The export directory of the DLL loaded at `base`, where every address is
// an offset from the base: an export lies in code when its section may be
// executed (IMAGE_SCN_MEM_EXECUTE).
Surface exportsOf(const unsigned char *base) {
  const unsigned char *pe = base + at<std::uint32_t>(base + 0x3C);
  const unsigned char *optional = pe + 24;
  EXPECT_EQ(at<std::uint16_t>(optional), 0x20B) << "no PE32+ image";
  const unsigned char *sections = optional + at<std::uint16_t>(pe + 20);
  const auto directory = at<std::uint32_t>(optional + 112);
  const auto directoryEnd = directory + at<std::uint32_t>(optional + 116);
  const auto kind = [&](std::uint32_t rva) -> std::string {
    if (rva >= directory && rva < directoryEnd) return "forwarded";
    for (unsigned i = 0; i < at<std::uint16_t>(pe + 6); ++i) {
      const unsigned char *s = sections + 40 * i;
      const auto address = at<std::uint32_t>(s + 12);
      const auto size = std::max(at<std::uint32_t>(s + 8), at<std::uint32_t>(s + 16));
      const bool code = (at<std::uint32_t>(s + 36) & 0x20000000) != 0;
      if (rva >= address && rva < address + size) return code ? "code" : "data";
    }
    return "nowhere";
  };
  const unsigned char *dir = base + directory;
  const auto textAt = [&](const unsigned char *rvaAt) {
    return std::string(reinterpret_cast<const char *>(base + at<std::uint32_t>(rvaAt)));
  };
  Surface out{textAt(dir + 12), {}};
  const auto nameCount = at<std::uint32_t>(dir + 24);
  EXPECT_EQ(at<std::uint32_t>(dir + 20), nameCount) << "exports by ordinal only";
  for (std::uint32_t i = 0; i < nameCount; ++i) {
    const auto ordinal = at<std::uint16_t>(base + at<std::uint32_t>(dir + 36) + 2 * i);
    out.exports[textAt(base + at<std::uint32_t>(dir + 32) + 4 * i)] =
        kind(at<std::uint32_t>(base + at<std::uint32_t>(dir + 28) + 4 * ordinal));
  }
  return out;
}

#else

template <typename T>
T readAt(const std::vector<char> &bytes, std::uint64_t offset) {
  T value{};
  if (offset + sizeof(T) <= bytes.size()) std::memcpy(&value, bytes.data() + offset, sizeof(T));
  return value;
}

// The defined, global, default-visibility symbols of an ELF64 file's
// .dynsym, and its DT_SONAME; data is a 4-byte object.
Surface exportsOf(const std::vector<char> &file) {
  Surface out;
  const auto header = readAt<Elf64_Ehdr>(file, 0);
  EXPECT_TRUE(std::memcmp(header.e_ident, ELFMAG, SELFMAG) == 0 &&
              header.e_ident[EI_CLASS] == ELFCLASS64)
      << "no ELF64 file";
  const auto section = [&](unsigned i) {
    return readAt<Elf64_Shdr>(file, header.e_shoff + std::uint64_t{i} * header.e_shentsize);
  };
  for (unsigned i = 0; i < header.e_shnum; ++i) {
    const Elf64_Shdr s = section(i);
    const Elf64_Shdr strings = section(s.sh_link);
    const auto name = [&](std::uint64_t at) {
      return std::string(file.data() + strings.sh_offset + at);
    };
    if (s.sh_type == SHT_DYNSYM) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Sym)) {
        const auto sym = readAt<Elf64_Sym>(file, at);
        if (sym.st_shndx == SHN_UNDEF || ELF64_ST_BIND(sym.st_info) != STB_GLOBAL ||
            ELF64_ST_VISIBILITY(sym.st_other) != STV_DEFAULT) {
          continue;
        }
        const unsigned type = ELF64_ST_TYPE(sym.st_info);
        out.exports[name(sym.st_name)] = type == STT_FUNC                         ? "code"
                                         : type == STT_OBJECT && sym.st_size == 4 ? "data"
                                                                                  : "other";
      }
    } else if (s.sh_type == SHT_DYNAMIC) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Dyn)) {
        const auto entry = readAt<Elf64_Dyn>(file, at);
        if (entry.d_tag == DT_SONAME) out.name = name(entry.d_un.d_val);
      }
    }
  }
  return out;
}

#endif

TEST(Exports, AreExactlyTheCataloguedRoutinesAndTheDataExportAsData) {
  void *library = openLibrary(ORV_LIBRARY_PATH);
  ASSERT_NE(library, nullptr) << loaderError();
#if defined(_WIN32)
  const Surface surface = exportsOf(static_cast<const unsigned char *>(library));
  EXPECT_EQ(surface.name, "ORVCLIFN.dll");
#else
  std::ifstream in(ORV_LIBRARY_PATH, std::ios::binary);
  const Surface surface = exportsOf({std::istreambuf_iterator<char>(in), {}});
  EXPECT_EQ(surface.name, "liborvclifn.so.1");
#endif
  closeLibrary(library);
  // Each routine once, named after its SQL function (with a digit when it
  // has several exports), but the table functions of mixed case.
  const std::set<std::string> mixedCase = {"CLI_udfFmpThreads", "CLI_udfFmpRows",
                                           "SQLCACHE_SNAPSHOT"};
  std::map<std::string, std::string> expected = {{"sqlzThisIsAORVLibrary", "data"}};
  for (const auto &r : kRoutines) {
    EXPECT_TRUE(expected.emplace(r.symbol, "code").second) << r.symbol << " is listed twice";
    const std::string base = "CLI_udf" + std::string(r.sqlName), symbol = r.symbol;
    EXPECT_TRUE(mixedCase.contains(symbol) || symbol == base ||
                (symbol.size() == base.size() + 1 && symbol.starts_with(base) &&
                 std::isdigit(static_cast<unsigned char>(symbol.back()))))
        << symbol << " for " << r.sqlName;
  }
  EXPECT_EQ(surface.exports, expected);
  const auto *mark = static_cast<const std::int32_t *>(exportAddress("sqlzThisIsAORVLibrary"));
  ASSERT_NE(mark, nullptr);
  EXPECT_EQ(*mark, 0);
}

// What the hosts read back from a status: one of the ten codes behind
// "38552" and "SYSFUN:", or none for anything else.
TEST(SysfunIn, ReadsOnlyTheTenCodes) {
  const struct {
    const char *sqlstate, *message;
    int code;
  } cases[] = {
      {"38552", "SYSFUN:01", 1}, {"38552", "SYSFUN:11", 11}, {"38552", "SYSFUN:10", 10},
      {"38552", "SYSFUN:09", 0}, {"38552", "SYSFUN:12", 0},  {"38552", "SYSFUN:0;", 0},
      {"38552", "SYSFUN:1", 0},  {"38553", "SYSFUN:01", 0},  {"38552", "SYSFUM:01", 0},
      {"02000", "", 0},
  };
  for (const auto &c : cases) {
    char sqlstate[CLI_SQLSTATE_SIZE] = {}, message[CLI_MESSAGE_SIZE] = {};
    std::strncpy(sqlstate, c.sqlstate, sizeof sqlstate - 1);
    std::strncpy(message, c.message, sizeof message - 1);
    EXPECT_EQ(static_cast<int>(cli::call::sysfunIn(sqlstate, message)), c.code) << c.message;
  }
}

// An export is called only with an argument count that some row has.
TEST(FrameCaller, RefusesAnArgumentCountThatNoRowHas) {
  static int calls = 0;
  void *args[cli::call::kMaxArguments] = {};
  void *fn = reinterpret_cast<void *>(+[] { ++calls; });
  for (const std::size_t count : {0U, 1U, 43U}) {
    EXPECT_FALSE(cli::call::invoke(fn, args, count)) << count;
  }
  EXPECT_EQ(calls, 0);
}

// The values an input slot takes, by its layout: texts of every kind
// (words, dates, times, timestamps, durations, numbers) and integers of
// every size (among them the interval codes and code pages), valid for
// some routines and failing for others.
std::vector<Value> poolFor(const cat::Slot &slot) {
  const std::string fox =
      "The quick brown fox jumps over the lazy dog, and again, and again, and again";
  // clang-format off
  const std::string texts[] = {
      "",                           "Hello World",                "  padded \t ",
      "aaaabaaabaab",               "Robert",                     "Tymczak",
      "ab",                         fox,                          "2001-09-27",
      "2000-02-29-23.59.59.999999", "1999-12-31   ",              "2001-02-29",
      "2001-9-7",                   "9999-12-31-24.00.00",        "0001-01-01 00:00:00",
      "13:30:15",                   "24:00:00",                   "25:00:00",
      "13.30.15 ",                  "1:2:3",                      "00000100000000.000000",
      "99991231235959.999999",      "123.5",                      "1x",
      "-2e10",                      "1e999",
  };
  // clang-format on
  // Integers of every width take these, cut to their width.
  const std::int64_t numbers[] = {
      INT64_MIN, -32768,     -7,           -1,       0,  1,   2,    3,    4,    7,
      16,        30,         32,           256,      37, 819, 1200, 1208, 4000, 4001,
      32767,     2147483647, 123456789012, INT64_MAX};
  std::vector<Value> pool;
  for (const std::string &t : texts) {
    if (slot.layout == cat::Layout::text) pool.push_back(text(t));
    if (slot.layout == cat::Layout::lob) pool.push_back(lob(t));
  }
  for (const std::int64_t v : numbers) {
    if (slot.layout == cat::Layout::int16) pool.push_back(i16(static_cast<std::int16_t>(v)));
    if (slot.layout == cat::Layout::int32) pool.push_back(i32(static_cast<std::int32_t>(v)));
    if (slot.layout == cat::Layout::int64) pool.push_back(i64(v));
  }
  for (const double v : {-0.0, 0.5, -2.25, 3.0, 1e308, 7.125e-3, std::nan(""), HUGE_VAL}) {
    if (slot.layout == cat::Layout::real) pool.push_back(f64(v));
  }
  if (slot.layout == cat::Layout::fixedBytes) {
    pool = {fixed(std::string(slot.size, '\xFF')), fixed(std::string(slot.size, '\0')),
            fixed(std::string("\x01\x02\x03\x04\x05\x06\x07\0", 8))};
  }
  return pool;
}

DatabaseInfo utf8(1208);

struct Case {
  const cat::Routine *routine;
  std::vector<Value> inputs;
  std::size_t dateBytesToIgnore;  // today's date at the head of the result

  // The outcome, checked by the frame's rules (canaries, null indicators,
  // status forms) on every call.
  [[nodiscard]] Outcome run() const {
    Outcome o = routine->frame == cat::Frame::dbinfo
                    ? call(routine->symbol, inputs, textArea(cat::kName + 1), {utf8.block})
                    : call(routine->symbol, inputs);
    o.bytes.erase(0, std::min(dateBytesToIgnore, o.bytes.size()));
    return o;
  }
};

// Every scalar routine but RAND (whose generator the process shares by
// design), called from 8 threads at once, gives what it gives alone.  For
// a routine of k inputs, case i takes value i * (j + 1) + j of input j's
// pool, so the inputs don't move in step; a routine added to the catalogue
// is covered without a new line.
TEST(Concurrency, EightThreadsGiveWhatOneThreadGives) {
  std::vector<Case> cases;
  for (const cat::Routine &r : cat::kRoutines) {
    const bool scalar = r.frame == cat::Frame::plain || r.frame == cat::Frame::dbinfo;
    if (!scalar || std::string_view(r.sqlName) == "RAND") continue;
    std::vector<std::vector<Value>> pools;
    std::size_t widest = 1;
    for (std::size_t j = 0; j < cat::inputCount(r); ++j) {
      pools.push_back(poolFor(r.inputs[j]));
      widest = std::max(widest, pools.back().size());
    }
    // TIMESTAMP and TIMESTAMPTIME put today's date in front of a time.
    const bool today = (r.properties & cat::kDeterministic) == 0 &&
                       std::string_view(r.sqlName).starts_with("TIMESTAMP");
    for (std::size_t i = 0; i < 2 * widest; ++i) {
      Case c{&r, {}, today ? 10U : 0U};
      for (std::size_t j = 0; j < pools.size(); ++j) {
        c.inputs.push_back(pools[j][(i * (j + 1) + j) % pools[j].size()]);
      }
      cases.push_back(std::move(c));
    }
  }
  ASSERT_GT(cases.size(), 500U);
  std::vector<Outcome> expected;
  std::size_t failures = 0;
  for (const Case &c : cases) {
    expected.push_back(c.run());
    if (!expected.back().error.empty()) ++failures;
  }
  // The pools give both results and errors, in good number.
  EXPECT_GT(failures, cases.size() / 10);
  EXPECT_LT(failures, cases.size() / 2);

  // Each thread walks the cases from its own starting point for about two
  // seconds, and at least twice over, so that different routines overlap.
  constexpr std::size_t kThreads = 8;
  const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  std::vector<std::string> firstMismatch(kThreads);
  std::vector<std::thread> threads;
  for (std::size_t t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      for (std::size_t pass = 0; pass < 2 || std::chrono::steady_clock::now() < until; ++pass) {
        for (std::size_t k = 0; k < cases.size(); ++k) {
          const std::size_t i = (k + t * cases.size() / kThreads) % cases.size();
          if (cases[i].run() != expected[i] && firstMismatch[t].empty()) {
            firstMismatch[t] = std::string(cases[i].routine->symbol) + " case " + std::to_string(i);
          }
        }
      }
    });
  }
  for (std::thread &th : threads) th.join();
  for (std::size_t t = 0; t < kThreads; ++t) EXPECT_EQ(firstMismatch[t], "") << "thread " << t;
}

}  // namespace
