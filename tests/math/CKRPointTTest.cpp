// CKRPointT and CKRPoint2T, CKRPoint3T, CKRPoint4T in both precision pairs:
// packed layout, affine operations, and the text forms of points and 3-D
// vectors (locale, hostile text, concurrent use).
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/math/CKRVector3T.h>

#include "KRMathTestTypes.h"
#include "KRTestSeed.h"

#include <clocale>
#include <cmath>
#include <cwchar>
#include <latch>
#include <limits>
#include <random>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

template <class Pair>
class CKRPointTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TOther = typename Pair::Other;
  using TM = CKRMathT<TReal, TOther>;
  using TP2 = CKRPoint2T<TReal, TOther>;
  using TP3 = CKRPoint3T<TReal, TOther>;
  using TP4 = CKRPoint4T<TReal, TOther>;
  using TV3 = CKRVector3T<TReal, TOther>;

  static TP3 Pt(double x, double y, double z) { return TP3(TReal(x), TReal(y), TReal(z)); }
  // What the C library's wide printf makes of the values under the current
  // locale.
  static std::wstring Printf(const wchar_t* format, double x, double y) {
    wchar_t text[1024];
    std::swprintf(text, 1024, format, x, y);
    return text;
  }
};
TYPED_TEST_SUITE(CKRPointTTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRPointTTest, PointsArePackedCoordinates) {
  using Real = typename TestFixture::TReal;
  using P3 = typename TestFixture::TP3;
  using P4 = typename TestFixture::TP4;
  static_assert(sizeof(P3[5]) == 15 * sizeof(Real));
  static_assert(std::is_trivially_copyable_v<P4> && std::is_standard_layout_v<P4>);
  P3 points[2] = {TestFixture::Pt(1, 2, 3), TestFixture::Pt(4, 5, 6)};
  const Real* coordinates = points[0];
  EXPECT_EQ(coordinates[4], Real(5));
  EXPECT_EQ(&points[1].X() - &points[0].X(), 3);

  EXPECT_EQ(double(P4::ZERO.W()), 1.0);
  EXPECT_EQ(P4(CKRPointT<4, Real, typename TestFixture::TOther>::ZERO()).W(), Real(0));
  EXPECT_EQ(P3::ZERO, TestFixture::Pt(0, 0, 0));
  EXPECT_EQ(P3(CKRPointT<3, Real, typename TestFixture::TOther>::UNIT(2)), TestFixture::Pt(0, 0, 1));
  EXPECT_EQ(P3(CKRPointT<3, Real, typename TestFixture::TOther>::UNIT(7)), P3::ZERO);
  EXPECT_FALSE(TestFixture::Pt(0.0, 1, 2) == TestFixture::Pt(-0.0, 1, 2));

  P3 p = P3::ZERO;
  p.Set(typename TestFixture::TOther(0.25), typename TestFixture::TOther(0.5), typename TestFixture::TOther(2));
  EXPECT_EQ(p, TestFixture::Pt(0.25, 0.5, 2));
  p.SetZ(Real(-1));
  p.X() = Real(3);
  EXPECT_EQ(p, TestFixture::Pt(3, 0.5, -1));
  EXPECT_TRUE(p.Approx_Equal(TestFixture::Pt(3.0004, 0.5, -1), 3));
  EXPECT_FALSE(p.Approx_Equal(TestFixture::Pt(3.0006, 0.5, -1), 3));
}

TYPED_TEST(CKRPointTTest, AffineOperations) {
  using Real = typename TestFixture::TReal;
  using P3 = typename TestFixture::TP3;
  using P4 = typename TestFixture::TP4;
  using V3 = typename TestFixture::TV3;
  const P3 p = TestFixture::Pt(1, 2, 3);
  const P3 q = TestFixture::Pt(5, -2, 4);
  const V3 v(Real(0.5), Real(-1), Real(2));
  EXPECT_EQ(P3(p + v), TestFixture::Pt(1.5, 1, 5));
  EXPECT_EQ(P3(p - v), TestFixture::Pt(0.5, 3, 1));
  EXPECT_EQ(V3(q - p), V3(Real(4), Real(-4), Real(1)));
  EXPECT_EQ(P3(-p), TestFixture::Pt(-1, -2, -3));
  EXPECT_EQ(P3(p.AffineSum(Real(0), q)), p);
  EXPECT_EQ(P3(p.AffineSum(Real(1), q)), q);
  EXPECT_EQ(P3(p.AffineSum(Real(0.5), q)), TestFixture::Pt(3, 0, 3.5));
  EXPECT_EQ(P3(p + (q - p)), q);

  const P4 r(Real(1), Real(1), Real(5), Real(7));
  const P4 moved = r.PolarBy(TestFixture::TM::HALF_PI, Real(2));
  EXPECT_NEAR(moved.X(), 1, 1e-6);
  EXPECT_NEAR(moved.Y(), 3, 1e-6);
  EXPECT_EQ(moved.Z(), Real(5));
  EXPECT_EQ(moved.W(), Real(1));
  using V4 = CKRVector4T<Real, typename TestFixture::TOther>;
  EXPECT_EQ(r.ToVector(), V4(Real(1), Real(1), Real(5), Real(7)));
}

