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
// Matrices and quaternions, against Eigen's fixed-size types in the same way
// (per element of kCount, inputs prepared outside the loop):
//
//   Product3, Product4      C[i] = A[i] * B[i]           (3 x 3, 4 x 4)
//   Transform3, Transform4  y[i] = A[i] * x[i]           (matrix times vector)
//   Inverse3, Inverse4      C[i] = inverse(A[i])
//   Eigen3                  eigenvalues and eigenvectors of a symmetric 3 x 3
//                           (SelfAdjointEigenSolver::compute)
//   Slerp                   q[i] = slerp(0.3, p[i], r[i])
//
// Targets: within 1.2x of Eigen on the products and inverses, at most 1x on
// Eigen3; Slerp is reported only.
//
// Run: bench_math --benchmark_repetitions=15 --benchmark_enable_random_interleaving=true
//      --benchmark_min_time=0.05 --benchmark_report_aggregates_only=true
// (interleaving the repetitions spreads the load of a shared machine evenly
// over the three sides; the ratios use the medians)
#include <krCoreLib/krCoreLib.h>

#include <Eigen/Core>
#include <Eigen/Eigenvalues>
#include <Eigen/Geometry>
#include <benchmark/benchmark.h>

#include "KRBenchReport.h"

#include <cmath>
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

// ---- matrices and quaternions ---------------------------------------------------------

enum class MatrixOperation { Product3, Product4, Transform3, Transform4, Inverse3, Inverse4, Eigen3, Slerp };

// kCount matrices (or vectors, quaternions) of `size` entries each, uniform
// in [-1, 1]; symmetric 3 x 3 matrices for Eigen3; unit quaternions for Slerp.
template <class Real>
std::vector<Real> RandomEntries(unsigned seed, int size, MatrixOperation op) {
  std::mt19937 random(seed);
  std::uniform_real_distribution<Real> value(Real(-1), Real(1));
  std::vector<Real> values(std::size_t(size) * kCount);
  for (Real& v : values)
    v = value(random);
  for (int i = 0; i < kCount; ++i) {
    Real* m = &values[std::size_t(size) * i];
    if (op == MatrixOperation::Eigen3)
      for (int r = 0; r < 3; ++r)
        for (int c = 0; c < r; ++c)
          m[r * 3 + c] = m[c * 3 + r];
    if (op == MatrixOperation::Slerp) {
      const Real length = std::sqrt(m[0] * m[0] + m[1] * m[1] + m[2] * m[2] + m[3] * m[3]);
      for (int k = 0; k < 4; ++k)
        m[k] /= length;
    }
  }
  return values;
}

// The entries per element of the first operand (and of the second, a
// vector for the transforms).
constexpr int FirstSize(MatrixOperation op) {
  return op == MatrixOperation::Product4 || op == MatrixOperation::Transform4 || op == MatrixOperation::Inverse4 ? 16
         : op == MatrixOperation::Slerp                                                                          ? 4
                                                                                                                  : 9;
}
constexpr int SecondSize(MatrixOperation op) {
  return op == MatrixOperation::Transform3 ? 3 : op == MatrixOperation::Transform4 ? 4 : FirstSize(op);
}

