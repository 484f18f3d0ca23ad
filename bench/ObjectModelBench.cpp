// Object-model micro-benchmarks: krCoreLib against libuuid, side by side in
// one run. A summary of the ratios and targets is printed after the results.
//
//   1. CKRGuid copy, operator== and operator< vs uuid_copy / uuid_compare.
//      Target: a few nanoseconds each and 0 allocations per iteration
//      (counter "allocs/iter", from the counting operator new below).
//   2. CKRGuid::CreateNewGUID vs uuid_generate.
//      Target: CreateNewGUID at least 20x faster.
//   3. CKRGuid::SetCString (braced, 38 characters, text prepared outside the
//      loop) vs uuid_parse (36 narrow characters).
//      Target: SetCString at least 5x faster.
//   4. CKRGuid::GetCString (the returned string's allocation included) vs
//      uuid_unparse_lower into a char[37].
//      Target: GetCString at most 2x the time of uuid_unparse_lower.
//   5. CreateInstance(CKRGuid()) + ReleaseInstance of a tiny framework class.
//      Target: at least 2,000,000 pairs per second (items_per_second).
//   6. GetInstance of existing IDs among N = 1,000 / 10,000 / 100,000 tracked
//      instances, drawn at random from all N ("Random": the cache and TLB
//      misses grow with N as well) and from a hot set of 64 of them ("HotSet":
//      caches warm, the cost is the depth of the search).
//      Target: logarithmic in N: benchmark's O(log N) fit, and the time ratio
//      100,000 : 1,000 near log(100,000) / log(1,000) = 1.67 (at most twice
//      that) rather than the 100 of a linear search. Paired with find in a
//      plain std::map<CKRGuid, IKRObject*> of the same IDs and memory layout
//      (ratio near 1: the tracking adds nothing to the tree search itself).
//
// Run: bench_objectmodel --benchmark_repetitions=3
//      --benchmark_report_aggregates_only=true
// The results are always printed by the console reporter (with the summary);
// --benchmark_out / --benchmark_out_format still write a file.
#include <krCoreLib/krCoreLib.h>

#include <benchmark/benchmark.h>
#include <uuid/uuid.h>

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <iomanip>
#include <map>
#include <new>
#include <ostream>
#include <random>
#include <string>
#include <unistd.h>
#include <vector>

#include "KRAllocationCounter.h"

// ---- a tiny framework class ----------------------------------------------------

class CKRBenchObject : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRBenchObject, CKRObjectTypeImpl, "{5E3A9C1B-7D24-4F68-B0A1-C2D3E4F50617}")
public:
  int m_Value = 0;

protected:
  CKRBenchObject() = default;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRBenchObject, CKRObjectImpl)

namespace {

constexpr CKRGuid kBenchRepository = CKRGuid::Literal("{9B2F6E4D-1C3A-4B58-8E7F-0A1B2C3D4E5F}");

// Fixed operands: two equal values, and a value greater than the first only
// in its last byte (so == and < compare every field).
constexpr CKRGuid kGuidA = CKRGuid::Literal("{3f2504e0-4f89-41d3-9a0c-0305e82c3301}");
constexpr CKRGuid kGuidB = CKRGuid::Literal("{3f2504e0-4f89-41d3-9a0c-0305e82c3302}");

// The same values in libuuid's byte order (most significant byte first).
struct Uuid {
  uuid_t bytes;
};

Uuid ToUuid(const CKRGuid& guid) {
  Uuid result{};
  const std::string text = guid.GetCString().ToUtf8().substr(1, 36);
  uuid_parse(text.c_str(), result.bytes);
  return result;
}

// ---- 1. copy and compare -----------------------------------------------------

void BM_CKRGuid_Copy(benchmark::State& state) {
  CKRGuid source = kGuidA;
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(source);
    CKRGuid copy(source);
    benchmark::DoNotOptimize(copy);
  }
}

void BM_uuid_copy(benchmark::State& state) {
  Uuid source = ToUuid(kGuidA);
  Uuid copy{};
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(source);
    uuid_copy(copy.bytes, source.bytes);
    benchmark::DoNotOptimize(copy);
  }
}

void BM_CKRGuid_Equal(benchmark::State& state) {
  CKRGuid a = kGuidA;
  CKRGuid b = kGuidA;
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(a);
    benchmark::DoNotOptimize(b);
    bool equal = (a == b);
    benchmark::DoNotOptimize(equal);
  }
}