TYPED_TEST(CKRPointTTest, ToStringWritesSixDecimals) {
  using Real = typename TestFixture::TReal;
  using P2 = typename TestFixture::TP2;
  using P4 = typename TestFixture::TP4;
  EXPECT_EQ(P2(Real(1.5), Real(-2)).ToString(), L"1.500000,-2.000000");
  EXPECT_EQ(TestFixture::Pt(0, -0.0, 1e-7).ToString(), L"0.000000,-0.000000,0.000000");
  EXPECT_EQ(P4(Real(1), Real(2), Real(3), Real(1)).ToString(), L"1.000000,2.000000,3.000000,1.000000");
  EXPECT_EQ(typename TestFixture::TV3(Real(0.25), Real(1e6), Real(-3)).ToString(), L"0.250000,1000000.000000,-3.000000");
  const Real huge = std::numeric_limits<Real>::max();
  EXPECT_EQ(P2(huge, -huge).ToString(), TestFixture::Printf(L"%f,%f", double(huge), -double(huge)));

  // The same digits as the C library's "%f" in the C locale.
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> value(-1e5, 1e5);
  for (int i = 0; i < 2000; ++i) {
    const P2 p(Real(value(random)), Real(value(random) * 1e-5));
    ASSERT_EQ(p.ToString(), TestFixture::Printf(L"%f,%f", double(p.X()), double(p.Y())));
  }
}

TYPED_TEST(CKRPointTTest, FromStringReadsUpToNPieces) {
  using Real = typename TestFixture::TReal;
  using P3 = typename TestFixture::TP3;
  const Real inf = std::numeric_limits<Real>::infinity();
  const std::wstring manyNines(100000, L'9');
  const std::wstring tinyFraction = L"0." + std::wstring(100000, L'0') + L"1,5";
  const struct {
    const wchar_t* m_pText;
    double m_X;
    double m_Y;
    double m_Z;
  } rows[] = {
      {L"1, 2", 1, 2, 9},
      {L"1,2,3,4", 1, 2, 3},
      {L"", 7, 8, 9},
      {L"    ", 7, 8, 9},
      {L"abc", 0, 8, 9},
      {L",5", 0, 5, 9},
      {L"1,,3", 1, 0, 3},
      {L",,", 0, 0, 9},
      {L"1,2,", 1, 2, 9},
      {L" - 1 . 5 , 2e1", -1.5, 20, 9},
      {L"\t4,+5", 4, 5, 9},
      {L"0x10,--2", 16, 0, 9},
      {L"1.5abc,2", 1.5, 2, 9},
      {L"inf,-INFINITY,1e999", inf, -inf, inf},
      {L"-1e999,1e-999", -inf, 0, 9},
      {manyNines.c_str(), inf, 8, 9},
      {tinyFraction.c_str(), 0, 5, 9},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(std::wstring(row.m_pText).substr(0, 40).size());
    P3 p = TestFixture::Pt(7, 8, 9);
    p.FromString(row.m_pText);
    EXPECT_EQ(p.X(), Real(row.m_X));
    EXPECT_EQ(p.Y(), Real(row.m_Y));
    EXPECT_EQ(p.Z(), Real(row.m_Z));
  }
  P3 p = TestFixture::Pt(7, 8, 9);
  p.FromString(static_cast<const wchar_t*>(nullptr));
  EXPECT_EQ(p, TestFixture::Pt(7, 8, 9));
  p.FromString(L"nan,1");
  EXPECT_TRUE(std::isnan(p.X()));
  // A NUL inside the string ends the number of its piece, not the text.
  p.FromString(CKRString(L"1\0,2,\0", 6));
  EXPECT_EQ(p.X(), Real(1));
  EXPECT_EQ(p.Y(), Real(2));
  EXPECT_EQ(p.Z(), Real(0));

  typename TestFixture::TP2 flat(Real(1), Real(1));
  flat.FromString(L"5,6,7");
  EXPECT_EQ(flat, typename TestFixture::TP2(Real(5), Real(6)));
  typename TestFixture::TP4 homogeneous = TestFixture::TP4::ZERO;
  homogeneous.FromString(L"1,2,3");
  EXPECT_EQ(homogeneous, typename TestFixture::TP4(Real(1), Real(2), Real(3), Real(1)));
  typename TestFixture::TV3 v = TestFixture::TV3::UNIT_Z;
  v.FromString(CKRString(L"-1,0.5"));
  EXPECT_EQ(v, typename TestFixture::TV3(Real(-1), Real(0.5), Real(1)));
}

