#include "bench_support.hpp"

#include <dlfcn.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <map>

namespace orv::bench {

void *exportNamed(const char *symbol) {
  static void *library = dlopen(ORV_LIBRARY_PATH, RTLD_NOW | RTLD_LOCAL);
  void *fn = library != nullptr ? dlsym(library, symbol) : nullptr;
  if (fn == nullptr) {
    static_cast<void>(std::fprintf(stderr, "no export %s in %s\n", symbol, ORV_LIBRARY_PATH));
    std::exit(1);
  }
  return fn;
}

const cat::Routine &routineNamed(const char *symbol) {
  const cat::Routine *row = cat::find(symbol);
  if (row == nullptr) {
    static_cast<void>(std::fprintf(stderr, "no catalogue row for %s\n", symbol));
    std::exit(1);
  }
  return *row;
}

Value text(std::string_view s) {
  Value v(s.begin(), s.end());
  v.push_back(0);
  return v;
}
Value lob(std::string_view s) {
  // A CLI_udfLob's length is a 32-bit word, and the values here are far
  // shorter; counted in it, the area's size cannot wrap round to nothing.
  const auto size = static_cast<std::uint32_t>(s.size());
  Value v(CLI_LOB_AREA_SIZE(std::size_t{size}));
  cli::call::layOutLob(v.data(), s.data(), size);
  return v;
}
Value textArea() { return Value(cli::call::areaSize(cat::textOf(cat::kText))); }
Value lobArea(std::uint32_t capacity) {
  Value v(cli::call::areaSize(cat::lobOf(capacity)));
  cli::call::prepareLobResult(v.data(), capacity);
  return v;
}

PreparedCall::PreparedCall(const cat::Routine &row, const void *const *inputs, void *result,
                           const void *dbinfo) noexcept {
  const std::size_t n = cat::inputCount(row);
  for (std::size_t i = 0; i < n; ++i) {
    inputs_[i] = const_cast<void *>(inputs[i]);
    inputIndicators_[i] = &indicators_[i];
  }
  results_[0] = result;
  resultIndicators_[0] = &indicators_[n];
  cli::call::Frame f =
      cli::call::frameOf(row, inputs_.data(), results_.data(), inputIndicators_.data(),
                         resultIndicators_.data(), status_);
  f.dbinfo = dbinfo;
  count_ = cli::call::layOut(row, f, args_.data());
}

namespace {

// Whether `values` fit `row` as its inputs and `result` as its one result:
// as many inputs as the row has, and each number as wide as its slot.
bool fits(const cat::Routine &row, const std::vector<Value> &values, const Value &result) {
  const auto isNumber = [](const cat::Slot &slot) {
    return slot.layout == cat::Layout::int16 || slot.layout == cat::Layout::int32 ||
           slot.layout == cat::Layout::int64 || slot.layout == cat::Layout::real;
  };
  if (values.size() != cat::inputCount(row) || cat::resultCount(row) != 1) return false;
  for (std::size_t i = 0; i < values.size(); ++i) {
    if (isNumber(row.inputs[i]) && values[i].size() != cli::call::areaSize(row.inputs[i])) {
      return false;
    }
  }
  if (row.results[0].layout == cat::Layout::lob) return result.size() >= CLI_LOB_DATA_OFFSET;
  return result.size() >= cli::call::areaSize(row.results[0]);
}

}  // namespace

double run(benchmark::State &state, const char *symbol, std::vector<Value> inputs, Value result,
           std::int64_t bytesPerCall) {
  const cat::Routine &row = routineNamed(symbol);
  void *fn = exportNamed(symbol);
  if (!fits(row, inputs, result)) {
    state.SkipWithError("the values do not fit the routine's row");
    return 0;
  }
  std::array<const void *, cat::kMaxInputs> values{};
  for (std::size_t i = 0; i < inputs.size(); ++i) values[i] = inputs[i].data();
  PreparedCall call(row, values.data(), result.data());
  const bool lobResult = row.results[0].layout == cat::Layout::lob;
  const std::uint32_t capacity =
      lobResult ? static_cast<std::uint32_t>(result.size() - CLI_LOB_DATA_OFFSET) : 0;
  const auto start = std::chrono::steady_clock::now();
  for (auto _ : state) {
    if (lobResult) cli::call::prepareLobResult(result.data(), capacity);
    cli::call::invoke(fn, call.args(), call.count());
    benchmark::DoNotOptimize(result.data());
    benchmark::ClobberMemory();
  }
  const std::chrono::duration<double, std::nano> spent = std::chrono::steady_clock::now() - start;
  if (call.status().stored()) state.SkipWithError("the routine reported a status");
  if (bytesPerCall != 0) state.SetBytesProcessed(state.iterations() * bytesPerCall);
  return spent.count() / static_cast<double>(state.iterations());
}

namespace {

std::map<std::string, double> &referenceTimes() {
  static std::map<std::string, double> times;
  return times;
}

}  // namespace

void setReferenceTime(const std::string &reference, double ns) { referenceTimes()[reference] = ns; }

void setRatio(benchmark::State &state, const char *counter, double ns,
              const std::string &reference) {
  const auto found = referenceTimes().find(reference);
  if (found != referenceTimes().end()) state.counters[counter] = ns / found->second;
}

}  // namespace orv::bench
