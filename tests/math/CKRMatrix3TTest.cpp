// CKRMatrix3T in both precision pairs: axis and angle, Euler angles in all
// six orders with their gimbal locks, interpolation, Gram-Schmidt, and the
// eigen, singular value and QDU decompositions over many random matrices,
// including repeated eigenvalues, rank deficiency, extreme scales and
// non-finite entries.
#include "KRMathTestTypes.h"

template <class Pair>
class CKRMatrix3TTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TVector = CKRVector3T<TReal, typename Pair::Other>;
  using TMatrix = CKRMatrix3T<TReal, typename Pair::Other>;
  static constexpr double kEpsilon = std::numeric_limits<TReal>::epsilon();

  static TVector RandomAxis(std::mt19937& random) {
    std::normal_distribution<double> value;
    const double x = value(random), y = value(random), z = value(random);
    const double length = std::sqrt(x * x + y * y + z * z);
    return TVector(TReal(x / length), TReal(y / length), TReal(z / length));
  }
  static TMatrix RandomRotation(std::mt19937& random) {
    return TMatrix(RandomAxis(random), TReal(std::uniform_real_distribution<double>(-3.14, 3.14)(random)));
  }
  // A symmetric matrix: a random one, or one with a repeated, a triple or a
  // zero eigenvalue, or a diagonal one, at scales far from 1.
  static TMatrix RandomSymmetric(std::mt19937& random, int kind) {
    std::uniform_real_distribution<double> value(-1, 1);
    const TReal a = TReal(value(random)), b = TReal(value(random));
    const TMatrix rotation = RandomRotation(random);
    TMatrix m = KRRandomMatrix<TMatrix>(random);
    switch (kind % 5) {
      case 0: m = (m + m.Transpose()) * TReal(0.5); break;
      case 1: m = rotation * TMatrix(a, a, b).TimesTranspose(rotation); break;
      case 2: m = TMatrix(a, a, a); break;
      case 3: m = TMatrix(rotation.GetColumn(0), rotation.GetColumn(0)) * a; break;
      default: m = TMatrix(a, b, a * b); break;
    }
    return m * Scale(random, kind);
  }
  // 1 mostly; every seventh matrix scaled towards the ends of the range.
  static TReal Scale(std::mt19937& random, int kind) {
    const double limit = KRByPrecision<TReal>(30, 250);
    return kind % 7 ? TReal(1) : TReal(std::pow(2.0, std::uniform_real_distribution<double>(-limit, limit)(random)));
  }
};
TYPED_TEST_SUITE(CKRMatrix3TTest, KRPrecisionPairs, KRPrecisionPairNames);

// Rotations by angles across (0, pi], also within 1e-4 of either end, come
// back with their angle, and their axis rebuilds the same matrix; half turns
// give the axis with its largest component positive.
TYPED_TEST(CKRMatrix3TTest, AxisAngleRoundTrips) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> unit(0, 1);
  for (int i = 0; i < 1000; ++i) {
    const V3 axis = TestFixture::RandomAxis(random);
    constexpr double pi = std::numbers::pi;
    const double angle = Real(i % 3 == 0 ? 1e-4 * unit(random) + 1e-6
                              : i % 3 == 1 ? pi - 1e-4 * unit(random)
                                           : pi * unit(random));
    const Mat3 rotation(axis, Real(angle));
    V3 found;
    Real foundAngle;
    rotation.ToAxisAngle(found, foundAngle);
    ASSERT_NEAR(foundAngle, angle, 8 * epsilon * std::max(1.0, angle)) << i;
    ASSERT_NEAR(found.Length(), 1.0, 4 * epsilon);
    ASSERT_LE(KRMaxDifference(Mat3(found, foundAngle), rotation), 16 * epsilon);
  }
  const V3 axis = TestFixture::RandomAxis(random);
  const Mat3 halfTurn = Mat3(axis, axis) * Real(2) - Mat3::IDENTITY;
  V3 found;
  Real angle;
  halfTurn.ToAxisAngle(found, angle);
  EXPECT_EQ(angle, Real(std::numbers::pi));
  int largest = 0;
  for (int k = 1; k < 3; ++k)
    if (std::fabs(axis[k]) > std::fabs(axis[largest]))
      largest = k;
  EXPECT_NEAR(found.Dot(axis), axis[largest] > 0 ? 1.0 : -1.0, 8 * epsilon);
  EXPECT_GT(found[largest], Real(0));
  // A quarter turn about z maps x to y; identity and NaN give 0 about x.
  EXPECT_TRUE(V3(Mat3(V3(0, 0, 1), Real(std::numbers::pi / 2)) * V3(1, 0, 0)).Approx_Equal(V3(0, 1, 0), 6));
  for (const Mat3& none : {Mat3::IDENTITY, Mat3(std::numeric_limits<Real>::quiet_NaN(), 1, 1)}) {
    none.ToAxisAngle(found, angle);
    EXPECT_EQ(angle, Real(0));
    EXPECT_EQ(found, V3::UNIT_X);
  }
}

