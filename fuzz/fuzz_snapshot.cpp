// SQLCACHE_SNAPSHOT over snapshot files made of the fuzzer's bytes.
//
// The bytes are written to `<instance>/tmp/cache.sql` in a temporary
// instance directory of this process, and the table is read through open,
// fetches until "02000" (at most kFetches) and close, with an unknown call
// type in between that must change nothing, as open and close must not
// write a column.  Beyond ASan's checks: every
// status is "02000" with its terminator or nothing; a row stores 0 into the
// indicators it fills and leaves column 17's alone; column 17 is a text of
// at most 8 bytes and column 18's text lies below the limit and occurs in
// the file, as does a non-empty column 17.
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

#include "harness.hpp"

namespace {

using namespace orv::fuzz;
namespace fs = std::filesystem;

constexpr const char *kName = "SQLCACHE_SNAPSHOT";
constexpr int kFetches = 2000;

fs::path &file() {
  static fs::path path;
  return path;
}

// Each argument has a block of its own, kept across calls and runs and
// laid out afresh before every call: 16 numbers, the section text and the
// statement.
struct Table {
  std::vector<Block> columns, indicators;
  Block scratchpad{100, 0}, sqlstate{CLI_SQLSTATE_SIZE}, message{CLI_MESSAGE_SIZE}, type{4};
  Export routine = lookUp(kName);
  Frame frame{sqlstate, message};

  Table() {
    for (std::size_t i = 0; i < 18; ++i) {
      columns.emplace_back(i < 16    ? 4
                           : i == 16 ? 9
                                     : CLI_LOB_AREA_SIZE(std::size_t{CLI_LOB_LIMIT}));
      indicators.emplace_back(2);
      frame.result(columns[i], indicators[i]);
    }
    frame.f.scratchpad = scratchpad.data();
    frame.f.callType = reinterpret_cast<std::int32_t *>(type.data());
  }

  // One call; returns the SQLSTATE's five characters, empty for none.
  std::string call(std::int32_t callType) {
    for (std::size_t i = 0; i < 18; ++i) {
      std::memcpy(indicators[i].data(), &kIndicator, 2);
      std::memset(columns[i].data(), kUnwritten, std::min<std::size_t>(columns[i].size(), 9));
    }
    std::memset(sqlstate.data(), 'S', sqlstate.size());
    std::memset(message.data(), 'M', message.size());
    std::memcpy(type.data(), &callType, 4);
    frame.call(routine);
    ORV_CHECK(kName, allAre(message.data(), message.size(), 'M'));
    if (allAre(sqlstate.data(), sqlstate.size(), 'S')) return {};
    ORV_CHECK(kName, sqlstate.view() == std::string_view("02000\0", 6));
    return "02000";
  }

  // Column c untouched, or all of them.
  [[nodiscard]] bool untouched(std::size_t c) const {
    return allAre(columns[c].data(), std::min<std::size_t>(columns[c].size(), 9)) &&
           numberIn<std::int16_t>(indicators[c]) == kIndicator;
  }
  [[nodiscard]] bool nothingWritten() const {
    for (std::size_t c = 0; c < 18; ++c) {
      if (!untouched(c)) return false;
    }
    return true;
  }
};

}  // namespace

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
  // In memory where the system has such a place: rewriting a file on disk
  // on every run makes the file system flush it to the device on close.
  std::error_code error;
  const fs::path base =
      fs::is_directory("/dev/shm", error) ? fs::path("/dev/shm") : fs::temp_directory_path();
  const fs::path dir = base / ("orv_fuzz_snapshot_" + std::to_string(::getpid()));
  fs::create_directories(dir / "tmp");
  setenv("ORVENGINE_INSTANCE_PATH", dir.c_str(), 1);
  setenv("ORVENGINE_SNAPSHOT_NAME", "cache", 1);
  file() = dir / "tmp" / "cache.sql";
  // The directory goes when the process ends normally.
  static_cast<void>(std::atexit([] {
    std::error_code ignored;
    fs::remove_all(file().parent_path().parent_path(), ignored);
  }));
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  const std::string_view stream(reinterpret_cast<const char *>(data), size);
  {
    std::ofstream out(file(), std::ios::binary | std::ios::trunc);
    out.write(stream.data(), static_cast<std::streamsize>(stream.size()));
  }
  static auto *table = new Table;  // its 1 MiB column is kept across runs
  Table &t = *table;
  std::memset(t.scratchpad.data(), 0, t.scratchpad.size());

  ORV_CHECK(kName, t.call(CLI_CALL_OPEN).empty() && t.nothingWritten());
  for (int i = 0; i < kFetches; ++i) {
    if (i % 7 == 3) ORV_CHECK(kName, t.call(2).empty() && t.nothingWritten());
    // A fetch that ends the table may have filled some columns of a
    // statement before a bad element stopped it.
    if (!t.call(CLI_CALL_FETCH).empty()) break;
    // A row: column 17's indicator is left alone, the others are 0 where
    // their column was filled and untouched where it was not.
    ORV_CHECK(kName, numberIn<std::int16_t>(t.indicators[16]) == kIndicator);
    for (std::size_t c = 0; c < 18; ++c) {
      ORV_CHECK(kName, c == 16 || numberIn<std::int16_t>(t.indicators[c]) == 0 || t.untouched(c));
    }
    const std::string_view section = textIn(kName, t.columns[16]);
    ORV_CHECK(kName, section.size() <= 8);
    if (!section.empty()) ORV_CHECK(kName, stream.find(section) != std::string_view::npos);
    if (numberIn<std::int16_t>(t.indicators[17]) == 0) {
      const std::string_view statement = lobIn(t.columns[17]);
      ORV_CHECK(kName, statement.size() < CLI_LOB_LIMIT);
      ORV_CHECK(kName, stream.find(statement) != std::string_view::npos);
      ORV_CHECK(kName, t.columns[17].data()[CLI_LOB_DATA_OFFSET + statement.size()] == 0);
    }
  }
  ORV_CHECK(kName, t.call(CLI_CALL_CLOSE).empty() && t.nothingWritten());
  ORV_CHECK(kName, t.call(CLI_CALL_CLOSE).empty() && t.nothingWritten());
  return 0;
}
