// SQLCACHE_SNAPSHOT over a file held in memory, step by step as the table
// is defined, trusting the file as that definition does.  It writes the
// services it would ask into a trace in the fake services' format (the
// static data on every entry, then the file and block services), and
// keeps the scratchpad's fields, so that the routine can be held against
// it on files cut at any byte.
#pragma once

#include <array>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>

namespace orv::model {

class SnapshotTable {
 public:
  explicit SnapshotTable(std::string file) : file_(std::move(file)) {}

  // What the scratchpad holds besides the file handle.
  std::uint32_t capacity = 0;
  std::array<char, 9> text{};
  std::uint8_t closed = 1;
  bool block = false;
  std::string trace;

  void open() {
    note('s');
    capacity = 0;
    block = false;
    note('o');
    closed = 0;
  }

  // A row as "section text:statement text", or nothing at the end.
  std::optional<std::string> fetch() {
    note('s');
    if (closed != 0) return {};
    std::uint32_t size = 0;
    std::uint16_t id = 0;
    if (!header(size, id)) return {};
    if (id == 30) {
      std::int64_t rewind = 0;
      bool gotText = false, gotData = false;
      while (!(gotText && gotData)) {
        if (!header(size, id)) return {};
        std::string data;
        if (id == 19) {
          note('m', size);
          at_ += size;
          rewind -= std::int64_t{size} + 8;
          continue;
        }
        if (id != 321 && id != 322) return {};
        if (id == 321) text.fill(0);
        const bool whole = read(size, data);
        if (id == 321) std::memcpy(text.data(), data.data(), data.size());
        if (!whole) return {};
        if (rewind < 0) rewind -= std::int64_t{size} + 8;
        (id == 321 ? gotText : gotData) = true;
      }
      if (rewind != 0) {
        note('m', rewind);
        at_ += static_cast<std::size_t>(rewind);
      }
      if (!header(size, id) || id != 19) return {};
    } else if (id != 19) {
      return {};
    }
    if (capacity < size) {
      if (capacity > 0) note('f');
      note('a', size);
      block = true;
      capacity = size;
    }
    std::string data, statement;
    if (!read(size, data)) return {};
    for (std::size_t p = 0; p < data.size();) {
      std::uint32_t n = 0;
      std::uint16_t e = 0;
      std::memcpy(&n, data.data() + p, 4);
      std::memcpy(&e, data.data() + p + 6, 2);
      if (e == 312) statement = data.substr(p + 8, n);
      p += 8 + std::size_t{n};
    }
    return std::string(text.data()) + ":" + statement;
  }

  void close() {
    note('s');
    if (closed != 0) return;
    note('c');
    if (capacity > 0) note('f');
  }

 private:
  void note(char kind, std::optional<std::int64_t> n = {}) {
    if (!trace.empty()) trace += ' ';
    trace += kind;
    if (n) trace += std::to_string(*n);
  }

  // A read delivers what the file still holds of the bytes asked for, as
  // a file read does, and fails when that is fewer.
  bool read(std::uint32_t n, std::string &out) {
    note('r', n);
    out = at_ < file_.size() ? file_.substr(at_, n) : std::string();
    at_ += out.size();
    return out.size() == n;
  }

  bool header(std::uint32_t &size, std::uint16_t &id) {
    std::string h;
    if (!read(8, h)) return false;
    std::memcpy(&size, h.data(), 4);
    std::memcpy(&id, h.data() + 6, 2);
    return true;
  }

  std::string file_;
  std::size_t at_ = 0;
};

}  // namespace orv::model
