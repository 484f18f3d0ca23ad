// Reader/writer lock micro-benchmarks: CReaderWriterLockNonReentrance and
// CKRReaderWriterLock against std::shared_mutex, side by side in one run. A
// summary of the ratios and targets is printed after the results.
//
//   1. Reader acquisition and release (one pair per iteration), one thread:
//      the uncontended cost. Target: at most 2x std::shared_mutex.
//   2. The same with two threads taking read locks on one lock at once: the
//      cost of contending readers (both bounce the lock's cache line).
//      Target: no slower than std::shared_mutex (ratio <= 1, with 10% for
//      noise).
//   3. A mix of 1% writers (every hundredth pair is a writer pair), with one
//      and with two threads. Reported side by side; no target.
//
// Times are per pair and per thread (benchmark's real time with threads
// reports the wall time of one thread's iterations).
//
// Run: bench_locks --benchmark_repetitions=5
//      --benchmark_report_aggregates_only=true
#include <krCoreLib/krCoreLib.h>

#include <benchmark/benchmark.h>

#include "KRBenchReport.h"

#include <ostream>
#include <shared_mutex>
#include <string>
#include <utility>

namespace {

// One lock per kind, shared by the threads of a benchmark.
template <class TLock>
TLock& SharedLock() {
  static TLock lock;
  return lock;
}

// The three kinds behind one calling convention.
struct SNonReentrance {
  using Lock = CReaderWriterLockNonReentrance;
  static void Read(Lock& lock) { lock.AcquireReaderLock(); }
  static void Unread(Lock& lock) { lock.ReleaseReaderLock(); }
  static void Write(Lock& lock) { lock.AcquireWriterLock(); }
  static void Unwrite(Lock& lock) { lock.ReleaseWriterLock(); }
};
struct SReentrant {
  using Lock = CKRReaderWriterLock;
  static void Read(Lock& lock) { lock.AcquireReaderLock(); }
  static void Unread(Lock& lock) { lock.ReleaseReaderLock(); }
  static void Write(Lock& lock) { lock.AcquireWriterLock(); }
  static void Unwrite(Lock& lock) { lock.ReleaseWriterLock(); }
};
struct SStdShared {
  using Lock = std::shared_mutex;
  static void Read(Lock& lock) { lock.lock_shared(); }
  static void Unread(Lock& lock) { lock.unlock_shared(); }
  static void Write(Lock& lock) { lock.lock(); }
  static void Unwrite(Lock& lock) { lock.unlock(); }
};

template <class TKind>
void BM_Read(benchmark::State& state) {
  auto& lock = SharedLock<typename TKind::Lock>();
  for (auto _ : state) {
    TKind::Read(lock);
    benchmark::ClobberMemory();
    TKind::Unread(lock);
  }
  state.SetItemsProcessed(state.iterations());
}

template <class TKind>
void BM_Mix1PercentWriters(benchmark::State& state) {
  auto& lock = SharedLock<typename TKind::Lock>();
  static long long shared = 0;
  long long seen = 0;
  unsigned round = 0;
  for (auto _ : state) {
    if (++round == 100) {
      round = 0;
      TKind::Write(lock);
      shared = shared + 1;
      TKind::Unwrite(lock);
    } else {
      TKind::Read(lock);
      seen += shared;
      TKind::Unread(lock);
    }
  }
  benchmark::DoNotOptimize(seen);
  state.SetItemsProcessed(state.iterations());
}

}  // namespace

BENCHMARK_TEMPLATE(BM_Read, SNonReentrance)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK_TEMPLATE(BM_Read, SReentrant)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK_TEMPLATE(BM_Read, SStdShared)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK_TEMPLATE(BM_Mix1PercentWriters, SNonReentrance)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK_TEMPLATE(BM_Mix1PercentWriters, SReentrant)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK_TEMPLATE(BM_Mix1PercentWriters, SStdShared)->Threads(1)->Threads(2)->UseRealTime();

// ---- reporting -----------------------------------------------------------------

namespace {

class CKRLockReporter : public CKRBenchReporter {
protected:
  void Summarize(std::ostream& out) override {
    const auto pair = [&](const char* test, const char* lock, const char* threads) {
      const std::string name = std::string(test) + "<" + lock + ">/threads:" + threads;
      const std::string peer = std::string(test) + "<SStdShared>/threads:" + threads;
      return std::pair{name, peer};
    };
    out << "\n1. Reader pair, one thread (target <= 2x std::shared_mutex)\n";
    for (const char* lock : {"SNonReentrance", "SReentrant"}) {
      const auto [name, peer] = pair("BM_Read", lock, "1");
      Ratio(out, name, name, peer, 2.0);
    }
    out << "\n2. Reader pair, two contending threads (target <= 1x std::shared_mutex, 10% noise allowed)\n";
    for (const char* lock : {"SNonReentrance", "SReentrant"}) {
      const auto [name, peer] = pair("BM_Read", lock, "2");
      Ratio(out, name, name, peer, 1.1);
    }
    out << "\n3. 1% writers (no target)\n";
    for (const char* threads : {"1", "2"})
      for (const char* lock : {"SNonReentrance", "SReentrant"}) {
        const auto [name, peer] = pair("BM_Mix1PercentWriters", lock, threads);
        Ratio(out, name, name, peer, 0.0);
      }
  }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRLockReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
