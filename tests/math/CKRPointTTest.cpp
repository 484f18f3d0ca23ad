// CKRPointT and CKRPoint2T, CKRPoint3T, CKRPoint4T in both precision pairs:
// packed layout, affine operations, and the text forms of points and 3-D
// vectors (locale, hostile text, concurrent use).
#include "KRMathTestTypes.h"

#include <atomic>
#include <clocale>
#include <cwchar>
#include <latch>
#include <thread>
#include <vector>

template <class Pair>
class CKRPointTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  static CKRPoint3T<TReal, typename Pair::Other> Pt(double x, double y, double z) {
    return CKRPoint3T<TReal, typename Pair::Other>(TReal(x), TReal(y), TReal(z));
  }
  // What the C library's wide printf makes of two values under the current
  // locale.
  static std::wstring Printf(double x, double y) {
    wchar_t text[1024];
    std::swprintf(text, 1024, L"%f,%f", x, y);
    return text;
  }
};
TYPED_TEST_SUITE(CKRPointTTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRPointTTest, PackedCoordinatesAndAffineOperations) {
  KR_MATH_TEST_TYPES;
  static_assert(sizeof(P3[5]) == 15 * sizeof(Real));
  static_assert(std::is_trivially_copyable_v<P4> && std::is_standard_layout_v<P4>);
  const P3 points[2] = {TestFixture::Pt(1, 2, 3), TestFixture::Pt(5, -2, 4)};
  EXPECT_EQ(static_cast<const Real*>(points[0])[4], Real(-2));
  // The homogeneous point's ZERO is a position (w = 1), the generic one all 0.
  EXPECT_EQ(P4::ZERO, P4(Real(0), Real(0), Real(0), Real(1)));
  EXPECT_EQ(P4(CKRPointT<4, Real, Other>::ZERO()).W(), Real(0));
  EXPECT_EQ(P3(CKRPointT<3, Real, Other>::UNIT(7)), P3::ZERO);
  EXPECT_NE(TestFixture::Pt(0.0, 1, 2), TestFixture::Pt(-0.0, 1, 2));
  // Affine arithmetic: a point less a point is a vector.
  EXPECT_EQ(V3(points[1] - points[0]), V3(Real(4), Real(-4), Real(1)));
  EXPECT_EQ(P3(points[0].AffineSum(Real(0.5), points[1])), TestFixture::Pt(3, 0, 3.5));
  // Moving a homogeneous point keeps z and makes it a position.
  const auto moved = P4(Real(1), Real(1), Real(5), Real(7)).PolarBy(M::HALF_PI, Real(2));
  EXPECT_TRUE(moved.Approx_Equal(P4(Real(1), Real(3), Real(5), Real(1)), 5));
}

// Integer arguments (literals) pick the Real constructor and Set: they are
// equally close to both precisions, and must not round through the other one.
TYPED_TEST(CKRPointTTest, IntegerArgumentsUseReal) {
  KR_MATH_TEST_TYPES;
  constexpr P4 homogeneous(0, 0, 0, 1);
  EXPECT_EQ(homogeneous, P4::ZERO);
  EXPECT_EQ(V3(0, 0, 1), V3::UNIT_Z);
  EXPECT_EQ(P2(3, -4u), P2(Real(3), Real(-4.0 + 4294967296.0)));
  // 2^24 + 1 has no float form: a double pair keeps it exactly.
  const P3 big(16777217, 0L, short(2));
  EXPECT_EQ(big.X(), Real(16777217));
  P3 set = P3::ZERO;
  set.Set(1, 2, 3);
  EXPECT_EQ(set, TestFixture::Pt(1, 2, 3));
  V3 vector = V3::ZERO;
  vector.Set(0, 1, 0);
  EXPECT_EQ(vector, V3::UNIT_Y);
  // Calls of one precision keep their constructors.
  EXPECT_EQ(P2(Other(0.1), Other(0.2)), P2(Real(Other(0.1)), Real(Other(0.2))));
}

// "%f" for every component, the same digits as the C library's in the C
// locale, and read back to the same text.
TYPED_TEST(CKRPointTTest, ToStringWritesSixDecimalsAndReadsBack) {
  KR_MATH_TEST_TYPES;
  EXPECT_EQ(TestFixture::Pt(0, -0.0, 1e-7).ToString(), L"0.000000,-0.000000,0.000000");
  EXPECT_EQ(V3(Real(0.25), Real(1e6), Real(-3)).ToString(), L"0.250000,1000000.000000,-3.000000");
  const Real huge = std::numeric_limits<Real>::max();
  EXPECT_EQ(P2(huge, -huge).ToString(), TestFixture::Printf(double(huge), -double(huge)));
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> value(-1e6, 1e6);
  for (int i = 0; i < 2000; ++i) {
    const P2 original(Real(value(random)), Real(value(random) * (i % 2 ? 1 : 1e-6)));
    ASSERT_EQ(original.ToString(), TestFixture::Printf(double(original.X()), double(original.Y())));
    P2 copy = P2::ZERO;
    copy.FromString(original.ToString());
    ASSERT_EQ(copy.ToString(), original.ToString());
  }
  // Each precision keeps what it can hold.
  P2 p = P2::ZERO;
  p.FromString(L"5000000.123456,0.1");
  EXPECT_EQ(p, P2(static_cast<Real>(5000000.123456), static_cast<Real>(0.1)));
}