TYPED_TEST(CKRMatrix3TTest, EulerAnglesRoundTripInAllSixOrders) {
  KR_MATH_TEST_TYPES;
  using From = void (Mat3::*)(Real, Real, Real) noexcept;
  using To = bool (Mat3::*)(Real&, Real&, Real&) const noexcept;
  const struct {
    const char* m_pName;
    From m_From;
    To m_To;
  } orders[] = {{"XYZ", &Mat3::FromEulerAnglesXYZ, &Mat3::ToEulerAnglesXYZ},
                {"XZY", &Mat3::FromEulerAnglesXZY, &Mat3::ToEulerAnglesXZY},
                {"YXZ", &Mat3::FromEulerAnglesYXZ, &Mat3::ToEulerAnglesYXZ},
                {"YZX", &Mat3::FromEulerAnglesYZX, &Mat3::ToEulerAnglesYZX},
                {"ZXY", &Mat3::FromEulerAnglesZXY, &Mat3::ToEulerAnglesZXY},
                {"ZYX", &Mat3::FromEulerAnglesZYX, &Mat3::ToEulerAnglesZYX}};
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> outer(-3.14, 3.14), middle(-1.52, 1.52);
  for (const auto& order : orders) {
    SCOPED_TRACE(order.m_pName);
    for (int i = 0; i < 300; ++i) {
      const Real a = Real(outer(random)), b = Real(middle(random)), c = Real(outer(random));
      Mat3 m;
      (m.*order.m_From)(a, b, c);
      Real x, y, z;
      ASSERT_TRUE((m.*order.m_To)(x, y, z));
      ASSERT_NEAR(std::remainder(x - a, 2 * std::numbers::pi), 0.0, 64 * epsilon);
      ASSERT_NEAR(y, b, 64 * epsilon);
      ASSERT_NEAR(std::remainder(z - c, 2 * std::numbers::pi), 0.0, 64 * epsilon);
      // At the lock only the first angle is found (the last is 0); the
      // three angles rebuild m.
      for (const Real lock : {Real(std::numbers::pi / 2), Real(-std::numbers::pi / 2)}) {
        (m.*order.m_From)(a, lock, c);
        ASSERT_FALSE((m.*order.m_To)(x, y, z));
        ASSERT_EQ(y, lock);
        ASSERT_EQ(z, Real(0));
        Mat3 rebuilt;
        (rebuilt.*order.m_From)(x, y, z);
        ASSERT_LE(KRMaxDifference(rebuilt, m), 16 * epsilon) << lock;
      }
    }
  }
  Mat3 m;
  m.FromEulerAnglesXYZ(Real(0.1), Real(std::numbers::pi / 2), Real(0.3));
  Real x, y, z;
  EXPECT_FALSE(m.ToEulerAnglesXYZ(x, y, z));
  EXPECT_NEAR(x, 0.4, 8 * epsilon);
}

// Slerp between rotations: the ends, half of the angle between them at the
// middle, and constant for equal ends.
TYPED_TEST(CKRMatrix3TTest, SlerpInterpolatesTheRelativeRotation) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 300; ++i) {
    const Mat3 r0 = TestFixture::RandomRotation(random), r1 = TestFixture::RandomRotation(random);
    ASSERT_LE(KRMaxDifference(Mat3::Slerp(Real(0), r0, r1), r0), 16 * epsilon);
    ASSERT_LE(KRMaxDifference(Mat3::Slerp(Real(1), r0, r1), r1), 64 * epsilon);
    V3 axis;
    Real whole, half;
    Mat3(r0.TransposeTimes(r1)).ToAxisAngle(axis, whole);
    Mat3(r0.TransposeTimes(Mat3::Slerp(Real(0.5), r0, r1))).ToAxisAngle(axis, half);
    ASSERT_NEAR(half, whole / 2, 64 * epsilon);
    ASSERT_EQ(Mat3::Slerp(Real(0.3), r0, r0), r0);
  }
}

