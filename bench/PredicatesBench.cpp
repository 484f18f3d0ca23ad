// Exact predicates and ear clipping.
//
//   orient/random/*, orient/collinear/*   ToLine of the filtered strategy
//       (both precision pairs) on 1,024 triples of random points and of
//       nearly collinear ones (exactly collinear, or one unit in the last
//       place off the line), side by side with CGAL's
//       Exact_predicates_inexact_constructions_kernel::orientation_2 on
//       the same points (when CGAL is installed).
//   rational/*   where the exact fallback spends its time: ToLine of the
//       rational strategy on the nearly collinear triples (vertices cached,
//       then the point converted on every call), the conversion of a float,
//       one 512-bit product, and the filtered in-circle test on cocircular
//       points (which always falls back to rationals).
//   earclip/<strategy>/<n>   ear clipping of an n-vertex star polygon
//       (random radii, about half the vertices reflex), n = 1,000 and 10,000.
//
// Targets: filtered orientation within 1.5x of CGAL on random points and
// within 2x on nearly collinear ones; the summary prints both ratios, and
// for ear clipping each strategy's time and its growth from 1,000 to 10,000
// vertices (the algorithm tests each candidate ear against every reflex
// vertex, so about 100x is expected).
//
// Run: bench_predicates --benchmark_repetitions=5 --benchmark_report_aggregates_only=true
#include <krCoreLib/geometry/CKRTriangulateEarClipping.h>
#include <krCoreLib/geometry/KRQuery2.h>

#include "KRBenchReport.h"

#if defined(KR_BENCH_CGAL)
#include <CGAL/Exact_predicates_inexact_constructions_kernel.h>
#endif
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <memory>
#include <numbers>
#include <random>
#include <string>
#include <vector>

