// A console reporter that also keeps each benchmark's CPU time per item
// processed (the median when repetitions are aggregated; CPU time, because
// other work on a shared machine inflates real time), for a summary of
// ratios that a derived reporter prints at the end.
#pragma once

#include <benchmark/benchmark.h>

#include <map>
#include <string>
#include <vector>

class CKRMedianReporter : public benchmark::ConsoleReporter {
public:
  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
      const double items = ItemsPerIteration(run);
      if (run.error_occurred || !(items > 0))
        continue;
      const std::string name = run.run_name.function_name;
      const double nanoseconds =
          run.GetAdjustedCPUTime() * (1e9 / benchmark::GetTimeUnitMultiplier(run.time_unit)) / items;
      if (run.run_type == Run::RT_Iteration && m_MedianSeen.count(name) == 0) {
        m_Times[name] = nanoseconds;
      } else if (run.run_type == Run::RT_Aggregate && run.aggregate_name == "median") {
        m_Times[name] = nanoseconds;
        m_MedianSeen[name] = true;
      }
    }
  }

protected:
  // The items one iteration of `run` processes; 0 leaves the run out.
  virtual double ItemsPerIteration(const Run& run) const = 0;

  // Nanoseconds of CPU time per item, by benchmark name.
  std::map<std::string, double> m_Times;

private:
  std::map<std::string, bool> m_MedianSeen;
};
