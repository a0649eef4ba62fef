// The engine's side of the Fmp table functions; see fmp_tables.hpp.
#include "fmp_tables.hpp"

#if defined(__linux__)
#include <dirent.h>
#endif

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "catalogue/catalogue.hpp"

namespace orv::standin {
namespace {

using cli::catalogue::kRoutines;
using cli::catalogue::Routine;

// Rows of 16 bytes: index, frame argument count, inputs, results, frame
// variant and the property bits, for every catalogue routine.
std::vector<unsigned char> routineRows() {
  std::vector<unsigned char> out;
  std::int32_t index = 0;
  for (const Routine &r : kRoutines) {
    unsigned char row[16] = {};
    const auto arguments = static_cast<std::int32_t>(argumentCount(r));
    const auto inputs = static_cast<std::int16_t>(inputCount(r));
    const auto results = static_cast<std::int16_t>(resultCount(r));
    std::memcpy(row, &index, 4);
    std::memcpy(row + 4, &arguments, 4);
    std::memcpy(row + 8, &inputs, 2);
    std::memcpy(row + 10, &results, 2);
    row[12] = static_cast<unsigned char>(r.frame);
    row[13] = static_cast<unsigned char>(r.properties);
    out.insert(out.end(), row, row + 16);
    ++index;
  }
  return out;
}

// Rows of 28 bytes for the threads of this process: thread id, state (as
// its letter), user and system time in clock ticks, priority and nice
// value, from /proc.  `selector` 0 gives all threads, any other value the
// thread with that id.
std::vector<unsigned char> threadRows(std::int32_t selector) {
  std::vector<unsigned char> out;
#if defined(__linux__)
  DIR *tasks = opendir("/proc/self/task");
  if (tasks == nullptr) return out;
  while (const dirent *entry = readdir(tasks)) {
    const auto tid = static_cast<std::int32_t>(std::strtol(entry->d_name, nullptr, 10));
    if (tid <= 0 || (selector != 0 && tid != selector)) continue;
    char path[64], line[1024] = {};
    static_cast<void>(std::snprintf(path, sizeof path, "/proc/self/task/%d/stat", tid));
    std::FILE *stat = std::fopen(path, "r");
    if (stat == nullptr) continue;
    const bool read = std::fgets(line, sizeof line, stat) != nullptr;
    static_cast<void>(std::fclose(stat));
    const char *close = read ? std::strrchr(line, ')') : nullptr;
    char state = '?';
    unsigned long utime = 0, stime = 0;
    long priority = 0, nice = 0;
    // From the state on: state, 10 fields, utime, stime, 2 fields, priority,
    // nice; the count of fields read is checked.
    constexpr const char *kFields =
        "%c %*d %*d %*d %*d %*d %*u %*u %*u %*u %*u %lu %lu %*d %*d %ld %ld";
    if (close == nullptr ||
        std::sscanf(close + 2, kFields, &state, &utime, &stime, &priority,  // NOLINT(cert-err34-c)
                    &nice) != 5) {
      continue;
    }
    const std::int32_t values[7] = {0,
                                    tid,
                                    static_cast<unsigned char>(state),
                                    static_cast<std::int32_t>(utime),
                                    static_cast<std::int32_t>(stime),
                                    static_cast<std::int32_t>(priority),
                                    static_cast<std::int32_t>(nice)};
    const auto *bytes = reinterpret_cast<const unsigned char *>(values);
    out.insert(out.end(), bytes, bytes + sizeof values);
  }
  closedir(tasks);
#else
  static_cast<void>(selector);
#endif
  return out;
}

// Open requests hand out a table in a block of its own; close takes it back.
}  // namespace

std::int32_t fmpCallback(std::int32_t /*slots*/, void *request) {
  auto *slot = static_cast<std::uint64_t *>(request);
  const std::int32_t code = *requestField(slot[0]);
  if (code == 1) {
    std::free(requestField(slot[1]));
    return 0;
  }
  if (code != 2 && code != 3) return -1;
  const bool threads = code == 3;
  const std::vector<unsigned char> rows =
      threads ? threadRows(*requestField(slot[1])) : routineRows();
  const std::size_t rowSize = threads ? 28 : 16;
  void *table = std::malloc(rows.empty() ? 1 : rows.size());
  if (table == nullptr) return -2;
  if (!rows.empty()) std::memcpy(table, rows.data(), rows.size());
  *requestField(slot[threads ? 2 : 1]) = static_cast<std::int32_t>(rows.size() / rowSize);
  std::memcpy(&slot[threads ? 3 : 2], &table, sizeof table);
  return threads && rows.empty() ? -3 : 0;
}

}  // namespace orv::standin
