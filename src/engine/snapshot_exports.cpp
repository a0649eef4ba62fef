// SQLCACHE_SNAPSHOT: a snapshot of the engine's SQL statement cache, one
// row per cached statement, read from a file of monitor elements under
// the instance path.
//
// The stream holds sections (a 30, then a section text 321 and section
// data 322, in any order among the section's statements) and statements
// (a 19 whose data is a list of inner elements, one per column).  Every
// failure looks like the end of the table to the engine.  The file comes
// from outside, so every size in it is checked against the room it claims
// before anything is read or written; a stream that breaks a limit ends
// the table.  A file cut short ends the table where a read falls short.
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "engine/services.h"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Report;
using cli::Row;

using cli::platform::kPathSeparator;

constexpr std::uint16_t kStatement = 19, kSection = 30, kSectionText = 321, kSectionData = 322;
constexpr std::uint32_t kTextRoom = 8, kDataRoom = 264;
// Statements up to this size get their block without a look at the file.
constexpr std::uint32_t kTrustedClaim = std::uint32_t{64} << 20;
// What the log line carries as the status when a larger statement is
// refused because the file ends before it would: no block was asked for.
constexpr std::int32_t kRefusedStatus = -1;
constexpr const char *kModule = "cliudf";

// The scratchpad's data.
struct Scratch {
  CLI_fileHandle file;
  std::uint32_t capacity;  // of the statement block; 0 when none is held
  char sectionText[9];
  std::uint8_t closed;  // 1 until the file is open
  unsigned char *block;
};

// The columns past the sixteen numbers: the section text and the statement.
constexpr std::size_t kSectionColumn = 16, kStatementColumn = 17;

using cli::kEndOfTable;

// The snapshot name, at the end of a chain of pointers that starts in the
// process's static data; null where a link is missing.
// The offsets are those of the engine's own records: the first link stands
// at byte 88 of the static data, the second at the start of the record it
// points to, the third at byte 112 of the next, and the name at byte 26408
// of the last.
constexpr std::size_t kFirstLink = 88, kThirdLink = 112, kNameInRecord = 26408;

const char *snapshotName(const void *staticData) {
  const auto *data = static_cast<const unsigned char *>(staticData);
  if (data == nullptr) return nullptr;
  const unsigned char *first = nullptr, *second = nullptr, *last = nullptr;
  std::memcpy(&first, data + kFirstLink, sizeof first);
  if (first == nullptr) return nullptr;
  std::memcpy(&second, first, sizeof second);
  if (second == nullptr) return nullptr;
  std::memcpy(&last, second + kThirdLink, sizeof last);
  return last == nullptr ? nullptr : reinterpret_cast<const char *>(last + kNameInRecord);
}

// The work areas of the path: the instance path service writes up to 264
// bytes, and the path is composed in 256.
constexpr std::size_t kInstanceRoom = 264, kPathRoom = 256;
// The open mode and flags that the file service takes for a file read from
// start to end.
constexpr std::uint32_t kOpenForReading = 20, kOpenFlags = 1024;

Report open(Scratch &s, const void *staticData) {
  s.block = nullptr;
  s.capacity = 0;
  s.closed = 1;
  char instance[kInstanceRoom] = {};
  if (sqleinstancepath(0, instance) != 0) return kEndOfTable;
  const char *name = snapshotName(staticData);
  char path[kPathRoom];
  const int n = name == nullptr ? -1
                                : std::snprintf(path, sizeof path, "%s%s%s%s%s.%s", instance,
                                                kPathSeparator, "tmp", kPathSeparator, name, "sql");
  // A path that does not fit its area is a file that cannot be opened.
  if (n < 0 || static_cast<std::size_t>(n) >= sizeof path) return {};
  sqlm_filter_file_name(path);
  if (sqloopenp(path, kOpenForReading, kOpenFlags, &s.file, 0) != 0) return {};
  s.closed = 0;
  return {};
}

// Reads n bytes on from where the file stands; false on a short read.  The
// service reports the bytes it read into a word of ours, which we don't
// need: a short read is a failure already.
bool readBytes(const Scratch &s, void *destination, std::uint32_t n) {
  std::uint32_t count = 0;
  return sqloread(s.file, destination, n, &count) == 0;
}