TYPED_TEST(CKRMatrix3TTest, GramSchmidtGivesOrthonormalColumns) {
  KR_MATH_TEST_TYPES;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 300; ++i) {
    const Mat3 m = KRRandomMatrix<Mat3>(random);
    if (std::fabs(m.Determinant()) < 0.05)
      continue;
    Mat3 q = m;
    q.Orthonormalize();
    // Gram-Schmidt loses orthogonality in proportion to the condition.
    const double condition = KRMaxEntry(m) * KRMaxEntry(m.Inverse()) * 9;
    ASSERT_LE(KROrthogonalityError(q), 16 * TestFixture::kEpsilon * condition);
    // Column 0 keeps its direction; the determinant its sign.
    ASSERT_NEAR(V3(q.GetColumn(0)).Dot(V3(m.GetColumn(0)).GetNormalized()), 1.0, 8 * TestFixture::kEpsilon);
    ASSERT_EQ(q.Determinant() > 0, m.Determinant() > 0);
  }
  Mat3 dependent(Real(1), Real(3), Real(3), Real(0), Real(0), Real(-1), Real(0), Real(0), Real(5));
  dependent.Orthonormalize();
  EXPECT_EQ(V3(dependent.GetColumn(1)), V3::ZERO);
}

// rot * diag * transpose(rot) gives the matrix back, rot is a rotation and
// the eigenvalues increase, for every kind of symmetric matrix.
TYPED_TEST(CKRMatrix3TTest, EigenDecompositionReconstructs) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 2000; ++i) {
    const Mat3 m = TestFixture::RandomSymmetric(random, i);
    Mat3 rot, diag;
    m.EigenDecomposition(rot, diag);
    ASSERT_LE(KROrthogonalityError(rot), 16 * epsilon) << ::testing::PrintToString(m);
    ASSERT_NEAR(rot.Determinant(), 1.0, 16 * epsilon);
    ASSERT_EQ(diag, Mat3(diag(0, 0), diag(1, 1), diag(2, 2)));
    ASSERT_TRUE(diag(0, 0) <= diag(1, 1) && diag(1, 1) <= diag(2, 2));
    ASSERT_LE(KRMaxDifference(Mat3(rot * diag.TimesTranspose(rot)), m), 32 * epsilon * KRMaxEntry(m))
        << ::testing::PrintToString(m);
    // Only the upper triangle is read.
    Mat3 upper = m;
    upper(2, 0) = upper(1, 0) = std::numeric_limits<Real>::quiet_NaN();
    Mat3 rotUpper, diagUpper;
    upper.EigenDecomposition(rotUpper, diagUpper);
    ASSERT_EQ(rotUpper, rot);
  }
}