template <class Real, class Other, MatrixOperation Op>
void BM_krCoreLibMatrix(benchmark::State& state) {
  using Matrix3 = CKRMatrix3T<Real, Other>;
  using Matrix4 = CKRMatrix4T<Real, Other>;
  using Vector3 = CKRVector3T<Real, Other>;
  using Vector4 = CKRVector4T<Real, Other>;
  using Quaternion = CKRQuaternionT<Real, Other>;
  const std::vector<Real> first = RandomEntries<Real>(1, FirstSize(Op), Op);
  const std::vector<Real> second = RandomEntries<Real>(2, SecondSize(Op), Op);
  std::vector<Matrix3> a3, b3, c3(kCount), d3(kCount);
  std::vector<Matrix4> a4, b4, c4(kCount);
  std::vector<Vector3> x3, y3(kCount, Vector3::ZERO);
  std::vector<Vector4> x4, y4(kCount, Vector4::ZERO);
  std::vector<Quaternion> p, q, r(kCount, Quaternion::IDENTITY);
  for (int i = 0; i < kCount; ++i) {
    const Real* f = &first[std::size_t(FirstSize(Op)) * i];
    const Real* g = &second[std::size_t(SecondSize(Op)) * i];
    if constexpr (FirstSize(Op) == 9) {
      a3.emplace_back(f);
      if constexpr (SecondSize(Op) == 9)
        b3.emplace_back(g);
      else
        x3.emplace_back(g);
    } else if constexpr (FirstSize(Op) == 16) {
      a4.emplace_back(f);
      if constexpr (SecondSize(Op) == 16)
        b4.emplace_back(g);
      else
        x4.emplace_back(g);
    } else {
      p.emplace_back(f[0], f[1], f[2], f[3]);
      q.emplace_back(g[0], g[1], g[2], g[3]);
    }
  }
  const Real t = Real(0.3);
  for (auto _ : state) {
    for (int i = 0; i < kCount; ++i) {
      if constexpr (Op == MatrixOperation::Product3)
        c3[i] = a3[i] * b3[i];
      else if constexpr (Op == MatrixOperation::Product4)
        c4[i] = a4[i] * b4[i];
      else if constexpr (Op == MatrixOperation::Transform3)
        y3[i] = a3[i] * x3[i];
      else if constexpr (Op == MatrixOperation::Transform4)
        y4[i] = a4[i] * x4[i];
      else if constexpr (Op == MatrixOperation::Inverse3)
        c3[i] = a3[i].Inverse();
      else if constexpr (Op == MatrixOperation::Inverse4)
        c4[i] = a4[i].Inverse();
      else if constexpr (Op == MatrixOperation::Eigen3)
        a3[i].EigenDecomposition(c3[i], d3[i]);
      else
        r[i] = Quaternion::Slerp(t, p[i], q[i]);
    }
    benchmark::DoNotOptimize(c3.data());
    benchmark::DoNotOptimize(d3.data());
    benchmark::DoNotOptimize(c4.data());
    benchmark::DoNotOptimize(y3.data());
    benchmark::DoNotOptimize(y4.data());
    benchmark::DoNotOptimize(r.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kCount);
}

template <class Real, MatrixOperation Op>
void BM_EigenMatrix(benchmark::State& state) {
  using Matrix3 = Eigen::Matrix<Real, 3, 3>;
  using Matrix4 = Eigen::Matrix<Real, 4, 4>;
  using Vector3 = Eigen::Matrix<Real, 3, 1>;
  using Vector4 = Eigen::Matrix<Real, 4, 1>;
  using Quaternion = Eigen::Quaternion<Real>;
  using Aligned3 = Eigen::aligned_allocator<Matrix3>;
  using Aligned4 = Eigen::aligned_allocator<Matrix4>;
  const std::vector<Real> first = RandomEntries<Real>(1, FirstSize(Op), Op);
  const std::vector<Real> second = RandomEntries<Real>(2, SecondSize(Op), Op);
  // The same row-major values as krCoreLib's matrices.
  using RowMajor3 = Eigen::Matrix<Real, 3, 3, Eigen::RowMajor>;
  using RowMajor4 = Eigen::Matrix<Real, 4, 4, Eigen::RowMajor>;
  std::vector<Matrix3, Aligned3> a3, b3, c3(kCount, Matrix3::Zero());
  std::vector<Matrix4, Aligned4> a4, b4, c4(kCount, Matrix4::Zero());
  std::vector<Vector3> x3, y3(kCount, Vector3::Zero());
  std::vector<Vector4, Eigen::aligned_allocator<Vector4>> x4, y4(kCount, Vector4::Zero());
  std::vector<Quaternion, Eigen::aligned_allocator<Quaternion>> p, q, r(kCount, Quaternion::Identity());
  std::vector<Vector3> values(kCount, Vector3::Zero());
  for (int i = 0; i < kCount; ++i) {
    const Real* f = &first[std::size_t(FirstSize(Op)) * i];
    const Real* g = &second[std::size_t(SecondSize(Op)) * i];
    if constexpr (FirstSize(Op) == 9) {
      a3.emplace_back(Eigen::Map<const RowMajor3>(f));
      if constexpr (SecondSize(Op) == 9)
        b3.emplace_back(Eigen::Map<const RowMajor3>(g));
      else
        x3.emplace_back(Eigen::Map<const Vector3>(g));
    } else if constexpr (FirstSize(Op) == 16) {
      a4.emplace_back(Eigen::Map<const RowMajor4>(f));
      if constexpr (SecondSize(Op) == 16)
        b4.emplace_back(Eigen::Map<const RowMajor4>(g));
      else
        x4.emplace_back(Eigen::Map<const Vector4>(g));
    } else {
      p.emplace_back(f[0], f[1], f[2], f[3]);
      q.emplace_back(g[0], g[1], g[2], g[3]);
    }
  }
  Eigen::SelfAdjointEigenSolver<Matrix3> solver;
  const Real t = Real(0.3);
  for (auto _ : state) {
    for (int i = 0; i < kCount; ++i) {
      if constexpr (Op == MatrixOperation::Product3)
        c3[i].noalias() = a3[i] * b3[i];
      else if constexpr (Op == MatrixOperation::Product4)
        c4[i].noalias() = a4[i] * b4[i];
      else if constexpr (Op == MatrixOperation::Transform3)
        y3[i].noalias() = a3[i] * x3[i];
      else if constexpr (Op == MatrixOperation::Transform4)
        y4[i].noalias() = a4[i] * x4[i];
      else if constexpr (Op == MatrixOperation::Inverse3)
        c3[i] = a3[i].inverse();
      else if constexpr (Op == MatrixOperation::Inverse4)
        c4[i] = a4[i].inverse();
      else if constexpr (Op == MatrixOperation::Eigen3) {
        solver.compute(a3[i]);
        c3[i] = solver.eigenvectors();
        values[i] = solver.eigenvalues();
      } else
        r[i] = p[i].slerp(t, q[i]);
    }
    benchmark::DoNotOptimize(c3.data());
    benchmark::DoNotOptimize(c4.data());
    benchmark::DoNotOptimize(y3.data());
    benchmark::DoNotOptimize(y4.data());
    benchmark::DoNotOptimize(r.data());
    benchmark::DoNotOptimize(values.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kCount);
}

#define KR_MATRIX_BENCHMARKS(Op)                                                                                   \
  BENCHMARK(BM_krCoreLibMatrix<float, double, MatrixOperation::Op>)->Name("float/" #Op "/krCoreLib");              \
  BENCHMARK(BM_EigenMatrix<float, MatrixOperation::Op>)->Name("float/" #Op "/Eigen");                              \
  BENCHMARK(BM_krCoreLibMatrix<double, float, MatrixOperation::Op>)->Name("double/" #Op "/krCoreLib");             \
  BENCHMARK(BM_EigenMatrix<double, MatrixOperation::Op>)->Name("double/" #Op "/Eigen");

KR_MATRIX_BENCHMARKS(Product3)
KR_MATRIX_BENCHMARKS(Product4)
KR_MATRIX_BENCHMARKS(Transform3)
KR_MATRIX_BENCHMARKS(Transform4)
KR_MATRIX_BENCHMARKS(Inverse3)
KR_MATRIX_BENCHMARKS(Inverse4)
KR_MATRIX_BENCHMARKS(Eigen3)
KR_MATRIX_BENCHMARKS(Slerp)

// ---- reporting --------------------------------------------------------------------

// CPU time per element, because other work on a shared machine inflates
// real time.
class CKRMathReporter : public CKRBenchReporter {
public:
  CKRMathReporter() : CKRBenchReporter(ETime::Cpu, kCount) {}

protected:
  void Summarize(std::ostream& out) override {
    out << "\nCPU time per element: krCoreLib / Plain and krCoreLib / Eigen (target <= 1.2x Eigen)\n";
    for (const char* precision : {"float", "double"})
      for (const char* operation : {"Add", "Dot", "Cross", "Normalize", "Affine"}) {
        const std::string key = std::string(precision) + "/" + operation + "/";
        Ratio(out, key + "krCoreLib / Plain", key + "krCoreLib", key + "Plain", 0.0);
        Ratio(out, key + "krCoreLib / Eigen", key + "krCoreLib", key + "Eigen", 1.2);
      }
    out << "\nMatrices and quaternions, CPU time per element: krCoreLib / Eigen (target <= 1.2x; the 3 x 3\n"
           "symmetric eigen decomposition <= 1x; slerp reported)\n";
    for (const char* precision : {"float", "double"})
      for (const char* operation :
           {"Product3", "Product4", "Transform3", "Transform4", "Inverse3", "Inverse4", "Eigen3", "Slerp"}) {
        const std::string key = std::string(precision) + "/" + operation + "/";
        const std::string name = operation;
        const double target = name == "Eigen3" ? 1.0 : name == "Slerp" ? 0.0 : 1.2;
        Ratio(out, key + "krCoreLib / Eigen", key + "krCoreLib", key + "Eigen", target);
      }
  }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRMathReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