void BM_uuid_compare_Equal(benchmark::State& state) {
  Uuid a = ToUuid(kGuidA);
  Uuid b = ToUuid(kGuidA);
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(a);
    benchmark::DoNotOptimize(b);
    bool equal = (uuid_compare(a.bytes, b.bytes) == 0);
    benchmark::DoNotOptimize(equal);
  }
}

void BM_CKRGuid_Less(benchmark::State& state) {
  CKRGuid a = kGuidA;
  CKRGuid b = kGuidB;
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(a);
    benchmark::DoNotOptimize(b);
    bool less = (a < b);
    benchmark::DoNotOptimize(less);
  }
}

void BM_uuid_compare_Less(benchmark::State& state) {
  Uuid a = ToUuid(kGuidA);
  Uuid b = ToUuid(kGuidB);
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(a);
    benchmark::DoNotOptimize(b);
    bool less = (uuid_compare(a.bytes, b.bytes) < 0);
    benchmark::DoNotOptimize(less);
  }
}

// ---- 2. new GUIDs --------------------------------------------------------------

void BM_CKRGuid_CreateNewGUID(benchmark::State& state) {
  AllocationProbe probe(state);
  for (auto _ : state) {
    CKRGuid guid = CKRGuid::CreateNewGUID();
    benchmark::DoNotOptimize(guid);
  }
  state.SetItemsProcessed(state.iterations());
}

void BM_uuid_generate(benchmark::State& state) {
  Uuid guid{};
  AllocationProbe probe(state);
  for (auto _ : state) {
    uuid_generate(guid.bytes);
    benchmark::DoNotOptimize(guid);
  }
  state.SetItemsProcessed(state.iterations());
}

// ---- 3. braced text in -----------------------------------------------------------

void BM_CKRGuid_SetCString(benchmark::State& state) {
  const CKRString text = CKRGuid::CreateNewGUID().GetCString();
  CKRGuid guid;
  guid.SetCString(text);
  if (text.size() != 38 || guid.GetCString() != text) {
    state.SkipWithError("SetCString did not read the braced text back");
    return;
  }
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(text);
    guid.SetCString(text);
    benchmark::DoNotOptimize(guid);
  }
}

void BM_uuid_parse(benchmark::State& state) {
  const std::string text = CKRGuid::CreateNewGUID().GetCString().ToUtf8().substr(1, 36);
  Uuid guid{};
  if (text.size() != 36 || uuid_parse(text.c_str(), guid.bytes) != 0) {
    state.SkipWithError("uuid_parse refused the text");
    return;
  }
  int failures = 0;
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(text);
    failures += uuid_parse(text.c_str(), guid.bytes);
    benchmark::DoNotOptimize(guid);
  }
  if (failures != 0)
    state.SkipWithError("uuid_parse failed in the loop");
}

// ---- 4. braced text out ----------------------------------------------------------

void BM_CKRGuid_GetCString(benchmark::State& state) {
  CKRGuid guid = CKRGuid::CreateNewGUID();
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(guid);
    CKRString text = guid.GetCString();
    benchmark::DoNotOptimize(text);
    benchmark::ClobberMemory();
  }
}

void BM_uuid_unparse_lower(benchmark::State& state) {
  Uuid guid = ToUuid(CKRGuid::CreateNewGUID());
  char text[37];
  AllocationProbe probe(state);
  for (auto _ : state) {
    benchmark::DoNotOptimize(guid);
    uuid_unparse_lower(guid.bytes, text);
    benchmark::DoNotOptimize(text);
    benchmark::ClobberMemory();
  }
}

// ---- 5. create and release ---------------------------------------------------------

void BM_CreateReleaseInstance(benchmark::State& state) {
  IKRObjectType* type = CKRBenchObject::GetCKRBenchObjectType();
  const CKRGuid none;
  int released = 0;
  {
    AllocationProbe probe(state);
    for (auto _ : state) {
      IKRObject* object = type->CreateInstance(none);
      benchmark::DoNotOptimize(object);
      released += type->ReleaseInstance(object);
    }
  }
  state.SetItemsProcessed(state.iterations());
  if (released != static_cast<int>(state.iterations()))
    state.SkipWithError("an instance was not created or not released");
}

// ---- 6. lookup among N tracked instances -------------------------------------------

