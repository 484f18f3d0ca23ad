// Polygons for the triangulator tests: random valid polygons with holes and
// their invariants, and helpers to run the whole pipeline.
#pragma once

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>
#include <krCoreLib/geometry/KRSweepPolygon.h>
#include <krCoreLib/math/CKRMathT.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <initializer_list>
#include <utility>
#include <numbers>
#include <random>
#include <vector>

using KRContour = std::vector<CKRPoint2T<double, float>>;

// A contour from (x, y) pairs.
inline KRContour Contour(std::initializer_list<std::pair<double, double>> points) {
  KRContour contour;
  for (const auto& [x, y] : points)
    contour.emplace_back(x, y);
  return contour;
}

// A polygon as contours: the outer boundary counter-clockwise, then the holes
// counter-clockwise too (they are added reversed).
struct SKRPolygonSample {
  KRContour m_Outer;
  std::vector<KRContour> m_Holes;

  std::size_t VertexCount() const {
    std::size_t count = m_Outer.size();
    for (const KRContour& hole : m_Holes)
      count += hole.size();
    return count;
  }
  void AddTo(krPolygonTriangulation::Polygon& polygon) const {
    polygon.AddContour(m_Outer);
    for (const KRContour& hole : m_Holes)
      polygon.AddContour(hole, true);
  }
};

inline double SignedArea(const KRContour& contour) {
  double twice = 0;
  for (std::size_t i = 0, j = contour.size() - 1; i < contour.size(); j = i++)
    twice += contour[j].X() * contour[i].Y() - contour[i].X() * contour[j].Y();
  return twice / 2;
}

// The distance from the origin to the segment a-b.
inline double DistanceFromOrigin(const CKRPoint2T<double, float>& a, const CKRPoint2T<double, float>& b) {
  const double dx = b.X() - a.X();
  const double dy = b.Y() - a.Y();
  const double t = std::clamp(-(a.X() * dx + a.Y() * dy) / (dx * dx + dy * dy), 0.0, 1.0);
  return std::hypot(a.X() + t * dx, a.Y() + t * dy);
}

// A star-shaped boundary (vertices at increasing angles and random radii in
// [60, 100]) with up to `holes` small axis-parallel squares at random places
// well inside it and apart from each other. With at least 4 vertices no two
// neighbours are half a turn apart, so the origin lies inside.
inline SKRPolygonSample RandomStarWithHoles(std::mt19937& random, int vertices, int holes) {
  std::uniform_real_distribution<double> unit(0, 1);
  SKRPolygonSample sample;
  for (int i = 0; i < vertices; ++i) {
    const double angle = 2 * std::numbers::pi * (i + 0.8 * unit(random)) / vertices;
    const double radius = 60 + 40 * unit(random);
    sample.m_Outer.emplace_back(radius * std::cos(angle), radius * std::sin(angle));
  }
  double inner = 100;
  for (std::size_t i = 0, j = sample.m_Outer.size() - 1; i < sample.m_Outer.size(); j = i++)
    inner = std::min(inner, DistanceFromOrigin(sample.m_Outer[j], sample.m_Outer[i]));
  const double reach = inner - 1;
  std::vector<std::array<double, 3>> squares;  // centre x, y and half side
  for (int attempt = 0; attempt < 20 * holes && int(squares.size()) < holes; ++attempt) {
    const double half = 0.5 + 2 * unit(random);
    const double x = reach * (2 * unit(random) - 1);
    const double y = reach * (2 * unit(random) - 1);
    if (std::hypot(x, y) + half * std::numbers::sqrt2 > reach)
      continue;
    bool apart = true;
    for (const auto& s : squares)
      apart = apart && (std::fabs(s[0] - x) > s[2] + half + 0.1 || std::fabs(s[1] - y) > s[2] + half + 0.1);
    if (!apart)
      continue;
    squares.push_back({x, y, half});
    sample.m_Holes.push_back(Contour({{x - half, y - half}, {x + half, y - half}, {x + half, y + half}, {x - half, y + half}}));
  }
  return sample;
}