// left * diag * transpose(right) gives the matrix back with left and right
// orthogonal and decreasing non-negative singular values; QDU likewise.
TYPED_TEST(CKRMatrix3TTest, SingularValueAndQDUDecompositionsReconstruct) {
  KR_MATH_TEST_TYPES;
  const double epsilon = TestFixture::kEpsilon;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 2000; ++i) {
    Mat3 m = KRRandomMatrix<Mat3>(random);
    if (i % 4 == 1)  // rank 2
      m.SetColumn(2, V3(m.GetColumn(0)) * Real(0.5) - V3(m.GetColumn(1)));
    else if (i % 4 == 2)  // rank 1, or a symmetric matrix with repeated values
      m = i % 8 == 2 ? Mat3(V3(m.GetColumn(0)), V3(m.GetColumn(1))) : TestFixture::RandomSymmetric(random, i);
    m *= TestFixture::Scale(random, i);
    Mat3 left, diag, right;
    m.SingularValueDecomposition(left, diag, right);
    const double size = KRMaxEntry(m);
    ASSERT_LE(KROrthogonalityError(left), 16 * epsilon) << ::testing::PrintToString(m);
    ASSERT_LE(KROrthogonalityError(right), 16 * epsilon) << ::testing::PrintToString(m);
    ASSERT_EQ(diag, Mat3(diag(0, 0), diag(1, 1), diag(2, 2)));
    ASSERT_TRUE(diag(0, 0) >= diag(1, 1) && diag(1, 1) >= diag(2, 2) && diag(2, 2) >= 0);
    Mat3 composed;
    composed.SingularValueComposition(left, diag, right);
    ASSERT_LE(KRMaxDifference(composed, m), 32 * epsilon * size) << ::testing::PrintToString(m);

    Mat3 q, d, u;
    m.QDUDecomposition(q, d, u);
    ASSERT_LE(KROrthogonalityError(q), 16 * epsilon);
    ASSERT_EQ(d, Mat3(d(0, 0), d(1, 1), d(2, 2)));
    ASSERT_TRUE(d(0, 0) >= 0 && d(1, 1) >= 0 && d(2, 2) >= 0);
    ASSERT_TRUE(u(0, 0) == 1 && u(1, 1) == 1 && u(2, 2) == 1 && u(1, 0) == 0 && u(2, 0) == 0 && u(2, 1) == 0);
    ASSERT_LE(KRMaxDifference(Mat3(q * d * u), m), 32 * epsilon * size) << ::testing::PrintToString(m);
  }
  // A zero pivot: that row of u is the identity's.
  Mat3 q, d, u;
  Mat3(Real(0), Real(1), Real(2), Real(0), Real(3), Real(4), Real(0), Real(5), Real(6)).QDUDecomposition(q, d, u);
  EXPECT_EQ(d(0, 0), Real(0));
  EXPECT_EQ(V3(u.GetRow(0)), V3::UNIT_X);
}

namespace {
// Reaches the iteration steps of the decompositions.
template <class Real, class Other>
class CKRMatrix3TSteps : public CKRMatrix3T<Real, Other> {
public:
  using CKRMatrix3T<Real, Other>::CKRMatrix3T;
  using CKRMatrix3T<Real, Other>::QLAlgorithm;
  using CKRMatrix3T<Real, Other>::GolubKahanStep;
};
}  // namespace