// Lookups per probe sequence: long enough that the branch predictor cannot
// learn the sequence even for N = 1,000 (a short repeating sequence would
// flatter the small maps), read sequentially so that reading the probes
// costs no cache misses of its own.
constexpr std::size_t kProbeCount = std::size_t(1) << 17;
// Distinct IDs looked up by the hot-set variant.
constexpr std::size_t kHotSetSize = 64;

enum class LookupMode {
  Random,  // GetInstance, IDs drawn from all N
  HotSet,  // GetInstance, IDs drawn from kHotSetSize of them
  StdMap,  // std::map<CKRGuid, IKRObject*>::find, IDs drawn from all N
};

// Creates N instances, looks up existing IDs, then releases the instances.
// Every mode also fills the reference std::map in the same loop, so that the
// memory layout (object, tracking node, reference node, ...) is the same
// whichever of the two maps is searched.
void RunGetInstance(benchmark::State& state, LookupMode mode) {
  auto* type = CKRBenchObject::GetCKRBenchObjectType();
  const auto count = static_cast<std::size_t>(state.range(0));
  std::vector<IKRObject*> objects;
  std::vector<CKRGuid> ids;
  std::map<CKRGuid, IKRObject*> reference;
  objects.reserve(count);
  ids.reserve(count);
  for (std::size_t i = 0; i < count; ++i) {
    IKRObject* object = type->CreateInstance(CKRGuid());
    objects.push_back(object);
    ids.push_back(object->GetInstanceID());
    reference.emplace(ids.back(), object);
  }
  std::mt19937_64 random(0x5eed);
  if (mode == LookupMode::HotSet) {
    std::shuffle(ids.begin(), ids.end(), random);
    ids.resize(std::min(kHotSetSize, ids.size()));
  }
  std::uniform_int_distribution<std::size_t> pick(0, ids.size() - 1);
  std::vector<CKRGuid> probes;
  probes.reserve(kProbeCount);
  for (std::size_t i = 0; i < kProbeCount; ++i)
    probes.push_back(ids[pick(random)]);

  std::size_t at = 0;
  std::size_t found = 0;
  {
    AllocationProbe probe(state);
    if (mode == LookupMode::StdMap) {
      for (auto _ : state) {
        const auto entry = reference.find(probes[at]);
        IKRObject* object = entry == reference.end() ? nullptr : entry->second;
        benchmark::DoNotOptimize(object);
        found += (object != nullptr) ? 1 : 0;
        at = (at + 1) & (kProbeCount - 1);
      }
    } else {
      for (auto _ : state) {
        IKRObject* object = type->GetInstance(probes[at]);
        benchmark::DoNotOptimize(object);
        found += (object != nullptr) ? 1 : 0;
        at = (at + 1) & (kProbeCount - 1);
      }
    }
  }
  state.SetComplexityN(state.range(0));
  state.counters["tracked"] = static_cast<double>(type->GetInstanceCount());

  for (IKRObject* object : objects)
    object->Release();
  if (found != static_cast<std::size_t>(state.iterations()))
    state.SkipWithError("an existing instance was not found");
  else if (type->GetInstanceCount() != 0)
    state.SkipWithError("instances were left tracked");
}

void BM_GetInstance_Random(benchmark::State& state) { RunGetInstance(state, LookupMode::Random); }
void BM_GetInstance_HotSet(benchmark::State& state) { RunGetInstance(state, LookupMode::HotSet); }
void BM_StdMapFind_Random(benchmark::State& state) { RunGetInstance(state, LookupMode::StdMap); }

}  // namespace

BENCHMARK(BM_CKRGuid_Copy);
BENCHMARK(BM_uuid_copy);
BENCHMARK(BM_CKRGuid_Equal);
BENCHMARK(BM_uuid_compare_Equal);
BENCHMARK(BM_CKRGuid_Less);
BENCHMARK(BM_uuid_compare_Less);
BENCHMARK(BM_CKRGuid_CreateNewGUID);
BENCHMARK(BM_uuid_generate);
BENCHMARK(BM_CKRGuid_SetCString);
BENCHMARK(BM_uuid_parse);
BENCHMARK(BM_CKRGuid_GetCString);
BENCHMARK(BM_uuid_unparse_lower);
BENCHMARK(BM_CreateReleaseInstance);
BENCHMARK(BM_GetInstance_Random)->RangeMultiplier(10)->Range(1000, 100000)->Complexity(benchmark::oLogN);
BENCHMARK(BM_GetInstance_HotSet)->RangeMultiplier(10)->Range(1000, 100000)->Complexity(benchmark::oLogN);
BENCHMARK(BM_StdMapFind_Random)->RangeMultiplier(10)->Range(1000, 100000)->Complexity(benchmark::oLogN);

