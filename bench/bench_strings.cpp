// Basic string rows: 20-byte texts as SQL hands them row by row, and the
// routines that build or rewrite 1 MiB.
#include <cstring>
#include <string>
#include <vector>

#include "bench_support.hpp"

namespace orv::bench {

namespace {

const std::string k20 = "  Mixed Case Text   ";  // 20 bytes, blanks at both ends
const std::string kMiBOfQ(kMiB, 'Q');

void space(benchmark::State &s) { run(s, "CLI_udfSPACE", {int32(20)}, textArea()); }
void lcase1(benchmark::State &s) { run(s, "CLI_udfLCASE1", {text(k20)}, textArea()); }
void rtrim1(benchmark::State &s) { run(s, "CLI_udfRTRIM1", {text(k20)}, textArea()); }
void ltrim1(benchmark::State &s) { run(s, "CLI_udfLTRIM1", {text(k20)}, textArea()); }
void left1(benchmark::State &s) { run(s, "CLI_udfLEFT1", {text(k20), int32(10)}, textArea()); }
void right1(benchmark::State &s) { run(s, "CLI_udfRIGHT1", {text(k20), int32(10)}, textArea()); }
void lcase2(benchmark::State &s) { run(s, "CLI_udfLCASE2", {lob(k20)}, lobArea(64)); }
void rtrim2(benchmark::State &s) { run(s, "CLI_udfRTRIM2", {lob(k20)}, lobArea(64)); }
void charCode(benchmark::State &s) { run(s, "CLI_udfCHAR", {int32(65)}, textArea()); }
void ascii1(benchmark::State &s) { run(s, "CLI_udfASCII1", {text(k20)}, int32(0)); }

void lcase2MiB(benchmark::State &s) { run(s, "CLI_udfLCASE2", {lob(kMiBOfQ)}, lobArea(), 1 << 20); }
void repeat2MiB(benchmark::State &s) {
  run(s, "CLI_udfREPEAT2", {lob("0123456789abcdef"), int32(65536)}, lobArea(), 1 << 20);
}
void repeat2MiBOneByte(benchmark::State &s) {
  run(s, "CLI_udfREPEAT2", {lob("z"), int32(1 << 20)}, lobArea(), 1 << 20);
}
void repeat1OneByte(benchmark::State &s) {
  run(s, "CLI_udfREPEAT1", {text("z"), int32(4000)}, textArea(), 4000);
}
void repeat1ThreeBytes(benchmark::State &s) {
  run(s, "CLI_udfREPEAT1", {text("abc"), int32(1333)}, textArea(), 3999);
}
// What REPEAT1 of 4000 bytes is measured against: copying 4000 bytes.
void memcpy4000(benchmark::State &s) {
  std::vector<char> from(4000, 'z');
  std::vector<char> to(4001);
  for (auto _ : s) {
    std::memcpy(to.data(), from.data(), from.size());
    benchmark::DoNotOptimize(to.data());
    benchmark::ClobberMemory();
  }
  s.SetBytesProcessed(s.iterations() * 4000);
}

}  // namespace

void registerStringRows() {
  benchmark::RegisterBenchmark("SPACE/20", space);
  benchmark::RegisterBenchmark("LCASE1/20-byte text", lcase1);
  benchmark::RegisterBenchmark("RTRIM1/20-byte text", rtrim1);
  benchmark::RegisterBenchmark("LTRIM1/20-byte text", ltrim1);
  benchmark::RegisterBenchmark("LEFT1/20-byte text, 10", left1);
  benchmark::RegisterBenchmark("RIGHT1/20-byte text, 10", right1);
  benchmark::RegisterBenchmark("LCASE2/20 bytes", lcase2);
  benchmark::RegisterBenchmark("RTRIM2/20 bytes", rtrim2);
  benchmark::RegisterBenchmark("CHAR/65", charCode);
  benchmark::RegisterBenchmark("ASCII1/20-byte text", ascii1);
  benchmark::RegisterBenchmark("LCASE2/1 MiB", lcase2MiB);
  benchmark::RegisterBenchmark("REPEAT2/16 bytes x 65536 = 1 MiB", repeat2MiB);
  benchmark::RegisterBenchmark("REPEAT2/1 byte x 1048576", repeat2MiBOneByte);
  benchmark::RegisterBenchmark("REPEAT1/1 byte x 4000", repeat1OneByte);
  benchmark::RegisterBenchmark("memcpy/4000 bytes (reference for REPEAT1)", memcpy4000);
  benchmark::RegisterBenchmark("REPEAT1/3 bytes x 1333", repeat1ThreeBytes);
}

}  // namespace orv::bench
