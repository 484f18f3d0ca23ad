// CKRMathT: elementary wrappers, rounding, random numbers, special functions
// and fast approximations, in both precision pairs.
#include "KRMathTestTypes.h"

#include <algorithm>
#include <climits>

template <class Pair>
class CKRMathTTest : public ::testing::Test {};
TYPED_TEST_SUITE(CKRMathTTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRMathTTest, ElementaryFunctionsClampSignAndRound) {
  KR_MATH_TEST_TYPES;
  const Real nan = std::numeric_limits<Real>::quiet_NaN();
  EXPECT_EQ(M::ACos(Real(1.0000001)), Real(0));
  EXPECT_EQ(M::ACos(Real(-2)), M::PI);
  EXPECT_EQ(M::ASin(Real(5)), M::HALF_PI);
  EXPECT_TRUE(std::isnan(M::ACos(nan)));
  EXPECT_EQ(M::Sign(Real(-0.0)), Real(0));
  EXPECT_EQ(M::Sign(nan), Real(0));
  EXPECT_EQ(M::Sign(Real(1e-30)), Real(1));
  EXPECT_EQ(M::Abs(INT_MIN), INT_MAX);
  // Round is half up on the grid; degenerate grids (none, infinite, extreme
  // decimal counts) end without NaN.
  // Rows: value, grid (NaN: round to the decimals instead), decimals, result.
  const double rows[][4] = {
      {2.5, 1, 0, 3},          {-2.5, 1, 0, -2},        {7.3, 0.5, 0, 7.5},      {1.75, 0, 0, 1.75},
      {-2.7, NAN, 0, -3},      {1250, NAN, -2, 1300},   {-1250, NAN, -2, -1200}, {123456, NAN, -3, 123000},
      {3.14159, NAN, 2, 3.14}, {1.23456789, NAN, 11, 1.23456789}, {1.75, NAN, INT_MIN, 0}, {1.75, NAN, INT_MAX, 1.75},
      {1.75, INFINITY, 0, 0}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row[0] << " grid " << row[1] << " decimals " << row[2]);
    const Real rounded =
        std::isnan(row[1]) ? M::Round(Real(row[0]), int(row[2])) : M::Round(Real(row[0]), Real(row[1]));
    EXPECT_NEAR(rounded, row[3], 1e-6 * std::fabs(row[3]));
  }
  EXPECT_EQ(M::Approx_Equal(Real(0.151), Real(0.249), Real(0.1)), 1);
  EXPECT_EQ(M::Approx_Equal(Real(1.2344), Real(1.2341), 3), 1);
  EXPECT_EQ(M::Approx_Equal(Real(1.2344), Real(1.2356), 3), 0);
  EXPECT_EQ(M::Approx_Equal(Real(1), std::numeric_limits<Real>::quiet_NaN(), 3), 0);
}

TYPED_TEST(CKRMathTTest, RandomNumbersStayInTheirRangesAndRepeatAfterSeeding) {
  KR_MATH_TEST_TYPES;
  Real low = 2, high = -2;
  M::UnitRandom(12345);
  for (int i = 0; i < 200000; ++i) {
    low = std::min(low, M::UnitRandom());
    high = std::max(high, M::UnitRandom());
    ASSERT_LE(std::fabs(M::SymmetricRandom()), Real(1));
    ASSERT_LE(std::fabs(M::IntervalRandom(Real(-3), Real(5)) - Real(1)), Real(4));
  }
  // The whole of [0, 1] is used: 0 and 32767 are both reached.
  EXPECT_EQ(low, Real(0));
  EXPECT_EQ(high, Real(1));
  const Real first = M::UnitRandom(99);
  const Real second = M::UnitRandom();
  EXPECT_EQ(M::UnitRandom(99), first);
  EXPECT_EQ(M::UnitRandom(), second);
}