// ---- reporting -----------------------------------------------------------------

namespace {

// The console reporter, which also keeps each benchmark's median real time
// (nanoseconds) and counters and prints the ratios against the targets at
// the end.
class RatioReporter : public benchmark::ConsoleReporter {
public:
  using ConsoleReporter::ConsoleReporter;

  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
      if (run.error_occurred)
        continue;
      const std::string name = Key(run);
      if (run.run_type == Run::RT_Iteration) {
        Samples& samples = m_Samples[name];
        samples.m_Times.push_back(Nanoseconds(run, run.GetAdjustedRealTime()));
        samples.m_Counters.push_back(run.counters);
      } else if (run.aggregate_name == "median") {
        m_Medians[name] = {Nanoseconds(run, run.GetAdjustedRealTime()), run.counters};
      } else if (run.aggregate_name == "RMS") {
        m_RMS[run.run_name.function_name] = run.GetAdjustedRealTime();
      }
    }
  }

  void Finalize() override {
    ConsoleReporter::Finalize();
    std::ostream& out = GetOutputStream();
    out << "\nRatios (median real times)\n";
    out << std::fixed;

    out << "\n1. Copy and compare: time and allocations per iteration\n";
    for (const char* name : {"BM_CKRGuid_Copy", "BM_uuid_copy", "BM_CKRGuid_Equal", "BM_uuid_compare_Equal",
                             "BM_CKRGuid_Less", "BM_uuid_compare_Less"}) {
      Result result;
      if (!Find(name, result))
        continue;
      const double allocations = Counter(result, "allocs/iter");
      out << "   " << std::left << std::setw(26) << name << std::right << std::setprecision(2) << std::setw(9)
          << result.m_Time << " ns   allocs/iter " << std::setprecision(3) << allocations;
      if (std::string(name).starts_with("BM_CKRGuid"))
        out << "   target <= 5 ns, 0 allocations: " << (result.m_Time <= 5.0 && allocations == 0.0 ? "met" : "MISSED");
      out << "\n";
    }
    Ratio(out, "CKRGuid copy vs uuid_copy", "BM_CKRGuid_Copy", "BM_uuid_copy", 0.0);
    Ratio(out, "CKRGuid == vs uuid_compare", "BM_CKRGuid_Equal", "BM_uuid_compare_Equal", 0.0);
    Ratio(out, "CKRGuid < vs uuid_compare", "BM_CKRGuid_Less", "BM_uuid_compare_Less", 0.0);

    out << "\n2.-4. Pairs against libuuid\n";
    Ratio(out, "CreateNewGUID vs uuid_generate", "BM_CKRGuid_CreateNewGUID", "BM_uuid_generate", 20.0);
    Ratio(out, "SetCString vs uuid_parse", "BM_CKRGuid_SetCString", "BM_uuid_parse", 5.0);
    Result mine;
    Result reference;
    if (Find("BM_CKRGuid_GetCString", mine) && Find("BM_uuid_unparse_lower", reference)) {
      const double ratio = mine.m_Time / reference.m_Time;
      out << "   " << std::left << std::setw(40) << "GetCString vs uuid_unparse_lower" << std::right
          << std::setprecision(2) << std::setw(9) << mine.m_Time << " ns vs " << std::setw(9) << reference.m_Time
          << " ns   GetCString / unparse = " << ratio << "x   target <= 2x: " << (ratio <= 2.0 ? "met" : "MISSED")
          << "\n";
    }

    out << "\n5. CreateInstance + ReleaseInstance\n";
    if (Find("BM_CreateReleaseInstance", mine)) {
      const double rate = Counter(mine, "items_per_second");
      out << "   " << std::setprecision(2) << mine.m_Time << " ns a pair, " << std::setprecision(0) << rate
          << " pairs/s, " << std::setprecision(2) << rate / 2e6 << "x the target of 2,000,000/s: "
          << (rate >= 2e6 ? "met" : "MISSED") << "\n";
    }

    constexpr double kLogRatio = 5.0 / 3.0;
    out << "\n6. GetInstance over N tracked instances (log ratio 100000:1000 is " << std::setprecision(2)
        << kLogRatio << ", linear would be 100)\n";
    for (const char* family : {"BM_GetInstance_Random", "BM_GetInstance_HotSet", "BM_StdMapFind_Random"}) {
      Result small;
      Result large;
      const std::string base = family;
      if (!Find(base + "/1000", small) || !Find(base + "/100000", large))
        continue;
      for (const char* n : {"/1000", "/10000", "/100000"}) {
        Result result;
        if (Find(base + n, result))
          out << "   " << std::left << std::setw(32) << base + n << std::right << std::setprecision(2)
              << std::setw(9) << result.m_Time << " ns\n";
      }
      const double ratio = large.m_Time / small.m_Time;
      const auto rms = m_RMS.find(base);
      out << "   " << family << ": t(100000) / t(1000) = " << std::setprecision(2) << ratio;
      if (rms != m_RMS.end())
        out << ", O(log N) fit RMS " << std::setprecision(0) << rms->second * 100.0 << "%";
      out << "   logarithmic (ratio <= " << std::setprecision(2) << 2 * kLogRatio
          << "): " << (ratio <= 2 * kLogRatio ? "met" : "MISSED") << "\n";
    }
    for (const char* n : {"/1000", "/10000", "/100000"}) {
      const std::string label = std::string("GetInstance vs std::map::find") + n;
      Ratio(out, label.c_str(), std::string("BM_GetInstance_Random") + n, std::string("BM_StdMapFind_Random") + n, 0.0);
    }
    out.flush();
  }

