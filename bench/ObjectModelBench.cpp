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
//   7. CKRObjPtrList: Add, Contains and Remove of N = 1,000 .. 1,000,000
//      objects, in insertion order and in random order, paired with a
//      std::unordered_set of the same pointers. Target: the cost per element
//      flat (in order: at most 2x its value at N = 1,000, where a linear scan
//      would grow 1,000x; at random, where cache misses grow for any
//      container, the ratio to the hash set within 2x across N).
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
#include <malloc.h>
#include <map>
#include <new>
#include <ostream>
#include <random>
#include <string>
#include <type_traits>
#include <unistd.h>
#include <unordered_set>
#include <vector>

#include "KRAllocationCounter.h"
#include "KRBenchReport.h"

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

// ---- 7. object lists ----------------------------------------------------------------

// Fills a container with N objects, asks for each and removes each, in
// insertion order (range(1) == 0: a document filling and emptying its lists)
// or in random order (1). The list is paired with a std::unordered_set of
// the same pointers in the same orders: random access to a million elements
// costs cache and TLB misses whatever the container, so flatness is judged
// per element in order, and relative to the hash set at random.
template <class TContainer>
void RunListCycle(benchmark::State& state) {
  auto* type = CKRBenchObject::GetCKRBenchObjectType();
  const auto count = static_cast<std::size_t>(state.range(0));
  std::vector<IKRObject*> objects;
  objects.reserve(count);
  for (std::size_t i = 0; i < count; ++i)
    objects.push_back(type->CreateInstance(CKRGuid()));
  std::vector<IKRObject*> lookups = objects;
  std::vector<IKRObject*> removal = objects;
  if (state.range(1) != 0) {
    std::mt19937_64 random(0x5eed);
    std::shuffle(lookups.begin(), lookups.end(), random);
    std::shuffle(removal.begin(), removal.end(), random);
  }
  std::size_t done = 0;
  const auto cycle = [&] {
    TContainer container;
    if constexpr (std::is_same_v<TContainer, CKRObjPtrList<IKRObject>>) {
      for (IKRObject* object : objects)
        done += std::size_t(container.Add(object));
      for (IKRObject* object : lookups)
        done += container.Contains(object) ? 1 : 0;
      for (IKRObject* object : removal)
        done += container.Remove(object) != nullptr ? 1 : 0;
    } else {
      for (IKRObject* object : objects)
        done += container.insert(object).second ? 1 : 0;
      for (IKRObject* object : lookups)
        done += container.count(object);
      for (IKRObject* object : removal)
        done += container.erase(object);
    }
  };
  // One untimed cycle first: creating the objects left the caches full of
  // the type's tracking map, and a million elements run few timed cycles.
  cycle();
  done = 0;
  for (auto _ : state)
    cycle();
  state.SetItemsProcessed(state.iterations() * std::int64_t(count));
  state.counters["elements"] = double(count);
  for (IKRObject* object : objects)
    object->Release();
  if (done != 3 * count * std::size_t(state.iterations()))
    state.SkipWithError("the container lost or refused an element");
}

void BM_ObjPtrList(benchmark::State& state) { RunListCycle<CKRObjPtrList<IKRObject>>(state); }
void BM_UnorderedSet(benchmark::State& state) { RunListCycle<std::unordered_set<IKRObject*>>(state); }

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
BENCHMARK(BM_ObjPtrList)->ArgsProduct({{1000, 10000, 100000, 1000000}, {0, 1}})->ArgNames({"N", "random"})->Unit(benchmark::kMillisecond);
BENCHMARK(BM_UnorderedSet)->ArgsProduct({{1000, 10000, 100000, 1000000}, {0, 1}})->ArgNames({"N", "random"})->Unit(benchmark::kMillisecond);

// ---- reporting -----------------------------------------------------------------