// Missing pieces keep their value, extra ones are ignored, empty and
// non-numeric ones read 0; spaces, NaN, infinities and overlong numbers.
TYPED_TEST(CKRPointTTest, FromStringReadsUpToNPieces) {
  KR_MATH_TEST_TYPES;
  const Real inf = std::numeric_limits<Real>::infinity();
  const std::wstring manyNines(100000, L'9');
  const std::wstring tinyFraction = L"0." + std::wstring(100000, L'0') + L"1,5";
  const struct {
    const wchar_t* m_pText;
    P3 m_Expected;
  } rows[] = {
      {L"1, 2", TestFixture::Pt(1, 2, 9)},         {L"1,2,3,4", TestFixture::Pt(1, 2, 3)},
      {L"", TestFixture::Pt(7, 8, 9)},             {L"    ", TestFixture::Pt(7, 8, 9)},
      {nullptr, TestFixture::Pt(7, 8, 9)},         {L"abc", TestFixture::Pt(0, 8, 9)},
      {L",5", TestFixture::Pt(0, 5, 9)},           {L"1,,3", TestFixture::Pt(1, 0, 3)},
      {L",,", TestFixture::Pt(0, 0, 9)},           {L"1,2,", TestFixture::Pt(1, 2, 9)},
      {L" - 1 . 5 , 2e1", TestFixture::Pt(-1.5, 20, 9)}, {L"\t4,+5", TestFixture::Pt(4, 5, 9)},
      {L"0x10,--2", TestFixture::Pt(16, 0, 9)},    {L"1.5abc,2", TestFixture::Pt(1.5, 2, 9)},
      {L"inf,-INFINITY,1e999", P3(inf, -inf, inf)}, {L"-1e999,1e-999", P3(-inf, Real(0), Real(9))},
      {manyNines.c_str(), P3(inf, Real(8), Real(9))}, {tinyFraction.c_str(), TestFixture::Pt(0, 5, 9)},
      {L"nan,1", P3(std::numeric_limits<Real>::quiet_NaN(), Real(1), Real(9))},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_pText == nullptr ? L"null" : std::wstring(row.m_pText).substr(0, 40));
    P3 p = TestFixture::Pt(7, 8, 9);
    p.FromString(row.m_pText);
    EXPECT_EQ(p, row.m_Expected);
  }
  P3 p = P3::ZERO;
  // A NUL inside the string ends the number of its piece, not the text.
  p.FromString(CKRString(L"1\0,2,\0", 6));
  EXPECT_EQ(p, TestFixture::Pt(1, 2, 0));
  // The homogeneous w is not read.
  P4 homogeneous = P4::ZERO;
  homogeneous.FromString(L"1,2,3");
  EXPECT_EQ(homogeneous, P4(Real(1), Real(2), Real(3), Real(1)));
}

// A host that sets a locale with a decimal comma still gets and reads the
// "." forms.
TYPED_TEST(CKRPointTTest, TextFormsIgnoreTheProcessLocale) {
  KR_MATH_TEST_TYPES;
  if (std::setlocale(LC_ALL, "de_DE.UTF-8") == nullptr)
    GTEST_SKIP() << "de_DE.UTF-8 is not installed";
  // The locale is in force: the C library writes a decimal comma.
  const std::wstring localised = TestFixture::Printf(1.5, -2);
  const CKRString text = P2(Real(1.5), Real(-2)).ToString();
  P2 read = P2::ZERO;
  read.FromString(L"1.25,-2.5");
  std::setlocale(LC_ALL, "C");
  EXPECT_EQ(localised, L"1,500000,-2,000000");
  EXPECT_EQ(text, L"1.500000,-2.000000");
  EXPECT_EQ(read, P2(Real(1.25), Real(-2.5)));
}

TYPED_TEST(CKRPointTTest, TextFormsAreSafeForConcurrentUse) {
  KR_MATH_TEST_TYPES;
  constexpr int kThreads = 4;
  std::latch start(kThreads);
  std::atomic<int> failures = 0;
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      for (int i = 0; i < 2000; ++i) {
        const P3 original = TestFixture::Pt(t, i, -0.5 * i);
        P3 copy = P3::ZERO;
        copy.FromString(original.ToString());
        failures += copy != original;
      }
    });
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(failures, 0);
}
