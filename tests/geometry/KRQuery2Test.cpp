// krRationalArithmetic: TInteger against the compiler's 128-bit integers, exact
// float conversion of TRational, and the five query strategies of both
// precision pairs against exact integer arithmetic on random, nearly
// collinear and cocircular points within each strategy's documented range
// (seed logged, settable with KR_TEST_SEED).
#include <krCoreLib/geometry/KRQuery2.h>

#include "KRGeometryTestTypes.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <random>
#include <vector>

using namespace krRationalArithmetic;

namespace {

__extension__ typedef __int128 KRInt128;
__extension__ typedef unsigned __int128 KRUInt128;

// The value of a TInteger<N> of at most 128 bits, sign-extended.
template <int N>
KRInt128 ToInt128(const TInteger<N>& v) {
  static_assert(N <= 4);
  KRUInt128 bits = 0;
  for (int i = TInteger<N>::BLOCKS - 1; i >= 0; --i)
    bits = (bits << 16) | v.GetBlock(i);
  if constexpr (N < 4)
    if ((v.GetBlock(TInteger<N>::BLOCKS - 1) & 0x8000u) != 0)
      bits |= ~((KRUInt128)(0)) << TInteger<N>::BITS;
  return KRInt128(bits);
}

// a wrapped to the width of TInteger<N>, as two's complement.
template <int N>
KRInt128 Wrap(KRUInt128 a) {
  if constexpr (N == 4) {
    return KRInt128(a);
  } else {
    const int bits = 32 * N;
    a &= (((KRUInt128)(1)) << bits) - 1;
    if ((a >> (bits - 1)) & 1)
      a |= ~((KRUInt128)(0)) << bits;
    return KRInt128(a);
  }
}

int Sign(KRInt128 v) { return (v > 0) - (v < 0); }

// The predicates on integral coordinates, exactly.
struct SKRExact {
  static int ToLine(const std::int64_t* p, const std::int64_t* a, const std::int64_t* b) {
    const KRInt128 x0 = p[0] - a[0], y0 = p[1] - a[1], x1 = b[0] - a[0], y1 = b[1] - a[1];
    return Sign(x0 * y1 - x1 * y0);
  }
  static int ToCircumcircle(const std::int64_t* p, const std::int64_t* const* v) {
    KRInt128 r[3][3];
    for (int k = 0; k < 3; ++k) {
      r[k][0] = v[k][0] - p[0];
      r[k][1] = v[k][1] - p[1];
      r[k][2] = KRInt128(v[k][0]) * v[k][0] + KRInt128(v[k][1]) * v[k][1] - KRInt128(p[0]) * p[0] -
                KRInt128(p[1]) * p[1];
    }
    const KRInt128 d = r[0][0] * (r[1][1] * r[2][2] - r[2][1] * r[1][2]) +
                       r[0][1] * (r[1][2] * r[2][0] - r[2][2] * r[1][0]) +
                       r[0][2] * (r[1][0] * r[2][1] - r[2][0] * r[1][1]);
    return -Sign(d);
  }
};

}  // namespace