namespace {

using namespace krRationalArithmetic;
using V = CKRVector2T<float, double>;
constexpr int kTriples = 1024;

// 3 * kTriples vertices: triple t is (3t, 3t + 1, 3t + 2), the last the
// point tested against the line through the first two. Random: uniform in
// [-1, 1]^2. Nearly collinear: a with 12-bit coordinates, b = a + (dx, dy)
// and p = a + k (dx, dy) with dx, dy multiples of 2^-10 and k in -3..3, all
// exact in float, so p lies exactly on the line; every other p is then
// moved by one unit in the last place of x. The double determinant cannot
// decide these, so every call takes the exact path (for CGAL as well).
std::vector<V> MakeTriples(bool collinear) {
  std::mt19937 random(12345);
  std::uniform_real_distribution<float> unit(-1, 1);
  std::uniform_int_distribution<int> grid(-2048, 2048);
  std::uniform_int_distribution<int> step(-3, 3);
  std::vector<V> v;
  for (int t = 0; t < kTriples; ++t) {
    if (!collinear) {
      for (int k = 0; k < 3; ++k)
        v.push_back(V(unit(random), unit(random)));
      continue;
    }
    const V a(std::ldexp(float(grid(random)), -11), std::ldexp(float(grid(random)), -11));
    const float dx = std::ldexp(float(grid(random)), -10), dy = std::ldexp(float(grid(random)), -10);
    const int k = step(random);
    V p(a.X() + float(k) * dx, a.Y() + float(k) * dy);
    if (t % 2 == 1)
      p = V(std::nextafter(p.X(), 10.0f), p.Y());
    v.push_back(a);
    v.push_back(V(a.X() + dx, a.Y() + dy));
    v.push_back(p);
  }
  return v;
}

const std::vector<V>& Triples(bool collinear) {
  static const std::vector<V> random = MakeTriples(false);
  static const std::vector<V> nearly = MakeTriples(true);
  return collinear ? nearly : random;
}

template <class Real, class Other>
void BM_Filtered(benchmark::State& state, bool collinear) {
  const std::vector<V>& v = Triples(collinear);
  // 32 units of rounding: the documented minimum for exact answers.
  const Query2Filtered<Real, Other> query(int(v.size()), v.data(), Real(16) * std::numeric_limits<Real>::epsilon());
  for (auto _ : state) {
    int sum = 0;
    for (int t = 0; t < kTriples; ++t)
      sum += query.ToLine(v[3 * t + 2], 3 * t, 3 * t + 1);
    benchmark::DoNotOptimize(sum);
  }
  state.SetItemsProcessed(state.iterations() * kTriples);
}

#if defined(KR_BENCH_CGAL)
void BM_CGAL(benchmark::State& state, bool collinear) {
  using K = CGAL::Exact_predicates_inexact_constructions_kernel;
  const std::vector<V>& v = Triples(collinear);
  std::vector<K::Point_2> points;
  for (const V& p : v)
    points.emplace_back(double(p.X()), double(p.Y()));
  const K::Orientation_2 orientation = K().orientation_2_object();
  for (auto _ : state) {
    int sum = 0;
    for (int t = 0; t < kTriples; ++t)
      sum += int(orientation(points[3 * t], points[3 * t + 1], points[3 * t + 2]));
    benchmark::DoNotOptimize(sum);
  }
  state.SetItemsProcessed(state.iterations() * kTriples);
}
#endif

void BM_RationalLine(benchmark::State& state, bool indexForm) {
  const std::vector<V>& v = Triples(true);
  const Query2TRational<float, double> query(int(v.size()), v.data());
  for (auto _ : state) {
    int sum = 0;
    for (int t = 0; t < kTriples; ++t)
      sum += indexForm ? query.ToLine(3 * t + 2, 3 * t, 3 * t + 1) : query.ToLine(v[3 * t + 2], 3 * t, 3 * t + 1);
    benchmark::DoNotOptimize(sum);
  }
  state.SetItemsProcessed(state.iterations() * kTriples);
}

void BM_RationalConvert(benchmark::State& state) {
  const std::vector<V>& v = Triples(true);
  for (auto _ : state) {
    for (int t = 0; t < kTriples; ++t) {
      TRational<16> r(v[t].X());
      benchmark::DoNotOptimize(r);
    }
  }
  state.SetItemsProcessed(state.iterations() * kTriples);
}

void BM_RationalProduct(benchmark::State& state) {
  const std::vector<V>& v = Triples(true);
  std::vector<TRational<16>> values;
  for (int t = 0; t < kTriples; ++t)
    values.emplace_back(v[t].X());
  for (auto _ : state) {
    for (int t = 0; t + 1 < kTriples; ++t) {
      TRational<16> r = values[t] * values[t + 1];
      benchmark::DoNotOptimize(r);
    }
  }
  state.SetItemsProcessed(state.iterations() * (kTriples - 1));
}

// Four corners of random axis-aligned rectangles: every in-circle test of a
// corner against the other three is exactly 0 and falls back.
void BM_FilteredCircle(benchmark::State& state) {
  std::mt19937 random(777);
  std::uniform_real_distribution<float> unit(-1, 1);
  std::vector<V> v;
  for (int t = 0; t < 256; ++t) {
    const float x0 = unit(random), y0 = unit(random), x1 = unit(random), y1 = unit(random);
    v.insert(v.end(), {V(std::min(x0, x1), std::min(y0, y1)), V(std::max(x0, x1), std::min(y0, y1)),
                       V(std::max(x0, x1), std::max(y0, y1)), V(std::min(x0, x1), std::max(y0, y1))});
  }
  const Query2Filtered<float, double> query(int(v.size()), v.data(), 32 * std::numeric_limits<float>::epsilon());
  for (auto _ : state) {
    int sum = 0;
    for (int t = 0; t < 256; ++t)
      sum += query.ToCircumcircle(4 * t + 3, 4 * t, 4 * t + 1, 4 * t + 2);
    benchmark::DoNotOptimize(sum);
  }
  state.SetItemsProcessed(state.iterations() * 256);
}

// A star-shaped polygon: n sorted angles, radii random in [0.2, 1].
std::vector<V> Star(int n) {
  std::mt19937 random(4242);
  std::uniform_real_distribution<double> unit(0, 1);
  std::vector<V> v;
  for (int i = 0; i < n; ++i) {
    const double angle = 2 * std::numbers::pi * i / n;
    const double radius = 0.2 + 0.8 * unit(random);
    v.emplace_back(float(radius * std::cos(angle)), float(radius * std::sin(angle)));
  }
  return v;
}

void BM_EarClip(benchmark::State& state, Query::Type type) {
  const std::vector<V> star = Star(int(state.range(0)));
  for (auto _ : state) {
    int* indices = nullptr;
    const CKRTriangulateEarClipping<double, float> clipping(int(star.size()), star.data(), type, 1e-12, indices);
    if (clipping.GetTriangleCount() != int(star.size()) - 2)
      state.SkipWithError("ear clipping failed");
    delete[] indices;
  }
}

const char* const kStrategies[] = {"int64", "integer", "rational", "real", "filtered"};

class CKRPredicatesReporter : public CKRBenchReporter {
public:
  CKRPredicatesReporter() : CKRBenchReporter(ETime::Cpu) {}

protected:
  double UnitsPerIteration(const Run& run) const override {
    const auto items = run.counters.find("items_per_second");
    if (items == run.counters.end())
      return 1;
    // items per iteration: the rate times the time of one iteration.
    return items->second.value * run.GetAdjustedCPUTime() / benchmark::GetTimeUnitMultiplier(run.time_unit);
  }

