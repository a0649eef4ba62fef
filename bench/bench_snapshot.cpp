// SQLCACHE_SNAPSHOT over a snapshot of 100000 statements: open, every
// fetch, close.  Reports rows per second.
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "bench_support.hpp"
#include "frame/table_call.hpp"
#include "snapshot.hpp"

namespace orv::bench {

namespace {

constexpr int kStatements = 100000;
constexpr const char *kSymbol = "SQLCACHE_SNAPSHOT";
void snapshotScan(benchmark::State &state) {
  const cat::Routine &row = routineNamed(kSymbol);
  void *fn = exportNamed(kSymbol);
  cli::call::TableCall table(row, fn);
  const std::string dir = "/tmp/orv_bench_snapshot_" + std::to_string(::getpid());
  std::filesystem::create_directories(dir + "/tmp");
  {
    std::ofstream out(dir + "/tmp/sqlcache.sql", std::ios::binary);
    out << orv::snapshot::section("BENCH");
    for (int i = 0; i < kStatements; ++i) {
      orv::snapshot::Statement st;
      st.columns.fill(i);
      st.text = "SELECT C1, C2 FROM T WHERE ID = " + std::to_string(i);
      out << orv::snapshot::statement(st);
    }
  }
  setenv("ORVENGINE_INSTANCE_PATH", dir.c_str(), 1);
  unsetenv("ORVENGINE_SNAPSHOT_NAME");
  std::int64_t rows = 0;
  for (auto _ : state) {
    table.open();
    while (table.fetch()) ++rows;
    table.close();
  }
  state.SetItemsProcessed(rows);
  if (rows != kStatements * static_cast<std::int64_t>(state.iterations())) {
    state.SkipWithError("the snapshot did not give every row");
  }
  std::filesystem::remove_all(dir);
}

}  // namespace

void registerSnapshotRows() {
  benchmark::RegisterBenchmark("SQLCACHE_SNAPSHOT/100000 statements", snapshotScan)
      ->Unit(benchmark::kMillisecond);
}

}  // namespace orv::bench
