// Numeric rows, and the C library's maths calls that some of the routines
// make, timed alone.
#include <cmath>
#include <cstdint>

#include "bench_support.hpp"

namespace orv::bench {

namespace {

// Numeric rows: name, export, inputs; the result area has 8 bytes.  Each
// family's rows sit next to the C library call that the routine makes,
// where it makes one, since the target is 5 ns plus that call.
struct NumericRow {
  const char *name, *routine;
  std::vector<Value> inputs;
};
const NumericRow kNumericRows[] = {
    {"ABS1/-2.5", "CLI_udfABS1", {number(-2.5)}},
    {"ABS4/-12345", "CLI_udfABS4", {number(std::int64_t{-12345})}},
    {"SIGN1/-2.5", "CLI_udfSIGN1", {number(-2.5)}},
    {"CEILING1/2.5", "CLI_udfCEILING1", {number(2.5)}},
    {"FLOOR4/12345", "CLI_udfFLOOR4", {number(std::int64_t{12345})}},
    {"MOD3/1000003, 97", "CLI_udfMOD3", {number(std::int64_t{1000003}), number(std::int64_t{97})}},
    {"MOD1/1000003, 97", "CLI_udfMOD1", {number(1000003), number(97)}},
    {"ROUND1/1234.5678, 2", "CLI_udfROUND1", {number(1234.5678), number(2)}},
    {"TRUNCATE1/1234.5678, 2", "CLI_udfTRUNCATE1", {number(1234.5678), number(2)}},
    {"ROUND2/1234567, -2", "CLI_udfROUND2", {number(1234567), number(-2)}},
    {"ROUND5/1234567890123, -4",
     "CLI_udfROUND5",
     {number(std::int64_t{1234567890123}), number(-4)}},
    {"TRUNCATE5/1234567890123, -4",
     "CLI_udfTRUNCATE5",
     {number(std::int64_t{1234567890123}), number(-4)}},
    {"POWER1/2.5, 3.5", "CLI_udfPOWER1", {number(2.5), number(3.5)}},
    {"POWER3/7, 5", "CLI_udfPOWER3", {number(7), number(5)}},
    {"POWER4/7, 5", "CLI_udfPOWER4", {number(std::int64_t{7}), number(std::int64_t{5})}},
    {"POWER4/3, 39 (longest loop)",
     "CLI_udfPOWER4",
     {number(std::int64_t{3}), number(std::int64_t{39})}},
    {"SIN/0.7", "CLI_udfSIN", {number(0.7)}},
    {"SQRT/2.0", "CLI_udfSQRT", {number(2.0)}},
    {"EXP/0.7", "CLI_udfEXP", {number(0.7)}},
    {"LOG/0.7", "CLI_udfLOG", {number(0.7)}},
    {"ATAN2/0.7, 0.3", "CLI_udfATAN2", {number(0.7), number(0.3)}},
    {"DEGREES1/0.7", "CLI_udfDEGREES1", {number(0.7)}},
    {"RAND1", "CLI_udfRAND1", {}},
};

// The C library's maths calls alone, for the targets "5 ns plus the call".
template <double (*F)(double, double)>
void mathCall2(benchmark::State &state, double x, double y) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(x);
    benchmark::DoNotOptimize(y);
    benchmark::DoNotOptimize(F(x, y));
  }
}
template <double (*F)(double)>
void mathCall1(benchmark::State &state, double x) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(x);
    benchmark::DoNotOptimize(F(x));
  }
}
double powCall(double x, double y) { return std::pow(x, y); }
double fmodCall(double x, double y) { return std::fmod(x, y); }
double sinCall(double x) { return std::sin(x); }
double expCall(double x) { return std::exp(x); }
double logCall(double x) { return std::log(x); }
double sqrtCall(double x) { return std::sqrt(x); }

}  // namespace

void registerNumericRows() {
  for (const NumericRow &r : kNumericRows) {
    benchmark::RegisterBenchmark(
        r.name, [&r](benchmark::State &s) { run(s, r.routine, r.inputs, Value(8)); });
  }
  benchmark::RegisterBenchmark("libm pow/10, -2", mathCall2<powCall>, 10.0, -2.0);
  benchmark::RegisterBenchmark("libm pow/2.5, 3.5", mathCall2<powCall>, 2.5, 3.5);
  benchmark::RegisterBenchmark("libm fmod/1234.5678, 0.01", mathCall2<fmodCall>, 1234.5678, 0.01);
  benchmark::RegisterBenchmark("libm sin/0.7", mathCall1<sinCall>, 0.7);
  benchmark::RegisterBenchmark("libm exp/0.7", mathCall1<expCall>, 0.7);
  benchmark::RegisterBenchmark("libm log/0.7", mathCall1<logCall>, 0.7);
  benchmark::RegisterBenchmark("libm sqrt/2.0", mathCall1<sqrtCall>, 2.0);
}

}  // namespace orv::bench
