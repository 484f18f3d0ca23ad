// CKRTriangulateEarClipping in both precision pairs and with every query
// strategy: the documented small cases, failures that must be reported
// rather than loop or fault, and random star-shaped polygons whose
// triangles must cover the polygon exactly once (seed logged, settable
// with KR_TEST_SEED).
#include <krCoreLib/geometry/CKRTriangulateEarClipping.h>

#include "KRGeometryTestTypes.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>
#include <random>
#include <string>
#include <vector>

using krRationalArithmetic::Query;

namespace {

const Query::Type kAllTypes[] = {Query::TYPE_INT64, Query::TYPE_INTEGER, Query::TYPE_RATIONAL, Query::TYPE_REAL,
                                 Query::TYPE_FILTERED};

using V = CKRVector2T<float, double>;

double Cross(const V& a, const V& b, const V& c) {
  return (double(b.X()) - a.X()) * (double(c.Y()) - a.Y()) - (double(b.Y()) - a.Y()) * (double(c.X()) - a.X());
}

}  // namespace

template <class Pair>
class CKRTriangulateEarClippingTest : public ::testing::Test {
protected:
  using Clipper = CKRTriangulateEarClipping<typename Pair::Real, typename Pair::Other>;
  struct SKRResult {
    std::vector<int> triangles;
    std::wstring error;
  };
  static SKRResult Run(const std::vector<V>& polygon, Query::Type type, double epsilon = 1e-5) {
    int* indices = reinterpret_cast<int*>(&indices);  // must be overwritten
    const Clipper clipper(int(polygon.size()), polygon.empty() ? nullptr : polygon.data(), type,
                          typename Pair::Real(epsilon), indices);
    SKRResult result;
    result.error = clipper.GetError().GetString();
    if (indices != nullptr) {
      result.triangles.assign(indices, indices + 3 * clipper.GetTriangleCount());
      delete[] indices;
    } else {
      EXPECT_EQ(clipper.GetTriangleCount(), 0);
      EXPECT_FALSE(result.error.empty());
    }
    return result;
  }
  // n - 2 triangles over valid indices, covering every vertex, whose
  // unsigned areas add up to the polygon's area (no triangle turned over,
  // none overlapping).
  static void CheckCover(const std::vector<V>& polygon, const std::vector<int>& triangles) {
    const int n = int(polygon.size());
    ASSERT_EQ(int(triangles.size()), 3 * (n - 2));
    std::vector<bool> covered(std::size_t(n), false);
    double sum = 0, absolute = 0;
    for (std::size_t t = 0; t < triangles.size(); t += 3) {
      for (int k = 0; k < 3; ++k) {
        ASSERT_GE(triangles[t + k], 0);
        ASSERT_LT(triangles[t + k], n);
        covered[std::size_t(triangles[t + k])] = true;
      }
      const double area = Cross(polygon[triangles[t]], polygon[triangles[t + 1]], polygon[triangles[t + 2]]);
      sum += area;
      absolute += std::fabs(area);
    }
    double area = 0;
    for (int i = 0, j = n - 1; i < n; j = i++)
      area += double(polygon[j].X()) * polygon[i].Y() - double(polygon[i].X()) * polygon[j].Y();
    EXPECT_NEAR(sum, area, 1e-9 * std::fabs(area));
    EXPECT_NEAR(absolute, area, 1e-9 * std::fabs(area));
    EXPECT_TRUE(std::all_of(covered.begin(), covered.end(), [](bool c) { return c; }));
  }
};
TYPED_TEST_SUITE(CKRTriangulateEarClippingTest, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(CKRTriangulateEarClippingTest, DocumentedCases) {
  const std::vector<V> square = {V(0, 0), V(1, 0), V(1, 1), V(0, 1)};
  const std::vector<V> ell = {V(0, 0), V(2, 0), V(2, 1), V(1, 1), V(1, 2), V(0, 2)};
  // The reflex vertex (2, 1) lies exactly on the edge of the ear at (1, 2):
  // it does not stop that ear.
  const std::vector<V> touching = {V(0, 0), V(4, 0), V(4, 1), V(2, 1), V(2, 2), V(0, 2)};
  const auto reference = TestFixture::Run(ell, Query::TYPE_RATIONAL).triangles;
  for (const Query::Type type : kAllTypes) {
    SCOPED_TRACE(int(type));
    EXPECT_EQ(TestFixture::Run(square, type).triangles, (std::vector<int>{0, 1, 2, 0, 2, 3}));
    const auto result = TestFixture::Run(ell, type);
    TestFixture::CheckCover(ell, result.triangles);
    EXPECT_EQ(result.triangles, reference);
    TestFixture::CheckCover(touching, TestFixture::Run(touching, type).triangles);
    // A straight vertex in the middle of an edge.
    const std::vector<V> straight = {V(0, 0), V(1, 0), V(2, 0), V(2, 2), V(1, 1), V(0, 2)};
    TestFixture::CheckCover(straight, TestFixture::Run(straight, type).triangles);
  }
  // Filtered with no uncertainty decides as plain floating point.
  const std::vector<V> star = {V(0, 0), V(3, 1), V(6, 0), V(5, 3), V(6, 6), V(3, 5), V(0, 6), V(1, 3)};
  EXPECT_EQ(TestFixture::Run(star, Query::TYPE_FILTERED, 0).triangles, TestFixture::Run(star, Query::TYPE_REAL).triangles);
}

TYPED_TEST(CKRTriangulateEarClippingTest, BadInputIsRefused) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  struct Case {
    const char* name;
    std::vector<V> polygon;
    Query::Type type;
    const wchar_t* error;
  };
  const Case cases[] = {
      {"empty", {}, Query::TYPE_FILTERED, L"fewer than 3 vertices"},
      {"two", {V(0, 0), V(1, 0)}, Query::TYPE_RATIONAL, L"fewer than 3 vertices"},
      {"strategy", {V(0, 0), V(1, 0), V(0, 1)}, Query::Type(7), L"unknown query type"},
      {"NaN", {V(0, 0), V(1, 0), V(nan, 1)}, Query::TYPE_REAL, L"a vertex coordinate is not finite"},
      {"infinite", {V(0, 0), V(INFINITY, 0), V(0, 1)}, Query::TYPE_INT64, L"a vertex coordinate is not finite"},
      {"duplicate", {V(0, 0), V(1, 0), V(1, 0), V(0, 1)}, Query::TYPE_INTEGER, L"two vertices coincide"},
      {"signed zeros", {V(0, 0), V(1, 0), V(-0.0f, 0), V(0, 1)}, Query::TYPE_INTEGER, L"two vertices coincide"},
      {"clockwise", {V(0, 0), V(0, 1), V(1, 1), V(1, 0)}, Query::TYPE_FILTERED,
       L"the polygon is not counter-clockwise"},
      {"collinear", {V(0, 0), V(1, 1), V(2, 2), V(3, 3)}, Query::TYPE_REAL, L"the polygon is not counter-clockwise"},
      // Counter-clockwise by area but crossing itself: the ears run out.
      {"self-crossing", {V(0, 0), V(4, 0), V(4, 4), V(3, 4), V(3, -1), V(2, -1), V(2, 4), V(0, 4)},
       Query::TYPE_RATIONAL, L"no ear left"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    const auto result = TestFixture::Run(c.polygon, c.type);
    EXPECT_TRUE(result.triangles.empty());
    EXPECT_EQ(result.error, c.error);
  }
  // Arbitrary point lists never loop or fault: n - 2 triangles or an error.
  std::mt19937 random(KRTestSeed());
  std::uniform_int_distribution<int> coordinate(-8, 8);
  for (int round = 0; round < 500; ++round) {
    std::vector<V> points;
    const int n = 3 + round % 9;
    for (int i = 0; i < n; ++i)
      points.emplace_back(float(coordinate(random)), float(coordinate(random)));
    for (const Query::Type type : kAllTypes) {
      const auto result = TestFixture::Run(points, type);
      EXPECT_TRUE(result.triangles.size() == std::size_t(3 * (n - 2)) || !result.error.empty());
    }
  }
}

TYPED_TEST(CKRTriangulateEarClippingTest, RandomStarPolygonsAreCovered) {
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> unit(0, 1);
  for (int round = 0; round < 60; ++round) {
    const int n = 5 + int(unit(random) * (round < 50 ? 60 : 400));
    // Angles sorted around the centre, radii between 0.2 and 1: simple and
    // counter-clockwise. Every fifth polygon has nearly equal radii (close
    // to a circle); every seventh keeps integral coordinates.
    std::vector<double> angles;
    for (int i = 0; i < n; ++i)
      angles.push_back(unit(random) * 2 * std::numbers::pi);
    std::sort(angles.begin(), angles.end());
    angles.erase(std::unique(angles.begin(), angles.end()), angles.end());
    std::vector<V> polygon;
    for (const double angle : angles) {
      const double radius = round % 5 == 0 ? 1 + 1e-6 * unit(random) : 0.2 + 0.8 * unit(random);
      const double scale = round % 7 == 0 ? 1000 : 1;
      V v(float(std::round(scale * radius * std::cos(angle)) / scale), float(std::round(scale * radius * std::sin(angle)) / scale));
      if (round % 7 != 0)
        v = V(float(radius * std::cos(angle)), float(radius * std::sin(angle)));
      polygon.push_back(v);
    }
    // Rounding may have merged points or folded a sliver: keep only
    // polygons that are still simple stars around the centre.
    const auto isStar = [](const std::vector<V>& star) {
      bool simple = star.size() >= 3;
      for (std::size_t i = 0; i < star.size(); ++i)
        simple = simple && Cross(V(0, 0), star[i], star[(i + 1) % star.size()]) > 0;
      return simple;
    };
    if (!isStar(polygon))
      continue;
    for (const Query::Type type : {Query::TYPE_RATIONAL, Query::TYPE_FILTERED}) {
      // Every rational ear test costs microseconds: the long polygons go to
      // the filtered strategy alone.
      if (type == Query::TYPE_RATIONAL && polygon.size() > 40)
        continue;
      SCOPED_TRACE(testing::Message() << "round " << round << " strategy " << int(type) << " n " << polygon.size());
      const auto result = TestFixture::Run(polygon, type);
      ASSERT_TRUE(result.error.empty()) << std::string(result.error.begin(), result.error.end());
      TestFixture::CheckCover(polygon, result.triangles);
    }
    // The approximate strategies on well-separated stars. The integer ones
    // truncate the coordinates: they get the star in whole units of 2^-16
    // of the radius, well inside their exact range.
    std::vector<V> integral;
    for (const V& v : polygon)
      integral.push_back(V(std::round(v.X() * 65536.0f), std::round(v.Y() * 65536.0f)));
    if (round % 5 != 0 && isStar(integral))
      for (const Query::Type type : {Query::TYPE_INT64, Query::TYPE_INTEGER, Query::TYPE_REAL}) {
        SCOPED_TRACE(testing::Message() << "round " << round << " strategy " << int(type));
        const std::vector<V>& input = type == Query::TYPE_REAL ? polygon : integral;
        const auto result = TestFixture::Run(input, type);
        ASSERT_TRUE(result.error.empty());
        TestFixture::CheckCover(input, result.triangles);
      }
  }
}
