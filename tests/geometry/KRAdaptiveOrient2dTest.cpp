// orient2d: the sign against exact integer arithmetic, on random points and
// on nearly collinear ones where rounded arithmetic gets it wrong.
#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <random>

namespace {

using krPolygonTriangulation::orient2d;

__extension__ typedef __int128 KRInt128;

// Three points as integer multiples of 2^-scale (each exactly a double).
struct SKRUnitTriangle {
  std::int64_t m_Units[6];
  int m_Scale;

  double Coordinate(int i) const { return std::ldexp(double(m_Units[i]), -m_Scale); }
  // Whether every unit count is a double (the test's own premise).
  bool IsExact() const {
    for (int i = 0; i < 6; ++i)
      if (std::int64_t(std::ldexp(Coordinate(i), m_Scale)) != m_Units[i])
        return false;
    return true;
  }
  double Orient(double factor = 1) const {
    return orient2d(Coordinate(0) * factor, Coordinate(1) * factor, Coordinate(2) * factor, Coordinate(3) * factor,
                    Coordinate(4) * factor, Coordinate(5) * factor);
  }
  double Naive() const {
    return (Coordinate(0) - Coordinate(4)) * (Coordinate(3) - Coordinate(5)) -
           (Coordinate(1) - Coordinate(5)) * (Coordinate(2) - Coordinate(4));
  }
  // The exact sign: units below 2^58 keep the products within 128 bits.
  int ExactSign() const {
    const std::int64_t* u = m_Units;
    const KRInt128 det = KRInt128(u[0] - u[4]) * (u[3] - u[5]) - KRInt128(u[1] - u[5]) * (u[2] - u[4]);
    return det > 0 ? 1 : (det < 0 ? -1 : 0);
  }
};

int Sign(double value) { return value > 0 ? 1 : (value < 0 ? -1 : 0); }

}  // namespace

TEST(Orient2d, SignIsExactOnRandomPoints) {
  std::mt19937_64 random(KRTestSeed());
  std::uniform_int_distribution<std::int64_t> units(-(std::int64_t(1) << 52), std::int64_t(1) << 52);
  std::uniform_int_distribution<int> scales(-20, 60);
  for (int i = 0; i < 20000; ++i) {
    SKRUnitTriangle t{};
    for (std::int64_t& u : t.m_Units)
      u = units(random);
    // Every third triangle is exactly degenerate: c = a + 2 (b - a) in halves.
    if (i % 3 == 0)
      for (int k = 0; k < 2; ++k) {
        t.m_Units[k] >>= 2;
        t.m_Units[2 + k] >>= 2;
        t.m_Units[4 + k] = 2 * t.m_Units[2 + k] - t.m_Units[k];
      }
    t.m_Scale = scales(random);
    ASSERT_TRUE(t.IsExact());
    ASSERT_EQ(Sign(t.Orient()), t.ExactSign()) << "triangle " << i;
  }
}

TEST(Orient2d, SignIsExactOnNearlyCollinearPoints) {
  // a moves over a grid of ulps around a base point; b and c lie exactly on
  // a line through the base, far away, so that the differences round: the
  // case that defeats rounded arithmetic. All values are multiples of 2^-53;
  // the base is one of 2^-44, so that b and c (below 512) are doubles.
  std::mt19937_64 random(KRTestSeed());
  std::uniform_int_distribution<std::int64_t> bases(std::int64_t(1) << 51, (std::int64_t(1) << 53) - 1);
  std::uniform_int_distribution<int> steps(1, 7);
  std::uniform_int_distribution<int> reaches(8, 24);
  int naiveMistakes = 0;
  int checked = 0;
  for (int round = 0; round < 40; ++round) {
    const std::int64_t baseX = bases(random) & ~std::int64_t(511);
    const std::int64_t baseY = bases(random) & ~std::int64_t(511);
    const std::int64_t dx = steps(random) * (std::int64_t(1) << 53);
    const std::int64_t dy = steps(random) * (std::int64_t(1) << 53);
    const int near = reaches(random) / 2;
    const int far = reaches(random);
    for (int i = -16; i < 16; ++i)
      for (int j = -16; j < 16; ++j) {
        SKRUnitTriangle t{{baseX + i, baseY + j, baseX + near * dx, baseY + near * dy, baseX + far * dx,
                           baseY + far * dy},
                          53};
        SCOPED_TRACE(testing::Message() << "round " << round << " offset " << i << "," << j);
        ASSERT_TRUE(t.IsExact());
        const int exact = t.ExactSign();
        ASSERT_EQ(Sign(t.Orient()), exact);
        // Scaling by powers of two keeps the sign, up to the limits of the
        // documented range.
        ASSERT_EQ(Sign(t.Orient(0x1p400)), exact);
        ASSERT_EQ(Sign(t.Orient(0x1p-400)), exact);
        naiveMistakes += Sign(t.Naive()) != exact;
        ++checked;
      }
  }
  // The sample is hard: rounded arithmetic misjudges a good share of it.
  EXPECT_GT(naiveMistakes, checked / 20);
}

TEST(Orient2d, NonFiniteInputEnds) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double inf = std::numeric_limits<double>::infinity();
  EXPECT_TRUE(std::isnan(orient2d(nan, 0, 1, 0, 0, 1)));
  EXPECT_EQ(Sign(orient2d(0, 0, 1, 0, 0, 1)), 1);
  // Overflowing products give no sign anyone relies on, only an answer.
  orient2d(inf, 0, 1, 0, 0, inf);
  orient2d(1e300, 1e300, -1e300, 1e300, 0, -1e300);
}