TEST(TInteger, ArithmeticMatchesInt128) {
  std::mt19937_64 random(KRTestSeed());
  // Values of every size up to the width, built from ints.
  const auto make = [&](auto tag, KRUInt128& exact) {
    using Integer = decltype(tag);
    Integer value(0);
    exact = 0;
    const int parts = int(random() % 5);
    for (int k = 0; k < parts; ++k) {
      const int part = int(std::int32_t(random()));
      value = value * Integer(65536) * Integer(65536) + Integer(part);
      exact = exact * 65536u * 65536u + (KRUInt128)(KRInt128(part));
    }
    return value;
  };
  for (int round = 0; round < 20000; ++round) {
    KRUInt128 a = 0, b = 0;
    const TInteger<4> x = make(TInteger<4>(), a);
    const TInteger<4> y = make(TInteger<4>(), b);
    SCOPED_TRACE(round);
    ASSERT_EQ(ToInt128(x), KRInt128(a));
    ASSERT_EQ(ToInt128(x + y), KRInt128(a + b));
    ASSERT_EQ(ToInt128(x - y), KRInt128(a - b));
    ASSERT_EQ(ToInt128(x * y), KRInt128(a * b));  // wraps like unsigned
    ASSERT_EQ(ToInt128(-x), KRInt128(-a));
    ASSERT_EQ(x < y, KRInt128(a) < KRInt128(b));
    ASSERT_EQ(x > y, KRInt128(a) > KRInt128(b));
    ASSERT_EQ(x.GetSignum(), Sign(KRInt128(a)));
    const int shift = int(random() % 140);
    TInteger<4> shifted = x;
    shifted >>= shift;
    ASSERT_EQ(ToInt128(shifted), shift >= 128 ? (KRInt128(a) < 0 ? -1 : 0) : KRInt128(a) >> shift);
    shifted = x;
    shifted <<= shift;
    ASSERT_EQ(ToInt128(shifted), shift >= 128 ? 0 : KRInt128(a << shift));

    KRUInt128 c = 0, d = 0;
    const TInteger<2> u = make(TInteger<2>(), c);
    const TInteger<2> v = make(TInteger<2>(), d);
    ASSERT_EQ(ToInt128(u * v), Wrap<2>(c * d));
    ASSERT_EQ(ToInt128(u + v), Wrap<2>(c + d));
    ASSERT_EQ(u < v, Wrap<2>(c) < Wrap<2>(d));
  }
  // The most negative value: its own negation, and a magnitude that
  // multiplies correctly.
  TInteger<2> lowest = TInteger<2>(1);
  lowest <<= 63;
  EXPECT_EQ(ToInt128(lowest), -(KRInt128(1) << 63));
  EXPECT_EQ(-lowest, lowest);
  EXPECT_EQ(ToInt128(lowest * TInteger<2>(-1)), -(KRInt128(1) << 63));
  EXPECT_EQ(ToInt128(TInteger<4>(-7) * TInteger<4>(6)), -42);
}

TEST(TRational, FloatsConvertExactly) {
  using R16 = TRational<16>;
  const R16 threeQuarters(0.75f);
  EXPECT_EQ(ToInt128(TInteger<4>(3)), 3);
  EXPECT_TRUE(threeQuarters.Numerator() == TInteger<16>(3));
  EXPECT_TRUE(threeQuarters.Denominator() == TInteger<16>(4));
  const R16 minusHalf(-0.5f);
  EXPECT_TRUE(minusHalf.Numerator() == TInteger<16>(-1));
  EXPECT_TRUE(minusHalf.Denominator() == TInteger<16>(2));
  EXPECT_EQ(R16(0.0f), R16());
  EXPECT_EQ(R16(-0.0f), R16());
  EXPECT_EQ(R16(std::numeric_limits<float>::quiet_NaN()), R16());
  EXPECT_EQ(R16(std::numeric_limits<float>::infinity()), R16());
  EXPECT_EQ(R16(1024.0f), R16(1024));
  EXPECT_EQ(R16(3, 6), R16(1, 2));
  // The extremes of the float range, both widths.
  const float tiny = std::numeric_limits<float>::denorm_min();
  EXPECT_EQ(R16(tiny) * R16(2), R16(2 * tiny));
  EXPECT_GT(R16(tiny), R16());
  EXPECT_EQ(TRational<32>(std::numeric_limits<float>::max()) / TRational<32>(0.5f),
            TRational<32>(std::numeric_limits<float>::max()) * TRational<32>(2));

  // Sums, products and order of random floats agree with double, which
  // holds them exactly.
  std::mt19937 random(KRTestSeed());
  std::uniform_int_distribution<int> exponent(-30, 30);
  std::uniform_real_distribution<float> unit(-1, 1);
  for (int round = 0; round < 2000; ++round) {
    const float a = std::ldexp(unit(random), exponent(random));
    const float b = std::ldexp(unit(random), exponent(random));
    SCOPED_TRACE(testing::Message() << a << " " << b);
    ASSERT_EQ(R16(a) < R16(b), a < b);
    ASSERT_EQ(R16(a) > R16(b), a > b);
    // The product of two floats is exact in double, their sum where it
    // passes the check; compare where the float of that is exact too.
    const double product = double(a) * double(b);
    if (double(float(product)) == product) {
      ASSERT_EQ(R16(a) * R16(b), R16(float(product)));
    }
    const double sum = double(a) + double(b);
    if (sum - double(a) == double(b) && sum - double(b) == double(a) && double(float(sum)) == sum) {
      ASSERT_EQ(R16(a) + R16(b), R16(float(sum)));
    }
    if (b != 0 && double(float(double(a) / double(b))) * double(b) == double(a)) {
      ASSERT_EQ(R16(a) / R16(b), R16(float(double(a) / double(b))));
    }
    ASSERT_EQ(R16(a) - R16(a), R16());
  }
}

