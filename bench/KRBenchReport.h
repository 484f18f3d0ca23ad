// The console reporter of the benchmark programs: prints the results as
// Google Benchmark does (in colour only on a terminal), keeps each
// benchmark's median time and counters, and after the results prints the
// program's summary, in which every ratio reads library / peer: below 1 the
// library is faster.
//
// A program derives from CKRBenchReporter, writes Summarize with Ratio and
// Find, and passes an instance to benchmark::RunSpecifiedBenchmarks.
// Benchmarks are found by their name, arguments and thread count, as the
// console prints them without the options of the run (for example
// "BM_Read<SStdShared>/threads:1", "BM_Save/10000" or "float/Add/krCoreLib").
#pragma once

#include <benchmark/benchmark.h>

#include <algorithm>
#include <iomanip>
#include <map>
#include <ostream>
#include <string>
#include <unistd.h>
#include <vector>

class CKRBenchReporter : public benchmark::ConsoleReporter {
public:
  // Which time the summary compares: wall-clock time, or CPU time (steadier
  // on a shared machine for single-threaded loops).
  enum class ETime { Real, Cpu };

  struct SKRResult {
    double m_Time = 0.0;  // nanoseconds per unit (see the constructor)
    benchmark::UserCounters m_Counters;
  };

  // Times are divided by `unitsPerIteration` (elements processed in one
  // iteration), so that the summary compares per element.
  explicit CKRBenchReporter(ETime time = ETime::Real, double unitsPerIteration = 1.0)
      : ConsoleReporter(isatty(STDOUT_FILENO) ? OO_ColorTabular : OO_Tabular),
        m_Time(time),
        m_UnitsPerIteration(unitsPerIteration) {}

  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
      if (run.error_occurred)
        continue;
      const double units = UnitsPerIteration(run);
      if (!(units > 0))
        continue;
      const std::string name = Key(run);
      const double time = (m_Time == ETime::Real ? run.GetAdjustedRealTime() : run.GetAdjustedCPUTime()) *
                          (1e9 / benchmark::GetTimeUnitMultiplier(run.time_unit)) / units;
      if (run.run_type == Run::RT_Iteration) {
        m_Samples[name].push_back({time, run.counters});
      } else if (run.aggregate_name == "median") {
        m_Medians[name] = {time, run.counters};
      } else if (run.aggregate_name == "RMS") {
        m_RMS[run.run_name.function_name] = run.GetAdjustedRealTime();
      }
    }
  }

  void Finalize() override {
    ConsoleReporter::Finalize();
    std::ostream& out = GetOutputStream();
    out << "\nSummary: ratios are library / peer (below 1 the library is faster), of median "
        << (m_Time == ETime::Real ? "real" : "CPU") << " times\n"
        << std::fixed;
    Summarize(out);
    out.flush();
  }

protected:
  virtual void Summarize(std::ostream& out) = 0;

  // The units one iteration of `run` processes (by default the
  // constructor's); 0 leaves the run out of the summary.
  virtual double UnitsPerIteration(const Run&) const { return m_UnitsPerIteration; }

  // The median aggregate when repetitions were reported, otherwise the
  // median of the runs.
  bool Find(const std::string& name, SKRResult& result) const {
    if (const auto median = m_Medians.find(name); median != m_Medians.end()) {
      result = median->second;
      return true;
    }
    const auto samples = m_Samples.find(name);
    if (samples == m_Samples.end() || samples->second.empty())
      return false;
    std::vector<SKRResult> sorted = samples->second;
    std::sort(sorted.begin(), sorted.end(), [](const SKRResult& a, const SKRResult& b) { return a.m_Time < b.m_Time; });
    result = sorted[sorted.size() / 2];
    return true;
  }

  static double Counter(const SKRResult& result, const char* name) {
    const auto at = result.m_Counters.find(name);
    return at == result.m_Counters.end() ? 0.0 : at->second.value;
  }

  // The root-mean-square error of the complexity fit of a benchmark family,
  // when one was computed.
  bool FitError(const std::string& family, double& rms) const {
    const auto at = m_RMS.find(family);
    if (at == m_RMS.end())
      return false;
    rms = at->second;
    return true;
  }

  // One line: both times and library / peer. A positive `target` is the
  // largest ratio that meets it. Nothing when either side did not run.
  void Ratio(std::ostream& out, const std::string& label, const std::string& library, const std::string& peer,
             double target) const {
    SKRResult mine;
    SKRResult theirs;
    if (!Find(library, mine) || !Find(peer, theirs))
      return;
    const double ratio = mine.m_Time / theirs.m_Time;
    out << "   " << std::left << std::setw(44) << label << std::right << std::setprecision(3) << std::setw(12)
        << mine.m_Time << " ns vs " << std::setw(12) << theirs.m_Time << " ns   " << std::setprecision(2)
        << std::setw(7) << ratio << "x";
    if (target > 0.0)
      out << "   target <= " << target << "x: " << (ratio <= target ? "met" : "MISSED");
    out << "\n";
  }

private:
  static std::string Key(const Run& run) {
    std::string key = run.run_name.function_name;
    if (!run.run_name.args.empty())
      key += "/" + run.run_name.args;
    if (!run.run_name.threads.empty())
      key += "/" + run.run_name.threads;
    return key;
  }

  ETime m_Time;
  double m_UnitsPerIteration;
  std::map<std::string, std::vector<SKRResult>> m_Samples;
  std::map<std::string, SKRResult> m_Medians;
  std::map<std::string, double> m_RMS;
};
