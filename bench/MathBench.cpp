// Vector and point micro-benchmarks: krCoreLib's 3-D vectors and points
// against hand-written loops over plain arrays and against Eigen's
// fixed-size vectors (Eigen::Matrix<Real, 3, 1>), side by side in one run,
// in single and double precision. A summary of the ratios is printed after
// the results.
//
// Every benchmark runs one operation over arrays of kCount elements (inputs
// prepared outside the loop, the same values for all three sides) and
// reports items_per_second per element:
//
//   Add        c[i] = a[i] + b[i]
//   Dot        sum += a[i] . b[i]
//   Cross      c[i] = a[i] x b[i]
//   Normalize  c[i] = a[i] / |a[i]|
//   Affine     p[i] = q[i] + (r[i] - q[i]) * t   (points; Eigen and plain
//              arrays have no point type and use vectors)
//
// Targets: krCoreLib within 1.2x of Eigen's time for each operation, and
// near 1x of the plain loops (no hidden allocation or virtual dispatch in
// the hot operations).
//
// Run: bench_math --benchmark_repetitions=15 --benchmark_enable_random_interleaving=true
//      --benchmark_min_time=0.05 --benchmark_report_aggregates_only=true
// (interleaving the repetitions spreads the load of a shared machine evenly
// over the three sides; the ratios use the medians)
#include <krCoreLib/krCoreLib.h>

#include "KRMedianReporter.h"

#include <Eigen/Core>
#include <Eigen/Geometry>
#include <benchmark/benchmark.h>

#include <cmath>
#include <iomanip>
#include <map>
#include <ostream>
#include <random>
#include <string>
#include <vector>

namespace {

// Elements per pass: three arrays of 3-D double vectors with their virtual
// table pointers (32 bytes each) stay within a 32 KiB first-level cache.
constexpr int kCount = 256;

template <class Real>
std::vector<Real> RandomValues(unsigned seed) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<Real> value(Real(-1), Real(1));
  std::vector<Real> values(3 * kCount);
  for (Real& v : values)
    v = value(random);
  return values;
}

template <class Real>
struct SKRInputs {
  std::vector<Real> m_A = RandomValues<Real>(1);
  std::vector<Real> m_B = RandomValues<Real>(2);
  std::vector<Real> m_C = RandomValues<Real>(3);
};

enum class Operation { Add, Dot, Cross, Normalize, Affine };

// ---- krCoreLib ----------------------------------------------------------------

template <class Real, class Other, Operation Op>
void BM_krCoreLib(benchmark::State& state) {
  using Vector = CKRVector3T<Real, Other>;
  using Point = CKRPoint3T<Real, Other>;
  const SKRInputs<Real> inputs;
  std::vector<Vector> a;
  std::vector<Vector> b;
  std::vector<Vector> c(kCount, Vector::ZERO);
  std::vector<Point> q;
  std::vector<Point> r;
  std::vector<Point> p(kCount, Point::ZERO);
  for (int i = 0; i < kCount; ++i) {
    a.emplace_back(&inputs.m_A[3 * i]);
    b.emplace_back(&inputs.m_B[3 * i]);
    q.emplace_back(&inputs.m_A[3 * i]);
    r.emplace_back(&inputs.m_C[3 * i]);
  }
  const Real t = Real(0.25);
  Real sum = 0;
  for (auto _ : state) {
    if constexpr (Op == Operation::Add) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i] + b[i];
    } else if constexpr (Op == Operation::Dot) {
      for (int i = 0; i < kCount; ++i)
        sum += a[i].Dot(b[i]);
    } else if constexpr (Op == Operation::Cross) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i].Cross(b[i]);
    } else if constexpr (Op == Operation::Normalize) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i].GetNormalized();
    } else {
      for (int i = 0; i < kCount; ++i)
        p[i] = q[i] + (r[i] - q[i]) * t;
    }
    benchmark::DoNotOptimize(sum);
    benchmark::DoNotOptimize(c.data());
    benchmark::DoNotOptimize(p.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kCount);
}

// ---- plain arrays -----------------------------------------------------------------

template <class Real, Operation Op>
void BM_Plain(benchmark::State& state) {
  const SKRInputs<Real> inputs;
  const Real* a = inputs.m_A.data();
  const Real* b = inputs.m_B.data();
  const Real* r = inputs.m_C.data();
  std::vector<Real> output(3 * kCount, Real(0));
  Real* c = output.data();
  const Real t = Real(0.25);
  // The library's normalisation threshold, the single-precision epsilon.
  const Real epsilon = Real(1.1920928955078125e-07);
  Real sum = 0;
  for (auto _ : state) {
    for (int i = 0; i < kCount; ++i) {
      const Real* x = a + 3 * i;
      const Real* y = b + 3 * i;
      Real* z = c + 3 * i;
      if constexpr (Op == Operation::Add) {
        z[0] = x[0] + y[0];
        z[1] = x[1] + y[1];
        z[2] = x[2] + y[2];
      } else if constexpr (Op == Operation::Dot) {
        sum += x[0] * y[0] + x[1] * y[1] + x[2] * y[2];
      } else if constexpr (Op == Operation::Cross) {
        z[0] = x[1] * y[2] - x[2] * y[1];
        z[1] = x[2] * y[0] - x[0] * y[2];
        z[2] = x[0] * y[1] - x[1] * y[0];
      } else if constexpr (Op == Operation::Normalize) {
        const Real length = std::sqrt(x[0] * x[0] + x[1] * x[1] + x[2] * x[2]);
        const Real inverse = length > epsilon ? Real(1) / length : Real(0);
        z[0] = x[0] * inverse;
        z[1] = x[1] * inverse;
        z[2] = x[2] * inverse;
      } else {
        const Real* w = r + 3 * i;
        z[0] = x[0] + (w[0] - x[0]) * t;
        z[1] = x[1] + (w[1] - x[1]) * t;
        z[2] = x[2] + (w[2] - x[2]) * t;
      }
    }
    benchmark::DoNotOptimize(sum);
    benchmark::DoNotOptimize(c);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kCount);
}