template <class Pair>
class KRQuery2Test : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TOther = typename Pair::Other;
  using Vector = CKRVector2T<float, double>;

  static std::unique_ptr<Query2<TReal, TOther>> Make(Query::Type type, int n, const Vector* v) {
    switch (type) {
      case Query::TYPE_INT64:
        return std::make_unique<Query2Int64<TReal, TOther>>(n, v);
      case Query::TYPE_INTEGER:
        return std::make_unique<Query2TInteger<TReal, TOther>>(n, v);
      case Query::TYPE_RATIONAL:
        return std::make_unique<Query2TRational<TReal, TOther>>(n, v);
      case Query::TYPE_REAL:
        return std::make_unique<Query2<TReal, TOther>>(n, v);
      case Query::TYPE_FILTERED:
        break;
    }
    // 32 units of rounding in Real: the documented minimum for exactness.
    return std::make_unique<Query2Filtered<TReal, TOther>>(n, v, TReal(32) * std::numeric_limits<TReal>::epsilon() / 2);
  }

  // Checks every strategy on a set of integral points (as coordinates k *
  // 2^-shift) against exact arithmetic, for the strategies whose range
  // holds the points' magnitude.
  static void Compare(const std::vector<std::int64_t>& points, int magnitudeBits, int shift, std::mt19937& random) {
    const int n = int(points.size() / 2);
    std::vector<Vector> vertices;
    for (int i = 0; i < n; ++i)
      vertices.emplace_back(std::ldexp(float(points[2 * i]), -shift), std::ldexp(float(points[2 * i + 1]), -shift));
    constexpr bool single = std::is_same_v<TReal, float>;
    struct SKRStrategy {
      Query::Type type;
      int lineBits, circleBits;  // the documented ranges of integral coordinates
      bool fractions;            // exact for non-integral coordinates too
    };
    const SKRStrategy strategies[] = {
        {Query::TYPE_INT64, 29, 13, false},
        {Query::TYPE_INTEGER, 29, 29, false},
        {Query::TYPE_RATIONAL, 64, 64, true},
        {Query::TYPE_REAL, single ? 11 : 25, single ? 4 : 10, false},
        {Query::TYPE_FILTERED, 64, 64, true},
    };
    std::uniform_int_distribution<int> pick(0, n - 1);
    for (const SKRStrategy& strategy : strategies) {
      if (shift != 0 && !strategy.fractions)
        continue;
      SCOPED_TRACE(testing::Message() << "strategy " << int(strategy.type));
      const auto query = Make(strategy.type, n, vertices.data());
      ASSERT_EQ(query->GetType(), strategy.type);
      for (int round = 0; round < 4 * n; ++round) {
        const int i = pick(random), a = pick(random), b = pick(random), c = pick(random);
        const std::int64_t* p = &points[2 * i];
        const std::int64_t* v[3] = {&points[2 * a], &points[2 * b], &points[2 * c]};
        if (magnitudeBits < strategy.lineBits) {
          const int line = SKRExact::ToLine(p, v[0], v[1]);
          ASSERT_EQ(query->ToLine(i, a, b), line) << i << " " << a << " " << b;
          ASSERT_EQ(query->ToLine(vertices[i], a, b), line);
          int expected = 0;
          const int s0 = SKRExact::ToLine(p, v[1], v[2]), s1 = SKRExact::ToLine(p, v[0], v[2]),
                    s2 = SKRExact::ToLine(p, v[0], v[1]);
          expected = s0 > 0 || s1 < 0 || s2 > 0 ? 1 : (s0 == 0 || s1 == 0 || s2 == 0 ? 0 : -1);
          ASSERT_EQ(query->ToTriangle(i, a, b, c), expected);
        }
        if (magnitudeBits < strategy.circleBits) {
          const int circle = SKRExact::ToCircumcircle(p, v);
          ASSERT_EQ(query->ToCircumcircle(i, a, b, c), circle) << i << " " << a << " " << b << " " << c;
          ASSERT_EQ(query->ToCircumcircle(vertices[i], a, b, c), circle);
        }
      }
    }
  }
};
TYPED_TEST_SUITE(KRQuery2Test, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(KRQuery2Test, DocumentedCases) {
  using V = typename TestFixture::Vector;
  const V v[] = {V(0, 0), V(1, 0), V(1, 1), V(0, 1), V(0, -1),
                      V(0.9f, 0), V(2, 0), V(1.0f / 3, 1.0f / 3)};
  for (const Query::Type type : {Query::TYPE_INT64, Query::TYPE_INTEGER, Query::TYPE_RATIONAL, Query::TYPE_REAL,
                                 Query::TYPE_FILTERED}) {
    SCOPED_TRACE(int(type));
    const auto q = TestFixture::Make(type, 8, v);
    EXPECT_EQ(q->ToLine(4, 0, 1), 1);   // below the x axis: right
    EXPECT_EQ(q->ToLine(3, 0, 1), -1);  // above: left
    EXPECT_EQ(q->ToLine(6, 0, 1), 0);   // on the line
    EXPECT_EQ(q->ToTriangle(1, 0, 1, 2), 0);
    EXPECT_EQ(q->ToTriangle(6, 0, 1, 2), 1);
    if (type != Query::TYPE_INT64 && type != Query::TYPE_INTEGER) {
      EXPECT_EQ(q->ToTriangle(V(0.6f, 0.3f), 0, 1, 2), -1);
    }
    EXPECT_EQ(q->ToCircumcircle(3, 0, 1, 2), 0);  // the square's fourth corner
    EXPECT_EQ(q->ToCircumcircle(6, 0, 1, 2), 1);
    EXPECT_EQ(q->ToCircumcircle(V(0.5f, 0.5f), 0, 1, 2), type == Query::TYPE_INT64 || type == Query::TYPE_INTEGER ? 0 : -1);
  }
  // The integer strategies truncate: (0.9, 0) lies at x = 0.
  Query2Int64<typename TestFixture::TReal, typename TestFixture::TOther> int64(8, v);
  EXPECT_EQ(int64.ToLine(5, 0, 3), 0);
  EXPECT_EQ(int64.ToLine(V(-0.9f, 5), 0, 3), 0);
}

TYPED_TEST(KRQuery2Test, StrategiesAgreeWithExactArithmetic) {
  std::mt19937 random(KRTestSeed());
  for (const int bits : {3, 10, 12, 23}) {
    const std::int64_t range = (std::int64_t(1) << bits) - 1;
    std::uniform_int_distribution<std::int64_t> coordinate(-range, range);
    SCOPED_TRACE(testing::Message() << "below 2^" << bits);
    // Random points.
    std::vector<std::int64_t> points;
    for (int i = 0; i < 2 * 64; ++i)
      points.push_back(coordinate(random));
    TestFixture::Compare(points, bits, 0, random);
    TestFixture::Compare(points, bits, 20, random);
    // Nearly collinear: steps along a line through two random points,
    // nudged by at most one unit.
    points.clear();
    std::uniform_int_distribution<std::int64_t> step(-range / 64, range / 64);
    std::uniform_int_distribution<std::int64_t> nudge(-1, 1);
    const std::int64_t dx = step(random), dy = step(random);
    for (int i = 0; i < 64; ++i) {
      const std::int64_t t = i - 32;
      points.push_back(std::clamp<std::int64_t>(t * dx + nudge(random), -range, range));
      points.push_back(std::clamp<std::int64_t>(t * dy + nudge(random), -range, range));
    }
    TestFixture::Compare(points, bits, 0, random);
    TestFixture::Compare(points, bits, 20, random);
  }
  // Cocircular: the twelve lattice points of the circle of radius 5, and
  // the points of radius 5525 (whose square has many representations as a
  // sum of two squares), some nudged by a unit.
  for (const std::int64_t radius : {5, 5525}) {
    std::vector<std::int64_t> points;
    for (std::int64_t x = -radius; x <= radius; ++x) {
      const std::int64_t y2 = radius * radius - x * x;
      const auto y = std::int64_t(std::llround(std::sqrt(double(y2))));
      if (y * y != y2)
        continue;
      for (const std::int64_t sy : {y, -y}) {
        points.push_back(x + (random() % 8 == 0 ? 1 : 0));
        points.push_back(sy);
      }
    }
    SCOPED_TRACE(testing::Message() << "radius " << radius);
    const int bits = radius == 5 ? 3 : 13;
    TestFixture::Compare(points, bits, 0, random);
    TestFixture::Compare(points, bits, 20, random);
  }
}
