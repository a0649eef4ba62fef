// What the extension keeps per connection and per registered SQL
// function, shared by the registration and the call path.
#pragma once

#include <sqlite3ext.h>

#include <array>
#include <cstddef>
#include <memory>
#include <string>

#include "catalogue/catalogue.hpp"
#include "common/exports.hpp"

namespace orv::sqlite {

// A buffer that grows to the largest size asked of it and is kept for the
// connection's life, so that long strings cost no allocation per row.
class Area {
 public:
  unsigned char *get(std::size_t size) {
    if (size > capacity_) {
      data_ = std::make_unique_for_overwrite<unsigned char[]>(size);
      capacity_ = size;
    }
    return data_.get();
  }

 private:
  std::unique_ptr<unsigned char[]> data_;
  std::size_t capacity_ = 0;
};

// What one connection holds: the exports found in the library and the
// areas for CLI_udfLob arguments and results.  Shared by all of the
// connection's functions and freed with the last of them.
struct Connection {
  host::Exports exports{};
  std::array<Area, cli::catalogue::kMaxInputs> lobInputs;
  Area lobResult;
  int functions = 0;
};

// One registered SQL function.
struct Function {
  Connection *connection;
  std::string label;
  unsigned stringArguments;  // bit i set when argument i is a string
  bool handlesNull;
  std::array<int, 16> formFor;  // row to call for each KindMask
  std::array<const char *, cli::catalogue::kMaxInputs> argumentNames{};
  // For an export called by its own name: the SQL name of the CLI_udfLob
  // export of the same function ("sysfun_lcase2"), if there is one.
  std::string longerForm;
};

// The SQL function of a name, by the row that its plain arguments reach
// (formFor[0]): classifies the arguments, picks the export that serves them
// and calls it.  Null for rows that the host cannot call.
using Entry = void (*)(sqlite3_context *context, int argc, sqlite3_value **argv);
extern const std::array<Entry, cli::catalogue::kRoutineCount> kEntries;

}  // namespace orv::sqlite
