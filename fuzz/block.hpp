// The blocks that the fuzz targets place values in, and the stop on a
// broken invariant.
//
// Each value sits at the very end of its own allocation, so a routine that
// writes or reads one byte past a result, an input, an indicator or a
// status buffer is caught by AddressSanitizer.  A broken invariant is
// reported on standard error and ends the run with __builtin_trap, which
// libFuzzer records as a crash with its input.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "frame/call.hpp"
#include "frame/cliudf.h"

namespace orv::fuzz {

// Reports a broken invariant and stops the run.
[[noreturn]] inline void broken(const char *routine, const char *what) {
  static_cast<void>(std::fprintf(stderr, "\n*** %s: %s\n", routine, what));
  __builtin_trap();
}

#define ORV_CHECK(routine, condition)                           \
  do {                                                          \
    if (!(condition)) ::orv::fuzz::broken(routine, #condition); \
  } while (0)

inline constexpr unsigned char kUnwritten = 0xCD;  // fills result areas before a call
inline constexpr std::int16_t kIndicator = 0x5A5A;

// Whether `n` bytes all hold the unwritten fill.  Compared in chunks with
// memcmp: a byte loop would be instrumented for the fuzzer's comparison
// tracing and make a scan of a 1 MiB area slow.
inline bool allUnwritten(const unsigned char *p, std::size_t n) {
  static const std::vector<unsigned char> fill(65536, kUnwritten);
  for (std::size_t at = 0; at < n; at += fill.size()) {
    const std::size_t chunk = std::min(fill.size(), n - at);
    if (std::memcmp(p + at, fill.data(), chunk) != 0) return false;
  }
  return true;
}

// Large blocks are kept for the next call of the same size: a CLI_udfLob
// result area of 1 MiB, mapped and unmapped on every call, would make a
// run slow.  Each kept block is still exactly its size.
class Pool {
 public:
  static constexpr std::size_t kLarge = 65536;
  static unsigned char *take(std::size_t size) {
    auto &kept = blocks();
    for (auto at = kept.begin(); at != kept.end(); ++at) {
      if (at->first == size) {
        unsigned char *p = at->second;
        kept.erase(at);
        return p;
      }
    }
    return new unsigned char[size];
  }
  static void give(unsigned char *p, std::size_t size) {
    auto &kept = blocks();
    if (size < kLarge || kept.size() >= 16) {
      delete[] p;
      return;
    }
    kept.emplace_back(size, p);
  }

 private:
  // Never destroyed, so that the kept blocks stay reachable at exit and
  // the leak check does not count them.
  static std::vector<std::pair<std::size_t, unsigned char *>> &blocks() {
    static auto *kept = new std::vector<std::pair<std::size_t, unsigned char *>>;
    return *kept;
  }
};

// Gives a block back to the pool.
struct Release {
  std::size_t size = 0;
  void operator()(unsigned char *p) const { Pool::give(p, size); }
};

// Bytes on the heap with nothing behind them: the allocation is exactly
// the value's size.
class Block {
 public:
  Block() = default;
  explicit Block(std::size_t size, unsigned char fill = kUnwritten)
      : bytes_(Pool::take(size == 0 ? 1 : size), Release{size == 0 ? 1 : size}), size_(size) {
    std::memset(bytes_.get(), fill, size == 0 ? 1 : size);
  }
  unsigned char *data() const { return bytes_.get(); }
  char *chars() const { return reinterpret_cast<char *>(bytes_.get()); }
  std::size_t size() const { return size_; }
  std::string_view view() const { return {chars(), size_}; }
  std::string copy() const { return std::string(view()); }
  bool holds(std::string_view v) const { return view() == v; }

 private:
  std::unique_ptr<unsigned char[], Release> bytes_;
  std::size_t size_ = 0;
};

// Value layouts, laid out into blocks of their exact size.
// The next value of type T from the fuzzer's bytes, zero-filled where the
// bytes run out.
template <typename T>
T take(const std::uint8_t *&data, std::size_t &size) {
  T v{};
  const std::size_t n = size < sizeof v ? size : sizeof v;
  std::memcpy(&v, data, n);
  data += n;
  size -= n;
  return v;
}

inline Block textBlock(std::string_view s) {
  Block b(s.size() + 1);
  std::memcpy(b.data(), s.data(), s.size());
  b.data()[s.size()] = 0;
  return b;
}

inline Block lobBlock(std::string_view s) {
  Block b(CLI_LOB_AREA_SIZE(s.size()));
  cli::call::layOutLob(b.data(), s.data(), s.size());
  return b;
}

template <typename T>
Block numberBlock(T v) {
  Block b(sizeof v);
  std::memcpy(b.data(), &v, sizeof v);
  return b;
}

// A CLI_udfLob result area: its length word holds the capacity on entry,
// its data bytes are unwritten.
inline Block lobArea(std::uint32_t capacity) {
  Block b(CLI_LOB_AREA_SIZE(std::size_t{capacity}));
  cli::call::prepareLobResult(b.data(), capacity);
  return b;
}

template <typename T>
T numberIn(const Block &b) {
  T v;
  std::memcpy(&v, b.data(), sizeof v);
  return v;
}

inline std::uint32_t lobLength(const Block &b) { return numberIn<std::uint32_t>(b); }

inline std::string_view lobData(const Block &b, std::uint32_t length) {
  return {b.chars() + CLI_LOB_DATA_OFFSET, length};
}

// The terminated text in an area; the terminator must lie inside it.
inline std::string_view textIn(const char *routine, const Block &b) {
  const void *end = std::memchr(b.data(), 0, b.size());
  ORV_CHECK(routine, end != nullptr);
  return {b.chars(), static_cast<std::size_t>(static_cast<const unsigned char *>(end) - b.data())};
}

// The 16-bit indicator a block of two bytes holds, as the frame passes it.
inline std::int16_t *indicatorIn(const Block &b) {
  return reinterpret_cast<std::int16_t *>(b.data());
}

// A terminated text from fuzz bytes: everything up to the first NUL.
inline std::string_view upToNul(std::string_view s) { return s.substr(0, s.find('\0')); }

}  // namespace orv::fuzz
