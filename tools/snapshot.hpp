// Writing snapshot element streams: the elements of the statement cache
// snapshot that SQLCACHE_SNAPSHOT reads, in the machine's byte order.
#pragma once

#include <array>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace orv::snapshot {

// An element: its header (data size, type, identifier) and its data.
inline std::string element(std::uint16_t id, std::string_view data, std::uint16_t type = 0) {
  std::string out(8, '\0');
  const auto size = static_cast<std::uint32_t>(data.size());
  std::memcpy(out.data(), &size, 4);
  std::memcpy(out.data() + 4, &type, 2);
  std::memcpy(out.data() + 6, &id, 2);
  out.append(data);
  return out;
}

template <typename T>
std::string bytesOf(T value) {
  std::string out(sizeof value, '\0');
  std::memcpy(out.data(), &value, sizeof value);
  return out;
}

// A section: its start, then its text and data elements.
inline std::string section(std::string_view text, std::size_t dataBytes = 16) {
  return element(30, "") + element(321, text) + element(322, std::string(dataBytes, 'd'));
}

// One cached statement with every column's element: columns 1 to 16 and
// the statement text of column 18.
struct Statement {
  std::array<std::int32_t, 16> columns{};
  std::string text;
};

inline std::string statement(const Statement &s) {
  const auto &c = s.columns;
  std::string inner;
  const std::uint16_t narrow[] = {554, 540, 521, 539};
  for (std::size_t i = 0; i < 4; ++i) inner += element(narrow[i], bytesOf(c[i]));
  const std::uint16_t wide[] = {446, 487, 522, 447, 523, 532};
  for (std::size_t i = 0; i < 6; ++i) {
    // The high half is set too: only the low 32 bits reach the column.
    inner += element(wide[i],
                     bytesOf((std::int64_t{0x7ABC} << 32) | static_cast<std::uint32_t>(c[4 + i])));
  }
  const std::uint16_t pairs[] = {229, 586, 585};
  for (std::size_t i = 0; i < 3; ++i) {
    inner += element(pairs[i],
                     element(300, bytesOf(c[10 + 2 * i])) + element(301, bytesOf(c[11 + 2 * i])));
  }
  inner += element(312, s.text);
  return element(19, inner);
}

}  // namespace orv::snapshot