namespace {

class CKRObjectModelReporter : public CKRBenchReporter {
protected:
  void Summarize(std::ostream& out) override {
    out << "\n1. Copy and compare: time and allocations per iteration\n";
    for (const char* name : {"BM_CKRGuid_Copy", "BM_uuid_copy", "BM_CKRGuid_Equal", "BM_uuid_compare_Equal",
                             "BM_CKRGuid_Less", "BM_uuid_compare_Less"}) {
      SKRResult result;
      if (!Find(name, result))
        continue;
      const double allocations = Counter(result, "allocs/iter");
      out << "   " << std::left << std::setw(26) << name << std::right << std::setprecision(2) << std::setw(9)
          << result.m_Time << " ns   allocs/iter " << std::setprecision(3) << allocations;
      if (std::string(name).starts_with("BM_CKRGuid"))
        out << "   target <= 5 ns, 0 allocations: " << (result.m_Time <= 5.0 && allocations == 0.0 ? "met" : "MISSED");
      out << "\n";
    }
    Ratio(out, "CKRGuid copy / uuid_copy", "BM_CKRGuid_Copy", "BM_uuid_copy", 0.0);
    Ratio(out, "CKRGuid == / uuid_compare", "BM_CKRGuid_Equal", "BM_uuid_compare_Equal", 0.0);
    Ratio(out, "CKRGuid < / uuid_compare", "BM_CKRGuid_Less", "BM_uuid_compare_Less", 0.0);

    out << "\n2.-4. Against libuuid\n";
    Ratio(out, "CreateNewGUID / uuid_generate", "BM_CKRGuid_CreateNewGUID", "BM_uuid_generate", 1.0 / 20);
    Ratio(out, "SetCString / uuid_parse", "BM_CKRGuid_SetCString", "BM_uuid_parse", 1.0 / 5);
    Ratio(out, "GetCString / uuid_unparse_lower", "BM_CKRGuid_GetCString", "BM_uuid_unparse_lower", 2.0);

    SKRResult result;
    out << "\n5. CreateInstance + ReleaseInstance\n";
    if (Find("BM_CreateReleaseInstance", result)) {
      const double rate = Counter(result, "items_per_second");
      out << "   " << std::setprecision(2) << result.m_Time << " ns a pair, " << std::setprecision(0) << rate
          << " pairs/s, target >= 2,000,000/s: " << (rate >= 2e6 ? "met" : "MISSED") << "\n";
    }

    constexpr double kLogRatio = 5.0 / 3.0;
    out << "\n6. GetInstance over N tracked instances (log ratio 100000:1000 is " << std::setprecision(2) << kLogRatio
        << ", linear would be 100)\n";
    for (const std::string family : {"BM_GetInstance_Random", "BM_GetInstance_HotSet", "BM_StdMapFind_Random"}) {
      SKRResult small;
      SKRResult large;
      if (!Find(family + "/1000", small) || !Find(family + "/100000", large))
        continue;
      const double ratio = large.m_Time / small.m_Time;
      out << "   " << family << ": t(100000) / t(1000) = " << std::setprecision(2) << ratio;
      if (double rms = 0; FitError(family, rms))
        out << ", O(log N) fit RMS " << std::setprecision(0) << rms * 100.0 << "%";
      out << "   logarithmic (ratio <= " << std::setprecision(2) << 2 * kLogRatio
          << "): " << (ratio <= 2 * kLogRatio ? "met" : "MISSED") << "\n";
    }
    for (const char* n : {"/1000", "/10000", "/100000"})
      Ratio(out, std::string("GetInstance / std::map::find") + n, std::string("BM_GetInstance_Random") + n,
            std::string("BM_StdMapFind_Random") + n, 0.0);

    out << "\n7. CKRObjPtrList: Add + Contains + Remove, ns per element (and / std::unordered_set)\n";
    double inOrder[2] = {0, 0};    // first and largest, in order
    double versusSet[2] = {0, 0};  // smallest and largest ratio, random order
    for (const char* n : {"1000", "10000", "100000", "1000000"}) {
      out << "   N = " << std::left << std::setw(9) << n << std::right;
      for (const char* random : {"0", "1"}) {
        const std::string args = std::string("/N:") + n + "/random:" + random;
        SKRResult list;
        SKRResult set;
        if (!Find("BM_ObjPtrList" + args, list) || !Find("BM_UnorderedSet" + args, set))
          continue;
        const double perElement = list.m_Time / Counter(list, "elements");
        const double ratio = list.m_Time / set.m_Time;
        out << (random[0] == '0' ? "  in order " : "   random ") << std::setprecision(1) << std::setw(7) << perElement
            << " ns (" << std::setprecision(2) << ratio << "x)";
        if (random[0] == '0') {
          inOrder[0] = inOrder[0] == 0 ? perElement : inOrder[0];
          inOrder[1] = std::max(inOrder[1], perElement);
        } else {
          versusSet[0] = versusSet[0] == 0 ? ratio : std::min(versusSet[0], ratio);
          versusSet[1] = std::max(versusSet[1], ratio);
        }
      }
      out << "\n";
    }
    if (inOrder[0] > 0 && versusSet[0] > 0) {
      const double growth = inOrder[1] / inOrder[0];
      const double spread = versusSet[1] / versusSet[0];
      out << "   in order: largest / first cost per element " << std::setprecision(2) << growth
          << "   flat (<= 2; a linear scan would grow 1,000x): " << (growth <= 2.0 ? "met" : "MISSED") << "\n";
      out << "   random: largest / smallest ratio to the hash set " << spread
          << "   flat (<= 2): " << (spread <= 2.0 ? "met" : "MISSED") << "\n";
    }
  }
};

}  // namespace

int main(int argc, char** argv) {
  // The allocator keeps what it got: otherwise freeing a container of a
  // million nodes in allocation order hands the pages back to the system
  // and every iteration pays page faults for them again, which measures the
  // allocator's trimming rather than the containers.
  mallopt(M_TRIM_THRESHOLD, 1 << 30);
  mallopt(M_MMAP_THRESHOLD, 1 << 30);
  // The benchmark's tiny class (and the library's own) are claimed into a
  // repository once, as a host does at start.
  CKRTypeSystem::Initialize(kBenchRepository);

  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRObjectModelReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();

  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  return 0;
}