bool readHeader(const Scratch &s, sqlm_header_info &h) {
  unsigned char raw[8];
  if (!readBytes(s, raw, sizeof raw)) return false;
  std::memcpy(&h, raw, sizeof h);
  return true;
}

// The section scan: reads the section's text and data, skipping statements
// that stand before them, and goes back to the first of those.  Leaves the
// file at the first statement's header, read into `h`.
bool scanSection(Scratch &s, sqlm_header_info &h) {
  std::int64_t rewind = 0;
  bool text = false, data = false;
  while (!(text && data)) {
    if (!readHeader(s, h)) return false;
    const std::int64_t whole = std::int64_t{h.size} + 8;
    switch (h.element) {
      case kSectionText:
        if (h.size > kTextRoom) return false;
        std::memset(s.sectionText, 0, sizeof s.sectionText);
        if (!readBytes(s, s.sectionText, h.size)) return false;
        if (rewind < 0) rewind -= whole;
        text = true;
        break;
      case kSectionData: {
        if (h.size > kDataRoom) return false;
        unsigned char work[kDataRoom];
        if (!readBytes(s, work, h.size)) return false;
        if (rewind < 0) rewind -= whole;
        data = true;
        break;
      }
      case kStatement:
        if (sqlochgfileptr(s.file, h.size, 1, 0) != 0) return false;
        rewind -= whole;
        break;
      default:
        return false;
    }
  }
  if (rewind != 0 && sqlochgfileptr(s.file, rewind, 1, 0) != 0) return false;
  return readHeader(s, h) && h.element == kStatement;
}

enum class Room : std::uint8_t { enough, tooLittle, lost };

// Whether the file holds `size` (at least 1) more bytes from where it
// stands: the last of them is read, and the position is put back.  A move
// that fails leaves the position where it was; a read that fails at the
// end of the file leaves it where the move took it.
Room fileHolds(const Scratch &s, std::uint32_t size) {
  if (sqlochgfileptr(s.file, std::int64_t{size} - 1, 1, 0) != 0) return Room::tooLittle;
  unsigned char last = 0;
  const bool there = readBytes(s, &last, 1);
  const std::int64_t back = there ? std::int64_t{size} : std::int64_t{size} - 1;
  if (sqlochgfileptr(s.file, -back, 1, 0) != 0) return Room::lost;
  return there ? Room::enough : Room::tooLittle;
}

bool has(const sqlm_header_info &h, std::uint32_t bytes) { return h.size >= bytes; }

// The 32-bit integer at the start of a child element's data.  Elements lie
// packed at any byte offset, so the child's header is copied out, never read
// through the pointer.
bool childValue(const sqlm_header_info *parent, std::uint32_t child, std::int32_t &out) {
  const auto *c = reinterpret_cast<const unsigned char *>(sqlm_find_element(child, parent));
  if (c == nullptr) return false;
  sqlm_header_info header{};
  std::memcpy(&header, c, sizeof header);
  if (!has(header, 4)) return false;
  std::memcpy(&out, c + sizeof header, 4);
  return true;
}

