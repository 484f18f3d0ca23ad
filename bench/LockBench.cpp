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

#include <algorithm>
#include <iomanip>
#include <map>
#include <ostream>
#include <shared_mutex>
#include <string>
#include <vector>

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

// The console reporter, which also keeps each benchmark's median real time
// (nanoseconds) and prints the ratios against the targets at the end.
class RatioReporter : public benchmark::ConsoleReporter {
public:
  using ConsoleReporter::ConsoleReporter;

  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
      if (run.error_occurred)
        continue;
      const std::string name = run.run_name.function_name + "/" + run.run_name.threads;
      const double time = Nanoseconds(run, run.GetAdjustedRealTime());
      if (run.run_type == Run::RT_Iteration)
        m_Samples[name].push_back(time);
      else if (run.aggregate_name == "median")
        m_Medians[name] = time;
    }
  }

  void Finalize() override {
    ConsoleReporter::Finalize();
    std::ostream& out = GetOutputStream();
    out << "\nRatios (median real time per pair and thread)\n" << std::fixed;
    out << "\n1. Reader pair, one thread (target <= 2x std::shared_mutex)\n";
    Ratio(out, "BM_Read<SNonReentrance>/threads:1", "BM_Read<SStdShared>/threads:1", 2.0);
    Ratio(out, "BM_Read<SReentrant>/threads:1", "BM_Read<SStdShared>/threads:1", 2.0);
    out << "\n2. Reader pair, two contending threads (target <= 1x std::shared_mutex, 10% noise allowed)\n";
    Ratio(out, "BM_Read<SNonReentrance>/threads:2", "BM_Read<SStdShared>/threads:2", 1.1);
    Ratio(out, "BM_Read<SReentrant>/threads:2", "BM_Read<SStdShared>/threads:2", 1.1);
    out << "\n3. 1% writers (no target)\n";
    for (const char* threads : {"/threads:1", "/threads:2"}) {
      Ratio(out, std::string("BM_Mix1PercentWriters<SNonReentrance>") + threads,
            std::string("BM_Mix1PercentWriters<SStdShared>") + threads, 0.0);
      Ratio(out, std::string("BM_Mix1PercentWriters<SReentrant>") + threads,
            std::string("BM_Mix1PercentWriters<SStdShared>") + threads, 0.0);
    }
    out.flush();
  }

private:
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

  // The median aggregate when repetitions were reported, otherwise the
  // median of the runs.
  bool Find(const std::string& name, double& time) const {
    if (const auto median = m_Medians.find(name); median != m_Medians.end()) {
      time = median->second;
      return true;
    }
    const auto samples = m_Samples.find(name);
    if (samples == m_Samples.end() || samples->second.empty())
      return false;
    std::vector<double> sorted = samples->second;
    std::sort(sorted.begin(), sorted.end());
    time = sorted[sorted.size() / 2];
    return true;
  }

  // Prints mine against the reference; a positive `target` is the largest
  // ratio that meets it.
  void Ratio(std::ostream& out, const std::string& mine, const std::string& reference, double target) const {
    double mineTime = 0.0;
    double referenceTime = 0.0;
    if (!Find(mine, mineTime) || !Find(reference, referenceTime))
      return;
    const double ratio = mineTime / referenceTime;
    out << "   " << std::left << std::setw(44) << mine << std::right << std::setprecision(2) << std::setw(8)
        << mineTime << " ns vs " << std::setw(8) << referenceTime << " ns   ratio " << ratio << "x";
    if (target > 0.0)
      out << "   target <= " << target << "x: " << (ratio <= target ? "met" : "MISSED");
    out << "\n";
  }

  std::map<std::string, std::vector<double>> m_Samples;
  std::map<std::string, double> m_Medians;
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  RatioReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