  void Summarize(std::ostream& out) override {
    out << "\nOrientation, time per call, filtered / CGAL\n";
    Ratio(out, "random, <double, float>", "orient/random/double", "orient/random/CGAL", 1.5);
    Ratio(out, "random, <float, double>", "orient/random/float", "orient/random/CGAL", 1.5);
    Ratio(out, "nearly collinear, <double, float>", "orient/collinear/double", "orient/collinear/CGAL", 2.0);
    Ratio(out, "nearly collinear, <float, double>", "orient/collinear/float", "orient/collinear/CGAL", 2.0);
    out << "\nEar clipping of a star polygon, milliseconds, and growth from 1,000 to 10,000 vertices\n";
    for (const char* strategy : kStrategies) {
      SKRResult small, large;
      const std::string name = std::string("earclip/") + strategy;
      if (Find(name + "/1000", small) && Find(name + "/10000", large))
        out << "   " << std::left << std::setw(10) << strategy << std::right << std::setprecision(3) << std::setw(10)
            << small.m_Time / 1e6 << " ms " << std::setw(10) << large.m_Time / 1e6 << " ms   x"
            << std::setprecision(1) << large.m_Time / small.m_Time << "\n";
    }
  }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  for (const bool collinear : {false, true}) {
    const std::string set = collinear ? "collinear" : "random";
    benchmark::RegisterBenchmark(("orient/" + set + "/double").c_str(), BM_Filtered<double, float>, collinear);
    benchmark::RegisterBenchmark(("orient/" + set + "/float").c_str(), BM_Filtered<float, double>, collinear);
#if defined(KR_BENCH_CGAL)
    benchmark::RegisterBenchmark(("orient/" + set + "/CGAL").c_str(), BM_CGAL, collinear);
#else
    std::printf("CGAL not found when built: the orientation runs have no peer\n");
#endif
  }
  benchmark::RegisterBenchmark("rational/line-cached", BM_RationalLine, true);
  benchmark::RegisterBenchmark("rational/line-point", BM_RationalLine, false);
  benchmark::RegisterBenchmark("rational/convert", BM_RationalConvert);
  benchmark::RegisterBenchmark("rational/product", BM_RationalProduct);
  benchmark::RegisterBenchmark("rational/filtered-circle", BM_FilteredCircle);
  const Query::Type types[] = {Query::TYPE_INT64, Query::TYPE_INTEGER, Query::TYPE_RATIONAL, Query::TYPE_REAL,
                               Query::TYPE_FILTERED};
  for (int k = 0; k < 5; ++k)
    benchmark::RegisterBenchmark((std::string("earclip/") + kStrategies[k]).c_str(), BM_EarClip, types[k])
        ->Arg(1000)
        ->Arg(10000)
        ->Unit(benchmark::kMillisecond);
  CKRPredicatesReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
