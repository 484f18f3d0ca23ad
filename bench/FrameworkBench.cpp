// Observer benchmarks: delivering observations to 10 observers registered
// under CKRObservation, side by side with the same fan-out through a plain
// std::vector<std::function<void()>> signal (the floor); and registering and
// removing one observer among N.
//
//   BM_Deliver         create an observation, NotifyObservers, auto-release
//   BM_FunctionSignal  call 10 std::function objects
//   BM_AddRemove/N     AddObserver + RemoveObserver of one observer among N
//
// Targets: deliveries per second reported against the floor; delivery
// allocates nothing beyond the observation itself (allocs/iter <= 1); the
// time of AddRemove grows no faster than log N from N = 100 to 10,000.
#include <krCoreLib/krCoreLib.h>

#include <benchmark/benchmark.h>

#include "KRAllocationCounter.h"
#include "KRBenchReport.h"

#include <cmath>
#include <functional>
#include <string>
#include <vector>

class CKRBenchObservable : public CKRObservable {
  KR_DECLARE_OBJECT_TYPE(CKRBenchObservable, CKRObjectTypeImpl, "{6B000000-0000-4000-8000-000000000001}")
};
KR_IMPLEMENT_OBJECT_TYPE(CKRBenchObservable, CKRObservable)

class CKRBenchObserver : public CKRObserver {
  KR_DECLARE_OBJECT_TYPE(CKRBenchObserver, CKRObjectTypeImpl, "{6B000000-0000-4000-8000-000000000002}")
public:
  long m_Heard = 0;
  void OnUpdate(CKRObservation*) override { ++m_Heard; }
};
KR_IMPLEMENT_OBJECT_TYPE(CKRBenchObserver, CKRObserver)

namespace {

constexpr int kFanOut = 10;

CKRBenchObservable* NewObservable() {
  return static_cast<CKRBenchObservable*>(CKRBenchObservable::GetCKRBenchObservableType()->CreateInstance(CKRGuid()));
}

std::vector<CKRBenchObserver*> NewObservers(int count) {
  std::vector<CKRBenchObserver*> observers;
  for (int i = 0; i < count; ++i)
    observers.push_back(static_cast<CKRBenchObserver*>(CKRBenchObserver::GetCKRBenchObserverType()->CreateInstance(CKRGuid())));
  return observers;
}

void BM_Deliver(benchmark::State& state) {
  CKRBenchObservable* subject = NewObservable();
  std::vector<CKRBenchObserver*> observers = NewObservers(kFanOut);
  for (CKRBenchObserver* observer : observers)
    subject->AddObserver(observer, CKRObservation::TypeID);
  IKRObjectType* observationType = CKRObservation::GetCKRObservationType();
  // Warm: the tables reach their size before counting.
  subject->NotifyObservers(static_cast<CKRObservation*>(observationType->CreateInstance(CKRGuid())));
  {
    AllocationProbe probe(state);
    for (auto _ : state)
      subject->NotifyObservers(static_cast<CKRObservation*>(observationType->CreateInstance(CKRGuid())));
  }
  state.SetItemsProcessed(state.iterations() * kFanOut);
  const long expected = long(state.iterations()) + 1;
  for (CKRBenchObserver* observer : observers) {
    if (observer->m_Heard != expected)
      state.SkipWithError("an observer missed an observation");
    observer->Release();
  }
  subject->Release();
}

void BM_FunctionSignal(benchmark::State& state) {
  std::vector<long> heard(kFanOut, 0);
  std::vector<std::function<void()>> signal;
  for (int i = 0; i < kFanOut; ++i)
    signal.emplace_back([&heard, i] { ++heard[std::size_t(i)]; });
  for (auto _ : state)
    for (const auto& slot : signal)
      slot();
  benchmark::DoNotOptimize(heard.data());
  state.SetItemsProcessed(state.iterations() * kFanOut);
}

void BM_AddRemove(benchmark::State& state) {
  CKRBenchObservable* subject = NewObservable();
  std::vector<CKRBenchObserver*> observers = NewObservers(int(state.range(0)) + 1);
  for (std::size_t i = 1; i < observers.size(); ++i)
    subject->AddObserver(observers[i], CKRObservation::TypeID);
  for (auto _ : state) {
    subject->AddObserver(observers[0], CKRObservation::TypeID);
    subject->RemoveObserver(observers[0], CKRObservation::TypeID);
  }
  for (CKRBenchObserver* observer : observers)
    observer->Release();
  subject->Release();
}

}  // namespace

BENCHMARK(BM_Deliver);
BENCHMARK(BM_FunctionSignal);
BENCHMARK(BM_AddRemove)->Arg(100)->Arg(1000)->Arg(10000);

namespace {

class CKRFrameworkReporter : public CKRBenchReporter {
protected:
  void Summarize(std::ostream& out) override {
    out << "\nDelivery of one observation to 10 observers (creation and auto-release included)\n";
    Ratio(out, "NotifyObservers / std::function signal", "BM_Deliver", "BM_FunctionSignal", 0.0);
    SKRResult deliver;
    if (Find("BM_Deliver", deliver))
      out << "   " << std::setprecision(0) << 1e9 / deliver.m_Time * kFanOut << " deliveries/s, "
          << std::setprecision(3) << Counter(deliver, "allocs/iter") << " allocations per observation (target <= 1): "
          << (Counter(deliver, "allocs/iter") <= 1.0 ? "met" : "MISSED") << "\n";
    SKRResult small;
    SKRResult large;
    if (Find("BM_AddRemove/100", small) && Find("BM_AddRemove/10000", large)) {
      const double ratio = large.m_Time / small.m_Time;
      const double logRatio = std::log(10000.0) / std::log(100.0);
      out << "\nAddObserver + RemoveObserver among N: " << std::setprecision(1) << small.m_Time << " ns at 100, "
          << large.m_Time << " ns at 10,000; ratio " << std::setprecision(2) << ratio << " (log ratio " << logRatio
          << "; target <= 2x that): " << (ratio <= 2 * logRatio ? "met" : "MISSED") << "\n";
    }
  }
};

}  // namespace

int main(int argc, char** argv) {
  CKRTypeSystem::Initialize(CKRGuid::Literal("{6B000000-0000-4000-8000-0000000000FF}"));
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRFrameworkReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  return 0;
}
