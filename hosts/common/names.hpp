// The names that a host gives the library's routines, read off the
// catalogue: SQL names in lower case, and each export's own name.
#pragma once

#include <algorithm>
#include <cctype>
#include <string>
#include <string_view>

#include "catalogue/catalogue.hpp"

namespace orv::host {

inline std::string lowerCase(std::string_view s) {
  std::string out(s);
  std::transform(out.begin(), out.end(), out.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return out;
}

// The name of an export by itself, without the CLI_udf prefix and in lower
// case: left2 for CLI_udfLEFT2, sqlcache_snapshot for SQLCACHE_SNAPSHOT.
inline std::string exportName(const cli::catalogue::Routine &r) {
  std::string_view symbol = r.symbol;
  if (symbol.starts_with("CLI_udf")) symbol.remove_prefix(7);
  return lowerCase(symbol);
}

}  // namespace orv::host
