// orv_snapshot: writes a statement cache snapshot for SQLCACHE_SNAPSHOT to
// read, with a few sections of made-up statements.
//
// Usage: orv_snapshot FILE [STATEMENTS [SECTIONS]]
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include "snapshot.hpp"

int main(int argc, char **argv) {
  if (argc < 2) {
    static_cast<void>(std::fprintf(stderr, "usage: %s FILE [STATEMENTS [SECTIONS]]\n", argv[0]));
    return 2;
  }
  const long statements = argc > 2 ? std::strtol(argv[2], nullptr, 10) : 5;
  const long sections = argc > 3 ? std::strtol(argv[3], nullptr, 10) : 2;
  std::ofstream out(argv[1], std::ios::binary);
  for (long s = 0; s < sections && out; ++s) {
    out << orv::snapshot::section("PKG" + std::to_string(s + 1));
    for (long i = s; i < statements; i += sections) {
      orv::snapshot::Statement st;
      for (std::size_t c = 0; c < st.columns.size(); ++c) {
        st.columns[c] = static_cast<std::int32_t>((i + 1) * 100 + static_cast<long>(c) + 1);
      }
      st.text = "SELECT * FROM T" + std::to_string(i + 1) + " WHERE ID = ?";
      out << orv::snapshot::statement(st);
    }
  }
  if (!out) {
    static_cast<void>(std::fprintf(stderr, "%s: cannot write %s\n", argv[0], argv[1]));
    return 1;
  }
  return 0;
}