// Fills the columns that an inner element names; false when the element is
// too short for what it must hold.
bool fill(const unsigned char *at, const sqlm_header_info &h, const Row &row) {
  static constexpr struct {
    std::uint16_t element;
    std::uint8_t column;  // 0-based
    std::uint8_t width;   // bytes read: 4, or 8 for the low half of a 64-bit value
  } kDirect[] = {{554, 0, 4}, {540, 1, 4}, {521, 2, 4}, {539, 3, 4}, {446, 4, 8},
                 {487, 5, 8}, {522, 6, 8}, {447, 7, 8}, {523, 8, 8}, {532, 9, 8}};
  const unsigned char *data = at + 8;
  for (const auto &d : kDirect) {
    if (h.element != d.element) continue;
    if (!has(h, d.width)) return false;
    std::int32_t v = 0;
    if (d.width == 4) {
      std::memcpy(&v, data, 4);
    } else {
      std::int64_t wide = 0;
      std::memcpy(&wide, data, 8);
      v = static_cast<std::int32_t>(static_cast<std::uint32_t>(static_cast<std::uint64_t>(wide)));
    }
    row.put(d.column, v);
    return true;
  }
  static constexpr struct {
    std::uint16_t element;
    std::uint8_t column;
  } kPairs[] = {{229, 10}, {586, 12}, {585, 14}};
  for (const auto &p : kPairs) {
    if (h.element != p.element) continue;
    const auto *parent = reinterpret_cast<const sqlm_header_info *>(at);
    std::int32_t first = 0, second = 0;
    if (!childValue(parent, 300, first) || !childValue(parent, 301, second)) return false;
    row.put(p.column, first);
    row.put(p.column + 1u, second);
    return true;
  }
  if (h.element == 312) {
    // The data and a NUL behind it must fit the statement column's area.
    const cli::LobOut statement = row.lob(kStatementColumn);
    if (h.size >= statement.limit()) return false;
    statement.finish(h.size);
    std::memcpy(statement.area(), data, h.size);
    statement.area()[h.size] = 0;
    row.filled(kStatementColumn);
  }
  return true;
}

Report fetch(Scratch &s, const Row &row) {
  if (s.closed != 0) return kEndOfTable;
  sqlm_header_info h{};
  if (!readHeader(s, h)) return kEndOfTable;
  if (h.element == kSection) {
    if (!scanSection(s, h)) return kEndOfTable;
  } else if (h.element != kStatement) {
    return kEndOfTable;
  }
  // One block serves every statement; it is replaced only by a larger one.
  if (s.capacity < h.size) {
    if (s.capacity > 0) sqlofmblkEx(kModule, __LINE__, s.block);
    s.block = nullptr;
    s.capacity = 0;
    void *block = nullptr;
    std::int32_t status = kRefusedStatus;
    // A claim beyond what any statement needs is first held against the
    // file: when the rest of the file is shorter, the size word is damaged
    // and no block of that size is asked for, so that a bad file never
    // costs gigabytes; it is logged as a block that can't be had.  Smaller
    // claims get their block at once, and a file cut short ends the table
    // on the read below.
    const Room room = h.size > kTrustedClaim ? fileHolds(s, h.size) : Room::enough;
    if (room == Room::lost) return kEndOfTable;  // the file position could not be put back
    if (room == Room::enough)
      status = sqlogmblkEx(nullptr, h.size, 0, &block, kModule, __LINE__, 0);
    if (status != 0) {
      sqlt_logerr_data("SQLCACHE_SNAPSHOT: unable to allocate temporary sqlcache stmt", &status, 4,
                       3);
      return kEndOfTable;
    }
    s.block = static_cast<unsigned char *>(block);
    s.capacity = h.size;
  }
  if (!readBytes(s, s.block, h.size)) return kEndOfTable;
  std::int64_t left = h.size;
  for (const unsigned char *at = s.block; left > 0;) {
    sqlm_header_info inner;
    if (left < 8) return kEndOfTable;
    std::memcpy(&inner, at, sizeof inner);
    const std::int64_t whole = std::int64_t{inner.size} + 8;
    if (whole > left || !fill(at, inner, row)) return kEndOfTable;
    at += whole;
    left -= whole;
  }
  std::memcpy(row.chars(kSectionColumn), s.sectionText, sizeof s.sectionText);
  return {};
}

Report close(Scratch &s) {
  if (s.closed != 0) return {};
  sqloclose(s.file);
  if (s.capacity > 0) sqlofmblkEx(kModule, __LINE__, s.block);
  s.block = nullptr;
  s.capacity = 0;
  s.closed = 1;
  return {};
}

}  // namespace

namespace cli {

// The engine's static data is asked for on every call, whatever its type,
// and used on open only.
Report routine::SQLCACHE_SNAPSHOT(Row row, Scratchpad scratchpad, CallType call_type) noexcept {
  const void *staticData = sqlo_get_static_data();
  return tableStep<Scratch>(
      call_type, scratchpad, [&](Scratch &s) { return open(s, staticData); },
      [&](Scratch &s) { return fetch(s, row); }, [&](Scratch &s) { return close(s); });
}

}  // namespace cli