// The special functions against the standard library, within the published
// accuracy of their approximations plus the rounding of the precision.
TYPED_TEST(CKRMathTTest, SpecialFunctionsMatchTheStandardLibraryAndReportFailure) {
  KR_MATH_TEST_TYPES;
  const double slack = KRByPrecision<Real>(2e-6, 1e-9);
  for (double x = 0.1; x < 30; x += 0.037) {
    SCOPED_TRACE(x);
    const double expected = std::lgamma(x);
    ASSERT_NEAR(M::LogGamma(Real(x)), expected, (2e-10 + slack) * std::max(1.0, std::fabs(expected)));
    if (x < 10) {
      ASSERT_NEAR(M::Gamma(Real(x)), std::tgamma(x), (1e-9 + 2 * slack) * std::tgamma(x));
    }
  }
  for (double x = -5; x <= 5; x += 0.0137) {
    SCOPED_TRACE(x);
    // Fractional error of erfc below 1.2e-7; in single precision exp(-x^2)
    // amplifies the rounding of x^2 by up to x^2.
    ASSERT_NEAR(M::Erfc(Real(x)), std::erfc(x), (1.2e-7 + slack * (1 + x * x)) * std::erfc(x));
    ASSERT_NEAR(M::Erf(Real(x)), std::erf(x), 2.4e-7 + slack);
  }
  for (double x = -15; x <= 15; x += 0.0173) {
    SCOPED_TRACE(x);
    const double a = std::fabs(x);
    const double i0 = std::cyl_bessel_i(0.0, a);
    const double i1 = std::copysign(std::cyl_bessel_i(1.0, a), x);
    if (a <= 3.75) {
      ASSERT_NEAR(M::ModBessel0(Real(x)), i0, 1.6e-7 + slack * i0);
      ASSERT_NEAR(M::ModBessel1(Real(x)), i1, 8e-9 * a + slack * std::fabs(i1));
    } else {
      // The bounds hold for sqrt(x) exp(-x) I(x).
      const double scale = std::sqrt(a) * std::exp(-a);
      ASSERT_NEAR(M::ModBessel0(Real(x)) * scale, i0 * scale, 1.9e-7 + slack);
      ASSERT_NEAR(M::ModBessel1(Real(x)) * scale, i1 * scale, 2.2e-7 + slack);
    }
  }
  EXPECT_EQ(M::ModBessel1(Real(0)), Real(0));
  for (double x = 0.01; x < 25; x += 0.053) {
    SCOPED_TRACE(x);
    // P(1, x) = 1 - exp(-x); P(1/2, x) = erf(sqrt(x)); both forms are used.
    ASSERT_NEAR(M::IncompleteGamma(Real(1), Real(x)), 1 - std::exp(-x), KRByPrecision<Real>(3e-6, 1e-6));
    ASSERT_NEAR(M::IncompleteGamma(Real(0.5), Real(x)), std::erf(std::sqrt(x)), KRByPrecision<Real>(3e-6, 1e-6));
  }
  EXPECT_EQ(M::IncompleteGamma(Real(2), Real(0)), Real(0));
  // A large a converges slowly: the series gives up after 100 terms.
  const Real failures[][2] = {{2, -1}, {0, 1}, {-1, 1}, {1, std::numeric_limits<Real>::quiet_NaN()}, {1e6, 9e5}};
  for (const auto& args : failures)
    EXPECT_EQ(M::IncompleteGamma(args[0], args[1]), M::MAX_REAL) << args[0] << ", " << args[1];
}

// Maximum errors of the fast approximations over their fitted ranges: the
// published bounds of the fits plus the rounding of the precision.
TYPED_TEST(CKRMathTTest, FastApproximationsStayWithinTheirBounds) {
  KR_MATH_TEST_TYPES;
  constexpr double kPi = std::numbers::pi;
  const struct {
    const char* m_pName;
    Real (*m_pFast)(Real);
    double (*m_pExact)(double);
    double m_Low;
    double m_High;
    double m_Bound;
  } rows[] = {
      {"FastSin0", &M::FastSin0, [](double x) { return std::sin(x); }, 0, kPi / 2, 1.7e-4},
      {"FastSin1", &M::FastSin1, [](double x) { return std::sin(x); }, 0, kPi / 2, 1.9e-8},
      {"FastCos0", &M::FastCos0, [](double x) { return std::cos(x); }, 0, kPi / 2, 1.2e-3},
      {"FastCos1", &M::FastCos1, [](double x) { return std::cos(x); }, 0, kPi / 2, 6.5e-9},
      {"FastTan0", &M::FastTan0, [](double x) { return std::tan(x); }, 0, kPi / 4, 8.1e-4},
      {"FastTan1", &M::FastTan1, [](double x) { return std::tan(x); }, 0, kPi / 4, 1.9e-8},
      {"FastInvSin", &M::FastInvSin, [](double x) { return std::asin(x); }, 0, 1, 6.8e-5},
      {"FastInvCos", &M::FastInvCos, [](double x) { return std::acos(x); }, 0, 1, 6.8e-5},
      {"FastInvTan0", &M::FastInvTan0, [](double x) { return std::atan(x); }, -1, 1, 1.2e-5},
      {"FastInvTan1", &M::FastInvTan1, [](double x) { return std::atan(x); }, -1, 1, 2.3e-8},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_pName);
    double worst = 0;
    for (int i = 0; i <= 4000; ++i) {
      const Real x = Real(row.m_Low + (row.m_High - row.m_Low) * i / 4000.0);
      worst = std::max(worst, std::fabs(row.m_pFast(x) - row.m_pExact(x)));
    }
    EXPECT_LE(worst, row.m_Bound + KRByPrecision<Real>(5e-7, 1e-9));
  }
  // One Newton step after the bit trick: relative error below 0.18%, and the
  // same single-precision result in both instantiations.
  for (double x = 1e-6; x < 1e12; x *= 1.37) {
    SCOPED_TRACE(x);
    ASSERT_NEAR(M::FastInvSqrt(Real(x)) * std::sqrt(double(Real(x))), 1.0, 1.8e-3);
    ASSERT_EQ(double(M::FastInvSqrt(Real(x))), double(CKRMathT<float, double>::FastInvSqrt(float(x))));
  }
}
