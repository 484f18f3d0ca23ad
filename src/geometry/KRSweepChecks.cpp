// Polygon: the checks that keep malformed input from passing as a result:
// contour orientations against their nesting before the sweep, and the
// triangles against the contours after it.
#include <krCoreLib/geometry/KRSweepPolygon.h>

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <numeric>

namespace krPolygonTriangulation {

namespace {

double Orientation(const Pointbase& a, const Pointbase& b, const Pointbase& c) {
  return orient2d(a.m_X, a.m_Y, b.m_X, b.m_Y, c.m_X, c.m_Y);
}

// The difference of the two products of a 2 x 2 cross product and the sum
// of their magnitudes, which bounds the rounding error of the difference.
struct SKRCrossTerm {
  double m_Value;
  double m_Magnitude;
};

SKRCrossTerm Cross(double ux, double uy, double vx, double vy) {
  const double p = ux * vy;
  const double q = uy * vx;
  return {p - q, std::fabs(p) + std::fabs(q)};
}

}  // namespace

bool Polygon::windingAround(unsigned contour, const Pointbase& p, int& winding) const {
  // Winding number by signed crossings of the horizontal through p, each
  // decided by the exact orientation; an edge running through p means the
  // contours touch.
  const unsigned first = contour == 0 ? 1 : m_ContourSizes[contour - 1] + 1;
  const unsigned last = m_ContourSizes[contour];
  winding = 0;
  for (unsigned i = first; i <= last; ++i) {
    const Pointbase& a = m_Points[i];
    const Pointbase& b = m_Points[i == last ? first : i + 1];
    if (a.m_Y <= p.m_Y) {
      if (b.m_Y > p.m_Y) {
        const double side = Orientation(a, b, p);
        if (side == 0)
          return false;
        winding += side > 0;
      }
    } else if (b.m_Y <= p.m_Y) {
      const double side = Orientation(a, b, p);
      if (side == 0)
        return false;
      winding -= side < 0;
    }
  }
  return true;
}

bool Polygon::contoursAgreeWithNesting() const {
  // Per contour: its highest vertex, whose turn gives the orientation
  // exactly (a simple contour turns left there when it runs
  // counter-clockwise), and its bounds.
  struct SKRContourInfo {
    unsigned m_Top;
    bool m_bCounterClockwise;
    double m_XMin, m_XMax, m_YMin, m_YMax;
  };
  const std::size_t count = m_ContourSizes.size();
  std::vector<SKRContourInfo> info(count);
  for (std::size_t c = 0; c < count; ++c) {
    const unsigned first = c == 0 ? 1 : m_ContourSizes[c - 1] + 1;
    const unsigned last = m_ContourSizes[c];
    SKRContourInfo& k = info[c];
    k = {first, false, m_Points[first].m_X, m_Points[first].m_X, m_Points[first].m_Y, m_Points[first].m_Y};
    for (unsigned i = first + 1; i <= last; ++i) {
      const Pointbase& p = m_Points[i];
      if (p.IsAbove(m_Points[k.m_Top]))
        k.m_Top = i;
      k.m_XMin = std::min(k.m_XMin, p.m_X);
      k.m_XMax = std::max(k.m_XMax, p.m_X);
      k.m_YMin = std::min(k.m_YMin, p.m_Y);
      k.m_YMax = std::max(k.m_YMax, p.m_Y);
    }
    const unsigned top = k.m_Top;
    const double turn = Orientation(m_Points[top == first ? last : top - 1], m_Points[top],
                                    m_Points[top == last ? first : top + 1]);
    // Both neighbours lie below the highest vertex; in line with it the
    // contour folds back on itself.
    if (turn == 0)
      return false;
    k.m_bCounterClockwise = turn > 0;
  }

  // A contour whose highest vertex lies where the other contours wind 0
  // times bounds the polygon from outside and must run counter-clockwise;
  // where they wind once it bounds a hole and must run clockwise. Only
  // contours whose bounds hold that vertex can wind around it: the queries
  // go left to right while the contours enter a candidate list by their
  // left bound and leave it past their right bound.
  std::vector<unsigned> byLeft(count);
  std::iota(byLeft.begin(), byLeft.end(), 0u);
  std::sort(byLeft.begin(), byLeft.end(), [&](unsigned a, unsigned b) { return info[a].m_XMin < info[b].m_XMin; });
  std::vector<unsigned> queries(byLeft);
  std::sort(queries.begin(), queries.end(),
            [&](unsigned a, unsigned b) { return m_Points[info[a].m_Top].m_X < m_Points[info[b].m_Top].m_X; });
  std::vector<unsigned> candidates;
  std::size_t entered = 0;
  for (const unsigned q : queries) {
    const Pointbase& p = m_Points[info[q].m_Top];
    while (entered < count && info[byLeft[entered]].m_XMin <= p.m_X)
      candidates.push_back(byLeft[entered++]);
    std::erase_if(candidates, [&](unsigned c) { return info[c].m_XMax < p.m_X; });
    int around = 0;
    for (const unsigned c : candidates) {
      if (c == q || p.m_Y < info[c].m_YMin || p.m_Y > info[c].m_YMax)
        continue;
      int winding = 0;
      if (!windingAround(c, p, winding))
        return false;
      around += winding;
    }
    if (around != (info[q].m_bCounterClockwise ? 0 : 1))
      return false;
  }
  return true;
}

bool Polygon::trianglesCoverContours() const {
  // Every triangle turns left, exactly.
  double triangles = 0;
  double magnitude = 0;
  std::size_t terms = 0;
  for (const Triangle& t : m_Triangles) {
    const Pointbase& a = m_Points[t[0]];
    const Pointbase& b = m_Points[t[1]];
    const Pointbase& c = m_Points[t[2]];
    if (!(Orientation(a, b, c) > 0))
      return false;
    const SKRCrossTerm term = Cross(b.m_X - a.m_X, b.m_Y - a.m_Y, c.m_X - a.m_X, c.m_Y - a.m_Y);
    triangles += term.m_Value;
    magnitude += term.m_Magnitude;
    ++terms;
  }
  // The signed area of the contours (twice it, as the triangles' sum),
  // each taken about its first vertex.
  double contours = 0;
  unsigned first = 1;
  for (const unsigned last : m_ContourSizes) {
    const Pointbase& r = m_Points[first];
    for (unsigned i = first + 1; i < last; ++i) {
      const Pointbase& a = m_Points[i];
      const Pointbase& b = m_Points[i + 1];
      const SKRCrossTerm term = Cross(a.m_X - r.m_X, a.m_Y - r.m_Y, b.m_X - r.m_X, b.m_Y - r.m_Y);
      contours += term.m_Value;
      magnitude += term.m_Magnitude;
      ++terms;
    }
    first = last + 1;
  }
  // Each term carries the rounding of two differences, two products and a
  // subtraction (below 4 eps of its magnitude) and each of the running sums
  // at most one rounding per term: the computed sums differ from the exact
  // ones by less than (terms + 4) eps times the summed magnitudes (the
  // classical bound of recursive summation), doubled for both sums.
  const double tolerance = 2.0 * double(terms + 4) * std::numeric_limits<double>::epsilon() * magnitude;
  return std::fabs(triangles - contours) <= tolerance;
}

}  // namespace krPolygonTriangulation
