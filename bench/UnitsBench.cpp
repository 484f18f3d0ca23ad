// Unit conversion: krCoreLib's ConvertUnitValue against udunits2, side by
// side in one run. udunits2 does on every call what a caller holding two
// unit texts must do there: parse both units, get a converter, convert and
// free both. Target: ConvertUnitValue at least 10 times faster on each pair
// ("in" to "mm", "Kg/m*s^2" to "psi", "min^-1" to "s^-1"), allocating
// nothing (counter "allocs/iter").
//
// udunits2 writes "kg" where the unit table writes "Kg", and its psi is a
// pressure where the table's psi is a mass per area (its pressure is
// "psig"); each side converts the pair in its own notation.
#include <krCoreLib/units/KRUnitConversion.h>

#include "KRAllocationCounter.h"
#include "KRBenchReport.h"

#include <benchmark/benchmark.h>
#include <udunits2.h>

#include <iterator>
#include <string>

namespace {

struct SKRPair {
  const wchar_t* m_pFrom;
  const wchar_t* m_pTo;
  const char* m_pUdunitsFrom;
  const char* m_pUdunitsTo;
};

constexpr SKRPair kPairs[] = {
    {L"in", L"mm", "in", "mm"},
    {L"Kg/m*s^2", L"psig", "kg/m/s^2", "psi"},
    // The table's psi is a mass per area: evaluated, then refused.
    {L"Kg/m*s^2", L"psi", "kg/m/s^2", "psi"},
    {L"min^-1", L"s^-1", "min^-1", "s^-1"},
};

ut_system* UdunitsSystem() {
  static ut_system* s_System = [] {
    ut_set_error_message_handler(ut_ignore);
    return ut_read_xml(nullptr);
  }();
  return s_System;
}

void BM_ConvertUnitValue(benchmark::State& state) {
  const SKRPair& pair = kPairs[state.range(0)];
  double value = 1.0;
  state.counters["converts"] = ConvertUnitValue(value, pair.m_pFrom, pair.m_pTo) ? 1 : 0;
  {
    AllocationProbe probe(state);
    for (auto _ : state) {
      double converted = 1.0;
      benchmark::DoNotOptimize(ConvertUnitValue(converted, pair.m_pFrom, pair.m_pTo));
      benchmark::DoNotOptimize(converted);
    }
  }
  state.counters["value"] = value;
  state.SetItemsProcessed(state.iterations());
}

void BM_Udunits2(benchmark::State& state) {
  const SKRPair& pair = kPairs[state.range(0)];
  ut_system* system = UdunitsSystem();
  if (system == nullptr) {
    state.SkipWithError("no udunits2 database");
    return;
  }
  double value = 0.0;
  for (auto _ : state) {
    ut_unit* from = ut_parse(system, pair.m_pUdunitsFrom, UT_ASCII);
    ut_unit* to = ut_parse(system, pair.m_pUdunitsTo, UT_ASCII);
    cv_converter* converter = ut_get_converter(from, to);
    value = converter != nullptr ? cv_convert_double(converter, 1.0) : -1.0;
    benchmark::DoNotOptimize(value);
    cv_free(converter);
    ut_free(from);
    ut_free(to);
  }
  state.counters["value"] = value;
  state.SetItemsProcessed(state.iterations());
}

}  // namespace

BENCHMARK(BM_ConvertUnitValue)->DenseRange(0, 3)->ArgName("pair");
BENCHMARK(BM_Udunits2)->DenseRange(0, 3)->ArgName("pair");

namespace {

class CKRUnitsReporter : public CKRBenchReporter {
protected:
  void Summarize(std::ostream& out) override {
    out << "\nConvertUnitValue / udunits2 (target <= 0.1x, 0 allocations)\n";
    for (int i = 0; i < int(std::size(kPairs)); ++i) {
      const std::string arg = "/pair:" + std::to_string(i);
      const CKRString label = CKRString::Formatted(L"%s -> %s", kPairs[i].m_pFrom, kPairs[i].m_pTo);
      Ratio(out, label.ToUtf8(), "BM_ConvertUnitValue" + arg, "BM_Udunits2" + arg, 0.1);
      if (SKRResult mine; Find("BM_ConvertUnitValue" + arg, mine))
        out << "      allocations per conversion " << std::setprecision(3) << Counter(mine, "allocs/iter")
            << (Counter(mine, "converts") == 0 ? ", refused (not the same quantity)" : "") << "\n";
    }
  }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRUnitsReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