// Special input ends every decomposition with its documented result:
// non-finite entries the NaN report, the zero matrix the identity and
// zeros, extreme scales and repeated eigenvalues a valid decomposition.
TYPED_TEST(CKRMatrix3TTest, DecompositionsEndOnSpecialInput) {
  KR_MATH_TEST_TYPES;
  using Limits = std::numeric_limits<Real>;
  const double epsilon = TestFixture::kEpsilon;
  const Real nan = Limits::quiet_NaN(), inf = Limits::infinity(), huge = Limits::max() / 16;
  const Real tiny = Limits::denorm_min() * 3, small = Limits::min();
  const Mat3 turn(V3(Real(0.6), Real(0), Real(0.8)), Real(0.5));
  const struct {
    const char* m_Name;
    Mat3 m_Matrix;  // symmetric
    bool m_bFinite;
  } cases[] = {
      {"NaN", Mat3(Real(1), nan, Real(0), nan, Real(2), Real(0), Real(0), Real(0), Real(3)), false},
      {"infinity", Mat3(inf, Real(1), Real(0), Real(1), Real(2), Real(0), Real(0), Real(0), Real(3)), false},
      {"minus infinity", Mat3(Real(1), Real(0), -inf, Real(0), Real(2), Real(0), -inf, Real(0), Real(3)), false},
      {"zero", Mat3::ZERO, true},
      {"huge", Mat3(huge, -huge, huge / 2, -huge, huge, Real(0), huge / 2, Real(0), -huge), true},
      {"tiny", Mat3(tiny, tiny, Real(0), tiny, tiny * 2, tiny, Real(0), tiny, tiny), true},
      {"smallest normal", Mat3(small, small, small), true},
      {"huge next to tiny", Mat3(huge, tiny, tiny, tiny, tiny, Real(0), tiny, Real(0), Real(1)), true},
      {"triple eigenvalue", Mat3(Real(2), Real(2), Real(2)), true},
      {"double eigenvalue", Mat3(turn * Mat3(Real(1), Real(1), Real(2)).TimesTranspose(turn)), true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.m_Name);
    const Mat3& m = c.m_Matrix;
    // Results in the subnormal range keep an absolute error of a few of
    // their units.
    const double size = KRMaxEntry(m) + 8 * Limits::denorm_min() / epsilon;
    Mat3 rot, diag, left, singular, right, q, d, u;
    m.EigenDecomposition(rot, diag);
    m.SingularValueDecomposition(left, singular, right);
    m.QDUDecomposition(q, d, u);
    Mat2 rot2, diag2;
    const Mat2 block(m(0, 0), m(0, 1), m(1, 0), m(1, 1));
    block.EigenDecomposition(rot2, diag2);
    if (!c.m_bFinite) {
      EXPECT_EQ(rot, Mat3::IDENTITY);
      EXPECT_TRUE(std::isnan(diag(0, 0)) && std::isnan(diag(1, 1)) && std::isnan(diag(2, 2)));
      EXPECT_TRUE(left == Mat3::IDENTITY && right == Mat3::IDENTITY);
      EXPECT_TRUE(std::isnan(singular(0, 0)) && std::isnan(singular(2, 2)));
      if (std::isnan(block(0, 1))) {
        EXPECT_TRUE(rot2 == Mat2::IDENTITY && std::isnan(diag2(0, 0)) && std::isnan(diag2(1, 1)));
      }
      continue;
    }
    if (m == Mat3::ZERO) {
      EXPECT_TRUE(rot == Mat3::IDENTITY && diag == Mat3::ZERO);
      EXPECT_TRUE(left == Mat3::IDENTITY && right == Mat3::IDENTITY && singular == Mat3::ZERO);
    }
    // The products are formed in double so that huge entries cannot
    // overflow on the way back.
    const auto widen = [](const Mat3& a) { return CKRMatrix3T<double, float>(a(0, 0), a(0, 1), a(0, 2), a(1, 0),
                                                                             a(1, 1), a(1, 2), a(2, 0), a(2, 1), a(2, 2)); };
    const auto wide = widen(m);
    EXPECT_LE(KROrthogonalityError(rot), 16 * epsilon);
    EXPECT_TRUE(diag(0, 0) <= diag(1, 1) && diag(1, 1) <= diag(2, 2));
    EXPECT_LE(KRMaxDifference(decltype(wide)(widen(rot) * widen(diag).TimesTranspose(widen(rot))), wide),
              32 * epsilon * size);
    EXPECT_LE(KROrthogonalityError(left), 16 * epsilon);
    EXPECT_LE(KROrthogonalityError(right), 16 * epsilon);
    EXPECT_TRUE(singular(0, 0) >= singular(1, 1) && singular(1, 1) >= singular(2, 2) && singular(2, 2) >= 0);
    EXPECT_LE(KRMaxDifference(decltype(wide)(widen(left) * widen(singular).TimesTranspose(widen(right))), wide),
              32 * epsilon * size);
    EXPECT_LE(KROrthogonalityError(q), 16 * epsilon);
    EXPECT_TRUE(d(0, 0) >= 0 && d(1, 1) >= 0 && d(2, 2) >= 0);
    EXPECT_LE(KRMaxDifference(decltype(wide)(widen(q) * widen(d) * widen(u)), wide), 32 * epsilon * size);
    EXPECT_TRUE(diag2(0, 0) <= diag2(1, 1));
    EXPECT_LE(KROrthogonalityError(rot2), 16 * epsilon);
  }
  // The iterations stop at their limits on input they cannot converge on.
  CKRMatrix3TSteps<Real, Other> steps(false);
  Real dd[3] = {Real(1), nan, Real(2)};
  Real ee[2] = {nan, Real(1)};
  EXPECT_FALSE(steps.QLAlgorithm(dd, ee));
  Real df[3] = {Real(3), Real(1), Real(2)};
  Real ef[2] = {Real(1), Real(0.5)};
  EXPECT_TRUE(steps.QLAlgorithm(df, ef));
  EXPECT_NEAR(df[0] + df[1] + df[2], 6.0, 8 * epsilon);
  CKRMatrix3TSteps<Real, Other> bidiagonal(Real(1), nan, Real(0), Real(0), Real(2), Real(1), Real(0), Real(0), nan);
  Mat3 gkLeft(false), gkRight(false);
  // One step on a non-finite block returns and keeps the NaN (the
  // decomposition itself reports such input before iterating).
  CKRMatrix3TSteps<Real, Other>::GolubKahanStep(bidiagonal, gkLeft, gkRight, 0, 2);
  bool reported = false;
  for (int e = 0; e < 9; ++e)
    reported |= std::isnan(bidiagonal(e / 3, e % 3));
  EXPECT_TRUE(reported);
}