// ---- Eigen --------------------------------------------------------------------------

template <class Real, Operation Op>
void BM_Eigen(benchmark::State& state) {
  using Vector = Eigen::Matrix<Real, 3, 1>;
  const SKRInputs<Real> inputs;
  std::vector<Vector> a;
  std::vector<Vector> b;
  std::vector<Vector> r;
  std::vector<Vector> c(kCount, Vector::Zero());
  for (int i = 0; i < kCount; ++i) {
    a.emplace_back(Eigen::Map<const Vector>(&inputs.m_A[3 * i]));
    b.emplace_back(Eigen::Map<const Vector>(&inputs.m_B[3 * i]));
    r.emplace_back(Eigen::Map<const Vector>(&inputs.m_C[3 * i]));
  }
  const Real t = Real(0.25);
  Real sum = 0;
  for (auto _ : state) {
    if constexpr (Op == Operation::Add) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i] + b[i];
    } else if constexpr (Op == Operation::Dot) {
      for (int i = 0; i < kCount; ++i)
        sum += a[i].dot(b[i]);
    } else if constexpr (Op == Operation::Cross) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i].cross(b[i]);
    } else if constexpr (Op == Operation::Normalize) {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i].normalized();
    } else {
      for (int i = 0; i < kCount; ++i)
        c[i] = a[i] + (r[i] - a[i]) * t;
    }
    benchmark::DoNotOptimize(sum);
    benchmark::DoNotOptimize(c.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kCount);
}

#define KR_MATH_BENCHMARKS(Op)                                                         \
  BENCHMARK(BM_krCoreLib<float, double, Operation::Op>)->Name("float/" #Op "/krCoreLib"); \
  BENCHMARK(BM_Plain<float, Operation::Op>)->Name("float/" #Op "/Plain");                 \
  BENCHMARK(BM_Eigen<float, Operation::Op>)->Name("float/" #Op "/Eigen");                 \
  BENCHMARK(BM_krCoreLib<double, float, Operation::Op>)->Name("double/" #Op "/krCoreLib"); \
  BENCHMARK(BM_Plain<double, Operation::Op>)->Name("double/" #Op "/Plain");               \
  BENCHMARK(BM_Eigen<double, Operation::Op>)->Name("double/" #Op "/Eigen");

KR_MATH_BENCHMARKS(Add)
KR_MATH_BENCHMARKS(Dot)
KR_MATH_BENCHMARKS(Cross)
KR_MATH_BENCHMARKS(Normalize)
KR_MATH_BENCHMARKS(Affine)

// ---- reporting --------------------------------------------------------------------

// Prints the ratios against the targets at the end.
class CKRRatioReporter : public CKRMedianReporter {
public:
  void Finalize() override {
    ConsoleReporter::Finalize();
    std::ostream& out = GetOutputStream();
    out << "\nRatios of krCoreLib's CPU time per element (target: at most 1.20x Eigen)\n\n";
    out << "   operation          krCoreLib ns   Plain ns   Eigen ns   vs Plain   vs Eigen\n";
    out << std::fixed;
    for (const char* precision : {"float", "double"})
      for (const char* operation : {"Add", "Dot", "Cross", "Normalize", "Affine"}) {
        const std::string key = std::string(precision) + "/" + operation + "/";
        const auto ours = m_Times.find(key + "krCoreLib");
        const auto plain = m_Times.find(key + "Plain");
        const auto eigen = m_Times.find(key + "Eigen");
        if (ours == m_Times.end() || plain == m_Times.end() || eigen == m_Times.end())
          continue;
        const double versusEigen = ours->second / eigen->second;
        out << "   " << std::left << std::setw(18) << (std::string(precision) + " " + operation) << std::right
            << std::setprecision(3) << std::setw(12) << ours->second << std::setw(11) << plain->second
            << std::setw(11) << eigen->second << std::setprecision(2) << std::setw(10)
            << ours->second / plain->second << "x" << std::setw(10) << versusEigen << "x   "
            << (versusEigen <= 1.2 ? "met" : "MISSED") << "\n";
      }
  }

protected:
  double ItemsPerIteration(const Run&) const override { return kCount; }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRRatioReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