private:
  struct Samples {
    std::vector<double> m_Times;
    std::vector<benchmark::UserCounters> m_Counters;
  };
  struct Result {
    double m_Time = 0.0;
    benchmark::UserCounters m_Counters;
  };

  static std::string Key(const Run& run) {
    std::string key = run.run_name.function_name;
    if (!run.run_name.args.empty())
      key += "/" + run.run_name.args;
    return key;
  }

  static double Nanoseconds(const Run& run, double value) {
    switch (run.time_unit) {
      case benchmark::kSecond:
        return value * 1e9;
      case benchmark::kMillisecond:
        return value * 1e6;
      case benchmark::kMicrosecond:
        return value * 1e3;
      case benchmark::kNanosecond:
        break;
    }
    return value;
  }

  static double Counter(const Result& result, const char* name) {
    const auto at = result.m_Counters.find(name);
    return at == result.m_Counters.end() ? 0.0 : at->second.value;
  }

  // The median aggregate when repetitions were reported, otherwise the
  // median of the runs.
  bool Find(const std::string& name, Result& result) const {
    if (const auto median = m_Medians.find(name); median != m_Medians.end()) {
      result = median->second;
      return true;
    }
    const auto samples = m_Samples.find(name);
    if (samples == m_Samples.end() || samples->second.m_Times.empty())
      return false;
    std::vector<std::size_t> order(samples->second.m_Times.size());
    for (std::size_t i = 0; i < order.size(); ++i)
      order[i] = i;
    std::sort(order.begin(), order.end(),
              [&](std::size_t a, std::size_t b) { return samples->second.m_Times[a] < samples->second.m_Times[b]; });
    const std::size_t middle = order[order.size() / 2];
    result = {samples->second.m_Times[middle], samples->second.m_Counters[middle]};
    return true;
  }

  // Prints reference / krCoreLib; a target of 0 prints the ratio only.
  void Ratio(std::ostream& out, const char* label, const std::string& mineName, const std::string& referenceName,
             double target) const {
    Result mine;
    Result reference;
    if (!Find(mineName, mine) || !Find(referenceName, reference))
      return;
    const double ratio = reference.m_Time / mine.m_Time;
    out << "   " << std::left << std::setw(40) << label << std::right << std::setprecision(2) << std::setw(9)
        << mine.m_Time << " ns vs " << std::setw(9) << reference.m_Time << " ns   reference / krCoreLib = " << ratio
        << "x";
    if (target > 0.0)
      out << "   target >= " << std::setprecision(0) << target << "x: " << (ratio >= target ? "met" : "MISSED");
    out << "\n";
  }

  std::map<std::string, Samples> m_Samples;
  std::map<std::string, Result> m_Medians;
  std::map<std::string, double> m_RMS;
};

}  // namespace

int main(int argc, char** argv) {
  // The benchmark's tiny class (and the library's own) are claimed into a
  // repository once, as a host does at start.
  CKRTypeSystem::Initialize(kBenchRepository);

  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  RatioReporter reporter(isatty(STDOUT_FILENO) ? RatioReporter::OO_Color : RatioReporter::OO_None);
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();

  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  return 0;
}
