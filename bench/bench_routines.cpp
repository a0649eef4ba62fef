// Cost of one call of each routine, called as an engine calls it: found by
// name in the built library, handed a frame of pointers to ready buffers,
// laid out by the frame caller from the routine's catalogue row.
//
// Rows: <ROUTINE>/<input>.  String rows over 1 MiB report bytes per second.
// The families register their rows here, in the order in which they run:
// the 1 MiB search rows read the reference times of the rows before them.
#include "bench_support.hpp"

int main(int argc, char **argv) {
  orv::bench::registerDateRows();
  orv::bench::registerNumericRows();
  orv::bench::registerSearchRows();
  orv::bench::registerNameRows();
  orv::bench::registerSnapshotRows();
  orv::bench::registerTimestampRows();
  orv::bench::registerStringRows();
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