// Each precision keeps what it can hold: the double instantiation the
// parsed double, the single one its nearest float.
TYPED_TEST(CKRPointTTest, FromStringKeepsThePrecisionOfTheClass) {
  using Real = typename TestFixture::TReal;
  using P2 = typename TestFixture::TP2;
  P2 p = P2::ZERO;
  p.FromString(L"5000000.123456,0.1");
  EXPECT_EQ(p.X(), static_cast<Real>(5000000.123456));
  EXPECT_EQ(p.Y(), static_cast<Real>(0.1));

  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> value(-1e6, 1e6);
  for (int i = 0; i < 2000; ++i) {
    const P2 original(Real(value(random)), Real(value(random)));
    P2 copy = P2::ZERO;
    copy.FromString(original.ToString());
    // Six decimals: within half a unit of the sixth decimal, plus the
    // rounding to Real.
    const double tolerance = 5e-7 + KRByPrecision<Real>(0.07, 1e-9);
    ASSERT_NEAR(copy.X(), original.X(), tolerance);
    ASSERT_NEAR(copy.Y(), original.Y(), tolerance);
    ASSERT_EQ(copy.ToString(), original.ToString());
  }
}

// A host that sets a locale with a decimal comma still gets and reads the
// "." forms.
TYPED_TEST(CKRPointTTest, TextFormsIgnoreTheProcessLocale) {
  using Real = typename TestFixture::TReal;
  using P2 = typename TestFixture::TP2;
  const char* names[] = {"de_DE.UTF-8", "de_DE.utf8", "de_DE", "de_DE@euro"};
  const char* chosen = nullptr;
  for (const char* name : names)
    if (std::setlocale(LC_ALL, name) != nullptr) {
      chosen = name;
      break;
    }
  if (chosen == nullptr)
    GTEST_SKIP() << "no German locale installed";
  // The locale is in force: the C library writes a decimal comma.
  const std::wstring localised = TestFixture::Printf(L"%f,%f", 1.5, -2);
  P2 p(Real(1.5), Real(-2));
  const CKRString text = p.ToString();
  P2 read = P2::ZERO;
  read.FromString(L"1.25,-2.5");
  std::setlocale(LC_ALL, "C");
  EXPECT_EQ(localised, L"1,500000,-2,000000");
  EXPECT_EQ(text, L"1.500000,-2.000000");
  EXPECT_EQ(read, P2(Real(1.25), Real(-2.5)));
}

TYPED_TEST(CKRPointTTest, TextFormsAreSafeForConcurrentUse) {
  using Real = typename TestFixture::TReal;
  using P3 = typename TestFixture::TP3;
  constexpr int kThreads = 4;
  std::latch start(kThreads);
  std::vector<int> failures(kThreads, 0);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      for (int i = 0; i < 2000; ++i) {
        const P3 original = TestFixture::Pt(t, i, -0.5 * i);
        P3 copy = P3::ZERO;
        copy.FromString(original.ToString());
        typename TestFixture::TV3 v = TestFixture::TV3::ZERO;
        v.FromString(L"1,2," + std::to_wstring(t));
        if (copy != original || v.Z() != Real(t))
          ++failures[t];
      }
    });
  for (std::thread& thread : threads)
    thread.join();
  for (int t = 0; t < kThreads; ++t)
    EXPECT_EQ(failures[t], 0) << "thread " << t;
}
